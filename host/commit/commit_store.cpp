#include "host/commit/commit_store.h"

#include "host/tree/name.h"

#include <optional>
#include <string>
#include <utility>

namespace ovhost
{

void StoreAdapter::load(const std::function<void(StoredNode &&)> &take) const
{
    store_.load(take);
}

std::uint64_t StoreAdapter::commit(std::span<const StoredChange> changes, const CommitNote &note)
{
    return store_.commit(changes, note);
}

Tree load_tree(const CommitStore &store)
{
    Tree tree;
    store.load([&tree](StoredNode &&node) {
        const std::optional<std::vector<std::string>> parts = split_name(node.name);
        if (!parts || parts->empty()) {
            throw StoreError("the store holds a value under '" + node.name +
                             "', which is not a node name: restore the store from a backup");
        }
        tree.set(*parts, Value{node.type, std::move(node.text)});
    });
    return tree;
}

std::vector<StoredChange> stored_changes(const std::vector<Change> &changes)
{
    std::vector<StoredChange> stored;
    stored.reserve(changes.size());
    for (const Change &change : changes) {
        StoredChange &target = stored.emplace_back(StoredChange{join_name(change.parts), {}});
        if (change.after) {
            target.after = StoredValue{change.after->type, change.after->text};
        }
    }
    return stored;
}

} // namespace ovhost
