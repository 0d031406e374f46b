#pragma once
// What a change of a map must keep to so that the library's checks mean what they say, and the
// nodes that a map lacks. maps.h calls the library.

#include "framework/md_commit.h"
#include "host/modules/map_kinds.h"

#include <optional>
#include <string>
#include <vector>

namespace ovhost
{

/// A changed node of a map, taken apart.
struct MapChange {
    std::string map;
    std::optional<std::string> priority;
    /// Below the map, or below the entry if there is one.
    std::vector<std::string> rest;

    [[nodiscard]] bool is_map() const { return !priority && rest.empty(); }
    [[nodiscard]] bool is_entry() const { return priority && rest.empty(); }
};

/// Nothing for a node above all maps.
[[nodiscard]] std::optional<MapChange> map_change(const MapKind &kind, const mdb_db_change *change);

/// What is wrong with a node that is added or modified.
[[nodiscard]] std::optional<std::string> map_fault(const MapKind &kind, const md_dbinfo *dbinfo,
                                                   const mdb_db_change *change,
                                                   const MapChange &changed);

/// Writes the nodes of the map, the entry and the set parameter that the changed node belongs to,
/// where they are missing: only what has a value can be seen to be new, or to go.
void complete_map(const MapKind &kind, const md_dbinfo *dbinfo, const MapChange &changed);

/// Brings back the node of a map, an entry or a set parameter that was deleted, when there is
/// something below it again: it was replaced, and not deleted. Whether it did.
[[nodiscard]] bool bring_back(const MapKind &kind, const md_dbinfo *dbinfo,
                              const mdb_db_change *change, const MapChange &changed);

} // namespace ovhost
