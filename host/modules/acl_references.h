#pragma once
// References from ACLs to the map entries that name them. The library keeps a record for each
// (md_acl_ref_processing), but not when an entry loses the node that names its ACL and nothing
// else; that is done here. Here they are read, too, and compared with what the maps say.
//
// acl_nodes.h has the nodes, acls.h the module that keeps users from writing records.

#include "framework/md_commit.h"
#include "framework/mdb_db.h"
#include "host/modules/map_entries.h"

#include <string>
#include <vector>

namespace ovhost
{

/// The ACL that the entry refers to; empty when there is none. The default entry of a map refers to
/// none, whatever it names.
[[nodiscard]] std::string acl_of(const mdb_db *db, const MapEntry &entry);

/// The full name of the record of an entry.
[[nodiscard]] std::string reference_node(const std::string &acl, const MapEntry &entry);

/// The entries of which an ACL has records, whether they still name it or not.
[[nodiscard]] std::vector<MapEntry> recorded_references(const mdb_db *db, const std::string &acl);

/// Takes the record of an entry, if there is one, out of the database that a commit proposes; the
/// last one of a map takes the map's level with it, as the library has it.
void forget_reference(const md_dbinfo *dbinfo, const std::string &acl, const MapEntry &entry);

/// Where records and maps do not agree.
struct ReferenceFault {
    std::string acl;
    MapEntry entry;
    std::string message; ///< what is wrong, and what to do about it
};

struct ReferenceCheck {
    std::size_t records = 0;
    std::vector<ReferenceFault> faults;
};

/// Compares all records with all maps.
[[nodiscard]] ReferenceCheck check_references(const mdb_db *db);

} // namespace ovhost
