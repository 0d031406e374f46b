#include "host/control/framing.h"

namespace ovhost
{

void LineSplitter::feed(std::string_view bytes)
{
    if (too_long_) {
        return;
    }
    drop_taken();
    bytes_.append(bytes);
}

/// Forgets the lines that were handed out. One long line must not leave its memory behind for the
/// life of a connection.
void LineSplitter::drop_taken()
{
    constexpr std::size_t worth_keeping = 1UL << 17;
    if (line_start_ == bytes_.size() && bytes_.capacity() > worth_keeping) {
        bytes_ = {};
    } else {
        bytes_.erase(0, line_start_);
    }
    searched_ -= line_start_;
    line_start_ = 0;
}

std::optional<std::string_view> LineSplitter::next()
{
    if (too_long_) {
        return std::nullopt;
    }
    // A long line arrives in many pieces; going on where the last search ended keeps that linear.
    const std::size_t newline = bytes_.find('\n', searched_);
    const std::size_t end = newline == std::string::npos ? bytes_.size() : newline;
    if (end - line_start_ > limit_) {
        give_up();
        return std::nullopt;
    }
    if (newline == std::string::npos) {
        searched_ = end;
        if (line_start_ == end) {
            drop_taken();
        }
        return std::nullopt;
    }
    const auto line = std::string_view(bytes_).substr(line_start_, end - line_start_);
    line_start_ = searched_ = newline + 1;
    return line;
}

std::string_view LineSplitter::rest() const
{
    return std::string_view(bytes_).substr(line_start_);
}

void LineSplitter::clear()
{
    bytes_ = {};
    line_start_ = searched_ = 0;
}

void LineSplitter::give_up()
{
    too_long_ = true;
    clear();
}

} // namespace ovhost
