#pragma once
// The module of the interfaces' addresses (interface_nodes.h): an address that goes, or becomes
// another one, takes the routes behind it with it (routes.h), unless another address leads into its
// subnet.

#include "host/commit/module.h"

namespace ovhost
{

class InterfaceAddressesModule : public Module
{
  public:
    [[nodiscard]] std::string name() const override { return "interface-address"; }
    [[nodiscard]] std::vector<std::string> patterns() const override;

    int check_change(md_dbinfo *dbinfo, mdb_db_change *change) override;

    /// Removes the routes in the new database: a commit is amended by its checks or not at all.
    int check_commit(md_dbinfo *dbinfo, const mdb_db_change_array *changes) override;

    /// Tells the log how many next hops went.
    int apply(const md_dbinfo *dbinfo, const mdb_db_change_array *changes) override;
};

} // namespace ovhost
