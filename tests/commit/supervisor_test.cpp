// A module that breaks the duty of a phase is told so, in the log and in the client's report, and
// its deed has no effect.
#include "host/commit/supervisor.h"

#include "framework/logging.h"
#include "framework/md_commit.h"
#include "tests/commit/support.h"

#include <gmock/gmock.h>

using commit_test::Bench;
using commit_test::Config;
using commit_test::LogCapture;
using commit_test::ScriptedModule;
using commit_test::write;
using ovhost::Candidate;
using ovhost::CommitOutcome;
using ovhost::CommitReport;
using ovhost::Phase;
using ovhost::Refusal;
using ovhost::Warning;
using testing::ElementsAre;
using testing::IsEmpty;

namespace
{

constexpr const char *check_duty =
    " in check; a check may refuse with a message and may write the new database, but must not "
    "write the old one and must not keep anything";
constexpr const char *apply_duty =
    " in apply; apply brings the module's own state in line with what is stored, and may neither "
    "refuse nor write";
constexpr const char *notify_duty =
    " in notify; notify tells peers what is in force, and may neither refuse nor write nor fail";

int write_old(const md_dbinfo *info)
{
    return mdb_set_node_str(info->commit, const_cast<mdb_db *>(info->olddb), bsso_modify, 0,
                            bt_string, "x", "/a");
}

/// The error lines that the engine has written.
std::vector<std::string> breaches_in(const LogCapture &log)
{
    std::vector<std::string> texts;
    for (const ovhost::test::LoggedLine &line : log.lines) {
        if (line.unit == "commit" && line.level == ov_log_error) {
            EXPECT_EQ(line.flags, 2048U);
            texts.push_back(line.text);
        }
    }
    return texts;
}

class DutyTest : public testing::Test
{
  protected:
    CommitReport commit()
    {
        bench.engine.add_module(module);
        bench.start_with({{"/a", "old"}});
        Candidate candidate = bench.candidate({{"/a", "new"}});
        return bench.engine.commit(candidate, {});
    }

    void expect_breach(const CommitReport &report, Phase phase, const std::string &text)
    {
        EXPECT_THAT(report.warnings, ElementsAre(Warning{"rogue", phase, 0, text}));
        EXPECT_THAT(breaches_in(log), ElementsAre(text));
    }

    void expect_committed(const CommitReport &report)
    {
        EXPECT_EQ(report.outcome, CommitOutcome::committed);
        EXPECT_EQ(bench.running(), (Config{{"/a", "new"}}));
        EXPECT_EQ(bench.store.config(), (Config{{"/a", "new"}}));
    }

    ScriptedModule module{"rogue", {"/a"}};
    Bench bench;
    LogCapture log;
};

TEST_F(DutyTest, CheckMustNotWriteTheOldDatabase)
{
    module.on_change = [](md_dbinfo *info, mdb_db_change *) {
        // Twice in one call is told once.
        EXPECT_EQ(write_old(info), 14002);
        EXPECT_EQ(write_old(info), 14002);
        return 0;
    };
    const CommitReport report = commit();
    expect_breach(report, Phase::check,
                  std::string("module rogue tried to write the old database") + check_duty);
    expect_committed(report);
}

TEST_F(DutyTest, CheckMustNotRefuseWithoutAMessage)
{
    module.on_change = [](md_dbinfo *info, mdb_db_change *) {
        return md_commit_set_return_status_msg(info->commit, 1, "");
    };
    const CommitReport report = commit();
    expect_breach(report, Phase::check,
                  std::string("module rogue refused without a message") + check_duty);
    EXPECT_THAT(
        report.refusals,
        ElementsAre(Refusal{"/a", "rogue", 1, "module rogue failed the check of /a with code 1"}));
    EXPECT_EQ(bench.running(), (Config{{"/a", "old"}}));
}

TEST_F(DutyTest, ApplyMustNotWriteTheNewDatabase)
{
    module.on_apply = [](const md_dbinfo *info, const mdb_db_change_array *) {
        EXPECT_EQ(write(info, "/a", "late"), 14002);
        return 0;
    };
    const CommitReport report = commit();
    expect_breach(report, Phase::apply,
                  std::string("module rogue tried to write the database") + apply_duty);
    expect_committed(report);
}

TEST_F(DutyTest, ApplyMustNotWriteTheOldDatabase)
{
    module.on_apply = [](const md_dbinfo *info, const mdb_db_change_array *) {
        EXPECT_EQ(write_old(info), 14002);
        return 0;
    };
    const CommitReport report = commit();
    expect_breach(report, Phase::apply,
                  std::string("module rogue tried to write the old database") + apply_duty);
    expect_committed(report);
}

TEST_F(DutyTest, ApplyMustNotRefuse)
{
    module.on_apply = [](const md_dbinfo *info, const mdb_db_change_array *) {
        EXPECT_EQ(md_commit_set_return_status_msg(info->commit, 1, "too late"), 14002);
        return 0;
    };
    const CommitReport report = commit();
    expect_breach(report, Phase::apply,
                  std::string("module rogue tried to refuse the commit") + apply_duty);
    EXPECT_THAT(report.refusals, IsEmpty());
    expect_committed(report);
}

TEST_F(DutyTest, EveryBreachOfOneCallIsTold)
{
    module.on_apply = [](const md_dbinfo *info, const mdb_db_change_array *) {
        EXPECT_EQ(write(info, "/a", "late"), 14002);
        EXPECT_EQ(write_old(info), 14002);
        EXPECT_EQ(md_commit_set_return_status_msg(info->commit, 1, "too late"), 14002);
        return 14002;
    };
    const CommitReport report = commit();
    EXPECT_THAT(
        report.warnings,
        ElementsAre(
            Warning{"rogue", Phase::apply, 0,
                    std::string("module rogue tried to write the old database") + apply_duty},
            Warning{"rogue", Phase::apply, 0,
                    std::string("module rogue tried to write the database") + apply_duty},
            Warning{"rogue", Phase::apply, 0,
                    std::string("module rogue tried to refuse the commit") + apply_duty},
            Warning{"rogue", Phase::apply, 14002,
                    "module rogue failed to apply the commit with code 14002 (assertion "
                    "failed); the commit stands"}));
    expect_committed(report);
}

TEST_F(DutyTest, NotifyMustNotUseWhatACheckHasKept)
{
    md_dbinfo kept{};
    module.on_change = [&kept](md_dbinfo *info, mdb_db_change *) {
        kept = *info;
        return 0;
    };
    module.on_notify = [&kept](const mdb_db_change_array *) {
        EXPECT_EQ(write(&kept, "/a", "late"), 14002);
        EXPECT_EQ(md_commit_set_return_status_msg(kept.commit, 1, "too late"), 14002);
    };
    const CommitReport report = commit();
    EXPECT_THAT(
        report.warnings,
        ElementsAre(Warning{"rogue", Phase::notify, 0,
                            std::string("module rogue tried to write the database") + notify_duty},
                    Warning{"rogue", Phase::notify, 0,
                            std::string("module rogue tried to refuse the commit") + notify_duty}));
    expect_committed(report);
}

TEST_F(DutyTest, CheckCannotSpoilTheHandlesOfTheNext)
{
    ScriptedModule next("next", {"/a"});
    module.on_change = [](md_dbinfo *info, mdb_db_change *) {
        *info = {};
        return 0;
    };
    std::optional<std::string> seen;
    next.on_change = [&seen](md_dbinfo *info, mdb_db_change *) {
        seen = commit_test::read(info->newdb, "/a");
        return 0;
    };
    bench.engine.add_module(module);
    bench.engine.add_module(next);
    Candidate candidate = bench.candidate({{"/a", "new"}});
    EXPECT_EQ(bench.engine.commit(candidate, {}).outcome, CommitOutcome::committed);
    EXPECT_EQ(seen, "new");
}

TEST_F(DutyTest, ModuleThatKeepsToItsDutyHearsNothing)
{
    module.on_change = [](md_dbinfo *info, mdb_db_change *) { return write(info, "/a", "newer"); };
    const CommitReport report = commit();
    EXPECT_THAT(report.warnings, IsEmpty());
    EXPECT_THAT(breaches_in(log), IsEmpty());
    EXPECT_EQ(bench.running(), (Config{{"/a", "newer"}}));
}

TEST(SupervisorTest, HandlesAreOpenForTheLengthOfACheck)
{
    ovhost::Supervisor supervisor({}, {});
    md_dbinfo kept{};
    const ovhost::CallResult result = supervisor.call("m", Phase::check, [&kept](md_dbinfo *info) {
        kept = *info;
        EXPECT_EQ(write(info, "/a", "1"), 0);
        EXPECT_EQ(md_commit_set_return_status_msg(info->commit, 5, "no"), 0);
        return 3;
    });
    EXPECT_EQ(result.code, 3);
    EXPECT_EQ(result.refusal.value().code, 5);
    EXPECT_EQ(result.refusal.value().message, "no");
    EXPECT_EQ(result.exception, std::nullopt);
    EXPECT_EQ(commit_test::config_of(supervisor.proposed()), (Config{{"/a", "1"}}));

    EXPECT_EQ(write(&kept, "/a", "2"), 14002);
    EXPECT_EQ(md_commit_set_return_status_msg(kept.commit, 5, "no"), 14002);
    EXPECT_EQ(commit_test::config_of(supervisor.proposed()), (Config{{"/a", "1"}}));
}

TEST(SupervisorTest, RefusalOfOneCallIsNotThatOfTheNext)
{
    ovhost::Supervisor supervisor({}, {});
    (void)supervisor.call("m", Phase::check, [](md_dbinfo *info) {
        return md_commit_set_return_status_msg(info->commit, 1, "no");
    });
    const ovhost::CallResult next =
        supervisor.call("m", Phase::check, [](md_dbinfo *) { return 0; });
    EXPECT_EQ(next.refusal, std::nullopt);
}

} // namespace
