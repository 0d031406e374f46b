#pragma once
// The configuration tree: an immutable snapshot of named, typed nodes. Names are taken apart by
// name.h; what a value of a type may look like is value_type.h; diff.h lists what differs.
//
// A Tree is a cheap handle. Copies share structure; set() and erase() on one copy leave every other
// copy as it was, so that a commit's old and new databases are two handles and a reader never sees
// half a commit. A change copies only the nodes on the way to it, and none at all when no other
// handle shares them. Handles that share structure belong to one thread.
//
// The node without a name, "/", always exists. Names are lists of unescaped components here.

#include "framework/bnode.h"

#include <cstddef>
#include <functional>
#include <memory>
#include <span>
#include <string>
#include <vector>

namespace ovhost
{

class NamePattern;
class Tree;
struct Change;
struct TreeNode;

[[nodiscard]] std::vector<Change> diff(const Tree &before, const Tree &after);

struct Value {
    bn_type type = 0;
    std::string text;

    bool operator==(const Value &) const = default;
};

class Tree
{
  public:
    using Parts = std::span<const std::string>;
    using Visitor = std::function<void(Parts, const Value &)>;

    Tree() = default;

    /// The value of a node; null when there is no such node or it holds no value (a node that
    /// exists only because something stands below it). Valid until this Tree is changed.
    [[nodiscard]] const Value *value(Parts name) const;

    /// Whether the node exists, with a value or only as the parent of others.
    [[nodiscard]] bool exists(Parts name) const;

    /// Names of the direct children (last component, not escaped) in the tree's order: names made
    /// of digits alone come first, in the order of their numbers; the others follow bytewise.
    [[nodiscard]] std::vector<std::string> children(Parts name) const;

    /// Full names (escaped) of all existing nodes that match, in the tree's order.
    [[nodiscard]] std::vector<std::string> matching(const NamePattern &pattern) const;

    /// Visits every node that holds a value at or below `below`, parents before children, in order.
    /// The visitor may change this tree; it goes on seeing the tree as it was.
    void visit(const Visitor &visitor, Parts below = {}) const;

    /// Number of nodes that hold a value.
    [[nodiscard]] std::size_t size() const;

    /// Writes a node's value; missing parents come into being without one. Throws
    /// std::invalid_argument when the components form no name (see is_valid_name()).
    void set(Parts name, Value value);

    /// Removes a node and everything below it; parents that hold no value and have lost their last
    /// child go with it. False when there was no such node. Erasing "/" empties the tree, and is
    /// false when it was empty.
    bool erase(Parts name);

  private:
    friend std::vector<Change> diff(const Tree &before, const Tree &after);

    [[nodiscard]] const TreeNode *find(Parts name) const;

    /// Null when the tree is empty.
    std::shared_ptr<TreeNode> root_;
};

} // namespace ovhost
