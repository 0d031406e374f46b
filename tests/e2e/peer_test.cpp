// jsond and the daemon: every change arrives in order, and no peer, however slow or dead, holds up
// a commit.

#include "tests/control/raw_client.h"
#include "tests/e2e/harness.h"

#include <algorithm>
#include <csignal>
#include <filesystem>

namespace
{

using namespace e2e;
using testing::ElementsAre;
using testing::HasSubstr;
using testing::IsEmpty;
using testing::Not;

/// How often a text stands in another one.
std::size_t count(const std::string &text, const std::string &part)
{
    std::size_t found = 0;
    for (std::size_t at = text.find(part); at != std::string::npos; at = text.find(part, at + 1))
        ++found;
    return found;
}

class PeerTest : public E2eTest
{
  protected:
    std::string status() const { return ovctl({"status"}).out; }

    bool is_registered() const
    {
        return status().find("peer                jsond") != std::string::npos;
    }
};

class Peer : public PeerTest
{
  protected:
    Peer() { start(); }
};

/// Commits so large that a line in the log for each change would be most of the work.
class PeerOfLargeCommit : public PeerTest
{
  protected:
    PeerOfLargeCommit() { start_quietly("warning", {"--peer-buffer", "2"}); }

    /// Commits 5,000 new nodes, /x/1 and so on, whose events make more than may wait for a peer.
    void commit_many() const
    {
        std::string text;
        for (unsigned i = 1; i <= 5000; ++i) {
            text += "/x/" + std::to_string(i) + ",string," + value_of(i) + "\n";
        }
        ASSERT_EQ(ovctl({"load", "-"}, text).exit_code, 0);
        ASSERT_EQ(ovctl({"commit"}), done("commit 2: 5000 changes\n"));
    }

    static std::string value_of(unsigned i) { return std::string(200, 'v') + std::to_string(i); }
};

TEST_F(Peer, HearsOfEachChangeInOrder)
{
    auto jsond = start_jsond();
    ASSERT_EQ(ovctl({"load", "-"}, "/x/b,uint8,1\n/x/a,ipv4addr,192.0.2.1\n"
                                   "/ov/tunneld/system/config/mode,string,router\n"
                                   "-/ov/tunneld/system/config/bonding\n")
                  .exit_code,
              0);
    ASSERT_EQ(ovctl({"commit"}), done("commit 2: 4 changes\n"));
    commit("/x/b", "uint8", "2");
    EXPECT_THAT(
        await_events(5),
        ElementsAre(event_line("delete", "/ov/tunneld/system/config/bonding", nullptr, "false"),
                    event_line("modify", "/ov/tunneld/system/config/mode", "router", "bridge"),
                    event_line("add", "/x/a", "192.0.2.1", nullptr),
                    event_line("add", "/x/b", "1", nullptr),
                    event_line("modify", "/x/b", "2", "1")));
    EXPECT_THAT(status(), HasSubstr(", 5 events sent)\n"));
    jsond->signal(SIGTERM);
    EXPECT_EQ(jsond->wait(), 0);
    EXPECT_EQ(events().size(), 5U);
}

TEST_F(Peer, HearsNothingOfWhatIsNotCommitted)
{
    auto jsond = start_jsond();
    ASSERT_EQ(ovctl({"set", "/x", "string", "1"}), done());
    ASSERT_EQ(ovctl({"check"}).exit_code, 0);
    ASSERT_EQ(ovctl({"discard"}).exit_code, 0);
    ASSERT_EQ(ovctl({"commit"}), done("nothing to commit\n"));
    commit("/y", "string", "1");
    EXPECT_THAT(await_events(1), ElementsAre(event_line("add", "/y", "1", nullptr)));
}

TEST_F(Peer, MayBeAbsent)
{
    commit("/x", "string", "1");
    const auto lines = log_lines(log());
    const auto first = std::ranges::find(lines, "notice commit -: commit 2 is in force: 1 change");
    ASSERT_EQ(lines.end() - first, 3);
    EXPECT_EQ(first[1], "notice - -: Cannot send event to jsond as jsond_session is null");
    EXPECT_EQ(first[2], "notice - -: DBC event sent: param=/x, old=(null), new=1");
}

TEST_F(Peer, ComesAndGoes)
{
    auto first = start_jsond();
    commit("/x/1", "string", "a");
    (void)await_events(1);
    first->signal(SIGKILL);
    EXPECT_EQ(first->wait(), 128 + SIGKILL);
    ASSERT_TRUE(eventually([this] { return !is_registered(); }));
    commit("/x/2", "string", "b");
    auto second = start_jsond();
    commit("/x/3", "string", "c");
    EXPECT_THAT(await_events(2), ElementsAre(event_line("add", "/x/1", "a", nullptr),
                                             event_line("add", "/x/3", "c", nullptr)));
}

TEST_F(Peer, ComesBackToADaemonThatWasRestarted)
{
    auto jsond = start_jsond({"--retry"});
    ASSERT_EQ(stop(SIGTERM), 0);
    start();
    ASSERT_TRUE(eventually([this] { return is_registered(); })) << jsond->err();
    commit("/x", "string", "1");
    EXPECT_THAT(await_events(1), ElementsAre(event_line("add", "/x", "1", nullptr)));
    EXPECT_EQ(count(jsond->err(), "registered with mgmtd"), 2U) << jsond->err();
}

TEST_F(Peer, IsReplacedByANewerOne)
{
    auto first = start_jsond({"--retry"});
    auto second = start_jsond();
    EXPECT_EQ(first->wait(), 1) << "two that both come back would never end";
    commit("/x", "string", "1");
    EXPECT_THAT(await_events(1), ElementsAre(event_line("add", "/x", "1", nullptr)));
}

TEST_F(Peer, ThatIsKilledDoesNotStopACommit)
{
    auto jsond = start_jsond();
    jsond->signal(SIGKILL);
    EXPECT_EQ(ovctl({"set", "/x", "string", "1"}), done());
    EXPECT_EQ(ovctl({"commit"}), done("commit 2: 1 change\n"));
    (void)jsond->wait();
}

TEST_F(Peer, ThatSleepsGetsAFewEventsWhenItWakes)
{
    auto jsond = start_jsond();
    jsond->signal(SIGSTOP);
    for (const char *value : {"1", "2", "3"}) {
        commit("/x", "string", value);
    }
    EXPECT_THAT(events(), IsEmpty());
    jsond->signal(SIGCONT);
    EXPECT_THAT(await_events(3), ElementsAre(event_line("add", "/x", "1", nullptr),
                                             event_line("modify", "/x", "2", "1"),
                                             event_line("modify", "/x", "3", "2")));
}

TEST_F(PeerOfLargeCommit, DoesNotHoldItUpWhenItSleeps)
{
    auto jsond = start_jsond({"--retry"});
    jsond->signal(SIGSTOP);
    commit_many();
    EXPECT_THAT(ovctl({"get", "/x/5000"}).out, HasSubstr("/x/5000 string vvv"));
    // More than may wait for it: it was let go, and comes back when it wakes.
    EXPECT_FALSE(is_registered());
    EXPECT_THAT(log(), HasSubstr("peer jsond) was disconnected: does not read: "));
    EXPECT_EQ(count(log(), "Cannot send event to jsond, err="), 1U) << "once for all that is lost";
    jsond->signal(SIGCONT);
    ASSERT_TRUE(eventually([this] { return is_registered(); })) << jsond->err();
    commit("/after", "string", "1");
    ASSERT_TRUE(eventually([this] {
        const auto lines = events();
        return !lines.empty() && lines.back() == event_line("add", "/after", "1", nullptr);
    }));
}

TEST_F(PeerOfLargeCommit, LosesNothingWhenItReads)
{
    auto jsond = start_jsond();
    commit_many();
    std::string expected;
    for (unsigned i = 1; i <= 5000; ++i) {
        const std::string name = "/x/" + std::to_string(i);
        expected += event_line("add", name, value_of(i).c_str(), nullptr) + "\n";
    }
    EXPECT_TRUE(eventually([&] { return std::filesystem::file_size(events_) >= expected.size(); }));
    EXPECT_TRUE(read_file(events_) == expected);
    EXPECT_TRUE(is_registered());
    EXPECT_THAT(log(), Not(HasSubstr("disconnected: ")));
}

} // namespace
