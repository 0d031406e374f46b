#include "host/mgmtd/confirmations.h"

#include "framework/logging.h"
#include "host/commit/past.h"
#include "host/mgmtd/daemon_log.h"
#include "host/mgmtd/rollback_target.h"
#include "host/support/commit_range.h"

#include <algorithm>
#include <exception>
#include <utility>

namespace ovhost
{
namespace
{

std::string commits_of(const Wait &wait)
{
    return commit_range(wait.back_to, wait.number);
}

CommitReport not_stored(const std::exception &error)
{
    CommitReport report;
    report.outcome = CommitOutcome::not_stored;
    report.store_error = error.what();
    return report;
}

} // namespace

std::int64_t commit_time()
{
    return std::chrono::duration_cast<std::chrono::seconds>(
               std::chrono::system_clock::now().time_since_epoch())
        .count();
}

CommitNote daemon_note(const std::string &comment)
{
    CommitNote note;
    note.time = commit_time();
    note.author = "mgmtd";
    note.comment = comment;
    return note;
}

void Confirmations::follow()
{
    if (store_.wait() == wait_) {
        return;
    }
    wait_ = store_.wait();
    refusal_.clear();
    if (wait_) {
        due_ = Clock::now() + std::chrono::seconds(wait_->seconds);
    }
}

void Confirmations::take_up()
{
    follow();
    if (!wait_) {
        return;
    }
    const std::int64_t left =
        std::clamp<std::int64_t>(wait_->deadline - commit_time(), 0, wait_->seconds);
    due_ = Clock::now() + std::chrono::seconds(left);
    log_line(ov_log_notice, commits_of(*wait_) + " will be undone in " + std::to_string(left) +
                                " s unless confirmed");
}

CommitReport Confirmations::commit(Candidate &candidate, const CommitNote &note)
{
    CommitReport report = engine_.commit(candidate, note);
    if (report.outcome == CommitOutcome::unchanged) {
        try {
            settle_unchanged(note);
        } catch (const StoreError &error) {
            report = not_stored(error);
        }
    }
    follow();
    return report;
}

/// What the store does to the wait with a commit, for one that it does not see.
void Confirmations::settle_unchanged(const CommitNote &note)
{
    if (!store_.wait()) {
        return;
    }
    if (note.confirm_within) {
        store_.prolong_wait(note.time, *note.confirm_within);
    } else if (note.undoes_wait) {
        store_.end_wait(Confirmation::undone);
    } else {
        (void)confirm();
    }
}

bool Confirmations::confirm()
{
    if (!store_.wait()) {
        return false;
    }
    const Wait wait = *store_.wait();
    store_.end_wait(Confirmation::confirmed);
    follow();
    log_line(ov_log_notice, commit_range(wait.back_to, wait.number, "is", "are") + " confirmed");
    return true;
}

std::optional<std::chrono::milliseconds> Confirmations::time_left() const
{
    if (!wait_) {
        return std::nullopt;
    }
    using std::chrono::milliseconds;
    return std::max(std::chrono::ceil<milliseconds>(due_ - Clock::now()), milliseconds(0));
}

bool Confirmations::undo_if_due()
{
    if (!wait_ || Clock::now() < due_) {
        return false;
    }
    const Wait wait = *wait_;
    const CommitReport report = undo(wait);
    if (!report.accepted()) {
        put_off(wait, failure_text(report, "; "));
        return false;
    }
    for (const Warning &warning : report.warnings) {
        log_line(ov_log_warning, warning.message);
    }
    log_line(ov_log_warning, commit_range(wait.back_to, wait.number, "was", "were") +
                                 " not confirmed in time: the configuration is again as after "
                                 "commit " +
                                 std::to_string(wait.back_to));
    return true;
}

CommitReport Confirmations::undo(const Wait &wait)
{
    try {
        Candidate candidate(engine_.running());
        candidate.replace(rollback_target(
            configuration_after(store_, engine_.running(), wait.back_to), engine_.running()));
        CommitNote note = daemon_note("undo of " + commits_of(wait) + ", not confirmed in time");
        note.rollback_to = wait.back_to;
        note.undoes_wait = true;
        return commit(candidate, note);
    } catch (const std::exception &error) {
        // Called by a timer: there is nobody else to tell, and the next try may do.
        return not_stored(error);
    }
}

void Confirmations::put_off(const Wait &wait, const std::string &why)
{
    due_ = Clock::now() + retry_interval;
    if (why == refusal_) {
        return;
    }
    refusal_ = why;
    log_line(ov_log_error, commits_of(wait) + " cannot be undone: " + why +
                               "; trying again every " + std::to_string(retry_interval.count()) +
                               " s until it can be, or is confirmed, or there is another commit");
    try {
        store_.note_undo_refusal(why);
    } catch (const StoreError &error) {
        log_line(ov_log_error, error.what());
    }
}

} // namespace ovhost
