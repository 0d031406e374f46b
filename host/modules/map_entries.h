#pragma once
// The entries of maps, one by one: what walks over all of them has in common. map_kinds.h has the
// nodes, acl_references.h who refers to an entry.

#include "framework/mdb_db.h"
#include "host/modules/map_kinds.h"

#include <string>
#include <vector>

namespace ovhost
{

/// An entry of a map.
struct MapEntry {
    const MapKind *kind = nullptr;
    std::string map;
    std::string priority;

    bool operator==(const MapEntry &) const = default;
};

/// "route-map m1, entry 10"
[[nodiscard]] std::string describe(const MapEntry &entry);

/// A node below what the entry matches, such as "acl".
[[nodiscard]] std::string match_node(const MapEntry &entry, const char *leaf);

/// The entries of one map, or of all maps of a kind. Both throw std::runtime_error when they cannot
/// be read.
[[nodiscard]] std::vector<MapEntry> entries_of(const mdb_db *db, const MapKind &kind,
                                               const std::string &map);
[[nodiscard]] std::vector<MapEntry> entries_of(const mdb_db *db, const MapKind &kind);

} // namespace ovhost
