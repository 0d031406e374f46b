#include "host/tree/value_format.h"

#include "framework/bnode.h"
#include "host/tree/name.h"
#include "host/tree/regex_size.h"

#include <algorithm>
#include <arpa/inet.h>
#include <charconv>
#include <chrono>
#include <cmath>
#include <iterator>
#include <limits>
#include <regex.h>
#include <string>

namespace ovhost
{

namespace
{

constexpr std::string_view digits = "0123456789";
constexpr std::string_view hex_digits = "0123456789abcdefABCDEF";
constexpr std::string_view letters = "abcdefghijklmnopqrstuvwxyzABCDEFGHIJKLMNOPQRSTUVWXYZ";

bool is_one_of(char character, std::string_view set)
{
    return set.find(character) != std::string_view::npos;
}

template <typename Number>
bool parse(std::string_view text, Number &number)
{
    const auto [end, error] = std::from_chars(text.data(), text.data() + text.size(), number);
    return error == std::errc() && end == text.data() + text.size();
}

/// Whether every "9" of the shape stands for a digit, every "x" for a hex digit, and all else for
/// itself.
bool has_shape(std::string_view text, std::string_view shape)
{
    return std::ranges::equal(text, shape, [](char character, char wanted) {
        if (wanted == '9') {
            return is_one_of(character, digits);
        }
        return wanted == 'x' ? is_one_of(character, hex_digits) : character == wanted;
    });
}

/// Hands each piece between separators to `accepts`; whether it accepts them all.
template <typename Accepts>
bool all_pieces(std::string_view text, char separator, Accepts accepts)
{
    for (;;) {
        const std::size_t end = text.find(separator);
        if (!accepts(text.substr(0, end))) {
            return false;
        }
        if (end == std::string_view::npos) {
            return true;
        }
        text.remove_prefix(end + 1);
    }
}

template <typename Float>
bool is_finite(std::string_view text)
{
    Float number = 0;
    return parse(text, number) && std::isfinite(number);
}

bool is_address(int family, std::string_view text)
{
    unsigned char address[sizeof(in6_addr)];
    return inet_pton(family, std::string(text).c_str(), address) == 1;
}

bool is_prefix(bool (*is_address_of_family)(std::string_view), std::uint64_t max_length,
               std::string_view text)
{
    const std::size_t slash = text.find('/');
    return slash != std::string_view::npos && is_address_of_family(text.substr(0, slash)) &&
           is_integer_between(text.substr(slash + 1), 0, max_length);
}

bool is_host_label(std::string_view label)
{
    return !label.empty() && label.size() <= 63 && label.front() != '-' && label.back() != '-' &&
           std::ranges::all_of(label, [](char character) {
               return is_one_of(character, letters) || is_one_of(character, digits) ||
                      character == '-';
           });
}

bool is_scheme(std::string_view scheme)
{
    return !scheme.empty() && is_one_of(scheme.front(), letters) &&
           std::ranges::all_of(scheme, [](char character) {
               return is_one_of(character, letters) || is_one_of(character, digits) ||
                      is_one_of(character, "+-.");
           });
}

bool is_uri_text(std::string_view text)
{
    constexpr std::string_view marks = "-._~:/?#[]@!$&'()*+,;=";
    for (std::size_t at = 0; at < text.size(); ++at) {
        if (text[at] == '%') {
            if (!has_shape(text.substr(at + 1, 2), "xx")) {
                return false;
            }
        } else if (!is_one_of(text[at], letters) && !is_one_of(text[at], digits) &&
                   !is_one_of(text[at], marks)) {
            return false;
        }
    }
    return std::ranges::count(text, '#') <= 1;
}

/// Length of the bracket expression at the front; 0 when it is not closed. A "]" right at its start
/// is one of its characters.
std::size_t glob_bracket_length(std::string_view pattern)
{
    const bool is_negated = pattern.size() > 1 && is_one_of(pattern[1], "!^");
    const std::size_t first = is_negated ? 2 : 1;
    for (std::size_t at = first; at < pattern.size(); ++at) {
        if (pattern[at] == '\\') {
            ++at;
        } else if (pattern[at] == ']' && at != first) {
            return at + 1;
        }
    }
    return 0;
}

/// Length of what the pattern starts with: a bracket expression, an escaped character or any other
/// one; 0 when it is none of these.
std::size_t glob_item_length(std::string_view pattern)
{
    switch (pattern.front()) {
    case '\\':
        return pattern.size() > 1 ? 2 : 0;
    case '[':
        return glob_bracket_length(pattern);
    case ']':
        return 0;
    default:
        return 1;
    }
}

} // namespace

bool is_integer_between(std::string_view text, std::int64_t low, std::uint64_t high)
{
    std::uint64_t magnitude = 0;
    if (parse(text, magnitude)) {
        return magnitude <= high && (low <= 0 || magnitude >= static_cast<std::uint64_t>(low));
    }
    std::int64_t negative = 0;
    return low < 0 && parse(text, negative) && negative >= low && negative <= 0;
}

bool is_bool(std::string_view text)
{
    return text == "true" || text == "false";
}

bool is_float32(std::string_view text)
{
    return is_finite<float>(text);
}

bool is_float64(std::string_view text)
{
    return is_finite<double>(text);
}

bool is_printable_character(std::string_view text)
{
    return text.size() == 1 && text.front() >= ' ' && text.front() <= '~';
}

bool is_ipv4_address(std::string_view text)
{
    return is_address(AF_INET, text);
}

bool is_ipv6_address(std::string_view text)
{
    return is_address(AF_INET6, text);
}

bool is_ip_address(std::string_view text)
{
    return is_ipv4_address(text) || is_ipv6_address(text);
}

bool is_ipv4_prefix(std::string_view text)
{
    return is_prefix(is_ipv4_address, 32, text);
}

bool is_ipv6_prefix(std::string_view text)
{
    return is_prefix(is_ipv6_address, 128, text);
}

bool is_ip_prefix(std::string_view text)
{
    return is_ipv4_prefix(text) || is_ipv6_prefix(text);
}

bool is_mac_address(std::string_view text)
{
    return has_shape(text, "xx:xx:xx:xx:xx:xx");
}

bool is_date(std::string_view text)
{
    int year = 0;
    unsigned month = 0;
    unsigned day = 0;
    return has_shape(text, "9999/99/99") && parse(text.substr(0, 4), year) &&
           parse(text.substr(5, 2), month) && parse(text.substr(8, 2), day) &&
           std::chrono::year_month_day(std::chrono::year(year), std::chrono::month(month),
                                       std::chrono::day(day))
               .ok();
}

template <unsigned decimals>
bool is_time(std::string_view text)
{
    constexpr std::string_view longest_shape = "99:99:99.999999";
    constexpr std::size_t length = decimals == 0 ? 8 : 9 + decimals;
    return has_shape(text, longest_shape.substr(0, length)) && text.substr(0, 2) <= "23" &&
           text.substr(3, 2) <= "59" && text.substr(6, 2) <= "59";
}

template <unsigned decimals>
bool is_date_and_time(std::string_view text)
{
    const std::size_t blank = text.find(' ');
    return blank != std::string_view::npos && is_date(text.substr(0, blank)) &&
           is_time<decimals>(text.substr(blank + 1));
}

template bool is_time<0>(std::string_view text);
template bool is_time<3>(std::string_view text);
template bool is_time<6>(std::string_view text);
template bool is_date_and_time<0>(std::string_view text);
template bool is_date_and_time<3>(std::string_view text);
template bool is_date_and_time<6>(std::string_view text);

bool is_any_text(std::string_view)
{
    return true;
}

bool is_empty(std::string_view text)
{
    return text.empty();
}

bool is_hex_bytes(std::string_view text)
{
    return text.size() % 2 == 0 && text.find_first_not_of(hex_digits) == std::string_view::npos;
}

bool is_object_id(std::string_view text)
{
    constexpr std::size_t max_numbers = 128;
    if (text.starts_with('.')) {
        text.remove_prefix(1);
    }
    std::size_t count = 0;
    const bool all_numbers = all_pieces(text, '.', [&count](std::string_view number) {
        ++count;
        return is_integer_between(number, 0, std::numeric_limits<std::uint32_t>::max());
    });
    return all_numbers && count >= 2 && count <= max_numbers;
}

bool is_node_name(std::string_view text)
{
    return split_name(text).has_value();
}

bool is_type_name(std::string_view text)
{
    return std::any_of(std::begin(bn_type_map), std::prev(std::end(bn_type_map)),
                       [text](const lc_enum_string_map &row) { return row.lesm_string == text; });
}

bool is_host_name(std::string_view text)
{
    return text.size() <= 253 && all_pieces(text, '.', is_host_label);
}

bool is_uri(std::string_view text)
{
    const std::size_t colon = text.find(':');
    return colon != std::string_view::npos && is_scheme(text.substr(0, colon)) &&
           is_uri_text(text.substr(colon + 1));
}

bool is_regex(std::string_view text)
{
    // The compiler of the C library descends into each bracket and unrolls each repetition, both
    // without a bound of its own.
    constexpr std::size_t max_length = 1024;
    constexpr std::size_t max_unrolled_size = 2048;
    if (text.size() > max_length || unrolled_regex_size(text) > max_unrolled_size) {
        return false;
    }
    regex_t compiled;
    if (regcomp(&compiled, std::string(text).c_str(), REG_EXTENDED | REG_NOSUB) != 0) {
        return false;
    }
    regfree(&compiled);
    return true;
}

bool is_glob_pattern(std::string_view text)
{
    while (!text.empty()) {
        const std::size_t length = glob_item_length(text);
        if (length == 0) {
            return false;
        }
        text.remove_prefix(length);
    }
    return true;
}

} // namespace ovhost
