#include "host/store/store.h"

#include <gtest/gtest.h>
#include <sys/stat.h>

#include <type_traits>

#include "tests/store/store_testing.h"
#include "tests/support/scratch_dir.h"

namespace
{

using ovhost::Store;
using ovhost::StoredChange;
using ovhost::StoredNode;
using ovtest::gone;
using ovtest::Nodes;
using ovtest::nodes_of;
using ovtest::put;
using ovtest::ScratchDir;

static_assert(std::is_nothrow_move_constructible_v<Store>);
static_assert(std::is_nothrow_move_assignable_v<Store>);
static_assert(!std::is_copy_constructible_v<Store>);

void commit(Store &store, const std::vector<StoredChange> &changes)
{
    store.commit(changes);
}

TEST(Store, ANewOneIsEmpty)
{
    const ScratchDir scratch;
    const Store store = Store::open(scratch / "state");
    EXPECT_TRUE(store.empty());
    EXPECT_EQ(store.commit_number(), 0U);
    EXPECT_EQ(nodes_of(store), Nodes{});
}

TEST(Store, ItsFilesAreForItsUserOnly)
{
    const ScratchDir scratch;
    Store store = Store::open(scratch / "state");
    commit(store, {put("/a", "1")});
    std::size_t files = 0;
    for (const auto &entry : std::filesystem::directory_iterator(scratch / "state")) {
        struct stat about {
        };
        ASSERT_EQ(::stat(entry.path().c_str(), &about), 0);
        EXPECT_EQ(about.st_mode & 07777U, 0600U) << entry.path();
        ++files;
    }
    EXPECT_EQ(files, 3U); // config.db, config.db-wal, lock
}

TEST(Store, FilesThatWerePutBackOpenAreClosed)
{
    const ScratchDir scratch;
    {
        Store store = Store::open(scratch.path());
        commit(store, {put("/a", "1")});
    }
    ovtest::write_file(scratch / "config.db-wal", "");
    for (const char *file : {"config.db", "config.db-wal"})
        ASSERT_EQ(::chmod((scratch / file).c_str(), 0644), 0);
    Store store = Store::open(scratch.path());
    commit(store, {put("/a", "2")});
    for (const char *file : {"config.db", "config.db-wal"}) {
        struct stat about {
        };
        ASSERT_EQ(::stat((scratch / file).c_str(), &about), 0);
        EXPECT_EQ(about.st_mode & 07777U, 0600U) << file;
    }
}

TEST(Store, AnEmptyOneIsStillEmptyWhenOpenedAgain)
{
    const ScratchDir scratch;
    {
        const Store store = Store::open(scratch.path());
    }
    const Store store = Store::open(scratch.path());
    EXPECT_TRUE(store.empty());
}

TEST(Store, KeepsWhatWasCommitted)
{
    const ScratchDir scratch;
    {
        Store store = Store::open(scratch.path());
        commit(store, {put("/a", "1", 3), put("/b/c\\/d", "two", 10), put("/e", "", 4294967295)});
    }
    const Store store = Store::open(scratch.path());
    EXPECT_FALSE(store.empty());
    EXPECT_EQ(store.commit_number(), 1U);
    EXPECT_EQ(nodes_of(store),
              (Nodes{{"/a", {3, "1"}}, {"/b/c\\/d", {10, "two"}}, {"/e", {4294967295, ""}}}));
}

TEST(Store, AChangeReplacesTypeAndText)
{
    const ScratchDir scratch;
    Store store = Store::open(scratch.path());
    commit(store, {put("/a", "1", 3), put("/b", "2", 3)});
    commit(store, {put("/a", "one", 10)});
    EXPECT_EQ(nodes_of(store), (Nodes{{"/a", {10, "one"}}, {"/b", {3, "2"}}}));
}

TEST(Store, ARemovedNodeIsGone)
{
    const ScratchDir scratch;
    {
        Store store = Store::open(scratch.path());
        commit(store, {put("/a", "1"), put("/b", "2")});
        commit(store, {gone("/a"), gone("/never/there")});
    }
    const Store store = Store::open(scratch.path());
    EXPECT_EQ(nodes_of(store), (Nodes{{"/b", {10, "2"}}}));
    EXPECT_EQ(store.commit_number(), 2U);
}

TEST(Store, AStoreWhoseNodesWereAllRemovedIsNotEmpty)
{
    const ScratchDir scratch;
    Store store = Store::open(scratch.path());
    commit(store, {put("/a", "1")});
    commit(store, {gone("/a")});
    EXPECT_EQ(nodes_of(store), Nodes{});
    EXPECT_FALSE(store.empty());
}

TEST(Store, ChangesCountInTheirOrder)
{
    const ScratchDir scratch;
    Store store = Store::open(scratch.path());
    commit(store, {put("/a", "1"), put("/a", "2"), put("/b", "1"), gone("/b"), gone("/c"),
                   put("/c", "3")});
    EXPECT_EQ(nodes_of(store), (Nodes{{"/a", {10, "2"}}, {"/c", {10, "3"}}}));
}

TEST(Store, EachCommitHasTheNextNumber)
{
    const ScratchDir scratch;
    {
        Store store = Store::open(scratch.path());
        EXPECT_EQ(store.commit({}), 1U);
        EXPECT_EQ(store.commit({}), 2U);
        EXPECT_EQ(store.commit_number(), 2U);
    }
    Store store = Store::open(scratch.path());
    EXPECT_EQ(store.commit({}), 3U);
}

TEST(Store, HandsOutNodesInTheByteOrderOfTheirNames)
{
    const ScratchDir scratch;
    Store store = Store::open(scratch.path());
    commit(store, {put("/b", ""), put("/a/b", ""), put("/\xc3\xa4", ""), put("/B", ""),
                   put("/a", ""), put("/a b", "")});
    std::vector<std::string> names;
    store.load([&names](StoredNode &&node) { names.push_back(node.name); });
    EXPECT_EQ(names, (std::vector<std::string>{"/B", "/a", "/a b", "/a/b", "/b", "/\xc3\xa4"}));
}

TEST(Store, KeepsEveryByte)
{
    std::string all;
    for (int byte = 0; byte < 256; ++byte)
        all.push_back(static_cast<char>(byte));
    const ScratchDir scratch;
    {
        Store store = Store::open(scratch.path());
        commit(store, {put("/" + all, all), put(std::string("/x\0a", 4), "1"),
                       put(std::string("/x\0b", 4), "2"), put("/x", "3")});
    }
    const Store store = Store::open(scratch.path());
    EXPECT_EQ(nodes_of(store), (Nodes{{"/" + all, {10, all}},
                                      {std::string("/x\0a", 4), {10, "1"}},
                                      {std::string("/x\0b", 4), {10, "2"}},
                                      {"/x", {10, "3"}}}));
}

TEST(Store, KeepsLongTexts)
{
    const std::string text(3'000'000, 'x');
    const ScratchDir scratch;
    {
        Store store = Store::open(scratch.path());
        commit(store, {put("/a", text), put("/" + text, "1")});
    }
    EXPECT_EQ(nodes_of(Store::open(scratch.path())),
              (Nodes{{"/a", {10, text}}, {"/" + text, {10, "1"}}}));
}

TEST(Store, AnExceptionOfTheReaderComesThroughAndTheStoreGoesOn)
{
    const ScratchDir scratch;
    Store store = Store::open(scratch.path());
    commit(store, {put("/a", "1"), put("/b", "2")});
    EXPECT_THROW(store.load([](StoredNode &&) { throw 7; }), int);
    commit(store, {gone("/a")});
    EXPECT_EQ(nodes_of(store), (Nodes{{"/b", {10, "2"}}}));
}

TEST(Store, CanBeMoved)
{
    const ScratchDir scratch;
    Store first = Store::open(scratch / "first");
    Store second = Store::open(scratch / "second");
    commit(first, {put("/a", "1")});
    Store moved(std::move(first));
    commit(moved, {put("/b", "2")});
    second = std::move(moved);
    EXPECT_EQ(nodes_of(second), (Nodes{{"/a", {10, "1"}}, {"/b", {10, "2"}}}));
    EXPECT_EQ(second.commit_number(), 2U);
}

TEST(Store, OpensThroughARelativePath)
{
    const ScratchDir scratch;
    const auto before = std::filesystem::current_path();
    std::filesystem::current_path(scratch.path());
    {
        const Store store = Store::open("state");
    }
    std::filesystem::current_path(before);
    EXPECT_TRUE(std::filesystem::exists(scratch / "state/config.db"));
}

} // namespace
