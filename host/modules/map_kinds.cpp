#include "host/modules/map_kinds.h"

#include "host/tree/name.h"

#include <algorithm>

namespace ovhost
{

const MapKind *find_map_kind(std::string_view key)
{
    const auto *const kind = std::ranges::find(map_kinds, key, &MapKind::key);
    return kind != map_kinds.end() ? kind : nullptr;
}

std::string map_node(const MapKind &kind, const std::string &map)
{
    return std::string(kind.root) + "/" + escape_component(map);
}

std::string entry_node(const MapKind &kind, const std::string &map, const std::string &priority)
{
    return map_node(kind, map) + "/prio/" + escape_component(priority);
}

std::string match_node(const MapKind &kind, const std::string &map, const std::string &priority,
                       const char *leaf)
{
    return entry_node(kind, map, priority) + "/" + kind.match + "/" + leaf;
}

} // namespace ovhost
