#include "host/commit/patch.h"

#include <algorithm>
#include <string>
#include <utility>
#include <vector>

namespace ovhost
{

namespace
{

using Parts = std::vector<std::string>;

/// Takes the value away from a node that may have others below it, which stay.
void clear_value(Tree &tree, const Parts &parts)
{
    if (tree.value(parts) == nullptr) {
        return;
    }
    std::vector<std::pair<Parts, Value>> below;
    tree.visit(
        [&](Tree::Parts name, const Value &value) {
            if (name.size() > parts.size()) {
                below.emplace_back(Parts(name.begin(), name.end()), value);
            }
        },
        parts);
    tree.erase(parts);
    for (auto &[name, value] : below) {
        tree.set(name, std::move(value));
    }
}

} // namespace

Tree with_changes(Tree configuration, std::span<const Change> changes)
{
    // Backwards, children go before their parents, so that a parent is seldom left with any.
    std::for_each(changes.rbegin(), changes.rend(), [&configuration](const Change &change) {
        if (!change.after) {
            clear_value(configuration, change.parts);
        }
    });
    for (const Change &change : changes) {
        if (change.after) {
            configuration.set(change.parts, *change.after);
        }
    }
    return configuration;
}

} // namespace ovhost
