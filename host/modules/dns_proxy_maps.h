#pragma once
// The module of the DNS-proxy maps. The library has limits for them and nothing else; these leave
// no room for a map with a node of its own.

#include "host/commit/module.h"

namespace ovhost
{

class DnsProxyMapsModule : public Module
{
  public:
    [[nodiscard]] std::string name() const override { return "dns-proxy-map"; }
    [[nodiscard]] std::vector<std::string> patterns() const override;

    int check_change(md_dbinfo *dbinfo, mdb_db_change *change) override;
};

} // namespace ovhost
