#include "host/modules/dns_proxy_maps.h"

#include "host/modules/commit_access.h"
#include "host/modules/map_kinds.h"
#include "host/modules/plain_names.h"
#include "host/tree/name.h"
#include "orvale/md_xmap_common.h"

namespace ovhost
{
namespace
{

using Parts = std::vector<std::string>;

constexpr std::size_t vrf_part = 3;
constexpr std::size_t map_part = 5;
constexpr std::size_t priority_part = 7;

bool is_map(const Parts &parts)
{
    return parts.size() == map_part + 1;
}

bool is_in_entry(const Parts &parts)
{
    return parts.size() > priority_part && parts[priority_part - 1] == "prio";
}

bool is_entry(const Parts &parts)
{
    return is_in_entry(parts) && parts.size() == priority_part + 1;
}

std::string node_of(const Parts &parts, std::size_t last_part)
{
    return join_name(std::span(parts).first(last_part + 1));
}

/// What is wrong with a node that is added or modified.
std::optional<std::string> node_fault(const Parts &parts, const mdb_db_change *change)
{
    if (parts[vrf_part] != dns_proxy_vrf) {
        return "DNS-proxy maps are those of VRF " + std::string(dns_proxy_vrf) + ", not \"" +
               parts[vrf_part] + "\"";
    }
    if (auto fault = plain_name_fault("a map's name", parts[map_part])) {
        return fault;
    }
    if (is_map(parts)) {
        return own_name_fault("the map's name", parts[map_part], change);
    }
    if (!is_in_entry(parts)) {
        return std::nullopt;
    }
    if (auto fault = entry_number_fault("an entry's priority", parts[priority_part])) {
        return fault;
    }
    return is_entry(parts) ? own_name_fault("the entry's priority", parts[priority_part], change)
                           : std::nullopt;
}

/// Writes the nodes of the map and the entry where they are missing: only what has a value can be
/// seen to be new.
void complete(const md_dbinfo *dbinfo, const Parts &parts)
{
    propose_missing(dbinfo, node_of(parts, map_part), bt_string, parts[map_part]);
    if (is_in_entry(parts)) {
        propose_missing(dbinfo, node_of(parts, priority_part), bt_uint16, parts[priority_part]);
    }
}

} // namespace

std::string dns_proxy_maps_node(const std::string &vrf)
{
    return "/ov/dnsproxy/config/" + vrf + "/map";
}

std::vector<std::string> DnsProxyMapsModule::patterns() const
{
    return {dns_proxy_maps_node("*") + "/**"};
}

int DnsProxyMapsModule::check_change(md_dbinfo *dbinfo, mdb_db_change *change)
{
    const Parts parts = name_parts(change);
    if (!is_deleted(change)) {
        if (const auto fault = node_fault(parts, change)) {
            return refuse(dbinfo, *fault);
        }
    }
    // Refused, the words are those of the library.
    tbool refused = false;
    if (const int err = md_xmap_common_change_check(change, dbinfo, MAP_TYPE_DNS_PROXY, &refused);
        err != 0 || refused) {
        return err;
    }
    if (!is_deleted(change)) {
        complete(dbinfo, parts);
    }
    return 0;
}

} // namespace ovhost
