#pragma once
// The module of the DNS-proxy maps. The library has limits for them and nothing else; these leave
// no room for a map. What a store holds of them from elsewhere can be shown, changed and deleted.
//
//   /ov/dnsproxy/config/0/map/MAP                string  MAP again
//   /ov/dnsproxy/config/0/map/MAP/prio/PRIORITY  uint16  PRIORITY again, 1 to 65535
//
// "0" is the VRF. The library counts the maps of that one alone, so that there are none of others.

#include "host/commit/module.h"

#include <string>
#include <vector>

namespace ovhost
{

/// Those of a VRF are the node's children; "*" makes a pattern of it for those of every VRF.
[[nodiscard]] std::string dns_proxy_maps_node(const std::string &vrf);

/// The VRF that the library counts.
inline constexpr const char *dns_proxy_vrf = "0";

class DnsProxyMapsModule : public Module
{
  public:
    [[nodiscard]] std::string name() const override { return "dns-proxy-map"; }
    [[nodiscard]] std::vector<std::string> patterns() const override;

    int check_change(md_dbinfo *dbinfo, mdb_db_change *change) override;
};

} // namespace ovhost
