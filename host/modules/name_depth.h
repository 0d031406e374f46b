#pragma once
// The module that keeps nodes of ACLs and maps from standing deeper than the modules of these look
// (acls.h, maps.h, dns_proxy_maps.h): a node that they do not see would escape every check of its
// ACL or map.

#include "host/commit/module.h"

namespace ovhost
{

class NameDepthModule : public Module
{
  public:
    [[nodiscard]] std::string name() const override { return "name-depth"; }

    /// Every change: a pattern stands for names of one length.
    int check_change(md_dbinfo *dbinfo, mdb_db_change *change) override;
};

} // namespace ovhost
