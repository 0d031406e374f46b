#include "host/modules/map_kinds.h"

#include "host/tree/name.h"

#include <algorithm>
#include <type_traits>

namespace ovhost
{
namespace
{

/// Whether no two kinds have one value of a member in common.
template <typename Member>
consteval bool tells_apart(Member MapKind::*member)
{
    using Comparable = std::conditional_t<std::is_pointer_v<Member>, std::string_view, Member>;
    for (std::size_t i = 0; i < map_kinds.size(); ++i) {
        for (std::size_t j = 0; j < i; ++j) {
            if (Comparable(map_kinds[i].*member) == Comparable(map_kinds[j].*member)) {
                return false;
            }
        }
    }
    return true;
}

// Whoever adds a row by copying one must change all of these.
static_assert(tells_apart(&MapKind::type));
static_assert(tells_apart(&MapKind::key));
static_assert(tells_apart(&MapKind::name));
static_assert(tells_apart(&MapKind::root));

} // namespace

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

} // namespace ovhost
