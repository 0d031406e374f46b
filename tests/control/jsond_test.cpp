// The event peer: host/jsond/.

#include "host/jsond/backoff.h"
#include "host/jsond/event_writer.h"
#include "tests/control/test_server.h"
#include "tests/support/eventually.h"
#include "tests/support/files.h"
#include "tests/support/process.h"
#include "tests/support/scratch_dir.h"

#include <fcntl.h>
#include <gtest/gtest.h>
#include <sys/ioctl.h>
#include <sys/stat.h>

#include <csignal>
#include <string>
#include <thread>
#include <utility>
#include <vector>

namespace ovhost
{
namespace
{

using nlohmann::json;
using ovtest::eventually;
using ovtest::Process;
using ovtest::read_file;
using ovtest::ScratchDir;
using std::chrono::milliseconds;
using test::TestServer;

class JsondTest : public testing::Test
{
  protected:
    std::vector<std::string> command(std::vector<std::string> more = {}) const
    {
        std::vector<std::string> words{OVMD_JSOND, "--socket", path_};
        words.insert(words.end(), more.begin(), more.end());
        return words;
    }

    [[nodiscard]] bool wait_for_peer(TestServer &server) const
    {
        return eventually([&] { return server.peers().size() == 1; });
    }

    ScratchDir dir_;
    std::string path_ = dir_.path("socket");
};

TEST_F(JsondTest, WritesEachEventAsALine)
{
    TestServer server({}, {}, path_);
    Process jsond(command());
    ASSERT_TRUE(wait_for_peer(server));
    ASSERT_TRUE(
        server.send_to_peer("jsond", {{"name", "/e"}, {"bindings", json::array({1, "a\nb"})}}));
    ASSERT_TRUE(server.send_to_peer("jsond", "second"));
    const std::string expected = "{\"bindings\":[1,\"a\\nb\"],\"name\":\"/e\"}\n\"second\"\n";
    // While it runs: each line is flushed.
    EXPECT_TRUE(eventually([&] { return jsond.out() == expected; })) << jsond.out();
    jsond.signal(SIGTERM);
    EXPECT_EQ(jsond.wait(), 0);
    EXPECT_EQ(jsond.out(), expected);
    EXPECT_EQ(jsond.err(), "jsond: registered with mgmtd at " + path_ + "\n");
}

TEST_F(JsondTest, AppendsToItsFile)
{
    const std::string file = dir_.path("events");
    ovtest::write_file(file, "\"old\"\n");
    TestServer server({}, {}, path_);
    Process jsond(command({"--output", file}));
    ASSERT_TRUE(wait_for_peer(server));
    ASSERT_TRUE(server.send_to_peer("jsond", 1));
    EXPECT_TRUE(eventually([&] { return read_file(file) == "\"old\"\n1\n"; }));
    jsond.signal(SIGINT);
    EXPECT_EQ(jsond.wait(), 0);
    EXPECT_EQ(jsond.out(), "");
}

TEST_F(JsondTest, WithoutADaemonItEndsWithAReason)
{
    Process jsond(command());
    EXPECT_EQ(jsond.wait(), 1);
    EXPECT_EQ(jsond.err(), "jsond: cannot connect to " + path_ +
                               ": No such file or directory; is mgmtd running, and is this its "
                               "--socket? (--retry keeps trying)\n");
}

TEST_F(JsondTest, AClosedStandardOutputIsAnError)
{
    const auto closed = [this](const std::vector<std::string> &more) {
        std::vector<std::string> words{"/bin/sh", "-c", R"(exec "$0" "$@" >&-)"};
        for (const std::string &word : command(more))
            words.push_back(word);
        return words;
    };
    Process jsond(closed({}));
    EXPECT_EQ(jsond.wait(), 2);
    EXPECT_EQ(jsond.err(), "jsond: standard output is closed: give a file with --output\n");

    TestServer server({}, {}, path_);
    Process with_file(closed({"--output", dir_.path("events")}));
    ASSERT_TRUE(wait_for_peer(server));
    ASSERT_TRUE(server.send_to_peer("jsond", 1));
    EXPECT_TRUE(eventually([&] { return read_file(dir_.path("events")) == "1\n"; }));
}

TEST_F(JsondTest, TellsItsVersionAndRefusesEmptyPaths)
{
    Process version({OVMD_JSOND, "--version"});
    EXPECT_EQ(version.wait(), 0);
    EXPECT_EQ(version.out(), "1.0.0\n");
    for (const char *flag : {"--socket", "--output"}) {
        Process jsond({OVMD_JSOND, flag, ""});
        EXPECT_EQ(jsond.wait(), 2);
        EXPECT_EQ(jsond.err(), std::string(flag) +
                                   ": must not be empty\nRun with --help for more information.\n");
    }
}

TEST_F(JsondTest, WhenTheDaemonGoesAwayItSaysSo)
{
    TestServer server({}, {}, path_);
    Process jsond(command());
    ASSERT_TRUE(wait_for_peer(server));
    server.stop();
    EXPECT_EQ(jsond.wait(), 1);
    EXPECT_EQ(jsond.err(), "jsond: registered with mgmtd at " + path_ +
                               "\njsond: mgmtd closed the connection: mgmtd is stopping (--retry "
                               "keeps trying)\n");
}

TEST_F(JsondTest, WithRetryItWaitsForTheDaemonAndComesBack)
{
    Process jsond(command({"--retry"}));
    const std::string away = "jsond: cannot connect to " + path_ +
                             ": No such file or directory; is mgmtd running, and is this its "
                             "--socket?\n";
    const std::string here = "jsond: registered with mgmtd at " + path_ + "\n";
    const std::string stopped = "jsond: mgmtd closed the connection: mgmtd is stopping\n";
    ASSERT_TRUE(eventually([&] { return jsond.err() == away; })) << jsond.err();
    // Being away is said once however many tries failed, and again the next time.
    std::string said = away;
    for (int round = 0; round < 2; ++round) {
        TestServer server({}, {}, path_);
        ASSERT_TRUE(wait_for_peer(server));
        ASSERT_TRUE(server.send_to_peer("jsond", round));
        server.stop();
        said += here + stopped + away;
        ASSERT_TRUE(eventually([&] { return jsond.err() == said; })) << jsond.err();
    }
    jsond.signal(SIGTERM);
    EXPECT_EQ(jsond.wait(), 0);
    EXPECT_EQ(jsond.out(), "0\n1\n");
    EXPECT_EQ(jsond.err(), said);
}

TEST_F(JsondTest, ASecondOneTakesOverAndTheFirstDoesNotComeBack)
{
    TestServer server({}, {}, path_);
    Process first(command({"--retry"}));
    ASSERT_TRUE(wait_for_peer(server));
    Process second(command({"--retry"}));
    EXPECT_EQ(first.wait(), 1);
    EXPECT_EQ(first.err(), "jsond: registered with mgmtd at " + path_ +
                               "\njsond: mgmtd closed the connection: another peer registered as "
                               "jsond\n");
    ASSERT_TRUE(server.send_to_peer("jsond", 1));
    EXPECT_TRUE(eventually([&] { return second.out() == "1\n"; }));
}

TEST_F(JsondTest, ADaemonThatRefusesItIsNamed)
{
    TestServer server({}, {.max_clients = 0}, path_);
    Process jsond(command());
    EXPECT_EQ(jsond.wait(), 1);
    EXPECT_EQ(jsond.err(),
              "jsond: mgmtd does not take jsond as a peer: 0 clients are connected, no "
              "more are taken: try again later (--retry keeps trying)\n");
}

TEST_F(JsondTest, AFileThatCannotBeWrittenIsNamed)
{
    Process no_folder(command({"--output", dir_.path("missing/events")}));
    EXPECT_EQ(no_folder.wait(), 1);
    EXPECT_EQ(no_folder.err(), "jsond: cannot write to " + dir_.path("missing/events") +
                                   ": No such file or directory\n");

    TestServer server({}, {}, path_);
    Process full(command({"--output", "/dev/full"}));
    ASSERT_TRUE(wait_for_peer(server));
    ASSERT_TRUE(server.send_to_peer("jsond", 1));
    EXPECT_EQ(full.wait(), 1);
    EXPECT_TRUE(full.err().ends_with("jsond: cannot write to /dev/full: No space left on device\n"))
        << full.err();
}

TEST_F(JsondTest, AWrongCommandLineIsAUsageError)
{
    Process jsond(command({"--frobnicate"}));
    EXPECT_EQ(jsond.wait(), 2);
    Process help(command({"--help"}));
    EXPECT_EQ(help.wait(), 0);
    EXPECT_NE(help.out().find("--retry"), std::string::npos);
}

TEST_F(JsondTest, ASignalEndsItWhileNobodyReadsItsOutput)
{
    const std::string fifo = dir_.path("fifo");
    ASSERT_EQ(::mkfifo(fifo.c_str(), 0600), 0);
    const UniqueFd reader(::open(fifo.c_str(), O_RDONLY | O_NONBLOCK | O_CLOEXEC));
    ASSERT_TRUE(reader);
    TestServer server({}, {}, path_);
    Process jsond(command({"--output", fifo}));
    ASSERT_TRUE(wait_for_peer(server));
    const std::string text(1000, 'e');
    for (int i = 0; i < 200; ++i)
        ASSERT_TRUE(server.send_to_peer("jsond", text));
    int waiting = 0;
    ASSERT_TRUE(eventually([&] {
        const int before = std::exchange(waiting, 0);
        ::ioctl(reader.get(), FIONREAD, &waiting);
        std::this_thread::sleep_for(milliseconds(50));
        return waiting > 60000 && waiting == before;
    })) << "the pipe never filled up";
    jsond.signal(SIGTERM);
    EXPECT_EQ(jsond.wait(), 0);
}

TEST(BackoffTest, GrowsToItsLimitAndStartsAgain)
{
    Backoff backoff(milliseconds(100), milliseconds(500));
    for (const int expected : {100, 200, 400, 500, 500})
        EXPECT_EQ(backoff.next(), milliseconds(expected));
    backoff.reset();
    EXPECT_EQ(backoff.next(), milliseconds(100));
}

} // namespace
} // namespace ovhost
