// Named peers and the events sent to them: host/control/server.h.

#include "host/control/server.h"

#include "tests/control/raw_client.h"
#include "tests/control/test_server.h"
#include "tests/support/eventually.h"

#include <gtest/gtest.h>
#include <unistd.h>

#include <string>

namespace ovhost
{
namespace
{

using nlohmann::json;
using ovtest::eventually;
using test::RawClient;
using test::TestServer;

constexpr const char *hello = "{\"id\":1,\"command\":\"hello\",\"peer\":\"jsond\"}\n";
constexpr const char *welcome = R"({"id":1,"ok":true,"result":{"peer":"jsond","protocol":1}})";

void register_as_jsond(RawClient &client)
{
    client.send(hello);
    ASSERT_EQ(client.line(), welcome);
}

TEST(PeerTest, EventsArriveInOrder)
{
    TestServer server;
    RawClient peer(server.path());
    register_as_jsond(peer);
    EXPECT_TRUE(server.send_to_peer("jsond", {{"name", "/e"}, {"bindings", json::array()}}));
    EXPECT_TRUE(server.send_to_peer("jsond", 2));
    EXPECT_EQ(peer.line(), R"({"event":{"bindings":[],"name":"/e"}})");
    EXPECT_EQ(peer.line(), R"({"event":2})");
}

TEST(PeerTest, AnAbsentPeerGetsNothing)
{
    TestServer server;
    EXPECT_FALSE(server.send_to_peer("jsond", 1));
    EXPECT_TRUE(server.peers().empty());
}

TEST(PeerTest, APeerIsListedWhileItIsThere)
{
    TestServer server;
    {
        RawClient peer(server.path());
        register_as_jsond(peer);
        ASSERT_TRUE(server.send_to_peer("jsond", 1));
        const auto peers = server.peers();
        ASSERT_EQ(peers.size(), 1U);
        EXPECT_EQ(peers[0].name, "jsond");
        EXPECT_EQ(peers[0].pid, ::getpid());
        EXPECT_EQ(peers[0].uid, ::getuid());
        EXPECT_EQ(peers[0].events_sent, 1U);
        EXPECT_EQ(peers[0].bytes_waiting, 0U);
        EXPECT_TRUE(server.in_loop([](ControlServer &s) { return s.has_peer("jsond"); }));
    }
    EXPECT_TRUE(eventually([&] { return server.peers().empty(); }));
    EXPECT_FALSE(server.send_to_peer("jsond", 2));
    EXPECT_EQ(server.logged("peer jsond is gone").size(), 1U);
}

TEST(PeerTest, APeerComesAndGoesAndComesAgain)
{
    TestServer server;
    for (int round = 0; round < 10; ++round) {
        RawClient peer(server.path());
        register_as_jsond(peer);
        ASSERT_TRUE(server.send_to_peer("jsond", round));
        ASSERT_EQ(peer.line(), "{\"event\":" + std::to_string(round) + "}");
    }
    EXPECT_TRUE(eventually([&] { return server.client_count() == 0; }));
}

TEST(PeerTest, TheNewestOfANameWins)
{
    TestServer server;
    RawClient old(server.path());
    register_as_jsond(old);
    RawClient fresh(server.path());
    register_as_jsond(fresh);
    EXPECT_EQ(old.line(),
              R"({"goodbye":{"code":"replaced","message":"another peer registered as jsond"}})");
    EXPECT_EQ(old.line(), "<end>");
    EXPECT_TRUE(server.send_to_peer("jsond", 1));
    EXPECT_EQ(fresh.line(), R"({"event":1})");
    EXPECT_EQ(server.peers().size(), 1U);
}

TEST(PeerTest, PeersOfDifferentNamesLiveSideBySide)
{
    TestServer server;
    RawClient jsond(server.path());
    register_as_jsond(jsond);
    RawClient other(server.path());
    other.send("{\"id\":1,\"command\":\"hello\",\"peer\":\"other\"}\n");
    ASSERT_EQ(other.line(), R"({"id":1,"ok":true,"result":{"peer":"other","protocol":1}})");
    EXPECT_TRUE(server.send_to_peer("other", 5));
    EXPECT_TRUE(server.send_to_peer("jsond", 6));
    EXPECT_EQ(other.line(), R"({"event":5})");
    EXPECT_EQ(jsond.line(), R"({"event":6})");
}

TEST(PeerTest, AConnectionHasOneName)
{
    TestServer server;
    RawClient peer(server.path());
    register_as_jsond(peer);
    register_as_jsond(peer);
    peer.send("{\"id\":2,\"command\":\"hello\",\"peer\":\"other\"}\n");
    EXPECT_EQ(peer.line(),
              R"({"error":{"code":"bad-request","details":[],"message":"this connection is )"
              R"(registered as peer jsond already: use another connection"},"id":2,"ok":false})");
    EXPECT_TRUE(server.send_to_peer("jsond", 1));
    EXPECT_EQ(peer.line(), R"({"event":1})");
}

TEST(PeerTest, NamesAreChecked)
{
    TestServer server;
    RawClient peer(server.path());
    const std::string too_long(65, 'x');
    for (const std::string &name :
         {std::string(), std::string("a b"), std::string("a/b"), too_long}) {
        peer.send(json{{"command", "hello"}, {"peer", name}}.dump() + "\n");
        EXPECT_NE(peer.line().find("must be 1 to 64 letters"), std::string::npos) << name;
    }
    peer.send("{\"command\":\"hello\"}\n");
    EXPECT_NE(peer.line().find(R"(command \"hello\": \"peer\" must be given, as a string)"),
              std::string::npos);
    EXPECT_TRUE(server.peers().empty());
}

TEST(PeerTest, APeerThatDoesNotReadIsLetGoAndBlocksNobody)
{
    TestServer server({}, {.max_events_waiting = 1000000});
    RawClient peer(server.path());
    register_as_jsond(peer);
    RawClient other(server.path());
    const std::string text(1000, 'e');
    int sent = 0;
    while (sent < 100000 && server.send_to_peer("jsond", text))
        ++sent;
    EXPECT_GT(sent, 900) << "a megabyte may wait";
    EXPECT_LT(sent, 5000) << "no more than that and what the socket takes may";
    EXPECT_TRUE(server.peers().empty());
    const auto lines = server.logged("does not read");
    ASSERT_EQ(lines.size(), 1U);
    EXPECT_NE(lines[0].find("peer jsond) was disconnected: does not read: "), std::string::npos)
        << lines[0];
    EXPECT_NE(lines[0].find(" bytes wait for it, 1000000 may"), std::string::npos) << lines[0];

    other.send("{\"id\":1,\"command\":\"echo\",\"text\":\"x\"}\n");
    EXPECT_EQ(other.line(), R"({"id":1,"ok":true,"result":{"text":"x"}})");
    RawClient successor(server.path());
    register_as_jsond(successor);
    EXPECT_TRUE(server.send_to_peer("jsond", 1));
    EXPECT_EQ(successor.line(), R"({"event":1})");
}

TEST(PeerTest, APeerThatReadsGetsAnyNumberOfEvents)
{
    TestServer server;
    RawClient peer(server.path());
    register_as_jsond(peer);
    constexpr int events = 20000;
    for (int round = 0; round < 5; ++round) {
        // All from one task, as a commit with many changes sends them.
        const int sent = server.in_loop([](ControlServer &s) {
            int taken = 0;
            for (int i = 0; i < events; ++i)
                taken += s.send_to_peer("jsond", std::string(100, 'e')) ? 1 : 0;
            return taken;
        });
        ASSERT_EQ(sent, events);
        for (int i = 0; i < events; ++i)
            ASSERT_EQ(peer.line(), "{\"event\":\"" + std::string(100, 'e') + "\"}");
    }
}

TEST(PeerTest, OneEventMayBeLargerThanWhatMayWait)
{
    TestServer server({}, {.max_events_waiting = 1000});
    RawClient peer(server.path());
    register_as_jsond(peer);
    const std::string large(2000000, 'e');
    EXPECT_TRUE(server.send_to_peer("jsond", large));
    EXPECT_EQ(peer.line(), "{\"event\":\"" + large + "\"}");
}

TEST(PeerTest, AHandlerMaySendToTheVeryPeerThatAsks)
{
    TestServer *running = nullptr;
    TestServer server([&](const json &, const ClientInfo &client) -> json {
        return running->server().send_to_peer(client.peer, "during");
    });
    running = &server;
    RawClient peer(server.path());
    register_as_jsond(peer);
    peer.send("{\"id\":2,\"command\":\"commit\"}\n");
    EXPECT_EQ(peer.line(), R"({"event":"during"})");
    EXPECT_EQ(peer.line(), R"({"id":2,"ok":true,"result":true})");
}

TEST(PeerTest, APeerLetGoDuringItsOwnRequestDoesNoHarm)
{
    TestServer *running = nullptr;
    TestServer server(
        [&](const json &, const ClientInfo &) -> json {
            while (running->server().send_to_peer("jsond", std::string(10000, 'e')))
                continue;
            return 1;
        },
        {.max_events_waiting = 50000});
    running = &server;
    RawClient peer(server.path());
    register_as_jsond(peer);
    peer.send("{\"id\":2,\"command\":\"commit\"}\n{\"id\":3,\"command\":\"commit\"}\n");
    EXPECT_TRUE(eventually([&] { return server.client_count() == 0; }));
    RawClient successor(server.path());
    register_as_jsond(successor);
}

TEST(PeerTest, PeersAreToldThatTheServerStops)
{
    TestServer server;
    RawClient peer(server.path());
    register_as_jsond(peer);
    ASSERT_TRUE(server.send_to_peer("jsond", 1));
    server.stop();
    EXPECT_EQ(peer.line(), R"({"event":1})");
    EXPECT_EQ(peer.line(), R"({"goodbye":{"code":"stopping","message":"mgmtd is stopping"}})");
    EXPECT_EQ(peer.line(), "<end>");
}

TEST(PeerTest, TextThatIsNotUtf8IsSentWithReplacements)
{
    TestServer server;
    RawClient peer(server.path());
    register_as_jsond(peer);
    EXPECT_TRUE(server.send_to_peer("jsond", "caf\xe9"));
    EXPECT_EQ(peer.line(), "{\"event\":\"caf\xef\xbf\xbd\"}");
}

} // namespace
} // namespace ovhost
