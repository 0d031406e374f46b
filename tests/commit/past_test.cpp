#include "host/commit/past.h"

#include "host/commit/commit_store.h"
#include "host/commit/patch.h"
#include "host/store/store.h"
#include "tests/commit/support.h"
#include "tests/support/scratch_dir.h"

#include <gmock/gmock.h>

#include <random>

using commit_test::Config;
using commit_test::config_of;
using commit_test::tree_of;
using ovhost::configuration_after;
using ovhost::diff;
using ovhost::oldest_known_commit;
using ovhost::Store;
using ovhost::Tree;
using ovhost::with_changes;
using ovtest::ScratchDir;

namespace
{

/// A store whose commits lead from one configuration to the next.
class PastTest : public testing::Test
{
  protected:
    void commit(const Config &next)
    {
        Tree tree = tree_of(next);
        (void)store_.commit(ovhost::stored_changes(diff(running_, tree)));
        running_ = std::move(tree);
    }

    [[nodiscard]] Config after(std::uint64_t number) const
    {
        return config_of(configuration_after(store_, running_, number));
    }

    ScratchDir directory_;
    Store store_ = Store::open(directory_.path(), {3, 1'000'000});
    Tree running_;
};

TEST(PatchTest, LeadsFromOneConfigurationToAnother)
{
    const Config configs[] = {{},
                              {{"/a", "1"}},
                              {{"/a", "2"}, {"/a/b", "1"}},
                              {{"/a/b", "1"}, {"/a/b/c", "1"}},
                              {{"/a/b/c", "2"}, {"/x", "1"}},
                              {{"/x", "1"}, {"/x/1", "1"}, {"/x/2", "1"}}};
    for (const Config &from : configs) {
        for (const Config &to : configs) {
            const Tree before = tree_of(from);
            EXPECT_EQ(config_of(with_changes(before, diff(before, tree_of(to)))), to);
            EXPECT_EQ(config_of(before), from);
        }
    }
}

TEST_F(PastTest, IsOnlyThePresentWithoutAHistory)
{
    EXPECT_EQ(oldest_known_commit(store_), 0U);
    EXPECT_EQ(after(0), Config{});
}

TEST_F(PastTest, IsKnownAfterEachRecordedCommit)
{
    commit({{"/a", "1"}, {"/a/b", "1"}});
    commit({{"/a/b", "1"}, {"/c", "1"}});
    commit({{"/a", "3"}});
    EXPECT_EQ(oldest_known_commit(store_), 1U) << "before the first there is none";
    EXPECT_EQ(after(1), (Config{{"/a", "1"}, {"/a/b", "1"}}));
    EXPECT_EQ(after(2), (Config{{"/a/b", "1"}, {"/c", "1"}}));
    EXPECT_EQ(after(3), (Config{{"/a", "3"}}));
}

TEST_F(PastTest, IsKnownBeforeTheOldestRecordedCommitToo)
{
    for (int i = 1; i <= 5; ++i) {
        commit({{"/a", std::to_string(i)}});
    }
    EXPECT_EQ(store_.oldest_recorded(), 3U);
    EXPECT_EQ(oldest_known_commit(store_), 2U);
    EXPECT_EQ(after(2), (Config{{"/a", "2"}}));
}

TEST_F(PastTest, KeepsTypes)
{
    Tree tree;
    tree.set(commit_test::parts_of("/a"), {bt_uint8, "7"});
    (void)store_.commit(ovhost::stored_changes(diff({}, tree)));
    running_ = tree;
    commit({{"/a", "7"}});
    EXPECT_TRUE(diff(configuration_after(store_, running_, 1), tree).empty());
}

TEST_F(PastTest, RefusesAHistoryOfNamesThatAreNone)
{
    const ovhost::StoredChange change{
        "/a//b",
        ovhost::StoredValue{bt_string, "1"},
    };
    (void)store_.commit(std::span(&change, 1));
    EXPECT_THROW((void)after(0), ovhost::StoreError);
}

TEST(PastPropertyTest, EveryConfigurationOfARandomHistoryComesBack)
{
    const ScratchDir directory;
    Store store = Store::open(directory.path());
    std::mt19937 random(5);
    const auto below = [&random](unsigned bound) {
        return static_cast<unsigned>(random() % bound);
    };
    std::vector<Config> states(1);
    Tree running;
    for (int round = 0; round < 60; ++round) {
        Config next = states.back();
        for (unsigned edits = below(5) + 1; edits > 0; --edits) {
            std::string name;
            for (unsigned depth = below(3) + 1; depth > 0; --depth) {
                name += "/" + std::to_string(below(3));
            }
            if (below(3) == 0) {
                next.erase(name);
            } else {
                next[name] = std::to_string(below(4));
            }
        }
        Tree tree = tree_of(next);
        (void)store.commit(ovhost::stored_changes(diff(running, tree)));
        running = std::move(tree);
        states.push_back(std::move(next));
    }
    for (std::size_t number = 1; number < states.size(); ++number) {
        EXPECT_EQ(config_of(configuration_after(store, running, number)), states[number]) << number;
    }
}

} // namespace
