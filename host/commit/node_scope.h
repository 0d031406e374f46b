#pragma once
// The nodes that a module asks for: see Module::patterns() in module.h.

#include "host/tree/name.h"

#include <optional>
#include <span>
#include <string>
#include <string_view>

namespace ovhost
{

/// The names that a pattern matches, or with "/**" behind it all names below those, however deep.
class NodeScope
{
  public:
    /// Nothing when the text is no pattern of node names.
    [[nodiscard]] static std::optional<NodeScope> parse(std::string_view text);

    [[nodiscard]] bool holds(std::span<const std::string> name) const;

  private:
    NodeScope(NamePattern pattern, bool is_below) : pattern_(std::move(pattern)), below_(is_below)
    {
    }

    NamePattern pattern_;
    bool below_;
};

} // namespace ovhost
