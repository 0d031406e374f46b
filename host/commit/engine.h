#pragma once
// The commit engine: the running configuration, and the one road by which it changes.
//
//   1. list the changes: what differs between the running configuration and the candidate
//   2. checks: every module checks every change that concerns it; all refusals are collected
//   3. amendments: what the checks have written is type-checked, listed and checked in its turn
//   4. store: the changes become durable
//   5. switch: the new configuration is the running one
//   6. apply: modules bring their own state in line
//   7. notify: modules tell peers
//
// Up to the end of step 4 nothing has happened that outlives the commit: a refusal or a failing
// store leaves the running configuration, the store, the modules and the candidate as they were.
// From there on the commit stands whatever modules do: it is durable, and a module that fails to
// follow it now would fail to follow it after a restart as well, so going back would hide its
// fault and undo a change that was accepted. The client gets a warning instead.
//
// candidate.h is where edits gather, module.h what takes part, report.h what comes of it;
// commit_store.h is the durable side.

#include "host/commit/candidate.h"
#include "host/commit/commit_store.h"
#include "host/commit/module.h"
#include "host/commit/report.h"
#include "host/commit/transaction.h"

#include <string>
#include <vector>

namespace ovhost
{

class CommitEngine
{
  public:
    /// The store outlives the engine. The running configuration is empty until load().
    explicit CommitEngine(CommitStore &store) : store_(store) {}

    /// Modules are called in the order in which they are added, and outlive the engine. Throws
    /// std::invalid_argument for a name that is empty or taken, and for a pattern that is none.
    void add_module(Module &module);

    /// Makes the stored configuration the running one; modules are not called. Throws StoreError.
    void load();

    /// Starts every module on the running configuration. What a module throws passes.
    void start_modules();

    [[nodiscard]] const Tree &running() const { return running_; }

    /// A dry run: what a commit of the candidate would do. Runs the checks, then throws away what
    /// they have written.
    [[nodiscard]] CheckReport check(const Candidate &candidate);

    /// Commits the candidate. When it is accepted the candidate equals the running configuration,
    /// amendments included; otherwise it keeps its edits. The note goes to the store, its comment
    /// to the log as well. Throws std::logic_error when a module calls it, or check(), from inside
    /// a commit.
    [[nodiscard]] CommitReport commit(Candidate &candidate, const CommitNote &note);

    /// The first commit, on an empty running configuration: defaults come in by the same road as
    /// everything after them. Throws std::logic_error when there is a configuration already.
    [[nodiscard]] CommitReport initial(Candidate &candidate, const CommitNote &note);

  private:
    /// Steps 4 to 7 of an accepted transaction.
    void put_in_force(Transaction &transaction, const CommitNote &note, CommitReport &report);

    /// Step 4; false when the store has failed.
    [[nodiscard]] bool store(const Transaction &transaction, const CommitNote &note,
                             CommitReport &report);

    CommitStore &store_;
    std::vector<RegisteredModule> modules_;
    Tree running_;
    bool busy_ = false;
};

} // namespace ovhost
