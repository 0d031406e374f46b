#include "host/commit/node_scope.h"

#include <utility>

namespace ovhost
{

std::optional<NodeScope> NodeScope::parse(std::string_view text)
{
    constexpr std::string_view all_below = "/**";
    const bool is_below = text.ends_with(all_below);
    if (is_below) {
        text.remove_suffix(all_below.size());
    }
    std::optional<NamePattern> pattern = NamePattern::parse(text);
    return pattern ? std::optional(NodeScope(*std::move(pattern), is_below)) : std::nullopt;
}

bool NodeScope::holds(std::span<const std::string> name) const
{
    const std::size_t length = pattern_.parts().size();
    if (!below_) {
        return pattern_.matches(name);
    }
    return name.size() > length && pattern_.matches(name.first(length));
}

} // namespace ovhost
