#pragma once
// The daemon's configuration as a whole: the durable store, the engine with its modules, and the
// one candidate that all clients edit. requests.h lets clients at it.

#include "host/commit/candidate.h"
#include "host/commit/engine.h"
#include "host/framework/objects.h"
#include "host/mgmtd/confirmations.h"
#include "host/mgmtd/module_set.h"
#include "host/store/store.h"

#include <cstdint>
#include <filesystem>
#include <string>

namespace ovhost
{

class Configuration
{
  public:
    /// Opens the store and takes up what it holds. Throws StoreError.
    explicit Configuration(const std::filesystem::path &state_dir,
                           const HistoryBounds &history = {});
    ~Configuration();
    Configuration(const Configuration &) = delete;
    Configuration &operator=(const Configuration &) = delete;

    /// Builds the first configuration when the store is empty, and brings what follows the
    /// configuration (model information, tunnels, limits file) up to date. Commits that were not
    /// confirmed in time are undone. Throws std::runtime_error when there is no configuration to
    /// run with.
    void start();

    [[nodiscard]] const Tree &running() const { return engine_.running(); }

    /// The configuration in force, for the library's questions.
    [[nodiscard]] const mdb_db *running_db();

    [[nodiscard]] Candidate &candidate() { return candidate_; }

    [[nodiscard]] CheckReport check() { return engine_.check(candidate_); }
    [[nodiscard]] CommitReport commit(const CommitNote &note);

    /// Commits the configuration as it was after a commit (see past.h for which). The candidate
    /// keeps its edits. Throws StoreError.
    [[nodiscard]] CommitReport rollback(std::uint64_t number, CommitNote note);

    /// Confirms the commits that wait for it; false when none does. Throws StoreError.
    bool confirm() { return confirmations_.confirm(); }

    /// Undoes commits that were not confirmed in time. The candidate keeps its edits.
    void undo_if_due();
    void discard() { candidate_.discard(running()); }

    [[nodiscard]] std::uint64_t commit_number() const { return store_.commit_number(); }

    /// The history of commits.
    [[nodiscard]] const Store &store() const { return store_; }
    [[nodiscard]] const Confirmations &confirmations() const { return confirmations_; }

    /// See past.h.
    [[nodiscard]] std::uint64_t oldest_known_commit() const;
    [[nodiscard]] Tree after(std::uint64_t commit) const;

    /// Tunnel IDs that were freed a short time ago.
    [[nodiscard]] const HeldIds &held_ids() const { return modules_.held_ids(); }

  private:
    void start_modules(const Tree &configuration);
    void commit_first();

    Store store_;
    StoreAdapter adapter_;
    ModuleSet modules_;
    CommitEngine engine_;
    Confirmations confirmations_{store_, engine_};
    Candidate candidate_;
    mdb_db running_db_;
};

} // namespace ovhost
