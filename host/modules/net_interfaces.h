#pragma once
// The module of the interfaces themselves: what they may be called, and that none goes while
// something uses it. interface_nodes.h has the nodes, interface_users.h the users;
// map_interfaces.h has what maps name interfaces by.

#include "host/commit/module.h"

namespace ovhost
{

class NetInterfacesModule : public Module
{
  public:
    [[nodiscard]] std::string name() const override { return "interface"; }
    [[nodiscard]] std::vector<std::string> patterns() const override;

    /// Writes the node of an interface of which only what stands below it was written: only what
    /// has a value can be seen to be new, or to go.
    int check_change(md_dbinfo *dbinfo, mdb_db_change *change) override;
};

} // namespace ovhost
