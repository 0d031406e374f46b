#include "host/modules/acl_references.h"

#include "host/modules/acl_nodes.h"
#include "host/modules/commit_access.h"
#include "host/modules/node_access.h"
#include "host/tree/name.h"

namespace ovhost
{
namespace
{

/// The level of an ACL under which the references of a kind of maps stand.
std::string kind_node(const std::string &acl, const MapKind &kind)
{
    return acl_node(acl) + "/" + kind.key;
}

std::string level_of_map(const std::string &acl, const MapEntry &entry)
{
    return kind_node(acl, *entry.kind) + "/" + escape_component(entry.map);
}

/// What mends a record that nothing stands behind.
std::string delete_record(const std::string &acl, const MapEntry &entry)
{
    return "; delete " + reference_node(acl, entry);
}

/// What mends a record that is missing, or is not what it should be: the ACL named once more.
std::string name_again(const MapEntry &entry)
{
    return "; delete " + match_node(entry, "acl") + ", commit, and set it again";
}

/// A record that does not fit the maps.
void check_record(const mdb_db *db, const std::string &acl, const MapEntry &entry,
                  std::vector<ReferenceFault> &faults)
{
    const std::string named = acl_of(db, entry);
    if (named != acl) {
        const std::string fault = named.empty() ? "no ACL" : "ACL \"" + named + "\"";
        faults.push_back(
            {acl, entry,
             "there is a record, but the entry names " + fault + delete_record(acl, entry)});
    } else if (node_text(db, reference_node(acl, entry)) != entry.priority) {
        faults.push_back({acl, entry, "the record does not hold the priority" + name_again(entry)});
    }
}

/// An entry without its record.
void check_entry(const mdb_db *db, const MapEntry &entry, std::vector<ReferenceFault> &faults)
{
    const std::string acl = acl_of(db, entry);
    if (acl.empty() || node_text(db, reference_node(acl, entry))) {
        return;
    }
    const std::string missing = has_acl(db, acl) ? "record" : "such ACL";
    faults.push_back(
        {acl, entry, "the entry names the ACL, but there is no " + missing + name_again(entry)});
}

} // namespace

std::string acl_of(const mdb_db *db, const MapEntry &entry)
{
    if (entry.priority == default_priority) {
        return {};
    }
    return node_text(db, match_node(entry, "acl")).value_or("");
}

std::string reference_node(const std::string &acl, const MapEntry &entry)
{
    return level_of_map(acl, entry) + "/prio/" + escape_component(entry.priority);
}

std::vector<MapEntry> recorded_references(const mdb_db *db, const std::string &acl)
{
    std::vector<MapEntry> entries;
    for (const MapKind &kind : map_kinds) {
        const std::string maps = kind_node(acl, kind);
        for (const std::string &map : child_names(db, maps)) {
            const std::string records = maps + "/" + escape_component(map) + "/prio";
            for (const std::string &priority : child_names(db, records)) {
                entries.push_back({&kind, map, priority});
            }
        }
    }
    return entries;
}

void forget_reference(const md_dbinfo *dbinfo, const std::string &acl, const MapEntry &entry)
{
    const std::string record = reference_node(acl, entry);
    if (!node_text(dbinfo->newdb, record)) {
        return;
    }
    const std::string map = level_of_map(acl, entry);
    const bool is_last = child_names(dbinfo->newdb, map + "/prio").size() < 2;
    propose_removal(dbinfo, is_last ? map : record);
}

ReferenceCheck check_references(const mdb_db *db)
{
    ReferenceCheck check;
    for (const std::string &acl : child_names(db, acls_node)) {
        for (const MapEntry &entry : recorded_references(db, acl)) {
            ++check.records;
            check_record(db, acl, entry, check.faults);
        }
    }
    for (const MapKind &kind : map_kinds) {
        for (const MapEntry &entry : entries_of(db, kind)) {
            check_entry(db, entry, check.faults);
        }
    }
    return check;
}

} // namespace ovhost
