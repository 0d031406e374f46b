#pragma once
// The module of the ACLs: their entries, the references to them, which are the daemon's own, and
// that an ACL stays as long as a map's entry names it. acl_nodes.h has the nodes, maps.h the module
// that has the references kept.

#include "host/commit/module.h"

namespace ovhost
{

class AclsModule : public Module
{
  public:
    [[nodiscard]] std::string name() const override { return "acl"; }
    [[nodiscard]] std::vector<std::string> patterns() const override;

    int check_change(md_dbinfo *dbinfo, mdb_db_change *change) override;
};

} // namespace ovhost
