#pragma once
// Questions about the tunnels in force: what `ovctl show tunnels` and `ovctl show tunnel` print.
// The library's allocator and cache find them; the configuration has their other fields.

#include "framework/mdb_db.h"

#include <optional>
#include <string>
#include <vector>

namespace ovhost
{

struct TunnelFacts {
    std::string name;
    std::optional<uint32> id; ///< nothing when the tunnel was left out at the start
    std::string alias;
    /// Another tunnel has the alias too: it leads to neither of them.
    bool alias_is_ambiguous = false;
    std::optional<std::string> remote;
    std::optional<uint32> bandwidth;
};

/// What a name, an alias or an ID leads to.
struct TunnelAnswer {
    /// Several tunnels claim it; it leads to none of them.
    bool ambiguous = false;
    /// The tunnel, or all that claim the name or alias; none when it is unknown.
    std::vector<TunnelFacts> tunnels;
};

/// All tunnels that have an ID, in the order of their names. Throws std::runtime_error when the
/// library fails.
[[nodiscard]] std::vector<TunnelFacts> list_tunnels(const mdb_db *db);

[[nodiscard]] TunnelAnswer find_tunnel_by_name(const mdb_db *db, const std::string &name);
[[nodiscard]] TunnelAnswer find_tunnel_by_alias(const mdb_db *db, const std::string &alias);
[[nodiscard]] TunnelAnswer find_tunnel_by_id(const mdb_db *db, uint32 id);

} // namespace ovhost
