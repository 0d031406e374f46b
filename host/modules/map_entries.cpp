#include "host/modules/map_entries.h"

#include "host/modules/node_access.h"

#include <algorithm>
#include <iterator>

namespace ovhost
{

std::string describe(const MapEntry &entry)
{
    return std::string(entry.kind->name) + " " + entry.map + ", entry " + entry.priority;
}

std::string match_node(const MapEntry &entry, const char *leaf)
{
    return entry_node(*entry.kind, entry.map, entry.priority) + "/" + entry.kind->match + "/" +
           leaf;
}

std::vector<MapEntry> entries_of(const mdb_db *db, const MapKind &kind, const std::string &map)
{
    std::vector<MapEntry> entries;
    for (std::string &priority : child_names(db, map_node(kind, map) + "/prio")) {
        entries.push_back({&kind, map, std::move(priority)});
    }
    return entries;
}

std::vector<MapEntry> entries_of(const mdb_db *db, const MapKind &kind)
{
    std::vector<MapEntry> entries;
    for (const std::string &map : child_names(db, kind.root)) {
        std::ranges::move(entries_of(db, kind, map), std::back_inserter(entries));
    }
    return entries;
}

} // namespace ovhost
