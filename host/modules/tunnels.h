#pragma once
// The module of the tunnels: sees to it that every configured tunnel has an ID, and that the
// library's allocator and cache know of the tunnels in force and of no others.
//
// A new tunnel gets its ID during the checks, where the allocator offers it and the configuration
// takes it up; it is bound when the commit is stored, so that a refused commit takes none. A tunnel
// is renamed by deleting it and adding another one with its ID in the same commit.
//
// tunnel_nodes.h has the nodes, tunnel_lookup.h the questions.

#include "host/commit/module.h"
#include "host/modules/held_ids.h"

namespace ovhost
{

class TunnelsModule : public Module
{
  public:
    [[nodiscard]] std::string name() const override { return "tunnels"; }
    [[nodiscard]] std::vector<std::string> patterns() const override;

    /// Sets up allocator and cache, and takes up the tunnels in force with the IDs they have. Needs
    /// the model information.
    void start(const mdb_db *running) override;

    int check_change(md_dbinfo *dbinfo, mdb_db_change *change) override;

    /// Completes the tunnels of the commit.
    int check_commit(md_dbinfo *dbinfo, const mdb_db_change_array *changes) override;

    /// Brings allocator and cache in line: what goes makes room before what comes.
    int apply(const md_dbinfo *dbinfo, const mdb_db_change_array *changes) override;

    /// IDs that were freed a short time ago.
    [[nodiscard]] const HeldIds &held_ids() const { return held_; }

  private:
    HeldIds held_;
};

} // namespace ovhost
