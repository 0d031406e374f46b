#pragma once
// The durable store: the configuration as it was last committed and the history that led to it,
// in an SQLite database (config.db) of the state directory. It knows nodes only as name, type and
// text; the commit engine hands it the changes of each commit and loads all nodes at start.
// Neighbours: commit_record.h is what is kept of a commit, state_dir.h keeps other daemons out,
// database_file.h judges the file.

#include "host/store/commit_record.h"
#include "host/store/store_error.h"

#include <cstdint>
#include <filesystem>
#include <functional>
#include <memory>
#include <optional>
#include <span>
#include <string>
#include <vector>

namespace ovhost
{

struct StoredNode {
    std::string name;
    std::uint32_t type = 0;
    std::string text;
};

struct StoredChange {
    std::string name;
    std::optional<StoredValue> after; // none: the node is removed
};

/// Belongs to one thread at a time.
class Store
{
  public:
    /// Opens the store of this directory, or makes an empty one. The directory is made when only
    /// its last component is missing, and is held until the store's end. Throws StoreError; what
    /// was found and refused is left as it is.
    [[nodiscard]] static Store open(const std::filesystem::path &state_dir,
                                    const HistoryBounds &bounds = {});

    Store(Store &&other) noexcept;
    Store &operator=(Store &&other) noexcept;
    ~Store();

    /// Whether no commit was ever stored.
    [[nodiscard]] bool empty() const noexcept { return commit_number() == 0; }

    /// The number of the last stored commit; the first is 1.
    [[nodiscard]] std::uint64_t commit_number() const noexcept;

    /// Hands out every node, in the byte order of the names. Throws StoreError.
    void load(const std::function<void(StoredNode &&)> &take) const;

    /// Stores one commit with its record, all of it or nothing, and answers its number. When it
    /// returns, the commit is on the disk. The changes count in their order; removing a node that
    /// is not there is no error. Throws StoreError: then the store is as it was, and can be used
    /// on.
    std::uint64_t commit(std::span<const StoredChange> changes, const CommitNote &note = {});

    /// The last commits, the newest first. This and what follows throw StoreError.
    [[nodiscard]] std::vector<RecordedCommit> history(std::uint64_t limit) const;

    /// A commit's record; none when it is not in the history.
    [[nodiscard]] std::optional<RecordedCommit> recorded(std::uint64_t number) const;

    /// The number of the oldest commit in the history; 0 when there are none.
    [[nodiscard]] std::uint64_t oldest_recorded() const;

    /// What a recorded commit changed.
    [[nodiscard]] std::vector<RecordedChange> changes_of(std::uint64_t number) const;

    /// Hands out what was changed after a commit, the last change first.
    void visit_back_to(std::uint64_t number,
                       const std::function<void(RecordedChange &&)> &take) const;

    /// The commit that is going to be undone, if the last one is.
    [[nodiscard]] const std::optional<Wait> &wait() const noexcept;

    /// Ends the wait without another commit, which leaves the nodes as they are.
    void end_wait(Confirmation as);

    /// Waits anew, from `now` on for so many seconds.
    void prolong_wait(std::int64_t now, std::uint32_t seconds);

    /// Records why the waiting commits could not be undone.
    void note_undo_refusal(const std::string &why);

  private:
    struct Parts;

    explicit Store(std::unique_ptr<Parts> parts) noexcept;

    std::unique_ptr<Parts> parts_;
};

} // namespace ovhost
