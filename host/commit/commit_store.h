#pragma once
// Where commits become durable, as far as the engine (engine.h) cares. StoreAdapter makes the
// daemon's store (store.h) one; tests have others, which fail when told to.

#include "host/store/store.h"
#include "host/tree/diff.h"
#include "host/tree/tree.h"

#include <cstdint>
#include <functional>
#include <span>
#include <vector>

namespace ovhost
{

class CommitStore
{
  public:
    virtual ~CommitStore() = default;

    /// Hands out every node. Throws StoreError.
    virtual void load(const std::function<void(StoredNode &&)> &take) const = 0;

    /// Stores one commit with its record, all of it or nothing, and answers its number. Throws
    /// StoreError; then the store is as it was.
    virtual std::uint64_t commit(std::span<const StoredChange> changes, const CommitNote &note) = 0;
};

class StoreAdapter : public CommitStore
{
  public:
    /// The store outlives the adapter.
    explicit StoreAdapter(Store &store) : store_(store) {}

    void load(const std::function<void(StoredNode &&)> &take) const override;
    std::uint64_t commit(std::span<const StoredChange> changes, const CommitNote &note) override;

  private:
    Store &store_;
};

/// The configuration in the store. Throws StoreError, also for a node whose name is none.
[[nodiscard]] Tree load_tree(const CommitStore &store);

/// The changes of a commit as the store takes them.
[[nodiscard]] std::vector<StoredChange> stored_changes(const std::vector<Change> &changes);

} // namespace ovhost
