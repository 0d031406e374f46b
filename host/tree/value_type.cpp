#include "host/tree/value_type.h"

#include "host/support/utf8.h"
#include "host/tree/value_format.h"

#include <algorithm>
#include <cstdint>
#include <iterator>
#include <limits>

namespace ovhost
{

namespace
{

struct TypeRule {
    bn_type type;
    bool (*fits)(std::string_view text);
    const char *wanted;
};

struct IntegerRule {
    bn_type type;
    std::int64_t low;
    std::uint64_t high;
};

template <typename Integer>
constexpr IntegerRule integer_rule(bn_type type)
{
    using Limits = std::numeric_limits<Integer>;
    return {type, static_cast<std::int64_t>(Limits::min()),
            static_cast<std::uint64_t>(Limits::max())};
}

constexpr IntegerRule integer_rules[] = {
    integer_rule<std::uint8_t>(bt_uint8),         integer_rule<std::int8_t>(bt_int8),
    integer_rule<std::uint16_t>(bt_uint16),       integer_rule<std::int16_t>(bt_int16),
    integer_rule<std::uint32_t>(bt_uint32),       integer_rule<std::int32_t>(bt_int32),
    integer_rule<std::uint64_t>(bt_uint64),       integer_rule<std::int64_t>(bt_int64),
    integer_rule<std::uint64_t>(bt_duration_sec), integer_rule<std::uint64_t>(bt_duration_ms),
    integer_rule<std::uint64_t>(bt_duration_us),  integer_rule<std::uint32_t>(bt_attribute),
};

constexpr const char *wanted_node_name =
    R"(must be a node name such as /a/b, at most 256 components, "\/" for a slash inside one)";
constexpr const char *wanted_text = "must be text";

constexpr TypeRule type_rules[] = {
    {bt_bool, is_bool, "must be true or false"},
    {bt_float32, is_float32, "must be a finite decimal number in the range of the type"},
    {bt_float64, is_float64, "must be a finite decimal number in the range of the type"},
    {bt_char, is_printable_character, "must be one printable ASCII character"},
    {bt_ipaddr, is_ip_address, "must be an IPv4 or IPv6 address"},
    {bt_ipprefix, is_ip_prefix,
     "must be an IPv4 or IPv6 address, a slash and a prefix length up to 32 or 128"},
    {bt_ipv4addr, is_ipv4_address, "must be an IPv4 address such as 192.0.2.1"},
    {bt_ipv4prefix, is_ipv4_prefix, "must be an IPv4 address, a slash and a length from 0 to 32"},
    {bt_ipv6addr, is_ipv6_address, "must be an IPv6 address such as 2001:db8::1"},
    {bt_ipv6prefix, is_ipv6_prefix, "must be an IPv6 address, a slash and a length from 0 to 128"},
    {bt_macaddr802, is_mac_address, "must be six pairs of hex digits such as 00:1b:21:0a:0b:0c"},
    {bt_date, is_date, "must be a calendar day as YYYY/MM/DD"},
    {bt_time_sec, is_time<0>, "must be a time of day as HH:MM:SS"},
    {bt_time_ms, is_time<3>, "must be a time of day as HH:MM:SS.mmm"},
    {bt_time_us, is_time<6>, "must be a time of day as HH:MM:SS.uuuuuu"},
    {bt_datetime_sec, is_date_and_time<0>, "must be a date and time as YYYY/MM/DD HH:MM:SS"},
    {bt_datetime_ms, is_date_and_time<3>, "must be a date and time as YYYY/MM/DD HH:MM:SS.mmm"},
    {bt_datetime_us, is_date_and_time<6>, "must be a date and time as YYYY/MM/DD HH:MM:SS.uuuuuu"},
    {bt_none, is_empty, "must be empty"},
    {bt_any, is_any_text, wanted_text},
    {bt_btype, is_type_name, "must be the name of a value type such as uint32"},
    {bt_string, is_any_text, wanted_text},
    {bt_utf8_string, is_utf8, "must be well-formed UTF-8"},
    {bt_binary, is_hex_bytes, "must be pairs of hex digits"},
    {bt_oid, is_object_id, "must be 2 to 128 decimal numbers joined by dots"},
    {bt_link, is_node_name, wanted_node_name},
    {bt_name, is_node_name, wanted_node_name},
    {bt_hostname, is_host_name,
     "must be labels of letters, digits and inner hyphens joined by dots, up to 63 characters each "
     "and 253 in all"},
    {bt_uri, is_uri, "must be a URI such as https://host/path"},
    {bt_charlist, is_any_text, wanted_text},
    {bt_regex, is_regex,
     "must be a POSIX extended regular expression of at most 1024 bytes that repeats little"},
    {bt_globpattern, is_glob_pattern, "must be a glob pattern with every bracket closed"},
};

constexpr bool has_rules_without_repeats()
{
    bn_type types[std::size(integer_rules) + std::size(type_rules)] = {};
    auto end = std::ranges::transform(integer_rules, types, &IntegerRule::type).out;
    std::ranges::transform(type_rules, end, &TypeRule::type);
    std::ranges::sort(types);
    return std::ranges::adjacent_find(types) == std::end(types);
}

static_assert(has_rules_without_repeats());
static_assert(std::size(integer_rules) + std::size(type_rules) + 1 == std::size(bn_type_map),
              "every type has a rule; the table of types ends with a row that is none");

std::optional<std::string> integer_fault(const IntegerRule &rule, std::string_view text)
{
    if (is_integer_between(text, rule.low, rule.high)) {
        return std::nullopt;
    }
    return "must be a decimal number from " + std::to_string(rule.low) + " to " +
           std::to_string(rule.high);
}

std::string type_with_article(bn_type type)
{
    const auto *const row = std::ranges::find(bn_type_map, type, &lc_enum_string_map::lesm_enum);
    if (type == 0 || row == std::end(bn_type_map)) {
        return "of type " + std::to_string(type);
    }
    const std::string name = row->lesm_string;
    // A "u" is spoken as in "unit" in every type's name.
    return (std::string_view("aeio").find(name.front()) == std::string_view::npos ? "a " : "an ") +
           name;
}

bool is_ascii_control(char byte)
{
    const auto value = static_cast<unsigned char>(byte);
    return value < 0x20 || value == 0x7f;
}

void append_escaped_byte(std::string &shown, char byte)
{
    constexpr std::string_view hex = "0123456789abcdef";
    const auto value = static_cast<unsigned char>(byte);
    shown += "\\x";
    shown += hex[value / 16];
    shown += hex[value % 16];
}

/// The value between quotes, such that it stays on one line and ends where it seems to end.
std::string quote(std::string_view text)
{
    constexpr std::size_t shown_bytes = 128;
    std::string shown = "\"";
    std::size_t at = 0;
    while (at < text.size() && at < shown_bytes) {
        const std::size_t length = utf8_character_length(text.substr(at));
        const std::string_view character = text.substr(at, std::max<std::size_t>(length, 1));
        if (length == 0 || is_ascii_control(character.front())) {
            append_escaped_byte(shown, character.front());
        } else {
            shown += character == "\"" || character == "\\" ? "\\" : "";
            shown += character;
        }
        at += character.size();
    }
    return shown + (at < text.size() ? "\"..." : "\"");
}

} // namespace

std::optional<std::string> value_fault(bn_type type, std::string_view text)
{
    if (text.find('\0') != std::string_view::npos) {
        return "must not hold a NUL byte";
    }
    const auto *const integer = std::ranges::find(integer_rules, type, &IntegerRule::type);
    if (integer != std::end(integer_rules)) {
        return integer_fault(*integer, text);
    }
    const auto *const rule = std::ranges::find(type_rules, type, &TypeRule::type);
    if (rule == std::end(type_rules)) {
        return "no value type has the code " + std::to_string(type);
    }
    return rule->fits(text) ? std::nullopt : std::optional<std::string>(rule->wanted);
}

std::string describe_fault(std::string_view name, bn_type type, std::string_view text,
                           std::string_view reason)
{
    std::string message(name);
    message += ": ";
    message += quote(text);
    message += " is not ";
    message += type_with_article(type);
    message += ": ";
    message += reason;
    return message;
}

} // namespace ovhost
