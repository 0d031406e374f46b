#pragma once
// The nodes of a tree and the shared, ordered sets of siblings they form. Private to tree.h, which
// finds its way through them by name, and diff.h, which compares them.
//
// The children of a node form a treap: a search tree ordered by name that is also a heap by a rank
// drawn from the name. The rank makes it balanced, and makes the shape follow from the names alone,
// so that two versions of one set differ in shape only where they differ in names. A change copies
// just the nodes on the way to it, 10,000 siblings or not, and everything else stays shared.
//
// A node is written only by way of own(), which copies it first if anybody else holds it too.

#include "host/tree/tree.h"

#include <compare>
#include <cstddef>
#include <memory>
#include <optional>
#include <string>

namespace ovhost
{

struct TreeNode;
using NodeLink = std::shared_ptr<TreeNode>;

struct TreeNode {
    std::string name;
    std::size_t rank = 0;
    std::optional<Value> value;
    NodeLink children;
    /// Siblings with smaller and with greater names, all of lower rank.
    NodeLink left;
    NodeLink right;
    /// Nodes that hold a value: this one, and all under `children`, `left` and `right`.
    std::size_t values = 0;

    [[nodiscard]] const Value *value_or_null() const { return value ? &*value : nullptr; }

    /// Values of this node and of what stands below it, without its siblings.
    [[nodiscard]] std::size_t own_values() const;

    /// Sets `values` from the value and the three links.
    void count_values();
};

[[nodiscard]] inline std::size_t count_of(const NodeLink &siblings)
{
    return siblings ? siblings->values : 0;
}

/// Makes the link's node this holder's alone, so that it may be written. When all the links on the
/// way to it were owned before, no other tree can see what is written.
TreeNode &own(NodeLink &link);

/// A node without a value, not yet among any siblings.
[[nodiscard]] NodeLink make_node(const std::string &name);

/// Whether the left node stands above the right one wherever both are siblings. Of two nodes
/// neither outranks the other only if they have the same name.
[[nodiscard]] bool outranks(const TreeNode &left, const TreeNode &right);

[[nodiscard]] const TreeNode *find_sibling(const TreeNode *siblings, const std::string &name);

/// Owns the way to the sibling of that name and hands it out, made anew if there was none. Adds
/// `change` to the counts on the way, the sibling's included: the caller is about to add or take
/// away as many values there.
TreeNode &obtain_sibling(NodeLink &siblings, const std::string &name, std::ptrdiff_t change);

/// Takes out the sibling of that name, which must be there, and all below it.
void remove_sibling(NodeLink &siblings, const std::string &name);

/// Calls visit(const TreeNode &) for each sibling in order.
template <typename Visit>
void for_each_sibling(const TreeNode *siblings, Visit &&visit)
{
    if (siblings == nullptr) {
        return;
    }
    for_each_sibling(siblings->left.get(), visit);
    visit(*siblings);
    for_each_sibling(siblings->right.get(), visit);
}

} // namespace ovhost
