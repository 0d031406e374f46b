// The kinds of policy maps as their users see them, each with its nodes' names written out.
#pragma once

#include "orvale/ov_xmap.h"

#include <ostream>
#include <string>
#include <vector>

namespace ovtest
{

// A kind whose entries match traffic. Leaves are what follows an entry's name.
struct MapKind {
    const char *name;
    int mtype;
    const char *key;       // in references
    const char *user_name; // in messages
    const char *root;      // of its maps
    const char *acl_leaf;  // as it is read
    const char *matchstr_leaf;
    const char *set_leaf;
    const char *match_leaf; // holds what the entry matches

    // "ROOT/MAP/prio/PRIORITY"
    std::string entry(const std::string &map, const std::string &priority) const
    {
        return std::string(root) + '/' + map + "/prio/" + priority;
    }
    std::string acl_node(const std::string &map, const std::string &priority) const
    {
        return entry(map, priority) + acl_leaf;
    }
    std::string matchstr_node(const std::string &map, const std::string &priority) const
    {
        return entry(map, priority) + matchstr_leaf;
    }
    std::string set_node(const std::string &map, const std::string &priority) const
    {
        return entry(map, priority) + set_leaf;
    }
    std::string match_node(const std::string &map, const std::string &priority) const
    {
        return entry(map, priority) + match_leaf;
    }
    // "/ov/tunneld/acl/config/ACL/KEY/MAP/prio/PRIORITY"
    std::string reference(const std::string &acl, const std::string &map,
                          const std::string &priority) const
    {
        return "/ov/tunneld/acl/config/" + acl + '/' + key + '/' + map + "/prio/" + priority;
    }
};

inline const MapKind route_map = {"RouteMap",
                                  MAP_TYPE_R,
                                  "rmap",
                                  "route-map",
                                  "/ov/tunneld/route_map/config/map",
                                  "/match/0/acl",
                                  "/match/0/matchstr",
                                  "/set/nexthop",
                                  "/match"};
inline const MapKind security_map = {
    "SecurityMap", MAP_TYPE_SEC,      "secmap", "sec-map", "/ov/tunneld/sec_map/config/map/map1",
    "/match/acl",  "/match/matchstr", "/set",   "/match"};

inline std::vector<MapKind> map_kinds()
{
    return {route_map,
            {"OptimisationMap", MAP_TYPE_O, "omap", "opt-map", "/ov/tunneld/opt_map/config/map",
             "/match/0/acl", "/match/0/matchstr", "/set/level", "/match"},
            {"QosMap", MAP_TYPE_Q, "qmap", "QoS-map", "/ov/tunneld/qos_map/config/map",
             "/match/0/acl", "/match/0/matchstr", "/set/class", "/match"},
            {"StatisticsMap", MAP_TYPE_S, "smap", "Stat-map", "/ov/tunneld/stats_map/config/map",
             "/match/0/acl", "/match/0/matchstr", "/set/group", "/match"},
            {"NatMap", MAP_TYPE_N, "nmap", "nat-map", "/ov/tunneld/nat_map/config/map",
             "/match/0/acl", "/match/0/matchstr", "/set/pool", "/match"},
            security_map};
}

inline void PrintTo(const MapKind &kind, std::ostream *out)
{
    *out << kind.name;
}

// Types that are no kind of map, or that have no entries that match traffic.
inline std::vector<int> unknown_types()
{
    return {-1, MAP_TYPE_RTMAP, 8, 1000, MAP_TYPE_DNS_PROXY};
}

} // namespace ovtest
