#include "host/tree/tree.h"

#include "host/tree/name.h"
#include "host/tree/node.h"

#include <cstddef>
#include <optional>
#include <stdexcept>
#include <utility>

namespace ovhost
{

namespace
{

using Parts = Tree::Parts;

bool has_several_children(const TreeNode &node)
{
    return node.children && (node.children->left || node.children->right);
}

/// What goes when the node `name` goes: the node itself or, of the parents that would be left
/// without value and child, the highest. Nothing when there is no such node.
std::optional<Parts> name_to_remove(const TreeNode *root, Parts name)
{
    std::size_t kept = 0;
    const TreeNode *node = root;
    for (std::size_t depth = 0; node != nullptr && depth < name.size(); ++depth) {
        if (node->value || has_several_children(*node)) {
            kept = depth;
        }
        node = find_sibling(node->children.get(), name[depth]);
    }
    return node != nullptr ? std::optional(name.first(kept + 1)) : std::nullopt;
}

class PatternWalk
{
  public:
    explicit PatternWalk(std::span<const NamePattern::Part> parts) : parts_(parts) {}

    void walk(const TreeNode *node, std::size_t depth)
    {
        if (depth == parts_.size()) {
            found.push_back(depth == 0 ? "/" : name_);
            return;
        }
        const TreeNode *children = node != nullptr ? node->children.get() : nullptr;
        if (!parts_[depth]) {
            for_each_sibling(children, [&](const TreeNode &child) { enter(child, depth); });
        } else if (const TreeNode *child = find_sibling(children, *parts_[depth])) {
            enter(*child, depth);
        }
    }

    std::vector<std::string> found;

  private:
    void enter(const TreeNode &child, std::size_t depth)
    {
        const std::size_t parent_length = name_.size();
        name_ += '/';
        name_ += escape_component(child.name);
        walk(&child, depth + 1);
        name_.resize(parent_length);
    }

    std::span<const NamePattern::Part> parts_;
    std::string name_;
};

void visit_below(const TreeNode &node, std::vector<std::string> &name, const Tree::Visitor &visitor)
{
    if (node.value) {
        visitor(name, *node.value);
    }
    for_each_sibling(node.children.get(), [&](const TreeNode &child) {
        name.push_back(child.name);
        visit_below(child, name, visitor);
        name.pop_back();
    });
}

} // namespace

const TreeNode *Tree::find(Parts name) const
{
    const TreeNode *node = root_.get();
    for (auto part = name.begin(); node != nullptr && part != name.end(); ++part) {
        node = find_sibling(node->children.get(), *part);
    }
    return node;
}

const Value *Tree::value(Parts name) const
{
    const TreeNode *node = find(name);
    return node != nullptr ? node->value_or_null() : nullptr;
}

bool Tree::exists(Parts name) const
{
    return name.empty() || find(name) != nullptr;
}

std::vector<std::string> Tree::children(Parts name) const
{
    std::vector<std::string> names;
    if (const TreeNode *node = find(name)) {
        for_each_sibling(node->children.get(),
                         [&names](const TreeNode &child) { names.push_back(child.name); });
    }
    return names;
}

std::vector<std::string> Tree::matching(const NamePattern &pattern) const
{
    PatternWalk walk(pattern.parts());
    walk.walk(root_.get(), 0);
    return std::move(walk.found);
}

void Tree::visit(const Visitor &visitor, Parts below) const
{
    const Tree unchanged = *this;
    if (const TreeNode *node = unchanged.find(below)) {
        std::vector<std::string> name(below.begin(), below.end());
        visit_below(*node, name, visitor);
    }
}

std::size_t Tree::size() const
{
    return count_of(root_);
}

void Tree::set(Parts name, Value value)
{
    if (!is_valid_name(name)) {
        throw std::invalid_argument("not a node name: " + join_name(name));
    }
    const Value *held = this->value(name);
    if (held != nullptr && *held == value) {
        return;
    }
    const std::ptrdiff_t change = held == nullptr ? 1 : 0;
    if (!root_) {
        root_ = make_node({});
    }
    TreeNode *node = &own(root_);
    node->values += static_cast<std::size_t>(change);
    for (const std::string &part : name) {
        node = &obtain_sibling(node->children, part, change);
    }
    node->value = std::move(value);
}

bool Tree::erase(Parts name)
{
    if (name.empty()) {
        return std::exchange(root_, nullptr) != nullptr;
    }
    const std::optional<Parts> removed = name_to_remove(root_.get(), name);
    if (!removed) {
        return false;
    }
    const std::size_t fewer_values = find(*removed)->own_values();
    if (fewer_values == size()) {
        root_.reset();
        return true;
    }
    TreeNode *parent = &own(root_);
    parent->values -= fewer_values;
    for (const std::string &part : removed->first(removed->size() - 1)) {
        parent =
            &obtain_sibling(parent->children, part, -static_cast<std::ptrdiff_t>(fewer_values));
    }
    remove_sibling(parent->children, removed->back());
    return true;
}

} // namespace ovhost
