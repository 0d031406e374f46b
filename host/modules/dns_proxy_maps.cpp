#include "host/modules/dns_proxy_maps.h"

#include "orvale/md_xmap_common.h"

namespace ovhost
{

std::vector<std::string> DnsProxyMapsModule::patterns() const
{
    return {"/ov/dnsproxy/config/*/map/*", "/ov/dnsproxy/config/*/map/*/prio/*"};
}

int DnsProxyMapsModule::check_change(md_dbinfo *dbinfo, mdb_db_change *change)
{
    // Refused, the words are those of the library.
    tbool refused = false;
    return md_xmap_common_change_check(change, dbinfo, MAP_TYPE_DNS_PROXY, &refused);
}

} // namespace ovhost
