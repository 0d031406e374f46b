// The kinds of policy maps, one row each: all that tells one kind from another, so that adding a
// kind is adding a row.
//
// Every other file of this folder asks it which nodes belong to a kind; md_tunneld_tunnel_common
// takes the roots of the maps that may name an application from it.
#pragma once

#include "framework/appliance.h"
#include "orvale/ov_xmap.h"

namespace ovmd
{

inline constexpr char acl_root[] = "/ov/tunneld/acl/config";

// The entry that every map has: it is neither counted nor does it refer to an ACL.
inline constexpr char default_priority[] = "65535";

struct map_type {
    int mtype;
    const char *key;       // names the kind in references from ACLs; null: the kind has none
    const char *user_name; // in messages

    const char *root;        // the maps are its children; paths are built from here
    const char *entry_level; // pattern: its children are the entries of all maps
    const char *vrf;         // stands for the %s of both; null: there is none

    const char *entry_pattern;
    const char *acl_pattern;
    const char *matchstr_pattern;
    const char *set_pattern;
    const char *acl_leaf; // below an entry, the ACL it names

    uint32 map_part; // components of a node's name
    uint32 priority_part;

    uint32 (*max_entries)(void);
    int max_maps;         // no_map_limit: new maps are not looked at
    bool counts_entries;  // otherwise their number is taken for 0
    bool has_legacy_form; // entries with one node for each field are upgraded
};

inline constexpr int no_map_limit = -1;

// The kinds whose maps have no level of their own: MAP/prio/PRIORITY below the root.
#define OVMD_REGULAR_MAP_TYPE(mtype, key, user_name, root, max_entries, counts_entries)            \
    {                                                                                              \
        (mtype), (key), (user_name), root, root "/*/prio", nullptr, root "/*/prio/*",              \
            root "/*/prio/*/match/*/acl", root "/*/prio/*/match/*/matchstr",                       \
            root "/*/prio/*/set/*", "match/0/acl", 5, 7, (max_entries), 10, (counts_entries), true \
    }

// The security map's patterns take any name in the place of "map1", its paths are built with that
// one. Its limit is the NAT maps'.
#define OVMD_SEC_MAP "/ov/tunneld/sec_map/config/map"

inline constexpr map_type map_types[] = {
    OVMD_REGULAR_MAP_TYPE(MAP_TYPE_R, "rmap", "route-map", "/ov/tunneld/route_map/config/map",
                          get_max_rmap_entries, true),
    OVMD_REGULAR_MAP_TYPE(MAP_TYPE_O, "omap", "opt-map", "/ov/tunneld/opt_map/config/map",
                          get_max_omap_entries, true),
    OVMD_REGULAR_MAP_TYPE(MAP_TYPE_Q, "qmap", "QoS-map", "/ov/tunneld/qos_map/config/map",
                          get_max_qmap_entries, true),
    OVMD_REGULAR_MAP_TYPE(MAP_TYPE_S, "smap", "Stat-map", "/ov/tunneld/stats_map/config/map",
                          get_max_smap_entries, true),
    OVMD_REGULAR_MAP_TYPE(MAP_TYPE_N, "nmap", "nat-map", "/ov/tunneld/nat_map/config/map",
                          get_max_nmap_entries, false),
    {MAP_TYPE_SEC, "secmap", "sec-map", OVMD_SEC_MAP "/map1", OVMD_SEC_MAP "/*/*/prio", nullptr,
     OVMD_SEC_MAP "/*/*/prio/*", OVMD_SEC_MAP "/*/*/prio/*/match/acl",
     OVMD_SEC_MAP "/*/*/prio/*/match/matchstr", OVMD_SEC_MAP "/*/*/prio/*/set", "match/acl", 6, 8,
     get_max_nmap_entries, no_map_limit, true, false},
    // No room for a map of it, which keeps new ones out.
    {MAP_TYPE_DNS_PROXY, nullptr, nullptr, "/ov/dnsproxy/config/%s/map",
     "/ov/dnsproxy/config/%s/map/*/prio", "0", nullptr, nullptr, nullptr, nullptr, nullptr, 0, 0,
     get_max_dns_proxy_map_entries, 0, false, false},
};

#undef OVMD_SEC_MAP
#undef OVMD_REGULAR_MAP_TYPE

consteval bool is_same_text(const char *left, const char *right)
{
    while (*left != '\0' && *left == *right) {
        ++left;
        ++right;
    }
    return *left == *right;
}

// A second row of a kind would never be found; kinds of one key would share their references.
consteval bool are_distinct(const map_type &left, const map_type &right)
{
    return left.mtype != right.mtype && !is_same_text(left.root, right.root) &&
           (left.key == nullptr || right.key == nullptr || !is_same_text(left.key, right.key));
}

consteval bool all_distinct()
{
    for (const map_type &row : map_types) {
        for (const map_type &other : map_types) {
            if (&row != &other && !are_distinct(row, other)) {
                return false;
            }
        }
    }
    return true;
}
static_assert(all_distinct(), "two map types share a number, a key or a root");

// Null for an unknown kind.
constexpr const map_type *find_map_type(int mtype)
{
    for (const map_type &row : map_types) {
        if (row.mtype == mtype) {
            return &row;
        }
    }
    return nullptr;
}

// A kind whose entries match traffic; null for any other.
constexpr const map_type *find_policy_map_type(int mtype)
{
    const map_type *const row = find_map_type(mtype);
    return row != nullptr && row->key != nullptr ? row : nullptr;
}

} // namespace ovmd
