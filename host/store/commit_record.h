#pragma once
// What the store keeps of each commit beside the configuration it leads to: who made it, when and
// why, what it changed, and whether it still waits for its confirmation. store.h hands it out.

#include <cstdint>
#include <optional>
#include <string>

namespace ovhost
{

struct StoredValue {
    std::uint32_t type = 0;
    std::string text;

    bool operator==(const StoredValue &) const = default;
};

/// What is known of a commit before it is stored.
struct CommitNote {
    std::int64_t time = 0;            // seconds since 1970
    std::optional<std::uint32_t> uid; // none: the daemon itself
    std::string author;
    std::string comment;
    std::optional<std::uint64_t> rollback_to; // the commit whose configuration it brings back
    /// The commit waits so many seconds for its confirmation. Without it, it ends the wait of the
    /// commits before it: by undoing them, or else by confirming them.
    std::optional<std::uint32_t> confirm_within;
    bool undoes_wait = false;
};

enum class Confirmation {
    none,      // was in force for good at once
    waiting,   // is going to be undone
    confirmed, // was confirmed, by a request or by a later commit
    undone     // was undone by a later commit, or by none when nothing was left to undo
};

struct RecordedCommit {
    std::uint64_t number = 0;
    std::int64_t time = 0;
    std::optional<std::uint32_t> uid;
    std::string author;
    std::string comment;
    std::optional<std::uint64_t> rollback_to;
    std::uint64_t changes = 0;
    Confirmation confirmation = Confirmation::none;
    std::optional<std::uint64_t> ended_by; // the commit that confirmed or undid it
    std::string undo_refusal;              // why the last try to undo it failed; it may be empty
};

struct RecordedChange {
    std::string name;
    std::optional<StoredValue> before; // none: the node was added
    std::optional<StoredValue> after;  // none: the node was removed

    bool operator==(const RecordedChange &) const = default;
};

/// The last commit is to be undone unless it is confirmed in time, and with it all commits after
/// `back_to`: each of them was stored while the one before it was waiting.
struct Wait {
    std::uint64_t number = 0;
    std::uint64_t back_to = 0;
    std::int64_t deadline = 0; // seconds since 1970
    std::uint32_t seconds = 0; // from the commit to the deadline

    bool operator==(const Wait &) const = default;
};

/// How much history is kept. The oldest commits go first; the newest stays whatever its size, and
/// so does what a waiting commit needs to be undone.
struct HistoryBounds {
    std::uint64_t commits = 1000;
    std::uint64_t bytes = std::uint64_t{256} << 20; // of names and values
};

} // namespace ovhost
