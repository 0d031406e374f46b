#pragma once
// What a commit may do to the nodes of a tunnel, one node at a time. tunnel_nodes.h has the nodes,
// tunnel_ids.h what concerns all new tunnels of a commit together.

#include "framework/md_commit.h"
#include "host/modules/held_ids.h"

#include <optional>
#include <string>

namespace ovhost
{

/// What is wrong with a change of a tunnel, of one of its fields, or of the number of tunnels that
/// the model allows.
[[nodiscard]] std::optional<std::string>
tunnel_fault(const md_dbinfo *dbinfo, const mdb_db_change *change, const HeldIds &held);

} // namespace ovhost
