#include "host/ovctl/text_input.h"

#include "host/support/read_file.h"
#include "host/support/unique_fd.h"
#include "host/support/utf8.h"

#include <fcntl.h>

#include <algorithm>
#include <cerrno>
#include <charconv>
#include <optional>
#include <string_view>
#include <system_error>

namespace ovhost
{

namespace
{

std::optional<std::size_t> first_fault(std::string_view text)
{
    for (std::size_t at = 0; at < text.size();) {
        const std::size_t length = utf8_character_length(text.substr(at));
        if (length == 0) {
            return at;
        }
        at += length;
    }
    return std::nullopt;
}

[[noreturn]] void fail_to_read(const std::string &what, const std::error_code &cause)
{
    throw UsageError("cannot read " + what + ": " + cause.message());
}

/// mgmtd takes no longer request.
constexpr std::size_t longest_mib = 16;

} // namespace

std::string checked_utf8(std::string text, const std::string &what)
{
    const auto fault = first_fault(text);
    if (!fault) {
        return text;
    }
    const auto line =
        1 + std::count(text.begin(), text.begin() + static_cast<std::ptrdiff_t>(*fault), '\n');
    throw UsageError(what + " is not UTF-8 in line " + std::to_string(line) + ": convert it first");
}

std::uint32_t checked_number(const std::string &text, const std::string &what,
                             const NumberRange &range)
{
    std::uint32_t number = 0;
    const char *const text_end = text.data() + text.size();
    const auto [end, fault] = std::from_chars(text.data(), text_end, number);
    const bool is_number = fault == std::errc() && end == text_end;
    if (!is_number || number < range.first || number > range.last) {
        throw UsageError(what + " must be a whole number from " + std::to_string(range.first) +
                         " to " + std::to_string(range.last));
    }
    return number;
}

std::string read_text(const std::string &file)
{
    if (file.empty()) {
        throw UsageError("the name of the file is empty; - is standard input");
    }
    const bool standard_input = file == "-";
    const std::string what = standard_input ? "standard input" : file;
    UniqueFd opened;
    if (!standard_input) {
        opened = UniqueFd(::open(file.c_str(), O_RDONLY | O_CLOEXEC));
        if (!opened) {
            fail_to_read(what, {errno, std::generic_category()});
        }
    }
    constexpr std::size_t longest = longest_mib << 20;
    std::string text;
    try {
        text = read_to_end(standard_input ? STDIN_FILENO : opened.get(), longest);
    } catch (const std::system_error &error) {
        fail_to_read(what, error.code());
    }
    if (text.size() > longest) {
        throw UsageError(what + " is longer than " + std::to_string(longest_mib) +
                         " MiB: load it in smaller parts");
    }
    return checked_utf8(std::move(text), what);
}

} // namespace ovhost
