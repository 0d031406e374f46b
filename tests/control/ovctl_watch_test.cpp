// ovctl watch: host/ovctl/follow.h.

#include "tests/control/raw_client.h"
#include "tests/control/test_server.h"
#include "tests/support/eventually.h"
#include "tests/support/process.h"
#include "tests/support/pty.h"

#include <gtest/gtest.h>

#include <csignal>
#include <optional>
#include <string>
#include <vector>

namespace ovhost
{
namespace
{

using nlohmann::json;
using ovtest::eventually;
using ovtest::Process;
using ovtest::PtyProcess;
using test::TestServer;

json commit_event(int number, json changes)
{
    return {{"kind", "commit"},
            {"commit",
             {{"number", number},
              {"time", 0},
              {"author", {{"uid", 0}, {"user", "alice"}}},
              {"comment", "new site"},
              {"changes", 1},
              {"rollback_to", nullptr},
              {"confirmation", nullptr}}},
            {"changes", std::move(changes)}};
}

json one_change()
{
    return json::array({{{"change", "delete"},
                         {"name", "/a\x1b"},
                         {"old", {{"type", "bool"}, {"value", "true"}}},
                         {"new", nullptr}}});
}

class OvctlWatchTest : public testing::Test
{
  protected:
    std::vector<std::string> command(const std::vector<std::string> &more = {}) const
    {
        std::vector<std::string> words{OVMD_OVCTL, "--socket", server_.path(), "watch"};
        words.insert(words.end(), more.begin(), more.end());
        return words;
    }

    [[nodiscard]] bool wait_for_watcher()
    {
        return eventually([&] {
            return server_.in_loop([](ControlServer &server) { return server.has_watchers(); });
        });
    }

    void report(const json &event)
    {
        static_cast<void>(server_.in_loop([&](ControlServer &server) {
            server.report(event);
            return true;
        }));
    }

    TestServer server_;
};

TEST_F(OvctlWatchTest, PrintsEachCommitAsItComes)
{
    Process watch(command(), {}, {"TZ=UTC"});
    ASSERT_TRUE(wait_for_watcher());
    report(commit_event(7, one_change()));
    const std::string first = "commit 7 by alice at 1970-01-01 00:00:00, 1 change: new site\n"
                              "- /a\\x1b bool true\n";
    EXPECT_TRUE(eventually([&] { return watch.out() == first; })) << watch.out();
    report(commit_event(8, nullptr));
    report({{"kind", "gap"}, {"left_out", 3}});
    report({{"kind", "of a later version"}});
    report(commit_event(12, json::array()));
    const std::string all =
        first + "commit 8 by alice at 1970-01-01 00:00:00, 1 change: new site\n"
                "too many changes to show here: run ovctl show commit 8\n"
                "missed 3 commits, which came faster than they were read: run ovctl history\n"
                "commit 12 by alice at 1970-01-01 00:00:00, 1 change: new site\n";
    EXPECT_TRUE(eventually([&] { return watch.out() == all; })) << watch.out();
    watch.signal(SIGINT);
    EXPECT_EQ(watch.wait(), 0);
    EXPECT_EQ(watch.err(), "");
    EXPECT_EQ(watch.out(), all);
}

TEST_F(OvctlWatchTest, PrintsEventsAsLinesOfJsonForPrograms)
{
    Process watch(command({"--json"}));
    ASSERT_TRUE(wait_for_watcher());
    report({{"kind", "gap"}, {"left_out", 3}});
    report(commit_event(7, nullptr));
    const std::string lines = R"({"kind":"gap","left_out":3})"
                              "\n" +
                              commit_event(7, nullptr).dump() + "\n";
    EXPECT_TRUE(eventually([&] { return watch.out() == lines; })) << watch.out();
    watch.signal(SIGTERM);
    EXPECT_EQ(watch.wait(), 0);
}

TEST_F(OvctlWatchTest, EndsWithTheDaemon)
{
    Process watch(command());
    ASSERT_TRUE(wait_for_watcher());
    report(commit_event(7, nullptr));
    server_.stop();
    EXPECT_EQ(watch.wait(), 0);
    EXPECT_EQ(watch.err(), "");
    EXPECT_TRUE(watch.out().starts_with("commit 7 by alice")) << watch.out();
}

TEST_F(OvctlWatchTest, ADaemonThatIsNotThereIsAnError)
{
    server_.stop();
    Process watch(command());
    EXPECT_EQ(watch.wait(), 3);
    EXPECT_EQ(watch.out(), "");
}

TEST_F(OvctlWatchTest, CanBeInterruptedWhileItsReaderDoesNotRead)
{
    PtyProcess watch(command(), 80);
    ASSERT_TRUE(wait_for_watcher());
    for (int i = 0; i < 500; ++i)
        report(commit_event(i, one_change()));
    ASSERT_TRUE(watch.fill_up()) << "the terminal holds less than that";
    watch.signal(SIGINT);
    int exit = -1;
    ASSERT_TRUE(watch.wait_unread(exit)) << "it is stuck";
    EXPECT_EQ(exit, 0);
}

TEST(OvctlWatchWithoutGoodbyeTest, AConnectionThatBreaksIsAnError)
{
    // A watcher that does not read is disconnected without a word.
    TestServer server({}, {.stall_timeout = std::chrono::milliseconds(100)});
    Process watch({OVMD_OVCTL, "--socket", server.path(), "watch"});
    ASSERT_TRUE(eventually(
        [&] { return server.in_loop([](ControlServer &inner) { return inner.has_watchers(); }); }));
    watch.signal(SIGSTOP);
    static_cast<void>(server.in_loop([&](ControlServer &inner) {
        inner.report({{"kind", "x"}, {"padding", std::string(1UL << 20, 'x')}});
        return true;
    }));
    ASSERT_TRUE(eventually([&] { return server.client_count() == 0; }));
    watch.signal(SIGCONT);
    EXPECT_EQ(watch.wait(), 3);
    EXPECT_EQ(watch.err(), "ovctl: mgmtd closed the connection\n");
}

} // namespace
} // namespace ovhost
