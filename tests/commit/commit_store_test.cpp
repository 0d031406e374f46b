#include "host/commit/commit_store.h"

#include "tests/commit/support.h"
#include "tests/support/scratch_dir.h"

#include <gmock/gmock.h>

using commit_test::Config;
using commit_test::config_of;
using commit_test::MemoryStore;
using commit_test::tree_of;
using ovtest::ScratchDir;

namespace
{

TEST(CommitStoreTest, ChangesBecomeStoredChangesInOrder)
{
    ovhost::Tree after;
    after.set(commit_test::parts_of("/a"), {bt_uint8, "7"});
    after.set(commit_test::parts_of("/n/1\\/2"), {bt_string, "x"});
    const std::vector<ovhost::StoredChange> stored =
        ovhost::stored_changes(ovhost::diff(tree_of({{"/gone", "1"}}), after));
    ASSERT_EQ(stored.size(), 3U);
    EXPECT_EQ(stored[0].name, "/a");
    EXPECT_EQ(stored[0].after.value().type, 1U);
    EXPECT_EQ(stored[0].after.value().text, "7");
    EXPECT_EQ(stored[1].name, "/gone");
    EXPECT_FALSE(stored[1].after);
    EXPECT_EQ(stored[2].name, "/n/1\\/2");
    EXPECT_EQ(stored[2].after.value().type, 101U);
}

TEST(CommitStoreTest, StoreHoldsAcrossTheAdapterWhatWasCommitted)
{
    const ScratchDir directory;
    const ovhost::Tree configured = tree_of({{"/a", "1"}, {"/n/1\\/2", "x"}});
    {
        ovhost::Store store = ovhost::Store::open(directory.path());
        ovhost::StoreAdapter adapter(store);
        EXPECT_EQ(adapter.commit(ovhost::stored_changes(ovhost::diff({}, configured)), {}), 1U);
    }
    ovhost::Store store = ovhost::Store::open(directory.path());
    const ovhost::Tree loaded = ovhost::load_tree(ovhost::StoreAdapter(store));
    EXPECT_TRUE(ovhost::diff(loaded, configured).empty());
}

TEST(CommitStoreTest, NameThatIsNoneStopsTheLoad)
{
    for (const std::string name : {"/a//b", "/", "a"}) {
        MemoryStore store;
        store.nodes.emplace(name, ovhost::StoredValue{bt_string, "1"});
        try {
            (void)ovhost::load_tree(store);
            FAIL() << name;
        } catch (const ovhost::StoreError &error) {
            EXPECT_EQ(error.what(), "the store holds a value under '" + name +
                                        "', which is not a node name: restore the store from a "
                                        "backup");
        }
    }
}

} // namespace
