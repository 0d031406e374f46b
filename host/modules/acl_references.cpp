#include "host/modules/acl_references.h"

#include "host/modules/acl_nodes.h"
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

/// A record that does not fit the maps.
void check_record(const mdb_db *db, const std::string &acl, const MapEntry &entry,
                  std::vector<ReferenceFault> &faults)
{
    const std::string named = acl_of(db, entry);
    if (named != acl) {
        faults.push_back({acl, entry,
                          named.empty()
                              ? "there is a record, but the entry names no ACL"
                              : "there is a record, but the entry names ACL \"" + named + "\""});
    } else if (node_text(db, reference_node(acl, entry)) != entry.priority) {
        faults.push_back({acl, entry, "the record does not hold the priority"});
    }
}

/// An entry without its record.
void check_entry(const mdb_db *db, const MapEntry &entry, std::vector<ReferenceFault> &faults)
{
    const std::string acl = acl_of(db, entry);
    if (acl.empty() || node_binding(db, reference_node(acl, entry).c_str()) != nullptr) {
        return;
    }
    faults.push_back({acl, entry,
                      has_acl(db, acl) ? "the entry names the ACL, but there is no record"
                                       : "the entry names the ACL, but there is no such ACL"});
}

void check_maps(const mdb_db *db, const MapKind &kind, std::vector<ReferenceFault> &faults)
{
    for (const std::string &map : child_names(db, kind.root)) {
        for (const std::string &priority : child_names(db, map_node(kind, map) + "/prio")) {
            check_entry(db, {&kind, map, priority}, faults);
        }
    }
}

} // namespace

std::string describe(const MapEntry &entry)
{
    return std::string(entry.kind->name) + " " + entry.map + ", entry " + entry.priority;
}

std::string acl_of(const mdb_db *db, const MapEntry &entry)
{
    if (entry.priority == default_priority) {
        return {};
    }
    return node_text(db, match_node(*entry.kind, entry.map, entry.priority, "acl")).value_or("");
}

std::string reference_node(const std::string &acl, const MapEntry &entry)
{
    return kind_node(acl, *entry.kind) + "/" + escape_component(entry.map) + "/prio/" +
           escape_component(entry.priority);
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
        check_maps(db, kind, check.faults);
    }
    return check;
}

} // namespace ovhost
