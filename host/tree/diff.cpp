#include "host/tree/diff.h"

#include "host/tree/name.h"
#include "host/tree/node.h"

namespace ovhost
{

namespace
{

/// The names between two others, which do not belong to it; null leaves that end open.
struct NameRange {
    const std::string *low = nullptr;
    const std::string *high = nullptr;
};

/// The highest of the siblings in a range. Those below it that lie outside the range are passed
/// over when their turn comes.
const TreeNode *highest_within(const TreeNode *siblings, NameRange range)
{
    const TreeNode *node = siblings;
    while (node != nullptr) {
        if (range.low != nullptr && compare_components(node->name, *range.low) <= 0) {
            node = node->right.get();
        } else if (range.high != nullptr && compare_components(node->name, *range.high) >= 0) {
            node = node->left.get();
        } else {
            break;
        }
    }
    return node;
}

std::optional<Value> value_of(const TreeNode *node)
{
    return node != nullptr ? node->value : std::nullopt;
}

class Comparison
{
  public:
    /// Compares a node that at least one side holds with the other side's node of the same name.
    void nodes(const TreeNode *before, const TreeNode *after)
    {
        std::optional<Value> old_value = value_of(before);
        std::optional<Value> new_value = value_of(after);
        if (old_value != new_value) {
            changes.push_back({name_, std::move(old_value), std::move(new_value)});
        }
        siblings(before != nullptr ? before->children.get() : nullptr,
                 after != nullptr ? after->children.get() : nullptr, {});
    }

    std::vector<Change> changes;

  private:
    /// Compares two sets of siblings as far as they lie in a range. The shape of a set follows from
    /// its names, so a name that both hold is the highest of both at the same point of the descent;
    /// a higher one is a name that the other side lacks.
    void siblings(const TreeNode *before, const TreeNode *after, NameRange range)
    {
        before = highest_within(before, range);
        after = highest_within(after, range);
        if (before == after) {
            return;
        }
        const bool in_before =
            before != nullptr && (after == nullptr || !outranks(*after, *before));
        const bool in_after = after != nullptr && (before == nullptr || !outranks(*before, *after));
        const std::string &name = in_before ? before->name : after->name;

        siblings(in_before ? before->left.get() : before, in_after ? after->left.get() : after,
                 {range.low, &name});
        name_.push_back(name);
        nodes(in_before ? before : nullptr, in_after ? after : nullptr);
        name_.pop_back();
        siblings(in_before ? before->right.get() : before, in_after ? after->right.get() : after,
                 {&name, range.high});
    }

    std::vector<std::string> name_;
};

} // namespace

std::vector<Change> diff(const Tree &before, const Tree &after)
{
    if (before.root_ == after.root_) {
        return {};
    }
    Comparison comparison;
    comparison.nodes(before.root_.get(), after.root_.get());
    return std::move(comparison.changes);
}

} // namespace ovhost
