#pragma once
// The tables of the store that hold its history (commit_record.h), and the statements on them. The
// writing functions are steps of a transaction that store.h runs; all throw SqliteError.

#include "host/store/commit_record.h"
#include "host/store/sqlite.h"

#include <cstdint>
#include <functional>
#include <optional>
#include <vector>

namespace ovhost
{

struct StoredChange;

class HistoryTables
{
  public:
    HistoryTables(const SqliteConnection &db, const HistoryBounds &bounds);

    /// The steps of a commit, in this order: begin() once, record() for each change before it is
    /// made in the nodes, finish() once.
    void begin(std::uint64_t number);
    void record(const StoredChange &change);
    void finish(const CommitNote &note);

    /// Ends the wait of commits, if there is one. `by` is the commit that does it, if it is one.
    void end_wait(const std::optional<Wait> &wait, Confirmation as,
                  std::optional<std::uint64_t> by);
    void begin_wait(const Wait &wait);
    void note_refusal(const Wait &wait, const std::string &why);

    /// Removes what is over the bounds. `keep_after` is the last commit that may go.
    void prune(std::uint64_t keep_after);

    /// Makes all statements ready again after a failure.
    void reset() noexcept;

    [[nodiscard]] std::optional<Wait> wait() const;
    [[nodiscard]] std::vector<RecordedCommit> newest(std::uint64_t limit) const;
    [[nodiscard]] std::optional<RecordedCommit> find(std::uint64_t number) const;

    /// 0 when there are none.
    [[nodiscard]] std::uint64_t oldest() const;

    /// The changes of a commit, in their order.
    [[nodiscard]] std::vector<RecordedChange> changes_of(std::uint64_t number) const;

    /// Changes of all later commits, the last one first.
    void visit_back_to(std::uint64_t number,
                       const std::function<void(RecordedChange &&)> &take) const;

  private:
    [[nodiscard]] bool is_over(std::uint64_t oldest) const;

    const SqliteConnection &db_;
    HistoryBounds bounds_;
    Statement read_old_;
    Statement add_change_;
    Statement add_commit_;
    std::uint64_t number_ = 0;
    std::uint64_t changes_ = 0;
    std::uint64_t bytes_ = 0;
};

} // namespace ovhost
