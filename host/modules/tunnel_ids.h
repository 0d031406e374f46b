#pragma once
// Completes the tunnels of a commit: an ID for each new one, and an alias for each that has none.
// tunnel_checks.h has looked at the nodes one by one.

#include "framework/md_commit.h"
#include "host/modules/held_ids.h"

#include <optional>
#include <string>

namespace ovhost
{

/// Writes what is missing into the new database. Nothing is taken from the allocator by this: an ID
/// that it offers stays free until it is bound. Answers why the commit cannot be, when two tunnels
/// claim one ID or the allocator has no IDs to give.
[[nodiscard]] std::optional<std::string>
complete_tunnels(const md_dbinfo *dbinfo, const mdb_db_change_array *changes, const HeldIds &held);

} // namespace ovhost
