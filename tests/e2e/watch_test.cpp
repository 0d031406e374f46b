// ovctl watch and mgmtd --group, with the real processes.

#include "tests/e2e/harness.h"

#include <sys/stat.h>

#include <csignal>

namespace
{

using namespace e2e;
using testing::MatchesRegex;

class Watch : public E2eTest
{
  protected:
    std::unique_ptr<Process> start_watch(const Words &more = {}) const
    {
        Words words{E2E_OVCTL, "--socket", socket_, "watch"};
        words.insert(words.end(), more.begin(), more.end());
        return std::make_unique<Process>(words);
    }

    /// Commits until the watcher, which may just have been started, has seen one; the number of the
    /// last commit.
    int commit_until_seen(const Process &watch)
    {
        int number = 1;
        EXPECT_TRUE(eventually([&] {
            ++number;
            commit("/x", "uint32", std::to_string(number));
            return watch.out().find("commit " + std::to_string(number)) != std::string::npos;
        }));
        return number;
    }
};

TEST_F(Watch, TellsOfCommitsAndOfThoseThatUndoThem)
{
    start();
    const auto watch = start_watch();
    const int number = commit_until_seen(*watch);
    ASSERT_EQ(ovctl({"rollback", std::to_string(number - 1), "--comment", "back again"}).exit_code,
              0);
    const std::string rollback = "commit " + std::to_string(number + 1) + " by ";
    ASSERT_TRUE(eventually([&] { return watch->out().find(rollback) != std::string::npos; }));
    EXPECT_EQ(stop(SIGTERM), 0);
    EXPECT_EQ(watch->wait(), 0) << "it ends with the daemon";
    EXPECT_EQ(watch->err(), "");
    EXPECT_THAT(watch->out().substr(watch->out().find(rollback)),
                MatchesRegex("commit [0-9]+ by [^ ]+ at [-0-9]+ [:0-9]+, 1 change: back "
                             "again\n[-~] /x.*\n"));
}

TEST_F(Watch, TellsOfACommitThatNobodyConfirmed)
{
    start();
    const auto watch = start_watch();
    const int number = commit_until_seen(*watch);
    ASSERT_EQ(ovctl({"set", "/y", "uint32", "1"}), done());
    ASSERT_EQ(ovctl({"commit", "--confirm", "1"}).exit_code, 0);
    const std::string undone = "commit " + std::to_string(number + 2) + " by ";
    EXPECT_TRUE(eventually([&] { return watch->out().find(undone) != std::string::npos; }))
        << watch->out();
    watch->signal(SIGINT);
    EXPECT_EQ(watch->wait(), 0);
}

TEST_F(Watch, SaysWhenTheDaemonIsKilled)
{
    start();
    const auto watch = start_watch();
    commit_until_seen(*watch);
    EXPECT_EQ(stop(SIGKILL), 128 + SIGKILL);
    EXPECT_EQ(watch->wait(), 3);
    EXPECT_EQ(watch->err(), "ovctl: mgmtd closed the connection\n");
}

TEST_F(Watch, TheSocketCanBeGivenToAGroup)
{
    std::string name = run({"/usr/bin/env", "id", "-gn"}).out;
    name.pop_back();
    start({"--group", name});
    struct stat status {
    };
    ASSERT_EQ(::stat(socket_.c_str(), &status), 0);
    EXPECT_EQ(status.st_mode, static_cast<mode_t>(S_IFSOCK | 0660));
    EXPECT_EQ(status.st_gid, ::getegid());
    EXPECT_EQ(ovctl({"discard"}), done("discarded 0 changes\n"));
}

TEST_F(Watch, AGroupMustBeThere)
{
    EXPECT_EQ(run_daemon({"--group", "no-such-group"}),
              (Outcome{1, "",
                       "mgmtd: there is no group \"no-such-group\": make it (groupadd), or choose "
                       "another --group\n"}));
    EXPECT_FALSE(exists(socket_));
}

} // namespace
