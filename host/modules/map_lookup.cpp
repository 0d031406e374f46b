#include "host/modules/map_lookup.h"

#include "host/modules/acl_nodes.h"
#include "host/modules/dns_proxy_maps.h"
#include "host/modules/node_access.h"
#include "host/tree/name.h"

namespace ovhost
{
namespace
{

MapFacts facts_of(const mdb_db *db, const MapKind &kind, const std::string &map)
{
    MapFacts facts{kind.name, map, {}};
    for (const MapEntry &entry : entries_of(db, kind, map)) {
        facts.entries.push_back({entry.priority, node_text(db, match_node(entry, "acl")),
                                 node_text(db, match_node(entry, "matchstr"))});
    }
    return facts;
}

void add_dns_proxy_maps(const mdb_db *db, std::vector<MapFacts> &maps)
{
    const std::string root = dns_proxy_maps_node(dns_proxy_vrf);
    for (const std::string &map : child_names(db, root)) {
        MapFacts facts{"dns-proxy-map", map, {}};
        const std::string entries = root + "/" + escape_component(map) + "/prio";
        for (const std::string &priority : child_names(db, entries)) {
            facts.entries.push_back({priority, std::nullopt, std::nullopt});
        }
        maps.push_back(std::move(facts));
    }
}

AclEntryFacts facts_of_entry(const mdb_db *db, const std::string &acl, const std::string &number)
{
    AclEntryFacts facts{number, {}};
    const std::string entry = acl_entry_node(acl, number);
    for (const std::string &field : child_names(db, entry)) {
        if (const auto value = node_text(db, entry + "/" + escape_component(field))) {
            facts.fields.emplace_back(field, *value);
        }
    }
    return facts;
}

} // namespace

std::vector<MapFacts> list_maps(const mdb_db *db)
{
    std::vector<MapFacts> maps;
    for (const MapKind &kind : map_kinds) {
        for (const std::string &map : child_names(db, kind.root)) {
            maps.push_back(facts_of(db, kind, map));
        }
    }
    add_dns_proxy_maps(db, maps);
    return maps;
}

std::optional<AclFacts> find_acl(const mdb_db *db, const std::string &acl)
{
    if (!is_whole_text(acl) || !has_acl(db, acl)) {
        return std::nullopt;
    }
    AclFacts facts;
    for (const std::string &number : child_names(db, acl_node(acl) + "/entry")) {
        facts.entries.push_back(facts_of_entry(db, acl, number));
    }
    facts.references = recorded_references(db, acl);
    return facts;
}

std::vector<std::string> list_acls(const mdb_db *db)
{
    return child_names(db, acls_node);
}

} // namespace ovhost
