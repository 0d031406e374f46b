#pragma once
// Match strings of map and ACL entries in a commit: whether the library takes them, and which
// entries of maps and ACLs say that they match a VLAN or an interface label.

#include "framework/md_commit.h"

#include <optional>
#include <string>

namespace ovhost
{

struct MatchStringVerdict {
    int code = 0;
    /// A message tells why.
    bool refused = false;
};

/// Has the library check the changed node's match string.
[[nodiscard]] MatchStringVerdict check_match_string(md_dbinfo *dbinfo, const mdb_db_change *change);

/// An entry as messages tell it.
struct MatchingEntry {
    std::string owner; ///< "a route-map"
    std::string entry; ///< "route-map m1, entry 10"
};

/// The first entry of a map, or else of an ACL, whose match string has a pair vlan:NAME.
[[nodiscard]] std::optional<MatchingEntry> entry_that_matches_vlan(const mdb_db *db,
                                                                   const std::string &name);

} // namespace ovhost
