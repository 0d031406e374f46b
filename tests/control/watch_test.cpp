// Watchers and the reports sent to them: host/control/server.h.

#include "host/control/client.h"
#include "host/control/server.h"
#include "tests/control/raw_client.h"
#include "tests/control/test_server.h"
#include "tests/support/eventually.h"

#include <gtest/gtest.h>

#include <chrono>
#include <string>

namespace ovhost
{
namespace
{

using nlohmann::json;
using ovtest::eventually;
using test::RawClient;
using test::TestServer;

constexpr const char *watch = "{\"id\":1,\"command\":\"watch\"}\n";
constexpr const char *watching = R"({"id":1,"ok":true,"result":{}})";

void begin_to_watch(RawClient &client)
{
    client.send(watch);
    ASSERT_EQ(client.line(), watching);
}

void report(TestServer &server, const json &event)
{
    static_cast<void>(server.in_loop([&](ControlServer &inner) {
        inner.report(event);
        return true;
    }));
}

TEST(WatchTest, EveryWatcherGetsEveryReportInOrder)
{
    TestServer server;
    RawClient first(server.path());
    RawClient second(server.path());
    RawClient other(server.path());
    begin_to_watch(first);
    begin_to_watch(second);
    begin_to_watch(second);
    report(server, 1);
    report(server, {{"kind", "commit"}});
    for (RawClient *client : {&first, &second}) {
        EXPECT_EQ(client->line(), R"({"event":1})");
        EXPECT_EQ(client->line(), R"({"event":{"kind":"commit"}})");
    }
    other.send("{\"id\":2,\"command\":\"echo\",\"text\":\"x\"}\n");
    EXPECT_EQ(other.line(), R"({"id":2,"ok":true,"result":{"text":"x"}})")
        << "one that does not watch got a report";
}

TEST(WatchTest, AWatcherCanAskToo)
{
    TestServer server;
    RawClient client(server.path());
    begin_to_watch(client);
    report(server, 1);
    client.send("{\"id\":2,\"command\":\"echo\",\"text\":\"x\"}\n");
    EXPECT_EQ(client.line(), R"({"event":1})");
    EXPECT_EQ(client.line(), R"({"id":2,"ok":true,"result":{"text":"x"}})");
}

TEST(WatchTest, AWatcherThatLeftIsForgotten)
{
    TestServer server;
    const auto has_watchers = [&] {
        return server.in_loop([](ControlServer &inner) { return inner.has_watchers(); });
    };
    EXPECT_FALSE(has_watchers());
    {
        RawClient client(server.path());
        begin_to_watch(client);
        EXPECT_TRUE(has_watchers());
    }
    EXPECT_TRUE(eventually([&] { return !has_watchers(); }));
    report(server, 1);
}

TEST(WatchTest, ASlowWatcherIsToldHowManyReportsItMissed)
{
    constexpr int reports = 2000;
    constexpr std::size_t most = 100000;
    TestServer server({}, {.max_watch_waiting = most});
    RawClient slow(server.path());
    RawClient quick(server.path());
    begin_to_watch(slow);
    begin_to_watch(quick);
    const std::string padding(1000, 'x');
    for (int i = 0; i < reports; ++i) {
        report(server, {{"number", i}, {"padding", padding}});
        ASSERT_EQ(json::parse(quick.line()).at("event").at("number"), i)
            << "the slow watcher held up the other one";
    }
    int next = 0;
    json event = json::parse(slow.line()).at("event");
    for (; event.contains("number"); event = json::parse(slow.line()).at("event"))
        ASSERT_EQ(event.at("number"), next++) << "reports are left out from one place on";
    EXPECT_EQ(event, (json{{"kind", "gap"}, {"left_out", reports - next}}));
    EXPECT_LT(next, 1000) << "2 MB are kept for one that does not read";
    EXPECT_GE(next, 100) << "less is kept than may wait";
    report(server, "after the gap");
    EXPECT_EQ(slow.line(), R"({"event":"after the gap"})");
}

TEST(WatchTest, AReportThatIsLargerThanMayWaitReachesAWatcherThatReads)
{
    TestServer server({}, {.max_watch_waiting = 1000});
    RawClient client(server.path());
    begin_to_watch(client);
    const std::string large(3UL << 20, 'x');
    report(server, large);
    EXPECT_EQ(client.line(), "{\"event\":\"" + large + "\"}");
}

TEST(WatchTest, AWatcherThatStopsReadingIsDisconnectedInTime)
{
    TestServer server({}, {.stall_timeout = std::chrono::milliseconds(200)});
    RawClient slow(server.path());
    begin_to_watch(slow);
    report(server, std::string(1UL << 20, 'x'));
    EXPECT_TRUE(eventually([&] { return server.client_count() == 0; }));
    EXPECT_EQ(server.logged("does not read").size(), 1U);
}

TEST(WatchTest, AWatcherIsToldThatTheDaemonStops)
{
    TestServer server;
    RawClient client(server.path());
    begin_to_watch(client);
    server.stop();
    EXPECT_EQ(client.line(), R"({"goodbye":{"code":"stopping","message":"mgmtd is stopping"}})");
    EXPECT_EQ(client.line(), "<end>");
}

TEST(WatchTest, AClientCanTellAStopFromABrokenConnection)
{
    TestServer server;
    ControlClient client(server.path());
    static_cast<void>(client.call("watch"));
    server.stop();
    try {
        static_cast<void>(client.read_event(std::chrono::seconds(10)));
        FAIL() << "an event came";
    } catch (const ClientError &error) {
        EXPECT_EQ(error.kind(), ClientError::Kind::stopping);
        EXPECT_STREQ(error.what(), "mgmtd closed the connection: mgmtd is stopping");
    }
}

} // namespace
} // namespace ovhost
