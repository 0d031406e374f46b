#include "host/tree/node.h"

#include "host/tree/name.h"

#include <functional>
#include <utility>

namespace ovhost
{

namespace
{

std::size_t rank_of(const std::string &name)
{
    return std::hash<std::string>()(name);
}

bool stands_above(std::size_t rank, const std::string &name, const TreeNode &other)
{
    return rank != other.rank ? rank > other.rank : name < other.name;
}

/// Parts siblings in those before and those after a name that is not among them.
void split(NodeLink siblings, const std::string &name, NodeLink &before, NodeLink &after)
{
    if (!siblings) {
        before = nullptr;
        after = nullptr;
        return;
    }
    TreeNode &node = own(siblings);
    if (compare_components(node.name, name) < 0) {
        split(std::move(node.right), name, node.right, after);
        node.count_values();
        before = std::move(siblings);
    } else {
        split(std::move(node.left), name, before, node.left);
        node.count_values();
        after = std::move(siblings);
    }
}

/// Joins two sets of siblings of which all of the first stand before all of the second.
NodeLink merge(NodeLink before, NodeLink after)
{
    if (!before) {
        return after;
    }
    if (!after) {
        return before;
    }
    if (outranks(*before, *after)) {
        TreeNode &top = own(before);
        top.right = merge(std::move(top.right), std::move(after));
        top.count_values();
        return before;
    }
    TreeNode &top = own(after);
    top.left = merge(std::move(before), std::move(top.left));
    top.count_values();
    return after;
}

} // namespace

std::size_t TreeNode::own_values() const
{
    return values - count_of(left) - count_of(right);
}

void TreeNode::count_values()
{
    values = (value ? 1U : 0U) + count_of(children) + count_of(left) + count_of(right);
}

TreeNode &own(NodeLink &link)
{
    if (link.use_count() != 1) {
        link = std::make_shared<TreeNode>(*link);
    }
    return *link;
}

NodeLink make_node(const std::string &name)
{
    auto node = std::make_shared<TreeNode>();
    node->name = name;
    node->rank = rank_of(name);
    return node;
}

bool outranks(const TreeNode &left, const TreeNode &right)
{
    return stands_above(left.rank, left.name, right);
}

const TreeNode *find_sibling(const TreeNode *siblings, const std::string &name)
{
    const TreeNode *node = siblings;
    while (node != nullptr) {
        const auto order = compare_components(name, node->name);
        if (order == 0) {
            return node;
        }
        node = order < 0 ? node->left.get() : node->right.get();
    }
    return nullptr;
}

TreeNode &obtain_sibling(NodeLink &siblings, const std::string &name, std::ptrdiff_t change)
{
    const auto more_values = static_cast<std::size_t>(change);
    const std::size_t rank = rank_of(name);
    NodeLink *place = &siblings;
    while (*place && !stands_above(rank, name, **place)) {
        TreeNode &node = own(*place);
        node.values += more_values;
        const auto order = compare_components(name, node.name);
        if (order == 0) {
            return node;
        }
        place = order < 0 ? &node.left : &node.right;
    }
    NodeLink added = make_node(name);
    split(std::move(*place), name, added->left, added->right);
    added->count_values();
    added->values += more_values;
    *place = std::move(added);
    return **place;
}

void remove_sibling(NodeLink &siblings, const std::string &name)
{
    const std::size_t fewer_values = find_sibling(siblings.get(), name)->own_values();
    NodeLink *place = &siblings;
    while ((*place)->name != name) {
        TreeNode &node = own(*place);
        node.values -= fewer_values;
        place = compare_components(name, node.name) < 0 ? &node.left : &node.right;
    }
    NodeLink removed = std::move(*place);
    TreeNode &node = own(removed);
    *place = merge(std::move(node.left), std::move(node.right));
}

} // namespace ovhost
