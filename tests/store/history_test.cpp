// The history that the store keeps beside the configuration, and the wait of a commit for its
// confirmation.

#include <gtest/gtest.h>

#include "host/store/store.h"
#include "tests/store/store_testing.h"
#include "tests/support/scratch_dir.h"

namespace
{

using ovhost::CommitNote;
using ovhost::Confirmation;
using ovhost::HistoryBounds;
using ovhost::RecordedChange;
using ovhost::RecordedCommit;
using ovhost::Store;
using ovhost::StoredValue;
using ovhost::StoreError;
using ovhost::Wait;
using ovtest::gone;
using ovtest::put;
using ovtest::ScratchDir;
using Changes = std::vector<RecordedChange>;

CommitNote note_of(std::int64_t time, const std::string &comment)
{
    CommitNote note;
    note.time = time;
    note.uid = 1000;
    note.author = "anna";
    note.comment = comment;
    return note;
}

CommitNote waiting(std::int64_t time, std::uint32_t seconds)
{
    CommitNote note = note_of(time, "");
    note.confirm_within = seconds;
    return note;
}

std::vector<std::uint64_t> numbers_of(const Store &store, std::uint64_t limit = 100)
{
    std::vector<std::uint64_t> numbers;
    for (const RecordedCommit &commit : store.history(limit))
        numbers.push_back(commit.number);
    return numbers;
}

Confirmation confirmation(const Store &store, std::uint64_t number)
{
    return store.recorded(number).value().confirmation;
}

TEST(History, IsEmptyInANewStore)
{
    const ScratchDir scratch;
    const Store store = Store::open(scratch.path());
    EXPECT_TRUE(store.history(10).empty());
    EXPECT_EQ(store.oldest_recorded(), 0U);
    EXPECT_FALSE(store.recorded(0));
    EXPECT_FALSE(store.recorded(1));
    EXPECT_FALSE(store.wait());
}

TEST(History, TellsWhoMadeACommitWhenAndWhy)
{
    const ScratchDir scratch;
    {
        Store store = Store::open(scratch.path());
        CommitNote note = note_of(1700000000, "new site\nwith \xc3\xa4");
        note.rollback_to = 7;
        store.commit(std::vector{put("/a", "1"), put("/b", "2")}, note);
        store.commit(std::vector{put("/a", "2")});
    }
    const Store store = Store::open(scratch.path());
    const RecordedCommit first = store.recorded(1).value();
    EXPECT_EQ(first.number, 1U);
    EXPECT_EQ(first.time, 1700000000);
    EXPECT_EQ(first.uid, 1000U);
    EXPECT_EQ(first.author, "anna");
    EXPECT_EQ(first.comment, "new site\nwith \xc3\xa4");
    EXPECT_EQ(first.rollback_to, 7U);
    EXPECT_EQ(first.changes, 2U);
    EXPECT_EQ(first.confirmation, Confirmation::none);
    EXPECT_FALSE(first.ended_by);
    EXPECT_EQ(first.undo_refusal, "");
    const RecordedCommit second = store.recorded(2).value();
    EXPECT_FALSE(second.uid);
    EXPECT_FALSE(second.rollback_to);
    EXPECT_EQ(second.changes, 1U);
}

TEST(History, TellsWhatACommitChanged)
{
    const ScratchDir scratch;
    {
        Store store = Store::open(scratch.path());
        store.commit(std::vector{put("/b", "", 3), put("/a", "1", 3)});
        store.commit(std::vector{put("/a", "2", 10), gone("/b"), gone("/never"), put("/c", "3")});
        store.commit({});
    }
    const Store store = Store::open(scratch.path());
    EXPECT_EQ(store.changes_of(1),
              (Changes{{"/b", {}, StoredValue{3, ""}}, {"/a", {}, StoredValue{3, "1"}}}));
    EXPECT_EQ(store.changes_of(2), (Changes{{"/a", StoredValue{3, "1"}, StoredValue{10, "2"}},
                                            {"/b", StoredValue{3, ""}, {}},
                                            {"/c", {}, StoredValue{10, "3"}}}));
    EXPECT_EQ(store.recorded(2).value().changes, 3U) << "/never was not there";
    EXPECT_EQ(store.changes_of(3), Changes{});
    EXPECT_EQ(store.recorded(3).value().changes, 0U);
}

TEST(History, KeepsEveryByte)
{
    std::string all;
    for (int byte = 0; byte < 256; ++byte)
        all.push_back(static_cast<char>(byte));
    const ScratchDir scratch;
    Store store = Store::open(scratch.path());
    store.commit(std::vector{put("/" + all, all)}, note_of(0, all));
    EXPECT_EQ(store.changes_of(1), (Changes{{"/" + all, {}, StoredValue{10, all}}}));
    EXPECT_EQ(store.recorded(1).value().comment, all);
}

TEST(History, IsToldNewestFirst)
{
    const ScratchDir scratch;
    Store store = Store::open(scratch.path());
    for (int i = 0; i < 4; ++i)
        store.commit({});
    EXPECT_EQ(numbers_of(store), (std::vector<std::uint64_t>{4, 3, 2, 1}));
    EXPECT_EQ(numbers_of(store, 2), (std::vector<std::uint64_t>{4, 3}));
    EXPECT_TRUE(numbers_of(store, 0).empty());
}

TEST(History, IsGoneBackInTheLastChangeFirst)
{
    const ScratchDir scratch;
    Store store = Store::open(scratch.path());
    store.commit(std::vector{put("/a", "1")});
    store.commit(std::vector{put("/a", "2"), put("/b", "1")});
    store.commit(std::vector{gone("/a")});
    Changes back;
    store.visit_back_to(1, [&back](RecordedChange &&change) { back.push_back(change); });
    EXPECT_EQ(back, (Changes{{"/a", StoredValue{10, "2"}, {}},
                             {"/b", {}, StoredValue{10, "1"}},
                             {"/a", StoredValue{10, "1"}, StoredValue{10, "2"}}}));
}

TEST(History, KeepsTheNewestCommitsUpToItsBound)
{
    const ScratchDir scratch;
    Store store = Store::open(scratch.path(), HistoryBounds{3, 1'000'000});
    for (int i = 1; i <= 5; ++i)
        store.commit(std::vector{put("/a", std::to_string(i))});
    EXPECT_EQ(numbers_of(store), (std::vector<std::uint64_t>{5, 4, 3}));
    EXPECT_EQ(store.oldest_recorded(), 3U);
    EXPECT_FALSE(store.recorded(2));
    EXPECT_EQ(store.changes_of(2), Changes{});
    EXPECT_EQ(store.changes_of(3), (Changes{{"/a", StoredValue{10, "2"}, StoredValue{10, "3"}}}));
}

TEST(History, ASmallerBoundCountsFromTheNextCommit)
{
    const ScratchDir scratch;
    {
        Store store = Store::open(scratch.path());
        for (int i = 1; i <= 5; ++i)
            store.commit({});
    }
    Store store = Store::open(scratch.path(), HistoryBounds{1, 1'000'000});
    EXPECT_EQ(store.oldest_recorded(), 1U);
    store.commit({});
    EXPECT_EQ(numbers_of(store), (std::vector<std::uint64_t>{6}));
}

TEST(History, KeepsAsManyBytesAsItsBound)
{
    const ScratchDir scratch;
    // A commit of one new value counts the name and the value, one that replaces it both values.
    Store store = Store::open(scratch.path(), HistoryBounds{100, 100});
    store.commit(std::vector{put("/a", std::string(38, '1'))}); // 40
    store.commit(std::vector{put("/b", std::string(58, '2'))}); // 60
    EXPECT_EQ(store.oldest_recorded(), 1U) << "100 bytes are within the bound";
    store.commit(std::vector{put("/c", "")}); // 2
    EXPECT_EQ(store.oldest_recorded(), 2U);
    store.commit(std::vector{put("/a", "")}); // 40
    EXPECT_EQ(store.oldest_recorded(), 3U);
    store.commit(std::vector{put("/b", std::string(500, '2'))});
    EXPECT_EQ(numbers_of(store), (std::vector<std::uint64_t>{5})) << "the newest always stays";
}

TEST(History, BeginsWithTheNextCommitOfAnOlderStore)
{
    const ScratchDir scratch;
    // As the version without a history made it.
    ovtest::run_sql(scratch / "config.db",
                    "PRAGMA journal_mode = WAL;"
                    "CREATE TABLE meta (\n"
                    "           id INTEGER PRIMARY KEY CHECK (id = 1),\n"
                    "           commits INTEGER NOT NULL CHECK (commits >= 0)\n"
                    "       ) STRICT;\n"
                    "       INSERT INTO meta VALUES (1, 5);\n"
                    "       CREATE TABLE nodes (\n"
                    "           name TEXT PRIMARY KEY NOT NULL,\n"
                    "           type INTEGER NOT NULL CHECK (type BETWEEN 0 AND 4294967295),\n"
                    "           text TEXT NOT NULL\n"
                    "       ) WITHOUT ROWID, STRICT;"
                    "INSERT INTO nodes VALUES ('/a', 3, 'old');"
                    "PRAGMA application_id = 1870032228;"
                    "PRAGMA user_version = 1");
    {
        Store store = Store::open(scratch.path());
        EXPECT_EQ(store.commit_number(), 5U);
        EXPECT_EQ(ovtest::nodes_of(store), (ovtest::Nodes{{"/a", {3, "old"}}}));
        EXPECT_TRUE(store.history(10).empty());
        EXPECT_EQ(store.commit(std::vector{put("/a", "new")}), 6U);
    }
    const Store store = Store::open(scratch.path());
    EXPECT_EQ(numbers_of(store), (std::vector<std::uint64_t>{6}));
    EXPECT_EQ(store.changes_of(6),
              (Changes{{"/a", StoredValue{3, "old"}, StoredValue{10, "new"}}}));
}

TEST(Wait, OfACommitOutlivesTheStore)
{
    const ScratchDir scratch;
    const Wait expected{2, 1, 1700000060, 60};
    {
        Store store = Store::open(scratch.path());
        store.commit({});
        store.commit({}, waiting(1700000000, 60));
        EXPECT_EQ(store.wait(), expected);
        EXPECT_EQ(confirmation(store, 2), Confirmation::waiting);
    }
    const Store store = Store::open(scratch.path());
    EXPECT_EQ(store.wait(), expected);
    EXPECT_EQ(confirmation(store, 1), Confirmation::none);
    EXPECT_EQ(confirmation(store, 2), Confirmation::waiting);
}

TEST(Wait, EndsWithTheConfirmation)
{
    const ScratchDir scratch;
    {
        Store store = Store::open(scratch.path());
        store.commit({}, waiting(0, 60));
        store.end_wait(Confirmation::confirmed);
        EXPECT_FALSE(store.wait());
    }
    const Store store = Store::open(scratch.path());
    EXPECT_FALSE(store.wait());
    EXPECT_EQ(confirmation(store, 1), Confirmation::confirmed);
    EXPECT_FALSE(store.recorded(1).value().ended_by);
}

TEST(Wait, CanEndUndoneWithoutACommit)
{
    const ScratchDir scratch;
    Store store = Store::open(scratch.path());
    store.commit({}, waiting(0, 60));
    store.end_wait(Confirmation::undone);
    EXPECT_FALSE(store.wait());
    EXPECT_EQ(confirmation(store, 1), Confirmation::undone);
    EXPECT_FALSE(store.recorded(1).value().ended_by);
}

TEST(Wait, CanBeProlonged)
{
    const ScratchDir scratch;
    const Wait expected{3, 1, 1100, 100};
    {
        Store store = Store::open(scratch.path());
        store.commit({});
        store.prolong_wait(1000, 100);
        EXPECT_FALSE(store.wait()) << "none begins by it";
        store.commit({}, waiting(0, 60));
        store.commit({}, waiting(0, 60));
        store.prolong_wait(1000, 100);
        EXPECT_EQ(store.wait(), expected);
    }
    const Store store = Store::open(scratch.path());
    EXPECT_EQ(store.wait(), expected);
    EXPECT_EQ(confirmation(store, 3), Confirmation::waiting);
}

TEST(Wait, EndsWithAPlainCommit)
{
    const ScratchDir scratch;
    Store store = Store::open(scratch.path());
    store.commit({}, waiting(0, 60));
    store.commit({});
    EXPECT_FALSE(store.wait());
    EXPECT_EQ(confirmation(store, 1), Confirmation::confirmed);
    EXPECT_EQ(store.recorded(1).value().ended_by, 2U);
    EXPECT_EQ(confirmation(store, 2), Confirmation::none);
}

TEST(Wait, GoesOnWithAnotherCommitThatWaits)
{
    const ScratchDir scratch;
    Store store = Store::open(scratch.path());
    store.commit({});
    store.commit({}, waiting(100, 60));
    store.commit({}, waiting(120, 600));
    EXPECT_EQ(store.wait(), (Wait{3, 1, 720, 600})) << "the undo leads back before both";
    CommitNote undo;
    undo.undoes_wait = true;
    store.commit({}, undo);
    for (const std::uint64_t number : {2U, 3U}) {
        EXPECT_EQ(confirmation(store, number), Confirmation::undone);
        EXPECT_EQ(store.recorded(number).value().ended_by, 4U);
    }
    EXPECT_EQ(confirmation(store, 1), Confirmation::none);
    EXPECT_EQ(confirmation(store, 4), Confirmation::none);
}

TEST(Wait, KeepsTheHistoryThatTheUndoNeeds)
{
    const ScratchDir scratch;
    Store store = Store::open(scratch.path(), HistoryBounds{2, 1'000'000});
    store.commit({});
    for (int i = 0; i < 5; ++i)
        store.commit({}, waiting(0, 60));
    EXPECT_EQ(store.oldest_recorded(), 2U);
    store.commit({});
    EXPECT_EQ(store.oldest_recorded(), 6U);
}

TEST(Wait, RefusalsOfTheUndoAreRecorded)
{
    const ScratchDir scratch;
    {
        Store store = Store::open(scratch.path());
        store.note_undo_refusal("there is none");
        store.commit({});
        store.commit({}, waiting(0, 60));
        store.commit({}, waiting(0, 60));
        store.note_undo_refusal("first");
        store.note_undo_refusal("second");
    }
    const Store store = Store::open(scratch.path());
    EXPECT_EQ(store.recorded(1).value().undo_refusal, "");
    EXPECT_EQ(store.recorded(2).value().undo_refusal, "second");
    EXPECT_EQ(store.recorded(3).value().undo_refusal, "second");
    EXPECT_TRUE(store.wait());
}

} // namespace
