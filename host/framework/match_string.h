#pragma once
// Match strings: "key:value" pairs joined by commas, or "any" alone, which has no pairs and matches
// all traffic. framework/appliance.h has the operation; vlan_name.cpp is the other parser of it.
//
// A key may be written in capitals and stands once at most; the value begins after the first colon,
// so an IPv6 prefix needs no quoting. The whole string has at most 1023 characters, the room that
// the library has for one.
//
// Key                              Value
// application app_group tbehavior  any text
// src_ip dst_ip                    address/length, IPv4 or IPv6
// src_port dst_port                a port, or a range of ports such as 8000-8080
// vlan                             a label or a VLAN's name: see longest_label
// protocol                         a number from 0 to 255, or a name of orvale/opkt_proto.h
// dscp                             a number from 0 to 63, cs0 to cs7, af11 to af43, ef or any
//
// A text in a value is not empty and holds no comma. The library makes a pattern of node names from
// a "vlan" to look for the label: one that were a wildcard there would be every label, and what has
// no room in it would be another label.

#include <cstddef>
#include <optional>
#include <string>
#include <string_view>
#include <vector>

namespace ovhost
{

/// The library's pattern has 255 characters, of which a label gets what is left.
inline constexpr std::size_t longest_label =
    255 - std::string_view("/ov/iflabels/config/*/").size();

struct MatchString {
    std::vector<std::string> keys; ///< as they were written
    std::vector<std::string> values;
};

/// Takes the text apart. Nothing when it is good, else a reason that names the pair at fault and
/// says what to write; `match` is then unchanged.
[[nodiscard]] std::optional<std::string> parse_match_string(std::string_view text,
                                                            MatchString &match);

} // namespace ovhost
