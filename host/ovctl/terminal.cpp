#include "host/ovctl/terminal.h"

#include <sys/ioctl.h>
#include <unistd.h>

#include <array>
#include <charconv>
#include <cstdlib>
#include <optional>
#include <ostream>
#include <string_view>

namespace ovhost
{

namespace
{

constexpr std::size_t usual_width = 80;

/// One row for each Style: what a terminal is told before the text.
constexpr std::array<const char *, 6> beginnings{
    "\x1b[1m",  // heading: bold
    "\x1b[32m", // added: green
    "\x1b[31m", // removed: red
    "\x1b[33m", // modified: yellow
    "\x1b[33m", // warning: yellow
    "\x1b[31m", // error: red
};
static_assert(beginnings.size() == static_cast<std::size_t>(Style::error) + 1);

constexpr const char *end_of_style = "\x1b[0m";

std::string_view environment(const char *name)
{
    const char *const value = std::getenv(name);
    return value == nullptr ? std::string_view() : value;
}

std::optional<std::size_t> width_by_environment()
{
    const std::string_view text = environment("COLUMNS");
    std::size_t width = 0;
    const char *const text_end = text.data() + text.size();
    const auto [end, fault] = std::from_chars(text.data(), text_end, width);
    constexpr std::size_t widest = 65535;
    const bool fits = fault == std::errc() && end == text_end && width > 0 && width <= widest;
    return fits ? std::optional(width) : std::nullopt;
}

std::size_t width_by_terminal(int fd)
{
    winsize size{};
    const bool known = ::ioctl(fd, TIOCGWINSZ, &size) == 0 && size.ws_col > 0;
    return known ? size.ws_col : usual_width;
}

bool shows_colour()
{
    const std::string_view kind = environment("TERM");
    return environment("NO_COLOR").empty() && !kind.empty() && kind != "dumb";
}

int width_slot()
{
    static const int slot = std::ios_base::xalloc();
    return slot;
}

int colour_slot()
{
    static const int slot = std::ios_base::xalloc();
    return slot;
}

} // namespace

Terminal look_at_terminal(int fd)
{
    if (::isatty(fd) != 1) {
        return {};
    }
    const auto given = width_by_environment();
    return {.width = given ? *given : width_by_terminal(fd), .colour = shows_colour()};
}

void set_terminal(std::ostream &stream, const Terminal &terminal)
{
    stream.iword(width_slot()) = static_cast<long>(terminal.width);
    stream.iword(colour_slot()) = terminal.colour ? 1 : 0;
}

Terminal terminal_of(std::ostream &stream)
{
    return {.width = static_cast<std::size_t>(stream.iword(width_slot())),
            .colour = stream.iword(colour_slot()) != 0};
}

std::string styled(std::ostream &stream, Style style, const std::string &text)
{
    if (!terminal_of(stream).colour) {
        return text;
    }
    return beginnings[static_cast<std::size_t>(style)] + text + end_of_style;
}

} // namespace ovhost
