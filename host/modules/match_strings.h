#pragma once
// Match strings of map and ACL entries in a commit: whether the library takes them, and which
// entries of maps say that they match a VLAN or an interface label.

#include "framework/md_commit.h"
#include "host/modules/acl_references.h"

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

/// The first entry of a map whose match string has a pair vlan:NAME.
[[nodiscard]] std::optional<MapEntry> entry_that_matches_vlan(const mdb_db *db,
                                                              const std::string &name);

} // namespace ovhost
