#pragma once
// The module of one kind of policy maps: what the library checks and keeps, asked in its order for
// each change. map_kinds.h has the nodes.

#include "host/commit/module.h"
#include "host/modules/map_kinds.h"

namespace ovhost
{

class MapsModule : public Module
{
  public:
    explicit MapsModule(const MapKind &kind) : kind_(kind) {}

    [[nodiscard]] std::string name() const override { return kind_.name; }
    [[nodiscard]] std::vector<std::string> patterns() const override;

    /// Limits, match before set, the match string, and the references from ACLs.
    int check_change(md_dbinfo *dbinfo, mdb_db_change *change) override;

  private:
    const MapKind &kind_;
};

} // namespace ovhost
