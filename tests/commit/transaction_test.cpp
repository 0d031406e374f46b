// Rounds of checks: what modules write during them, and how it is checked in its turn.
#include "host/commit/transaction.h"

#include "tests/commit/support.h"

#include <gmock/gmock.h>

using commit_test::Bench;
using commit_test::Config;
using commit_test::described;
using commit_test::read;
using commit_test::ScriptedModule;
using commit_test::write;
using ovhost::Candidate;
using ovhost::CommitOutcome;
using ovhost::CommitReport;
using ovhost::Refusal;
using testing::ElementsAre;
using testing::IsEmpty;

namespace
{

int length_of(const std::optional<std::string> &text)
{
    return text ? static_cast<int>(text->size()) : 0;
}

/// Writes into a node one character more than it held, or than another node holds.
int lengthen(const md_dbinfo *info, const std::string &node, const std::string &other)
{
    const int length = length_of(read(info->newdb, other));
    return write(info, node, std::string(static_cast<std::size_t>(length) + 1, 'x'));
}

TEST(TransactionTest, AmendmentIsCheckedByAllModulesItConcerns)
{
    std::vector<std::string> calls;
    ScriptedModule before("before");
    ScriptedModule amender("amender", {"/a"});
    ScriptedModule after("after", {"/b", "/c"});
    Bench bench({&before, &amender, &after});
    before.calls = amender.calls = after.calls = &calls;
    amender.on_change = [](md_dbinfo *info, mdb_db_change *) { return write(info, "/b", "1"); };
    Candidate candidate = bench.candidate({{"/a", "1"}, {"/c", "1"}});

    EXPECT_EQ(bench.engine.check(candidate).changes.size(), 3U);

    EXPECT_THAT(calls,
                ElementsAre("before check add /a", "before check add /c", "before check commit",
                            "amender check add /a", "amender check commit", "after check add /c",
                            "after check commit",
                            // The second round: /b is new, /a and /c were checked.
                            "before check add /b", "before check commit", "after check add /b",
                            "after check commit"));
}

TEST(TransactionTest, CheckOfTheCommitSeesTheAmendedList)
{
    std::vector<std::vector<std::string>> lists;
    ScriptedModule counter("counter");
    ScriptedModule amender("amender", {"/a"});
    Bench bench({&counter, &amender});
    amender.on_change = [](md_dbinfo *info, mdb_db_change *) { return write(info, "/b", "1"); };
    counter.on_commit = [&](md_dbinfo *, const mdb_db_change_array *changes) {
        lists.push_back(described(changes));
        return 0;
    };
    Candidate candidate = bench.candidate({{"/a", "1"}});
    (void)bench.engine.check(candidate);
    EXPECT_THAT(lists, ElementsAre(ElementsAre("add /a"), ElementsAre("add /a", "add /b")));
}

TEST(TransactionTest, AmendmentIsVisibleToLaterModulesOfTheSameRound)
{
    ScriptedModule amender("amender", {"/a"});
    ScriptedModule reader("reader", {"/a"});
    Bench bench({&amender, &reader});
    amender.on_change = [](md_dbinfo *info, mdb_db_change *) { return write(info, "/b", "1"); };
    std::optional<std::string> seen;
    reader.on_change = [&](md_dbinfo *info, mdb_db_change *) {
        seen = read(info->newdb, "/b");
        return 0;
    };
    (void)bench.engine.check(bench.candidate({{"/a", "1"}}));
    EXPECT_EQ(seen, "1");
}

TEST(TransactionTest, NodeThatIsAmendedAgainIsCheckedAgain)
{
    std::vector<std::string> values;
    ScriptedModule watcher("watcher", {"/a"});
    ScriptedModule amender("amender", {"/a"});
    Bench bench({&watcher, &amender});
    watcher.on_change = [&](md_dbinfo *info, mdb_db_change *) {
        values.push_back(*read(info->newdb, "/a"));
        return 0;
    };
    amender.on_change = [](md_dbinfo *info, mdb_db_change *) { return write(info, "/a", "tidy"); };
    (void)bench.engine.check(bench.candidate({{"/a", "untidy"}}));
    EXPECT_THAT(values, ElementsAre("untidy", "tidy"));
}

TEST(TransactionTest, AmendmentMayBeRefusedByAnotherModule)
{
    ScriptedModule amender("amender", {"/a"});
    ScriptedModule limits("limits", {"/b"});
    Bench bench({&limits, &amender});
    amender.on_change = [](md_dbinfo *info, mdb_db_change *) { return write(info, "/b", "1"); };
    limits.on_change = [](md_dbinfo *info, mdb_db_change *) {
        return md_commit_set_return_status_msg(info->commit, 1, "no /b");
    };
    Candidate candidate = bench.candidate({{"/a", "1"}});
    EXPECT_THAT(bench.engine.commit(candidate, {}).refusals,
                ElementsAre(Refusal{"/b", "limits", 1, "no /b"}));
    EXPECT_EQ(bench.running(), Config());
}

TEST(TransactionTest, RoundWithARefusalIsTheLast)
{
    std::vector<std::string> calls;
    ScriptedModule amender("amender", {"/a"});
    ScriptedModule refuser("refuser", {"/a", "/b"});
    Bench bench({&amender, &refuser});
    refuser.calls = &calls;
    amender.on_change = [](md_dbinfo *info, mdb_db_change *) { return write(info, "/b", "1"); };
    refuser.on_change = [](md_dbinfo *, mdb_db_change *) { return 1; };
    (void)bench.engine.check(bench.candidate({{"/a", "1"}}));
    EXPECT_THAT(calls, ElementsAre("refuser check add /a", "refuser check commit"));
}

TEST(TransactionTest, DeletionsOfModulesAreListedAndChecked)
{
    std::vector<std::string> calls;
    ScriptedModule cleaner("cleaner", {"/a"});
    ScriptedModule watcher("watcher", {"/b", "/b/*"});
    Bench bench({&cleaner, &watcher});
    bench.start_with({{"/a", "1"}, {"/b", "1"}, {"/b/c", "1"}});
    watcher.calls = &calls;
    cleaner.on_change = [](md_dbinfo *info, mdb_db_change *) {
        return commit_test::remove(info, "/b");
    };
    Candidate candidate = bench.candidate({{"/a", std::nullopt}});
    EXPECT_EQ(bench.engine.commit(candidate, {}).outcome, CommitOutcome::committed);
    EXPECT_THAT(calls, ElementsAre("watcher check delete /b", "watcher check delete /b/c",
                                   "watcher check commit", "watcher apply", "watcher notify"));
    EXPECT_EQ(bench.running(), Config());
    EXPECT_EQ(bench.store.config(), Config());
}

TEST(TransactionTest, WithdrawnChangeIsReasonToCheckTheCommitAgain)
{
    std::vector<std::string> calls;
    std::vector<std::vector<std::string>> lists;
    ScriptedModule counter("counter", {"/b"});
    ScriptedModule restorer("restorer", {"/a"});
    Bench bench({&counter, &restorer});
    counter.calls = &calls;
    counter.on_commit = [&](md_dbinfo *, const mdb_db_change_array *changes) {
        lists.push_back(described(changes));
        return 0;
    };
    restorer.on_change = [](md_dbinfo *info, mdb_db_change *) {
        return commit_test::remove(info, "/b");
    };
    Candidate candidate = bench.candidate({{"/a", "1"}, {"/b", "1"}});
    EXPECT_EQ(bench.engine.commit(candidate, {}).outcome, CommitOutcome::committed);
    EXPECT_THAT(
        calls, ElementsAre("counter check add /b", "counter check commit", "counter check commit"));
    EXPECT_THAT(lists, ElementsAre(ElementsAre("add /a", "add /b"), ElementsAre("add /a")));
    EXPECT_EQ(bench.running(), (Config{{"/a", "1"}}));
}

TEST(TransactionTest, WriteOfWhatIsThereIsNoAmendment)
{
    std::vector<std::string> calls;
    ScriptedModule module("same", {"/a"});
    Bench bench({&module});
    module.calls = &calls;
    module.on_change = [](md_dbinfo *info, mdb_db_change *) { return write(info, "/a", "1"); };
    (void)bench.engine.check(bench.candidate({{"/a", "1"}}));
    EXPECT_THAT(calls, ElementsAre("same check add /a", "same check commit"));
}

TEST(TransactionTest, ModulesMayAmendInSevenRounds)
{
    // The amendment of round 7 is checked in round 8, the last, which writes nothing.
    unsigned rounds = 0;
    ScriptedModule module("chain");
    Bench bench({&module});
    module.on_commit = [&](md_dbinfo *info, const mdb_db_change_array *) {
        return ++rounds < 8 ? lengthen(info, "/a", "/a") : 0;
    };
    Candidate candidate = bench.candidate({{"/a", "x"}});
    EXPECT_EQ(bench.engine.commit(candidate, {}).outcome, CommitOutcome::committed);
    EXPECT_EQ(rounds, 8U);
    EXPECT_EQ(bench.running(), (Config{{"/a", "xxxxxxxx"}}));
}

TEST(TransactionTest, ModuleThatKeepsAmendingIsNamed)
{
    unsigned rounds = 0;
    ScriptedModule module("chain");
    Bench bench({&module});
    module.on_commit = [&](md_dbinfo *info, const mdb_db_change_array *) {
        ++rounds;
        return lengthen(info, "/a", "/a");
    };
    Candidate candidate = bench.candidate({{"/a", "x"}});
    EXPECT_THAT(bench.engine.commit(candidate, {}).refusals,
                ElementsAre(Refusal{"/a", "chain", 14000,
                                    "module chain keeps amending the configuration: /a still "
                                    "changed in check round 8, the last"}));
    EXPECT_EQ(rounds, 8U);
    EXPECT_EQ(bench.running(), Config());
    EXPECT_EQ(bench.store.attempts, 0U);
}

TEST(TransactionTest, AllModulesThatKeepAmendingAreNamed)
{
    ScriptedModule once("once", {"/start"});
    ScriptedModule right("right", {"/l"});
    ScriptedModule left("left", {"/r", "/start"});
    ScriptedModule bystander("bystander");
    Bench bench({&once, &right, &left, &bystander});
    once.on_change = [](md_dbinfo *info, mdb_db_change *) { return write(info, "/x", "1"); };
    right.on_change = [](md_dbinfo *info, mdb_db_change *) { return lengthen(info, "/r", "/l"); };
    left.on_commit = [](md_dbinfo *info, const mdb_db_change_array *) {
        return lengthen(info, "/l", "/r");
    };
    // Both ends of the chain are in motion at once: /start makes /l, and /r is there already.
    Candidate candidate = bench.candidate({{"/start", "1"}, {"/l", "1"}, {"/r", "1"}});
    EXPECT_THAT(bench.engine.commit(candidate, {}).refusals,
                ElementsAre(Refusal{"/l", "left, right", 14000,
                                    "modules left, right keep amending the configuration: /l still "
                                    "changed in check round 8, the last"}));
}

TEST(TransactionTest, LastWithdrawnChangeNamesTheNode)
{
    // The node is there in every other round: in round 8 it goes, and nothing is new.
    unsigned rounds = 0;
    ScriptedModule module("flicker");
    Bench bench({&module});
    module.on_commit = [&](md_dbinfo *info, const mdb_db_change_array *) {
        return ++rounds % 2 == 1 ? write(info, "/b", "1") : commit_test::remove(info, "/b");
    };
    Candidate candidate = bench.candidate({{"/a", "1"}});
    EXPECT_THAT(bench.engine.commit(candidate, {}).refusals,
                ElementsAre(Refusal{"/b", "flicker", 14000,
                                    "module flicker keeps amending the configuration: /b still "
                                    "changed in check round 8, the last"}));
    EXPECT_EQ(rounds, 8U);
}

TEST(TransactionTest, AmendmentThatDoesNotFitItsTypeIsRefused)
{
    ScriptedModule module("sloppy", {"/a"});
    Bench bench({&module});
    module.on_change = [](md_dbinfo *info, mdb_db_change *) {
        // Past the host operation, which would not have let it through.
        const_cast<mdb_db *>(info->newdb)->tree.set(commit_test::parts_of("/b"), {bt_uint8, "300"});
        return 0;
    };
    Candidate candidate = bench.candidate({{"/a", "1"}});
    EXPECT_THAT(bench.engine.commit(candidate, {}).refusals,
                ElementsAre(Refusal{"/b", "sloppy", 14020,
                                    "/b: \"300\" is not a uint8: must be a decimal number from 0 "
                                    "to 255"}));
    EXPECT_EQ(bench.running(), Config());
}

TEST(TransactionTest, NoNotifyMarkOfACheckReachesNotify)
{
    ScriptedModule marker("marker", {"/a"});
    ScriptedModule amender("amender", {"/a"});
    Bench bench({&marker, &amender});
    marker.on_change = [](md_dbinfo *, mdb_db_change *change) {
        change->mdc_no_notify = true;
        return 0;
    };
    amender.on_change = [](md_dbinfo *info, mdb_db_change *) { return write(info, "/b", "1"); };
    std::vector<bool> marks;
    marker.on_notify = [&](const mdb_db_change_array *changes) {
        for (uint32 index = 0; index < 2; ++index) {
            marks.push_back(mdb_db_change_array_get_quick(changes, index)->mdc_no_notify);
        }
    };
    Candidate candidate = bench.candidate({{"/a", "1"}});
    EXPECT_EQ(bench.engine.commit(candidate, {}).outcome, CommitOutcome::committed);
    EXPECT_THAT(marks, ElementsAre(true, false));
}

TEST(RegisteredModuleTest, PatternsSelectNodesAndNoneSelectsAll)
{
    const ovhost::RegisteredModule some{
        nullptr, "some", {*ovhost::NodeScope::parse("/a/*"), *ovhost::NodeScope::parse("/b")}};
    const auto concerned = [](const ovhost::RegisteredModule &module, const std::string &name) {
        return module.concerned_by(commit_test::parts_of(name));
    };
    EXPECT_TRUE(concerned(some, "/a/x"));
    EXPECT_TRUE(concerned(some, "/b"));
    EXPECT_FALSE(concerned(some, "/a"));
    EXPECT_FALSE(concerned(some, "/a/x/y"));
    EXPECT_TRUE(concerned(ovhost::RegisteredModule{nullptr, "all", {}}, "/any"));
}

} // namespace
