#pragma once
// The module of the data plane's routes, and who of them leads into a subnet:
//
//   /ov/tunneld/net/routes/config/ipv4/prefix/PREFIX               ipv4prefix  PREFIX again
//   /ov/tunneld/net/routes/config/ipv4/prefix/PREFIX/nhop/ADDRESS  ipv4addr    ADDRESS again
//
// The slash of a prefix is escaped, "10.0.0.0\/8". interface_addresses.h removes the routes behind
// an address.

#include "host/commit/module.h"

#include <string>
#include <vector>

namespace ovhost
{

struct Subnet {
    std::string address; ///< any in it
    uint8 mask_length = 0;

    bool operator==(const Subnet &) const = default;
};

/// The full names of the next hops that lie in a subnet.
[[nodiscard]] std::vector<std::string> next_hops_in(const mdb_db *db, const Subnet &subnet);

/// Removes them from the database that a commit proposes, and the prefixes that are left with none.
/// Throws std::runtime_error when that fails.
void remove_next_hops(const md_dbinfo *dbinfo, const Subnet &subnet);

class RoutesModule : public Module
{
  public:
    [[nodiscard]] std::string name() const override { return "route"; }
    [[nodiscard]] std::vector<std::string> patterns() const override;

    int check_change(md_dbinfo *dbinfo, mdb_db_change *change) override;
};

} // namespace ovhost
