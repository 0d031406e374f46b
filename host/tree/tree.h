#pragma once
// The configuration tree: an immutable snapshot of named, typed nodes. Names are taken apart by
// name.h; what a value of a type may look like is value_type.h; diff.h lists what differs.
//
// A Tree is a cheap handle. Copies share structure; set() and erase() on one copy leave every other
// copy as it was, so that a commit's old and new databases are two handles and a reader never sees
// half a commit.

#include "framework/bnode.h"

#include <cstddef>
#include <functional>
#include <memory>
#include <span>
#include <string>
#include <vector>

namespace ovhost {

class NamePattern;

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
    void visit(const Visitor &visitor, Parts below = {}) const;

    /// Number of nodes that hold a value.
    [[nodiscard]] std::size_t size() const;

    /// Writes a node's value; missing parents come into being without one.
    void set(Parts name, Value value);

    /// Removes a node and everything below it; parents that hold no value and have lost their last
    /// child go with it. False when there was no such node.
    bool erase(Parts name);

  private:
    struct Node;
    friend struct TreeDiff;
    std::shared_ptr<const Node> root_;
};

} // namespace ovhost
