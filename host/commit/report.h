#pragma once
// What the client hears of a dry run or a commit. engine.h hands these out.

#include "host/commit/module.h"
#include "host/tree/diff.h"

#include <cstdint>
#include <string>
#include <vector>

namespace ovhost
{

/// Why a check says no. A commit may be refused by several checks; the client hears them all.
struct Refusal {
    /// The node that was checked; empty when the check was of the commit as a whole.
    std::string node;
    std::string module;
    int code = 0;
    /// Never empty.
    std::string message;

    bool operator==(const Refusal &) const = default;
};

/// Something a module did wrong that does not stop the commit.
struct Warning {
    std::string module;
    Phase phase = Phase::check;
    /// The code the module failed with; 0 when it has broken its duty and failed in nothing.
    int code = 0;
    std::string message;

    bool operator==(const Warning &) const = default;
};

/// The answer to a dry run.
struct CheckReport {
    /// What a commit would change, with what modules have added to it.
    std::vector<Change> changes;
    /// None: a commit would be accepted.
    std::vector<Refusal> refusals;
    std::vector<Warning> warnings;

    [[nodiscard]] bool accepted() const { return refusals.empty(); }
};

enum class CommitOutcome {
    unchanged, ///< there was nothing to commit, and nothing was stored
    committed, ///< stored and in force
    refused,   ///< refused by checks; nothing has changed
    not_stored ///< the store has failed; nothing has changed
};

/// The answer to a commit.
struct CommitReport {
    CommitOutcome outcome = CommitOutcome::unchanged;
    /// The number the store gave the commit; 0 when nothing was stored.
    std::uint64_t commit_number = 0;
    /// What the commit has changed, or was to change when it was refused or could not be stored.
    std::vector<Change> changes;
    std::vector<Refusal> refusals;
    std::vector<Warning> warnings;
    /// What the store says when the outcome is not_stored.
    std::string store_error;

    /// Whether the configuration in force is now the candidate's.
    [[nodiscard]] bool accepted() const
    {
        return outcome == CommitOutcome::unchanged || outcome == CommitOutcome::committed;
    }
};

} // namespace ovhost
