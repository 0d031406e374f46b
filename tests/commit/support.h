#pragma once
// What the commit engine's tests share: modules that do as they are told, a store that fails when
// told to, and configurations as plain maps.

#include "host/commit/commit_store.h"
#include "host/commit/engine.h"
#include "host/commit/module.h"
#include "host/framework/objects.h"
#include "host/tree/tree.h"
#include "tests/framework/log_capture.h"

#include <functional>
#include <map>
#include <optional>
#include <string>
#include <utility>
#include <vector>

namespace commit_test
{

using ovhost::test::LogCapture;

/// A configuration: full names with their texts.
using Config = std::map<std::string, std::string>;

[[nodiscard]] std::vector<std::string> parts_of(const std::string &name);
[[nodiscard]] Config config_of(const ovhost::Tree &tree);

/// A tree whose values are all strings.
[[nodiscard]] ovhost::Tree tree_of(const Config &config);

/// The value of a node in a database, by the host operation that modules use.
[[nodiscard]] std::optional<std::string> read(const mdb_db *db, const std::string &name);

/// Writes a string node through the host operation, as modules do.
int write(const md_dbinfo *info, const std::string &name, const std::string &text);
int remove(const md_dbinfo *info, const std::string &name);

/// "add /a", "modify /a", "delete /a" for each change.
[[nodiscard]] std::vector<std::string> described(const mdb_db_change_array *changes);
[[nodiscard]] std::string described(const mdb_db_change *change);

/// Does what its functions say, and nothing where there is none.
class ScriptedModule : public ovhost::Module
{
  public:
    explicit ScriptedModule(std::string name, std::vector<std::string> patterns = {});

    [[nodiscard]] std::string name() const override { return name_; }
    [[nodiscard]] std::vector<std::string> patterns() const override { return patterns_; }
    void start(const mdb_db *running) override;
    int check_change(md_dbinfo *info, mdb_db_change *change) override;
    int check_commit(md_dbinfo *info, const mdb_db_change_array *changes) override;
    int apply(const md_dbinfo *info, const mdb_db_change_array *changes) override;
    void notify(const mdb_db_change_array *changes) override;

    std::function<void(const mdb_db *)> on_start;
    std::function<int(md_dbinfo *, mdb_db_change *)> on_change;
    std::function<int(md_dbinfo *, const mdb_db_change_array *)> on_commit;
    std::function<int(const md_dbinfo *, const mdb_db_change_array *)> on_apply;
    std::function<void(const mdb_db_change_array *)> on_notify;

    /// Where every call is noted, as "NAME PHASE WHAT"; null notes nothing.
    std::vector<std::string> *calls = nullptr;

  private:
    void note(const std::string &what);

    std::string name_;
    std::vector<std::string> patterns_;
};

/// Keeps commits in memory.
class MemoryStore : public ovhost::CommitStore
{
  public:
    void load(const std::function<void(ovhost::StoredNode &&)> &take) const override;
    std::uint64_t commit(std::span<const ovhost::StoredChange> changes,
                         const ovhost::CommitNote &note) override;

    [[nodiscard]] Config config() const;

    std::map<std::string, ovhost::StoredValue> nodes;
    /// Of the last commit.
    ovhost::CommitNote note;
    /// Thrown by every commit while it is set.
    std::optional<std::string> failure;
    unsigned commits = 0;
    unsigned attempts = 0;
    std::vector<std::string> *calls = nullptr;
};

/// An engine over a store in memory. What it logs goes nowhere else.
struct Bench {
    LogCapture log;
    MemoryStore store;
    ovhost::CommitEngine engine{store};

    /// Adds modules in order.
    explicit Bench(std::initializer_list<ovhost::Module *> modules = {});

    /// Makes a configuration the running one, without any module being asked.
    void start_with(const Config &config);

    /// A candidate with string nodes set, or erased where the text is missing.
    [[nodiscard]] ovhost::Candidate
    candidate(const std::vector<std::pair<std::string, std::optional<std::string>>> &edits) const;

    [[nodiscard]] Config running() const { return config_of(engine.running()); }
};

} // namespace commit_test
