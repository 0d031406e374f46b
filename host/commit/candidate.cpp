#include "host/commit/candidate.h"

#include "host/commit/patch.h"
#include "host/tree/name.h"
#include "host/tree/value_type.h"

#include <utility>

namespace ovhost
{

namespace
{

using Parts = std::vector<std::string>;
using Fault = std::optional<std::string>;

/// The root holds no value, and removing it would remove everything: no edit is about it.
std::optional<Parts> split_node_name(const std::string &name)
{
    std::optional<Parts> parts = split_name(name);
    return parts && !parts->empty() ? std::move(parts) : std::nullopt;
}

std::string bad_name_message(const std::string &name)
{
    return "\"" + name +
           "\" is not the name of a node: a name is /PART/PART, with \"\\/\" for a slash inside a "
           "part";
}

Fault set_in(Tree &tree, const std::string &name, bn_type type, const std::string &text)
{
    const std::optional<Parts> parts = split_node_name(name);
    if (!parts) {
        return bad_name_message(name);
    }
    if (const std::optional<std::string> reason = value_fault(type, text)) {
        return describe_fault(name, type, text, *reason);
    }
    tree.set(*parts, Value{type, text});
    return std::nullopt;
}

/// Applies one edit of a load.
Fault apply_edit(Tree &tree, const Edit &edit)
{
    if (!edit.erase) {
        return set_in(tree, edit.name, edit.type, edit.text);
    }
    const std::optional<Parts> parts = split_node_name(edit.name);
    if (!parts) {
        return bad_name_message(edit.name);
    }
    tree.erase(*parts);
    return std::nullopt;
}

} // namespace

Candidate::Candidate(Tree running) : base_(running), tree_(std::move(running)) {}

Fault Candidate::set(const std::string &name, bn_type type, const std::string &text)
{
    return set_in(tree_, name, type, text);
}

Fault Candidate::erase(const std::string &name)
{
    const std::optional<Parts> parts = split_node_name(name);
    if (!parts) {
        return bad_name_message(name);
    }
    if (!tree_.erase(*parts)) {
        return "there is no node " + name + " to delete";
    }
    return std::nullopt;
}

std::vector<std::string> Candidate::load(std::span<const Edit> edits)
{
    std::vector<std::string> faults;
    Tree edited = tree_;
    for (const Edit &edit : edits) {
        if (Fault fault = apply_edit(edited, edit)) {
            faults.push_back(*std::move(fault));
        }
    }
    if (faults.empty()) {
        tree_ = std::move(edited);
    }
    return faults;
}

void Candidate::discard(Tree running) noexcept
{
    base_ = running;
    tree_ = std::move(running);
}

void Candidate::rebase(Tree running)
{
    tree_ = over(running);
    base_ = std::move(running);
}

Tree Candidate::over(const Tree &running) const
{
    if (diff(base_, running).empty()) {
        return tree_;
    }
    return with_changes(running, diff(base_, tree_));
}

std::vector<Change> Candidate::pending(const Tree &running) const
{
    return diff(running, over(running));
}

} // namespace ovhost
