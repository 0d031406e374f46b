#include "host/modules/map_checks.h"

#include "host/modules/acl_nodes.h"
#include "host/modules/commit_access.h"
#include "host/modules/node_access.h"
#include "host/modules/plain_names.h"
#include "host/tree/name.h"

#include <span>

namespace ovhost
{
namespace
{

using Fault = std::optional<std::string>;
using Parts = std::span<const std::string>;

Fault level_fault(const MapKind &kind, const mdb_db_change *change)
{
    if (!is_security_map(kind) || name_parts(change)[kind.map_part - 1] == "map1") {
        return std::nullopt;
    }
    return "the one security map is called map1: set nodes below " + std::string(kind.root);
}

Fault acl_fault(const md_dbinfo *dbinfo, const std::string &acl)
{
    return acl.empty() || has_acl(dbinfo->newdb, acl)
               ? std::nullopt
               : Fault("there is no ACL \"" + acl + "\": set " + acls_node +
                       "/NAME to its name first");
}

/// Of a node below an entry.
Fault field_fault(const MapKind &kind, const md_dbinfo *dbinfo, const mdb_db_change *change,
                  Parts rest)
{
    if (rest.front() != "match") {
        return std::nullopt;
    }
    rest = rest.subspan(1);
    if (!is_security_map(kind) && !rest.empty()) {
        if (rest.front() != "0") {
            return "an entry matches by match/0 alone, not by match/" + rest.front();
        }
        rest = rest.subspan(1);
    }
    const bool is_acl = rest.size() == 1 && rest.front() == "acl";
    return is_acl ? acl_fault(dbinfo, new_text(change).value_or("")) : std::nullopt;
}

/// How many components below the entry a set parameter's own node has: of the security map "set"
/// itself is the parameter.
std::size_t set_depth(const MapKind &kind)
{
    return is_security_map(kind) ? 1 : 2;
}

std::string joined(std::string node, Parts parts)
{
    for (const std::string &part : parts) {
        node.append("/").append(escape_component(part));
    }
    return node;
}

struct NodeValue {
    std::string node;
    bn_type type = bt_string;
    std::string text;
};

NodeValue own_node(const MapKind &kind, const MapChange &changed)
{
    if (changed.is_map()) {
        return {map_node(kind, changed.map), bt_string, changed.map};
    }
    const std::string entry = entry_node(kind, changed.map, *changed.priority);
    return changed.is_entry()
               ? NodeValue{entry, bt_uint16, *changed.priority}
               : NodeValue{joined(entry, changed.rest), bt_string, changed.rest.back()};
}

} // namespace

std::optional<MapChange> map_change(const MapKind &kind, const mdb_db_change *change)
{
    const std::vector<std::string> parts = name_parts(change);
    if (parts.size() <= kind.map_part) {
        return std::nullopt;
    }
    MapChange changed;
    changed.map = parts[kind.map_part];
    const std::size_t priority_part = kind.map_part + 2;
    std::size_t above = kind.map_part + 1;
    if (parts.size() > priority_part && parts[above] == "prio") {
        changed.priority = parts[priority_part];
        above = priority_part + 1;
    }
    changed.rest.assign(parts.begin() + static_cast<std::ptrdiff_t>(above), parts.end());
    return changed;
}

Fault map_fault(const MapKind &kind, const md_dbinfo *dbinfo, const mdb_db_change *change,
                const MapChange &changed)
{
    if (Fault fault = level_fault(kind, change)) {
        return fault;
    }
    if (Fault fault = plain_name_fault("a map's name", changed.map)) {
        return fault;
    }
    if (changed.is_map()) {
        return own_name_fault("the map's name", changed.map, change);
    }
    if (!changed.priority) {
        return std::nullopt;
    }
    if (Fault fault = entry_number_fault("an entry's priority", *changed.priority)) {
        return fault;
    }
    return changed.is_entry() ? own_name_fault("the entry's priority", *changed.priority, change)
                              : field_fault(kind, dbinfo, change, changed.rest);
}

void complete_map(const MapKind &kind, const md_dbinfo *dbinfo, const MapChange &changed)
{
    if (!changed.is_map()) {
        propose_missing(dbinfo, map_node(kind, changed.map), bt_string, changed.map);
    }
    if (!changed.priority || changed.rest.empty()) {
        return;
    }
    const std::string entry = entry_node(kind, changed.map, *changed.priority);
    propose_missing(dbinfo, entry, bt_uint16, *changed.priority);
    const std::size_t depth = set_depth(kind);
    if (changed.rest.front() == "set" && changed.rest.size() > depth) {
        const Parts set = Parts(changed.rest).first(depth);
        propose_missing(dbinfo, joined(entry, set), bt_string, set.back());
    }
}

bool bring_back(const MapKind &kind, const md_dbinfo *dbinfo, const mdb_db_change *change,
                const MapChange &changed)
{
    const bool is_set = changed.priority && !changed.rest.empty() &&
                        changed.rest.front() == "set" && changed.rest.size() == set_depth(kind);
    if (!is_deleted(change) || (!changed.is_map() && !changed.is_entry() && !is_set)) {
        return false;
    }
    const NodeValue node = own_node(kind, changed);
    return bring_back_replaced(dbinfo, node.node, node.type, node.text);
}

} // namespace ovhost
