#include "host/ovctl/text_input.h"

#include "host/support/unique_fd.h"

#include <fcntl.h>

#include <algorithm>
#include <array>
#include <cerrno>
#include <cstring>
#include <optional>
#include <string_view>

namespace ovhost
{

namespace
{

/// One row per form of a UTF-8 character: the range of its first byte, the number of bytes that
/// follow, and the range of the second one, which keeps out overlong forms, surrogates and what is
/// past U+10FFFF.
struct Utf8Form {
    unsigned char first_low;
    unsigned char first_high;
    unsigned char following;
    unsigned char second_low;
    unsigned char second_high;
};

constexpr Utf8Form utf8_forms[] = {
    {0x00, 0x7f, 0, 0x00, 0x00}, {0xc2, 0xdf, 1, 0x80, 0xbf}, {0xe0, 0xe0, 2, 0xa0, 0xbf},
    {0xe1, 0xec, 2, 0x80, 0xbf}, {0xed, 0xed, 2, 0x80, 0x9f}, {0xee, 0xef, 2, 0x80, 0xbf},
    {0xf0, 0xf0, 3, 0x90, 0xbf}, {0xf1, 0xf3, 3, 0x80, 0xbf}, {0xf4, 0xf4, 3, 0x80, 0x8f},
};

/// Length of the character `text` starts with; 0 when it starts with none.
std::size_t utf8_length(std::string_view text)
{
    const auto byte = [text](std::size_t at) { return static_cast<unsigned char>(text[at]); };
    for (const Utf8Form &form : utf8_forms) {
        if (byte(0) < form.first_low || byte(0) > form.first_high)
            continue;
        if (text.size() <= form.following)
            return 0;
        if (form.following > 0 && (byte(1) < form.second_low || byte(1) > form.second_high))
            return 0;
        for (std::size_t at = 2; at <= form.following; ++at)
            if ((byte(at) & 0xc0) != 0x80)
                return 0;
        return form.following + std::size_t{1};
    }
    return 0;
}

std::optional<std::size_t> first_fault(std::string_view text)
{
    for (std::size_t at = 0; at < text.size();) {
        const std::size_t length = utf8_length(text.substr(at));
        if (length == 0)
            return at;
        at += length;
    }
    return std::nullopt;
}

[[noreturn]] void fail_to_read(const std::string &file)
{
    throw UsageError("cannot read " + file + ": " + std::strerror(errno));
}

} // namespace

std::string checked_utf8(std::string text, const std::string &what)
{
    const auto fault = first_fault(text);
    if (!fault)
        return text;
    const auto line =
        1 + std::count(text.begin(), text.begin() + static_cast<std::ptrdiff_t>(*fault), '\n');
    throw UsageError(what + " is not UTF-8 in line " + std::to_string(line) + ": convert it first");
}

std::string read_text(const std::string &file)
{
    const bool standard_input = file == "-";
    UniqueFd opened;
    if (!standard_input) {
        opened = UniqueFd(::open(file.c_str(), O_RDONLY | O_CLOEXEC));
        if (!opened)
            fail_to_read(file);
    }
    const int fd = standard_input ? STDIN_FILENO : opened.get();
    const std::string what = standard_input ? "standard input" : file;

    std::string text;
    std::array<char, 65536> piece;
    for (;;) {
        const ssize_t got = ::read(fd, piece.data(), piece.size());
        if (got == 0)
            return checked_utf8(std::move(text), what);
        if (got < 0 && errno != EINTR)
            fail_to_read(what);
        if (got > 0)
            text.append(piece.data(), static_cast<std::size_t>(got));
    }
}

} // namespace ovhost
