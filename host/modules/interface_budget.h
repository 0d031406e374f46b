#pragma once
// The module of the interface budget: VLAN and tunnel interfaces (interface_nodes.h) are added only
// while the library says that they fit, and its count of them follows the configuration in force.
//
// Both kinds are counted by one pattern, so that a commit that adds some of each is measured as a
// whole. The other interfaces, which have a record only, are the machine's own: they are in the
// kernel's count.

#include "host/commit/module.h"

namespace ovhost
{

/// How many of the kernel's interfaces a VLAN or tunnel interface takes: its own, and the end of it
/// on the data plane's side.
inline constexpr int kernel_interfaces_each = 2;

struct InterfaceBudget {
    uint32 configured = 0; ///< the library's count
    uint32 allowed = 0;    ///< by the model
    uint32 in_kernel = 0;  ///< at this moment
    uint32 left = 0;       ///< how many can be added in one commit
};

[[nodiscard]] InterfaceBudget measure_interface_budget();

class InterfaceBudgetModule : public Module
{
  public:
    [[nodiscard]] std::string name() const override { return "interface-budget"; }
    [[nodiscard]] std::vector<std::string> patterns() const override;

    /// Counts what is in force, and nothing that was counted before.
    void start(const mdb_db *running) override;

    int check_commit(md_dbinfo *dbinfo, const mdb_db_change_array *changes) override;
    int apply(const md_dbinfo *dbinfo, const mdb_db_change_array *changes) override;
};

} // namespace ovhost
