// Random commits against a model of what must come of them. Modules refuse, amend, fail and break
// their duties; the store fails. After every commit the running configuration, the store, the
// modules' own state and the candidate are what the model says, whatever went wrong.
#include "framework/md_commit.h"
#include "tests/commit/support.h"
#include "tests/support/scratch_dir.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <filesystem>
#include <random>
#include <stdexcept>

using commit_test::Config;
using commit_test::config_of;
using commit_test::ScriptedModule;
using ovhost::Candidate;
using ovhost::CommitOutcome;
using ovhost::CommitReport;

namespace
{

constexpr std::size_t max_sources = 5;

/// What the misbehaving module does in one commit.
enum class Mischief {
    none,
    refuse,
    fail_check,
    throw_in_check,
    write_bad_value,
    keep_amending,
    write_old_database,
    write_in_apply,
    refuse_in_apply,
    fail_apply,
    throw_in_apply,
    throw_in_notify,
};
constexpr int mischief_count = 12;

bool is_refusal(Mischief mischief)
{
    return mischief >= Mischief::refuse && mischief <= Mischief::keep_amending;
}

bool is_warning(Mischief mischief)
{
    return mischief >= Mischief::write_old_database;
}

/// A store of the test's choice that fails when told to.
class FailingStore : public ovhost::CommitStore
{
  public:
    explicit FailingStore(ovhost::CommitStore &inner) : inner_(inner) {}

    void load(const std::function<void(ovhost::StoredNode &&)> &take) const override
    {
        inner_.load(take);
    }

    std::uint64_t commit(std::span<const ovhost::StoredChange> changes,
                         const ovhost::CommitNote &note) override
    {
        if (fails) {
            throw ovhost::StoreError("out of space");
        }
        return inner_.commit(changes, note);
    }

    bool fails = false;

  private:
    ovhost::CommitStore &inner_;
};

std::string source(unsigned index)
{
    return "/src/" + std::to_string(index);
}

bool is_source(const std::string &name)
{
    return name.starts_with("/src/");
}

std::string mirror_of(const std::string &source_name)
{
    return "/mirror/" + source_name.substr(5);
}

std::size_t sources_in(const Config &config)
{
    return static_cast<std::size_t>(
        std::ranges::count_if(config, [](const auto &node) { return is_source(node.first); }));
}

/// The sources and mirrors a module finds in a database.
Config kept_state(const mdb_db *db)
{
    Config state;
    for (unsigned index = 0; index < 8; ++index) {
        for (const std::string &name : {source(index), mirror_of(source(index))}) {
            if (const auto text = commit_test::read(db, name)) {
                state.emplace(name, *text);
            }
        }
    }
    return state;
}

/// Keeps a mirror of every source, and its own copy of both.
struct MirrorModule : ScriptedModule {
    Config state;

    MirrorModule() : ScriptedModule("mirror", {"/src/*"})
    {
        on_change = [](md_dbinfo *info, mdb_db_change *change) {
            const std::string name = ts_str(change->mdc_name);
            const auto text = commit_test::read(info->newdb, name);
            return text ? commit_test::write(info, mirror_of(name), *text)
                        : commit_test::remove(info, mirror_of(name));
        };
        on_apply = [this](const md_dbinfo *info, const mdb_db_change_array *) {
            state = kept_state(info->newdb);
            return 0;
        };
    }
};

/// Refuses more sources than the limit.
struct LimitModule : ScriptedModule {
    LimitModule() : ScriptedModule("limit", {"/src/*"})
    {
        on_commit = [](md_dbinfo *info, const mdb_db_change_array *) {
            return sources_in(kept_state(info->newdb)) > max_sources
                       ? md_commit_set_return_status_msg(info->commit, 1, "too many sources")
                       : 0;
        };
    }
};

struct MischiefModule : ScriptedModule {
    Mischief mischief = Mischief::none;
    unsigned applied = 0;

    MischiefModule() : ScriptedModule("mischief")
    {
        on_commit = [this](md_dbinfo *info, const mdb_db_change_array *) { return check(info); };
        on_apply = [this](const md_dbinfo *info, const mdb_db_change_array *) {
            ++applied;
            return do_apply(info);
        };
        on_notify = [this](const mdb_db_change_array *) {
            if (mischief == Mischief::throw_in_notify) {
                throw std::runtime_error("peer gone");
            }
        };
    }

    int check(md_dbinfo *info)
    {
        // What it writes must not come to light when the commit is refused.
        mdb_db *newdb = const_cast<mdb_db *>(info->newdb);
        switch (mischief) {
        case Mischief::refuse:
            EXPECT_EQ(commit_test::write(info, "/leak", "refused"), 0);
            return md_commit_set_return_status_msg(info->commit, 1, "not today");
        case Mischief::fail_check:
            EXPECT_EQ(commit_test::remove(info, "/src"), 0);
            return 14004;
        case Mischief::throw_in_check:
            EXPECT_EQ(commit_test::write(info, "/leak", "thrown"), 0);
            throw std::runtime_error("confused");
        case Mischief::write_bad_value:
            newdb->tree.set(commit_test::parts_of("/leak"), {bt_bool, "maybe"});
            return 0;
        case Mischief::keep_amending:
            return commit_test::write(info, "/leak",
                                      commit_test::read(info->newdb, "/leak").value_or("") + "x");
        case Mischief::write_old_database:
            EXPECT_EQ(mdb_set_node_str(info->commit, const_cast<mdb_db *>(info->olddb), bsso_delete,
                                       0, bt_none, nullptr, "/src"),
                      14002);
            return 0;
        default:
            return 0;
        }
    }

    int do_apply(const md_dbinfo *info) const
    {
        switch (mischief) {
        case Mischief::write_in_apply:
            EXPECT_EQ(commit_test::write(info, "/leak", "late"), 14002);
            return 0;
        case Mischief::refuse_in_apply:
            EXPECT_EQ(md_commit_set_return_status_msg(info->commit, 1, "late"), 14002);
            return 0;
        case Mischief::fail_apply:
            return 14014;
        case Mischief::throw_in_apply:
            throw std::runtime_error("cannot follow");
        default:
            return 0;
        }
    }
};

class RandomCommits
{
  public:
    RandomCommits(ovhost::CommitStore &store, std::uint32_t seed) : random_(seed), store_(store)
    {
        engine_.add_module(mirror_);
        engine_.add_module(limit_);
        engine_.add_module(mischief_);
    }

    /// One round of edits and one commit, compared with the model.
    void step()
    {
        edit();
        ASSERT_EQ(config_of(candidate_.tree()), edited_);
        mischief_.mischief =
            pick(3) == 0 ? static_cast<Mischief>(pick(mischief_count)) : Mischief::none;
        store_.fails = pick(6) == 0;
        if (pick(4) == 0) {
            dry_run();
        }
        const CommitOutcome expected = expected_outcome();
        const CommitReport report = engine_.commit(candidate_, {});
        ++outcomes[expected];
        ASSERT_EQ(report.outcome, expected) << "mischief " << static_cast<int>(mischief_.mischief);
        compare(report);
    }

    [[nodiscard]] const Config &running() const { return running_; }

    std::map<CommitOutcome, unsigned> outcomes;

  private:
    unsigned pick(int choices)
    {
        return static_cast<unsigned>(std::uniform_int_distribution<int>(0, choices - 1)(random_));
    }

    void edit()
    {
        for (unsigned edits = pick(4); edits > 0; --edits) {
            const std::string name =
                pick(2) == 0 ? source(pick(8)) : "/other/" + std::to_string(pick(4));
            if (pick(3) == 0) {
                EXPECT_EQ(!candidate_.erase(name), edited_.erase(name) == 1);
            } else {
                const std::string text = std::to_string(pick(3));
                EXPECT_EQ(candidate_.set(name, bt_string, text), std::nullopt);
                edited_[name] = text;
            }
        }
    }

    /// The edited configuration with the mirror's amendments: of sources that have changed.
    [[nodiscard]] Config amended() const
    {
        Config config = edited_;
        for (unsigned index = 0; index < 8; ++index) {
            const std::string name = source(index);
            const auto before = running_.find(name);
            const auto after = edited_.find(name);
            if (after == edited_.end()) {
                if (before != running_.end()) {
                    config.erase(mirror_of(name));
                }
            } else if (before == running_.end() || before->second != after->second) {
                config[mirror_of(name)] = after->second;
            }
        }
        return config;
    }

    [[nodiscard]] CommitOutcome expected_outcome() const
    {
        if (edited_ == running_) {
            return CommitOutcome::unchanged;
        }
        if (is_refusal(mischief_.mischief) || sources_in(edited_) > max_sources) {
            return CommitOutcome::refused;
        }
        return store_.fails ? CommitOutcome::not_stored : CommitOutcome::committed;
    }

    void dry_run()
    {
        const bool accepted = engine_.check(candidate_).accepted();
        const CommitOutcome expected = expected_outcome();
        EXPECT_EQ(accepted, expected != CommitOutcome::refused);
        EXPECT_EQ(config_of(candidate_.tree()), edited_);
        EXPECT_EQ(config_of(engine_.running()), running_);
    }

    void compare(const CommitReport &report)
    {
        if (report.outcome == CommitOutcome::committed) {
            mirror_state_ = touches_sources() ? sources_and_mirrors(amended()) : mirror_state_;
            running_ = amended();
            edited_ = running_;
            ++commits_;
        }
        EXPECT_EQ(report.refusals.empty(), report.outcome != CommitOutcome::refused);
        EXPECT_TRUE(std::ranges::none_of(report.refusals, [](const ovhost::Refusal &refusal) {
            return refusal.message.empty() || refusal.module.empty();
        }));
        EXPECT_EQ(!report.warnings.empty(), warning_expected(report.outcome));
        EXPECT_EQ(config_of(engine_.running()), running_);
        EXPECT_EQ(config_of(ovhost::load_tree(store_)), running_);
        EXPECT_EQ(config_of(candidate_.tree()), edited_);
        EXPECT_EQ(mirror_.state, mirror_state_);
        EXPECT_EQ(mischief_.applied, commits_);
        if (!report.accepted() && pick(3) == 0) {
            candidate_.discard(engine_.running());
            edited_ = running_;
        }
    }

    [[nodiscard]] bool touches_sources() const
    {
        return sources_only(running_) != sources_only(edited_);
    }

    [[nodiscard]] static Config sources_only(Config config)
    {
        std::erase_if(config, [](const auto &node) { return !is_source(node.first); });
        return config;
    }

    [[nodiscard]] static Config sources_and_mirrors(Config config)
    {
        std::erase_if(config, [](const auto &node) { return node.first.starts_with("/other/"); });
        return config;
    }

    [[nodiscard]] bool warning_expected(CommitOutcome outcome) const
    {
        if (outcome == CommitOutcome::unchanged || !is_warning(mischief_.mischief)) {
            return false;
        }
        return outcome == CommitOutcome::committed ||
               mischief_.mischief == Mischief::write_old_database;
    }

    std::mt19937 random_;
    FailingStore store_;
    MirrorModule mirror_;
    LimitModule limit_;
    MischiefModule mischief_;
    ovhost::CommitEngine engine_{store_};
    Candidate candidate_;

    // The model.
    Config running_;
    Config edited_;
    Config mirror_state_;
    unsigned commits_ = 0;
};

TEST(CommitPropertyTest, RandomCommitsOnAStoreInMemory)
{
    const commit_test::LogCapture quiet;
    std::map<CommitOutcome, unsigned> outcomes;
    for (std::uint32_t seed = 1; seed <= 40; ++seed) {
        commit_test::MemoryStore store;
        RandomCommits commits(store, seed);
        for (unsigned step = 0; step < 250; ++step) {
            SCOPED_TRACE("seed " + std::to_string(seed) + " step " + std::to_string(step));
            commits.step();
            ASSERT_FALSE(testing::Test::HasFailure());
        }
        for (const auto &[outcome, count] : commits.outcomes) {
            outcomes[outcome] += count;
        }
    }
    // Each outcome is a good part of the 10,000, so that none of them goes untried.
    for (const auto outcome : {CommitOutcome::unchanged, CommitOutcome::committed,
                               CommitOutcome::refused, CommitOutcome::not_stored}) {
        EXPECT_GT(outcomes[outcome], 500U) << static_cast<int>(outcome);
    }
}

/// A store on disk that is closed and opened again before every load.
class ReopenedStore : public ovhost::CommitStore
{
  public:
    explicit ReopenedStore(std::filesystem::path directory) : directory_(std::move(directory)) {}

    void load(const std::function<void(ovhost::StoredNode &&)> &take) const override
    {
        store_.reset();
        opened().load(take);
    }

    std::uint64_t commit(std::span<const ovhost::StoredChange> changes,
                         const ovhost::CommitNote &note) override
    {
        return opened().commit(changes, note);
    }

  private:
    ovhost::Store &opened() const
    {
        if (!store_) {
            store_.emplace(ovhost::Store::open(directory_));
        }
        return *store_;
    }

    std::filesystem::path directory_;
    mutable std::optional<ovhost::Store> store_;
};

TEST(CommitPropertyTest, RandomCommitsOnAStoreOnDisk)
{
    const commit_test::LogCapture quiet;
    const ovtest::ScratchDir directory;
    ReopenedStore store(directory.path());
    RandomCommits commits(store, 4711);
    for (unsigned step = 0; step < 300; ++step) {
        SCOPED_TRACE("step " + std::to_string(step));
        commits.step();
        ASSERT_FALSE(testing::Test::HasFailure());
    }
    ovhost::CommitEngine restarted(store);
    restarted.load();
    EXPECT_EQ(config_of(restarted.running()), commits.running());
}

} // namespace
