#pragma once
// What differs between two trees. Cheap for trees that descend from one another: what they share
// (tree.h) is passed over as a whole, so the cost follows the number of changes.

#include "host/tree/tree.h"

#include <optional>
#include <string>
#include <vector>

namespace ovhost
{

/// A node whose value differs; a side without a value does not hold the node, or holds it only as
/// the parent of others. The two sides are never equal.
struct Change {
    std::vector<std::string> parts;
    std::optional<Value> before;
    std::optional<Value> after;

    bool operator==(const Change &) const = default;
};

/// Every node that differs, in the tree's order, parents before children.
[[nodiscard]] std::vector<Change> diff(const Tree &before, const Tree &after);

} // namespace ovhost
