#pragma once
// Commits on trial: each is undone by itself unless it is confirmed in time, by request or by
// another commit. The store keeps the wait, so that it outlives the daemon; undo_timer.h wakes the
// daemon up.

#include "host/commit/candidate.h"
#include "host/commit/engine.h"
#include "host/store/store.h"

#include <chrono>
#include <optional>
#include <string>

namespace ovhost
{

class Confirmations
{
  public:
    using Clock = std::chrono::steady_clock;

    /// What is refused now may be possible later: a tunnel's ID is held back for a minute.
    static constexpr std::chrono::seconds retry_interval{10};

    /// Both outlive the object.
    Confirmations(Store &store, CommitEngine &engine) : store_(store), engine_(engine) {}

    /// Takes up the wait that an earlier run has left. The time that the daemon was away counts by
    /// the system's clock, of which no step makes the wait longer than it was to be.
    void take_up();

    /// A commit of the engine. When it is accepted and does not wait itself, those before it need
    /// not wait any more, even if it changes nothing; when it does wait, they wait as long as it.
    [[nodiscard]] CommitReport commit(Candidate &candidate, const CommitNote &note);

    /// Confirms what waits; false when nothing does. Throws StoreError.
    [[nodiscard]] bool confirm();

    /// How long it is until something is to be undone; nothing when nothing is.
    [[nodiscard]] std::optional<std::chrono::milliseconds> time_left() const;

    /// Why the last try to undo has failed; empty when there was none.
    [[nodiscard]] const std::string &undo_refusal() const { return refusal_; }

    /// Undoes what was not confirmed in time, by a commit that is checked like any other. While
    /// that is refused it is tried again and again; log and history tell why. Answers whether the
    /// configuration has changed.
    [[nodiscard]] bool undo_if_due();

  private:
    /// Sets the deadline anew when the store's wait is another one.
    void follow();
    [[nodiscard]] CommitReport undo(const Wait &wait);
    void settle_unchanged(const CommitNote &note);
    void put_off(const Wait &wait, const std::string &why);

    Store &store_;
    CommitEngine &engine_;
    std::optional<Wait> wait_;
    Clock::time_point due_;
    std::string refusal_;
};

/// The time as commits are recorded with it.
[[nodiscard]] std::int64_t commit_time();

/// A note for a commit of the daemon itself.
[[nodiscard]] CommitNote daemon_note(const std::string &comment);

} // namespace ovhost
