#include "host/commit/engine.h"

#include "framework/logging.h"
#include "framework/md_commit.h"
#include "tests/commit/support.h"

#include <gmock/gmock.h>

#include <stdexcept>

using commit_test::Bench;
using commit_test::Config;
using commit_test::config_of;
using commit_test::described;
using commit_test::LogCapture;
using commit_test::read;
using commit_test::ScriptedModule;
using commit_test::write;
using ovhost::Candidate;
using ovhost::CheckReport;
using ovhost::CommitNote;
using ovhost::CommitOutcome;
using ovhost::CommitReport;
using ovhost::Phase;
using ovhost::Refusal;
using ovhost::Warning;
using testing::ElementsAre;
using testing::IsEmpty;

namespace
{

/// Refuses with the module's message, as the library does: code 1.
int refuse(const md_dbinfo *info, const char *text)
{
    return md_commit_set_return_status_msg(info->commit, 1, text);
}

TEST(CommitEngineTest, PhasesComeInOrder)
{
    std::vector<std::string> calls;
    ScriptedModule first("first");
    ScriptedModule second("second", {"/b/*"});
    Bench bench({&first, &second});
    first.calls = second.calls = bench.store.calls = &calls;
    Config running_at_store;
    Config running_at_apply;
    first.on_commit = [&](md_dbinfo *, const mdb_db_change_array *) {
        running_at_store = bench.running();
        return 0;
    };
    first.on_apply = [&](const md_dbinfo *, const mdb_db_change_array *) {
        running_at_apply = bench.running();
        return 0;
    };
    Candidate candidate = bench.candidate({{"/a", "1"}, {"/b/c", "2"}, {"/b/c/d", "3"}});

    const CommitReport report = bench.engine.commit(candidate, {});

    EXPECT_EQ(report.outcome, CommitOutcome::committed);
    EXPECT_TRUE(report.accepted());
    EXPECT_EQ(report.commit_number, 1U);
    EXPECT_EQ(report.changes.size(), 3U);
    EXPECT_THAT(calls, ElementsAre("first check add /a", "first check add /b/c",
                                   "first check add /b/c/d", "first check commit",
                                   "second check add /b/c", "second check commit", "store",
                                   "first apply", "second apply", "first notify", "second notify"));
    EXPECT_EQ(running_at_store, Config());
    EXPECT_EQ(running_at_apply, (Config{{"/a", "1"}, {"/b/c", "2"}, {"/b/c/d", "3"}}));
    EXPECT_EQ(bench.running(), running_at_apply);
    EXPECT_EQ(bench.store.config(), running_at_apply);
    EXPECT_THAT(candidate.pending(bench.engine.running()), IsEmpty());
}

TEST(CommitEngineTest, ModulesStartInTheirOrderOnWhatIsInForce)
{
    std::vector<std::string> calls;
    ScriptedModule first("first");
    ScriptedModule second("second", {"/b/*"});
    Bench bench({&first, &second});
    first.calls = second.calls = &calls;
    Config seen;
    bool could_write = true;
    second.on_start = [&](const mdb_db *running) {
        seen = config_of(running->tree);
        could_write = mdb_set_node_str(nullptr, const_cast<mdb_db *>(running), bsso_modify, 0,
                                       bt_string, "2", "/a") == 0;
    };
    bench.start_with({{"/a", "1"}});
    bench.engine.start_modules();
    EXPECT_THAT(calls, ElementsAre("first start", "second start"));
    EXPECT_EQ(seen, (Config{{"/a", "1"}}));
    EXPECT_FALSE(could_write);
    EXPECT_EQ(bench.running(), (Config{{"/a", "1"}}));
}

TEST(CommitEngineTest, AModuleThatCannotStartKeepsTheOthersFromIt)
{
    std::vector<std::string> calls;
    ScriptedModule first("first");
    ScriptedModule second("second");
    Bench bench({&first, &second});
    first.calls = second.calls = &calls;
    first.on_start = [](const mdb_db *) { throw std::runtime_error("no memory"); };
    EXPECT_THROW(bench.engine.start_modules(), std::runtime_error);
    EXPECT_THAT(calls, ElementsAre("first start"));
    first.on_start = nullptr;
    bench.engine.start_modules();
    EXPECT_THAT(calls, ElementsAre("first start", "first start", "second start"));
}

TEST(CommitEngineTest, ModuleWithoutAMatchingChangeIsNotCalled)
{
    std::vector<std::string> calls;
    ScriptedModule module("elsewhere", {"/x/*", "/y"});
    Bench bench({&module});
    module.calls = &calls;
    Candidate candidate = bench.candidate({{"/x", "1"}, {"/x/y/z", "2"}, {"/z", "3"}});
    EXPECT_EQ(bench.engine.commit(candidate, {}).outcome, CommitOutcome::committed);
    EXPECT_THAT(calls, IsEmpty());
}

TEST(CommitEngineTest, ModulesSeeBothDatabasesAndAllChanges)
{
    ScriptedModule module("reader", {"/a"});
    Bench bench({&module});
    bench.start_with({{"/a", "old"}, {"/gone", "1"}});
    std::vector<std::string> seen;
    const auto look = [&seen](const md_dbinfo *info, const mdb_db_change_array *changes) {
        seen.push_back(*read(info->olddb, "/a") + ">" + *read(info->newdb, "/a"));
        seen.push_back(testing::PrintToString(described(changes)));
        return 0;
    };
    module.on_commit = look;
    module.on_apply = look;
    module.on_notify = [&seen](const mdb_db_change_array *changes) {
        seen.push_back(testing::PrintToString(described(changes)));
    };
    Candidate candidate = bench.candidate({{"/a", "new"}, {"/gone", std::nullopt}});
    EXPECT_EQ(bench.engine.commit(candidate, {}).outcome, CommitOutcome::committed);
    const std::string changes = "{ \"modify /a\", \"delete /gone\" }";
    EXPECT_THAT(seen, ElementsAre("old>new", changes, "old>new", changes, changes));
}

TEST(CommitEngineTest, RefusalLeavesEverythingAsItWas)
{
    std::vector<std::string> calls;
    ScriptedModule writer("writer", {"/a"});
    ScriptedModule module("limits", {"/a"});
    Bench bench({&writer, &module});
    bench.start_with({{"/a", "1"}});
    module.calls = bench.store.calls = &calls;
    writer.on_change = [](md_dbinfo *info, mdb_db_change *) { return write(info, "/w", "1"); };
    module.on_change = [](md_dbinfo *info, mdb_db_change *) {
        return refuse(info, "no 2, please");
    };
    Candidate candidate = bench.candidate({{"/a", "2"}, {"/b", "x"}});

    const CommitReport report = bench.engine.commit(candidate, {});

    EXPECT_EQ(report.outcome, CommitOutcome::refused);
    EXPECT_FALSE(report.accepted());
    EXPECT_EQ(report.commit_number, 0U);
    EXPECT_THAT(report.refusals, ElementsAre(Refusal{"/a", "limits", 1, "no 2, please"}));
    EXPECT_THAT(report.warnings, IsEmpty());
    EXPECT_THAT(calls, ElementsAre("limits check modify /a", "limits check commit"));
    EXPECT_EQ(bench.running(), (Config{{"/a", "1"}}));
    EXPECT_EQ(bench.store.config(), (Config{{"/a", "1"}}));
    EXPECT_EQ(bench.store.attempts, 0U);
    EXPECT_EQ(config_of(candidate.tree()), (Config{{"/a", "2"}, {"/b", "x"}}));

    // The candidate can be mended and committed: nothing of the refused round sticks to it.
    ASSERT_EQ(candidate.set("/a", bt_string, "1"), std::nullopt);
    EXPECT_EQ(bench.engine.commit(candidate, {}).outcome, CommitOutcome::committed);
    EXPECT_EQ(bench.running(), (Config{{"/a", "1"}, {"/b", "x"}}));
}

TEST(CommitEngineTest, AllRefusalsReachTheClientEachWithItsNode)
{
    ScriptedModule first("first");
    ScriptedModule second("second", {"/b"});
    Bench bench({&first, &second});
    first.on_change = [](md_dbinfo *info, mdb_db_change *change) {
        return refuse(info, (std::string("first: ") + ts_str(change->mdc_name)).c_str());
    };
    first.on_commit = [](md_dbinfo *info, const mdb_db_change_array *) {
        return refuse(info, "too much at once");
    };
    second.on_change = [](md_dbinfo *info, mdb_db_change *) {
        return md_commit_set_return_status_msg_fmt(info->commit, 7, "%s: %d", "second", 2);
    };
    Candidate candidate = bench.candidate({{"/a", "1"}, {"/b", "2"}});
    EXPECT_THAT(bench.engine.commit(candidate, {}).refusals,
                ElementsAre(Refusal{"/a", "first", 1, "first: /a"},
                            Refusal{"/b", "first", 1, "first: /b"},
                            Refusal{"", "first", 1, "too much at once"},
                            Refusal{"/b", "second", 7, "second: 2"}));
}

TEST(CommitEngineTest, LaterMessageOfOneCallReplacesTheEarlier)
{
    ScriptedModule module("wordy", {"/a"});
    Bench bench({&module});
    module.on_change = [](md_dbinfo *info, mdb_db_change *) {
        return refuse(info, "first words") + refuse(info, "last words");
    };
    module.on_commit = [](md_dbinfo *, const mdb_db_change_array *) { return 0; };
    Candidate candidate = bench.candidate({{"/a", "1"}});
    EXPECT_THAT(bench.engine.commit(candidate, {}).refusals,
                ElementsAre(Refusal{"/a", "wordy", 1, "last words"}));
}

TEST(CommitEngineTest, MessageCountsWhateverTheCheckReturns)
{
    ScriptedModule module("maps", {"/a"});
    Bench bench({&module});
    for (const int code : {0, 1, 14004, 14120, 80000}) {
        module.on_change = [code](md_dbinfo *info, mdb_db_change *) {
            EXPECT_EQ(refuse(info, "in use"), 0);
            return code;
        };
        Candidate candidate = bench.candidate({{"/a", "1"}});
        EXPECT_THAT(bench.engine.commit(candidate, {}).refusals,
                    ElementsAre(Refusal{"/a", "maps", 1, "in use"}));
    }
}

TEST(CommitEngineTest, RefusalWithTheCodeForSuccessIsARefusal)
{
    ScriptedModule module("odd", {"/a"});
    Bench bench({&module});
    module.on_change = [](md_dbinfo *info, mdb_db_change *) {
        return md_commit_set_return_status_msg(info->commit, 0, "no");
    };
    Candidate candidate = bench.candidate({{"/a", "1"}});
    EXPECT_THAT(bench.engine.commit(candidate, {}).refusals,
                ElementsAre(Refusal{"/a", "odd", 14000, "no"}));
}

TEST(CommitEngineTest, ExceptionReplacesTheMessageOfItsCall)
{
    ScriptedModule module("rash", {"/a"});
    Bench bench({&module});
    module.on_change = [](md_dbinfo *info, mdb_db_change *) -> int {
        EXPECT_EQ(refuse(info, "first words"), 0);
        throw std::runtime_error("last words");
    };
    Candidate candidate = bench.candidate({{"/a", "1"}});
    EXPECT_THAT(bench.engine.commit(candidate, {}).refusals,
                ElementsAre(Refusal{"/a", "rash", 14000, "last words"}));
}

struct SilentFailure {
    int code;
    const char *of_node;
    const char *of_commit;
};

class SilentFailureTest : public testing::TestWithParam<SilentFailure>
{
};

TEST_P(SilentFailureTest, ClientGetsAMessageAllTheSame)
{
    const SilentFailure &failure = GetParam();
    ScriptedModule module("limits", {"/a/b"});
    Bench bench({&module});
    module.on_change = [&](md_dbinfo *, mdb_db_change *) { return failure.code; };
    module.on_commit = [&](md_dbinfo *, const mdb_db_change_array *) { return failure.code; };
    Candidate candidate = bench.candidate({{"/a/b", "1"}});
    LogCapture log;
    const CommitReport report = bench.engine.commit(candidate, {});
    EXPECT_THAT(report.refusals,
                ElementsAre(Refusal{"/a/b", "limits", failure.code, failure.of_node},
                            Refusal{"", "limits", failure.code, failure.of_commit}));
    EXPECT_THAT(report.warnings, IsEmpty());
    EXPECT_THAT(log.lines, IsEmpty());
}

INSTANTIATE_TEST_SUITE_P(
    Codes, SilentFailureTest,
    testing::Values(
        SilentFailure{14004,
                      "module limits failed the check of /a/b with code 14004 (item not found)",
                      "module limits failed the check of the commit with code 14004 (item not "
                      "found)"},
        SilentFailure{13999, "module limits failed the check of /a/b with code 13999",
                      "module limits failed the check of the commit with code 13999"},
        SilentFailure{80000, "module limits failed the check of /a/b with code 80000",
                      "module limits failed the check of the commit with code 80000"},
        SilentFailure{14120, "cancelled", "cancelled"}));

TEST(CommitEngineTest, ExceptionInACheckRefusesWithItsWords)
{
    ScriptedModule module("rash", {"/a"});
    Bench bench({&module});
    module.on_change = [](md_dbinfo *, mdb_db_change *) -> int {
        throw std::runtime_error("cannot tell");
    };
    module.on_commit = [](md_dbinfo *, const mdb_db_change_array *) -> int { throw 42; };
    Candidate candidate = bench.candidate({{"/a", "1"}});
    const CommitReport report = bench.engine.commit(candidate, {});
    EXPECT_THAT(report.refusals,
                ElementsAre(Refusal{"/a", "rash", 14000, "cannot tell"},
                            Refusal{"", "rash", 14000,
                                    "module rash failed the check of the commit with code 14000 "
                                    "(generic error)"}));
    EXPECT_EQ(bench.running(), Config());
}

TEST(CommitEngineTest, FailingStoreLeavesEverythingAsItWas)
{
    std::vector<std::string> calls;
    ScriptedModule module("limits");
    Bench bench({&module});
    bench.start_with({{"/a", "1"}});
    module.on_change = [](md_dbinfo *info, mdb_db_change *) { return write(info, "/w", "1"); };
    Candidate candidate = bench.candidate({{"/a", "2"}});
    bench.store.failure = "config.db: the disk is full: make room and commit again";
    module.calls = &calls;

    const CommitReport report = bench.engine.commit(candidate, {});

    EXPECT_EQ(report.outcome, CommitOutcome::not_stored);
    EXPECT_FALSE(report.accepted());
    EXPECT_EQ(report.store_error, "config.db: the disk is full: make room and commit again");
    EXPECT_EQ(report.commit_number, 0U);
    EXPECT_THAT(report.refusals, IsEmpty());
    EXPECT_THAT(calls, ElementsAre("limits check modify /a", "limits check commit",
                                   "limits check add /w", "limits check commit"));
    EXPECT_EQ(bench.running(), (Config{{"/a", "1"}}));
    EXPECT_EQ(bench.store.config(), (Config{{"/a", "1"}}));
    EXPECT_EQ(config_of(candidate.tree()), (Config{{"/a", "2"}}));

    bench.store.failure.reset();
    EXPECT_EQ(bench.engine.commit(candidate, {}).outcome, CommitOutcome::committed);
    EXPECT_EQ(bench.running(), (Config{{"/a", "2"}, {"/w", "1"}}));
    EXPECT_EQ(bench.store.config(), bench.running());
}

TEST(CommitEngineTest, CommitStandsWhenApplyFails)
{
    std::vector<std::string> calls;
    ScriptedModule failing("failing");
    ScriptedModule throwing("throwing");
    ScriptedModule quiet("quiet");
    Bench bench({&failing, &throwing, &quiet});
    failing.calls = throwing.calls = quiet.calls = &calls;
    failing.on_apply = [](const md_dbinfo *, const mdb_db_change_array *) { return 14014; };
    throwing.on_apply = [](const md_dbinfo *, const mdb_db_change_array *) -> int {
        throw std::runtime_error("no such tunnel");
    };
    quiet.on_apply = [](const md_dbinfo *, const mdb_db_change_array *) { return 14120; };
    Candidate candidate = bench.candidate({{"/a", "1"}});
    LogCapture log;

    const CommitReport report = bench.engine.commit(candidate, {});

    const std::string failed = "module failing failed to apply the commit with code 14014 (generic "
                               "IO error); the commit stands";
    const std::string thrown =
        "module throwing threw an exception in apply (no such tunnel); the commit stands";
    EXPECT_EQ(report.outcome, CommitOutcome::committed);
    EXPECT_THAT(report.warnings,
                ElementsAre(Warning{"failing", Phase::apply, 14014, failed},
                            Warning{"throwing", Phase::apply, 14000, thrown},
                            Warning{"quiet", Phase::apply, 14120,
                                    "module quiet failed to apply the commit with code 14120 "
                                    "(Operation cancelled); the commit stands"}));
    EXPECT_THAT(log.texts(ov_log_error), ElementsAre(failed, thrown));
    EXPECT_THAT(calls,
                ElementsAre("failing check add /a", "failing check commit", "throwing check add /a",
                            "throwing check commit", "quiet check add /a", "quiet check commit",
                            "failing apply", "throwing apply", "quiet apply", "failing notify",
                            "throwing notify", "quiet notify"));
    EXPECT_EQ(bench.running(), (Config{{"/a", "1"}}));
    EXPECT_EQ(bench.store.config(), (Config{{"/a", "1"}}));
    EXPECT_THAT(candidate.pending(bench.engine.running()), IsEmpty());
}

TEST(CommitEngineTest, ExceptionInNotifyIsAWarning)
{
    ScriptedModule module("peers");
    Bench bench({&module});
    module.on_notify = [](const mdb_db_change_array *) { throw 42; };
    Candidate candidate = bench.candidate({{"/a", "1"}});
    LogCapture log;
    const CommitReport report = bench.engine.commit(candidate, {});
    const std::string text =
        "module peers threw an exception in notify (no reason given); the commit stands";
    EXPECT_EQ(report.outcome, CommitOutcome::committed);
    EXPECT_THAT(report.warnings, ElementsAre(Warning{"peers", Phase::notify, 14000, text}));
    EXPECT_THAT(log.texts(ov_log_error), ElementsAre(text));
}

TEST(CommitEngineTest, CommitWithoutChangesIsToldAndNotStored)
{
    std::vector<std::string> calls;
    ScriptedModule module("any");
    Bench bench({&module});
    bench.start_with({{"/a", "1"}});
    module.calls = bench.store.calls = &calls;
    Candidate candidate = bench.candidate({{"/a", "1"}});
    const CommitReport report = bench.engine.commit(candidate, {});
    EXPECT_EQ(report.outcome, CommitOutcome::unchanged);
    EXPECT_TRUE(report.accepted());
    EXPECT_THAT(report.changes, IsEmpty());
    EXPECT_THAT(calls, IsEmpty());
}

TEST(CommitEngineTest, CommitWhoseChangesAllAreTakenBackIsUnchanged)
{
    ScriptedModule module("restorer", {"/a"});
    Bench bench({&module});
    bench.start_with({{"/a", "1"}});
    module.on_change = [](md_dbinfo *info, mdb_db_change *) { return write(info, "/a", "1"); };
    Candidate candidate = bench.candidate({{"/a", "2"}});
    EXPECT_EQ(bench.engine.commit(candidate, {}).outcome, CommitOutcome::unchanged);
    EXPECT_EQ(bench.store.attempts, 0U);
    EXPECT_EQ(config_of(candidate.tree()), (Config{{"/a", "1"}}));
}

TEST(CommitEngineTest, CheckIsADryRun)
{
    std::vector<std::string> calls;
    ScriptedModule module("amender", {"/a", "/b"});
    Bench bench({&module});
    bench.start_with({{"/a", "1"}});
    module.calls = bench.store.calls = &calls;
    module.on_change = [](md_dbinfo *info, mdb_db_change *) { return write(info, "/b", "1"); };
    Candidate candidate = bench.candidate({{"/a", "2"}});

    const CheckReport report = bench.engine.check(candidate);

    EXPECT_TRUE(report.accepted());
    EXPECT_THAT(report.changes,
                ElementsAre(ovhost::Change{{"a"}, {{bt_string, "1"}}, {{bt_string, "2"}}},
                            ovhost::Change{{"b"}, {}, {{bt_string, "1"}}}));
    EXPECT_THAT(calls, ElementsAre("amender check modify /a", "amender check commit",
                                   "amender check add /b", "amender check commit"));
    EXPECT_EQ(bench.running(), (Config{{"/a", "1"}}));
    EXPECT_EQ(config_of(candidate.tree()), (Config{{"/a", "2"}}));
}

TEST(CommitEngineTest, CheckTellsRefusals)
{
    ScriptedModule module("limits");
    Bench bench({&module});
    module.on_commit = [](md_dbinfo *info, const mdb_db_change_array *) {
        return refuse(info, "enough");
    };
    const CheckReport report = bench.engine.check(bench.candidate({{"/a", "2"}}));
    EXPECT_FALSE(report.accepted());
    EXPECT_THAT(report.refusals, ElementsAre(Refusal{"", "limits", 1, "enough"}));
}

TEST(CommitEngineTest, CandidateHasTheAmendmentsAfterTheCommit)
{
    ScriptedModule module("amender", {"/a"});
    Bench bench({&module});
    module.on_change = [](md_dbinfo *info, mdb_db_change *) { return write(info, "/b", "1"); };
    Candidate candidate = bench.candidate({{"/a", "2"}});
    const CommitReport report = bench.engine.commit(candidate, {});
    EXPECT_EQ(report.changes.size(), 2U);
    EXPECT_EQ(config_of(candidate.tree()), (Config{{"/a", "2"}, {"/b", "1"}}));
    EXPECT_EQ(bench.running(), (Config{{"/a", "2"}, {"/b", "1"}}));
    EXPECT_EQ(bench.store.config(), bench.running());
    EXPECT_EQ(bench.engine.commit(candidate, {}).outcome, CommitOutcome::unchanged);
}

TEST(CommitEngineTest, EditsOfTwoCandidatesAreBothKept)
{
    Bench bench;
    bench.start_with({{"/a", "1"}, {"/b", "1"}});
    Candidate mine = bench.candidate({{"/a", "mine"}});
    Candidate theirs = bench.candidate({{"/b", "theirs"}});
    EXPECT_EQ(bench.engine.commit(theirs, {}).outcome, CommitOutcome::committed);
    EXPECT_EQ(bench.engine.commit(mine, {}).outcome, CommitOutcome::committed);
    EXPECT_EQ(bench.running(), (Config{{"/a", "mine"}, {"/b", "theirs"}}));
}

TEST(CommitEngineTest, LoadMakesTheStoredConfigurationTheRunningOne)
{
    std::vector<std::string> calls;
    ScriptedModule module("any");
    Bench bench({&module});
    module.calls = &calls;
    bench.start_with({{"/a", "1"}, {"/n/1\\/2", "x"}});
    EXPECT_EQ(bench.running(), (Config{{"/a", "1"}, {"/n/1\\/2", "x"}}));
    EXPECT_THAT(calls, IsEmpty());
}

TEST(CommitEngineTest, InitialCommitGoesTheSameRoad)
{
    std::vector<std::string> calls;
    ScriptedModule module("any");
    Bench bench({&module});
    module.calls = bench.store.calls = &calls;
    Candidate candidate = bench.candidate({{"/a", "1"}});
    const CommitReport report = bench.engine.initial(candidate, {});
    EXPECT_EQ(report.outcome, CommitOutcome::committed);
    EXPECT_THAT(calls, ElementsAre("any check add /a", "any check commit", "store", "any apply",
                                   "any notify"));
    EXPECT_EQ(bench.store.config(), (Config{{"/a", "1"}}));
    EXPECT_THROW((void)bench.engine.initial(candidate, {}), std::logic_error);
}

TEST(CommitEngineTest, CommitIsLoggedWithItsComment)
{
    Bench bench;
    Candidate candidate = bench.candidate({{"/a", "1"}});
    LogCapture log;
    (void)bench.engine.commit(candidate, {});
    ASSERT_EQ(candidate.set("/a", bt_string, "2"), std::nullopt);
    ASSERT_EQ(candidate.set("/b", bt_string, "2"), std::nullopt);
    CommitNote note;
    note.comment = "from the lab";
    (void)bench.engine.commit(candidate, note);
    EXPECT_THAT(log.texts(ov_log_notice),
                ElementsAre("commit 1 is in force: 1 change",
                            "commit 2 is in force: 2 changes (from the lab)"));
}

TEST(CommitEngineTest, NoteGoesToTheStore)
{
    Bench bench;
    Candidate candidate = bench.candidate({{"/a", "1"}});
    CommitNote note;
    note.time = 1700000000;
    note.uid = 7;
    note.author = "anna";
    note.confirm_within = 60;
    (void)bench.engine.commit(candidate, note);
    EXPECT_EQ(bench.store.note.time, 1700000000);
    EXPECT_EQ(bench.store.note.uid, 7U);
    EXPECT_EQ(bench.store.note.author, "anna");
    EXPECT_EQ(bench.store.note.confirm_within, 60U);
}

TEST(CommitEngineTest, ModuleCannotCommitInsideACommit)
{
    ScriptedModule module("nested", {"/a"});
    Bench bench({&module});
    Candidate candidate = bench.candidate({{"/a", "1"}});
    module.on_change = [&](md_dbinfo *, mdb_db_change *) {
        Candidate other = bench.candidate({{"/b", "1"}});
        (void)bench.engine.commit(other, {});
        return 0;
    };
    EXPECT_THAT(bench.engine.commit(candidate, {}).refusals,
                ElementsAre(Refusal{"/a", "nested", 14000,
                                    "a commit is running: a module cannot start another one"}));
    EXPECT_EQ(bench.running(), Config());
    module.on_change = nullptr;
    EXPECT_EQ(bench.engine.commit(candidate, {}).outcome, CommitOutcome::committed);
}

std::string registration_fault(Bench &bench, ScriptedModule &module)
{
    try {
        bench.engine.add_module(module);
    } catch (const std::invalid_argument &error) {
        return error.what();
    }
    return "";
}

TEST(CommitEngineTest, RegistrationNamesWhatIsWrong)
{
    ScriptedModule first("limits");
    ScriptedModule again("limits");
    ScriptedModule nameless("");
    ScriptedModule patternless("maps", {"/a/*", "a/b"});
    Bench bench({&first});
    EXPECT_EQ(registration_fault(bench, again), "there are two modules of the name limits");
    EXPECT_EQ(registration_fault(bench, nameless), "a module must have a name");
    EXPECT_EQ(registration_fault(bench, patternless),
              "module maps asks for \"a/b\", which is not a pattern of node names");
}

TEST(ModuleTest, DefaultsAcceptEverything)
{
    class Plain : public ovhost::Module
    {
        [[nodiscard]] std::string name() const override { return "plain"; }
    };
    Plain module;
    Bench bench({&module});
    Candidate candidate = bench.candidate({{"/a", "1"}});
    const CommitReport report = bench.engine.commit(candidate, {});
    EXPECT_EQ(report.outcome, CommitOutcome::committed);
    EXPECT_THAT(report.warnings, IsEmpty());
}

} // namespace
