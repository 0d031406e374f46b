#pragma once
// Questions about the maps and ACLs in force: what `ovctl show maps` and `ovctl show acl` print.
// acl_references.h has the question whether references agree with the maps.

#include "host/modules/acl_references.h"

#include "framework/mdb_db.h"

#include <optional>
#include <string>
#include <utility>
#include <vector>

namespace ovhost
{

struct EntryFacts {
    std::string priority;
    std::optional<std::string> acl;
    std::optional<std::string> matchstr;
};

struct MapFacts {
    std::string kind; ///< as users call it
    std::string name;
    std::vector<EntryFacts> entries;
};

/// All maps, kind by kind, those of the DNS proxy last.
[[nodiscard]] std::vector<MapFacts> list_maps(const mdb_db *db);

struct AclEntryFacts {
    std::string number;
    std::vector<std::pair<std::string, std::string>> fields; ///< names and values
};

struct AclFacts {
    std::vector<AclEntryFacts> entries;
    std::vector<MapEntry> references; ///< by the records
};

/// Nothing when there is no such ACL.
[[nodiscard]] std::optional<AclFacts> find_acl(const mdb_db *db, const std::string &acl);

/// The names of all ACLs.
[[nodiscard]] std::vector<std::string> list_acls(const mdb_db *db);

} // namespace ovhost
