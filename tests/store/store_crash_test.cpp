// kill -9 at random moments: every acknowledged commit is there whole, and none is there in part.

#include <gtest/gtest.h>
#include <signal.h>
#include <sys/wait.h>
#include <unistd.h>

#include <array>
#include <functional>
#include <random>

#include "host/store/store.h"
#include "tests/store/store_testing.h"
#include "tests/support/scratch_dir.h"

namespace
{

using ovhost::Store;
using ovtest::gone;
using ovtest::numbered;
using ovtest::put;
using ovtest::ScratchDir;

constexpr int kNodesPerCommit = 40;

// Commit k sets every node to k, adds /only/k and removes the one before.
void commit_until_killed(const std::filesystem::path &dir, int acknowledge)
{
    Store store = Store::open(dir);
    for (;;) {
        const std::uint64_t number = store.commit_number() + 1;
        auto changes = numbered(kNodesPerCommit, std::to_string(number));
        changes.push_back(put("/only/" + std::to_string(number), "1"));
        changes.push_back(gone("/only/" + std::to_string(number - 1)));
        const std::uint64_t stored = store.commit(changes);
        if (::write(acknowledge, &stored, sizeof stored) != sizeof stored)
            ::_exit(1);
    }
}

void kill_after(pid_t child, std::chrono::microseconds delay)
{
    ::usleep(static_cast<useconds_t>(delay.count()));
    ::kill(child, SIGKILL);
    int status = 0;
    ASSERT_EQ(::waitpid(child, &status, 0), child);
    ASSERT_TRUE(WIFSIGNALED(status) && WTERMSIG(status) == SIGKILL);
}

// The last number the child acknowledged, or what was known before.
std::uint64_t run_and_kill(const std::filesystem::path &dir, std::uint64_t known,
                           std::chrono::microseconds delay)
{
    std::array<int, 2> ends{};
    EXPECT_EQ(::pipe(ends.data()), 0);
    const pid_t child = ::fork();
    if (child == 0) {
        ::close(ends[0]);
        commit_until_killed(dir, ends[1]);
    }
    ::close(ends[1]);
    kill_after(child, delay);
    std::uint64_t acknowledged = known;
    std::uint64_t number = 0;
    while (::read(ends[0], &number, sizeof number) == sizeof number)
        acknowledged = number;
    ::close(ends[0]);
    return acknowledged;
}

void expect_whole_commit(const Store &store)
{
    const ovtest::Nodes nodes = ovtest::nodes_of(store);
    if (store.empty()) {
        EXPECT_EQ(nodes.size(), 0U);
        return;
    }
    const std::string number = std::to_string(store.commit_number());
    EXPECT_EQ(nodes.size(), kNodesPerCommit + 1U);
    EXPECT_EQ(nodes.count("/only/" + number), 1U);
    for (int i = 0; i < kNodesPerCommit; ++i) {
        EXPECT_EQ(nodes.at("/n/" + std::to_string(i)).second, number);
    }
}

TEST(StoreCrash, AcknowledgedCommitsSurviveKill)
{
    const ScratchDir scratch;
    std::mt19937 random(1);
    std::uniform_int_distribution<int> delay(0, 60'000);
    std::uint64_t known = 0;
    for (int round = 0; round < 40; ++round) {
        const std::uint64_t acknowledged =
            run_and_kill(scratch.path(), known, std::chrono::microseconds(delay(random)));
        const Store store = Store::open(scratch.path());
        // The one more was stored, and its child killed before the word of it went out.
        ASSERT_GE(store.commit_number(), acknowledged);
        ASSERT_LE(store.commit_number(), acknowledged + 1);
        expect_whole_commit(store);
        known = store.commit_number();
    }
    EXPECT_GT(known, 40U) << "too few commits to tell anything";
}

TEST(StoreCrash, AKillWhileTheStoreIsMadeLeavesNoHalfOne)
{
    std::mt19937 random(2);
    std::uniform_int_distribution<int> delay(0, 15'000);
    for (int round = 0; round < 40; ++round) {
        const ScratchDir scratch;
        const pid_t child = ::fork();
        if (child == 0) {
            const Store store = Store::open(scratch.path());
            ::pause();
        }
        kill_after(child, std::chrono::microseconds(delay(random)));
        const Store store = Store::open(scratch.path());
        EXPECT_TRUE(store.empty());
    }
}

} // namespace
