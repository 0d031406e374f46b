#pragma once
// The module that knows what the daemon's own nodes may hold. The tree checks that a value fits its
// type; this module checks that the node is given the right type, and one of the texts that mean
// something where only some do.

#include "host/commit/module.h"

namespace ovhost
{

class SchemaModule : public Module
{
  public:
    [[nodiscard]] std::string name() const override { return "schema"; }
    [[nodiscard]] std::vector<std::string> patterns() const override;

    /// Refuses a value whose type is not the node's, and a text that the node has no use for.
    int check_change(md_dbinfo *dbinfo, mdb_db_change *change) override;
};

} // namespace ovhost
