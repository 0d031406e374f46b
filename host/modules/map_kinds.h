#pragma once
// The kinds of policy maps as the daemon's own parts see them, one row each. What is checked of
// them is the library's (orvale/md_xmap_common.h); maps.h has the module of a kind,
// map_entries.h their entries, map_lookup.h the questions about all of them. DNS-proxy maps are not
// among them: dns_proxy_maps.h.
//
// A map and what it consists of, ROOT being that of its kind:
//
//   ROOT/MAP                                string  MAP again
//   ROOT/MAP/prio/PRIORITY                  uint16  PRIORITY again, 1 to 65535
//   ROOT/MAP/prio/PRIORITY/match/0/acl      string  an ACL's name (acl_nodes.h)
//   ROOT/MAP/prio/PRIORITY/match/0/matchstr string
//   ROOT/MAP/prio/PRIORITY/set/...          what the kind's entries can do
//
// The security map has no match index: its entries have match/acl and match/matchstr. The first two
// nodes are there as long as anything is below them: whoever sets something below need not set
// them.

#include "framework/types.h"
#include "orvale/ov_xmap.h"

#include <array>
#include <string>
#include <string_view>

namespace ovhost
{

struct MapKind {
    int type;
    const char *key;  ///< names the kind in references from ACLs
    const char *name; ///< to users; the module's too
    /// The maps are its children.
    const char *root;
    /// As a pattern over names: the library's take any name for the level of the one security map.
    const char *root_pattern;
    /// The component with a map's name, counted from 0; its priority is two further on.
    uint32 map_part;
    const char *match; ///< below an entry
};

inline constexpr std::array<MapKind, 6> map_kinds{{
    {MAP_TYPE_R, "rmap", "route-map", "/ov/tunneld/route_map/config/map",
     "/ov/tunneld/route_map/config/map", 5, "match/0"},
    {MAP_TYPE_O, "omap", "opt-map", "/ov/tunneld/opt_map/config/map",
     "/ov/tunneld/opt_map/config/map", 5, "match/0"},
    {MAP_TYPE_Q, "qmap", "QoS-map", "/ov/tunneld/qos_map/config/map",
     "/ov/tunneld/qos_map/config/map", 5, "match/0"},
    {MAP_TYPE_S, "smap", "Stat-map", "/ov/tunneld/stats_map/config/map",
     "/ov/tunneld/stats_map/config/map", 5, "match/0"},
    {MAP_TYPE_N, "nmap", "nat-map", "/ov/tunneld/nat_map/config/map",
     "/ov/tunneld/nat_map/config/map", 5, "match/0"},
    {MAP_TYPE_SEC, "secmap", "sec-map", "/ov/tunneld/sec_map/config/map/map1",
     "/ov/tunneld/sec_map/config/map/*", 6, "match"},
}};

/// The entry of every map for what no other entry matches. No reference is kept of the ACL that it
/// names.
inline constexpr const char *default_priority = "65535";

[[nodiscard]] constexpr bool is_security_map(const MapKind &kind)
{
    return kind.type == MAP_TYPE_SEC;
}

/// Null when no kind has the key.
[[nodiscard]] const MapKind *find_map_kind(std::string_view key);

[[nodiscard]] std::string map_node(const MapKind &kind, const std::string &map);

/// An entry's node.
[[nodiscard]] std::string entry_node(const MapKind &kind, const std::string &map,
                                     const std::string &priority);

} // namespace ovhost
