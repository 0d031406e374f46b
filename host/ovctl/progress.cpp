#include "host/ovctl/progress.h"

#include "host/ovctl/terminal.h"
#include "host/ovctl/text_width.h"
#include "host/support/printable.h"

#include <ostream>

namespace ovhost
{

namespace
{

// What is done sooner needs no telling.
constexpr std::chrono::milliseconds moment(500);

} // namespace

ProgressLine::ProgressLine(std::ostream &stream, std::string_view what, Clock::time_point now)
    : stream_(stream), what_(printable(what)), began_(now)
{
}

ProgressLine::~ProgressLine()
{
    if (!shown_.empty()) {
        show("");
    }
}

void ProgressLine::update(const CallProgress &progress, Clock::time_point now)
{
    const std::size_t width = terminal_of(stream_).width;
    if (width == 0 || now - began_ < moment) {
        return;
    }
    // The last column stays free: many terminals go on to the next line after it.
    show(fitted(text_for(progress, now), width - 1));
}

std::string ProgressLine::text_for(const CallProgress &progress, Clock::time_point now) const
{
    if (progress.sent < progress.total) {
        return "sending " + what_ + ": " + std::to_string(progress.sent * 100 / progress.total) +
               "%";
    }
    const auto seconds = std::chrono::duration_cast<std::chrono::seconds>(now - began_).count();
    return "mgmtd is at work on " + what_ + ": " + std::to_string(seconds) + " s";
}

/// Over what was shown before, with blanks where that was longer.
void ProgressLine::show(const std::string &text)
{
    if (text == shown_) {
        return;
    }
    const std::size_t before = width_of(shown_);
    const std::size_t now = width_of(text);
    stream_ << '\r' << text;
    if (before > now) {
        stream_ << std::string(before - now, ' ') << '\r' << text;
    }
    stream_.flush();
    shown_ = text;
}

} // namespace ovhost
