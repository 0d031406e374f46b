#pragma once
// The text formats that values of some types must have. value_type.h says which type takes which
// format, and describes the formats.
//
// Every function answers whether the whole text has the format. Texts hold no NUL byte.

#include <cstdint>
#include <string_view>

namespace ovhost
{

[[nodiscard]] bool is_integer_between(std::string_view text, std::int64_t low, std::uint64_t high);
[[nodiscard]] bool is_bool(std::string_view text);
[[nodiscard]] bool is_float32(std::string_view text);
[[nodiscard]] bool is_float64(std::string_view text);
[[nodiscard]] bool is_printable_character(std::string_view text);

[[nodiscard]] bool is_ipv4_address(std::string_view text);
[[nodiscard]] bool is_ipv6_address(std::string_view text);
[[nodiscard]] bool is_ip_address(std::string_view text);
[[nodiscard]] bool is_ipv4_prefix(std::string_view text);
[[nodiscard]] bool is_ipv6_prefix(std::string_view text);
[[nodiscard]] bool is_ip_prefix(std::string_view text);
[[nodiscard]] bool is_mac_address(std::string_view text);

[[nodiscard]] bool is_date(std::string_view text);

/// A time of day whose seconds have so many decimals.
template <unsigned decimals>
[[nodiscard]] bool is_time(std::string_view text);

/// A date, one blank and such a time.
template <unsigned decimals>
[[nodiscard]] bool is_date_and_time(std::string_view text);

[[nodiscard]] bool is_any_text(std::string_view text);
[[nodiscard]] bool is_empty(std::string_view text);
[[nodiscard]] bool is_hex_bytes(std::string_view text);
[[nodiscard]] bool is_object_id(std::string_view text);
[[nodiscard]] bool is_node_name(std::string_view text);
[[nodiscard]] bool is_type_name(std::string_view text);
[[nodiscard]] bool is_host_name(std::string_view text);
[[nodiscard]] bool is_uri(std::string_view text);
[[nodiscard]] bool is_regex(std::string_view text);
[[nodiscard]] bool is_glob_pattern(std::string_view text);

} // namespace ovhost
