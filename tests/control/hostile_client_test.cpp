// Clients that send what they should not, or do not read: the daemon lives on and the others do not
// notice. host/control/connection.h is what holds them off.

#include "tests/control/raw_client.h"
#include "tests/control/test_server.h"
#include "tests/support/eventually.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <atomic>
#include <chrono>
#include <latch>
#include <string>
#include <thread>

namespace ovhost
{
namespace
{

using nlohmann::json;
using ovtest::eventually;
using test::RawClient;
using test::TestServer;

constexpr const char *echo_request = "{\"id\":9,\"command\":\"echo\",\"text\":\"x\"}\n";
constexpr const char *echo_answer = R"({"id":9,"ok":true,"result":{"text":"x"}})";

void expect_served(RawClient &client)
{
    ASSERT_TRUE(client.send(echo_request));
    EXPECT_EQ(client.line(), echo_answer);
}

TEST(HostileClientTest, MalformedJsonIsAnsweredAndTheConnectionGoesOn)
{
    TestServer server;
    RawClient client(server.path());
    client.send("{\"id\":1,\n");
    EXPECT_EQ(client.line(),
              R"({"error":{"code":"bad-json","details":[],"message":"not valid JSON: parse error )"
              R"(at line 1, column 9: syntax error while parsing object key - unexpected end of )"
              R"(input; expected string literal"},"id":null,"ok":false})");
    expect_served(client);
}

TEST(HostileClientTest, BinaryBytesAreAnsweredAndTheConnectionGoesOn)
{
    TestServer server;
    RawClient client(server.path());
    client.send(std::string_view("\x00\xff\xfe\x80\x01\n", 6));
    EXPECT_NE(client.line().find("\"bad-json\""), std::string::npos);
    expect_served(client);
}

TEST(HostileClientTest, WhatIsNotAnObjectIsAnsweredAndTheConnectionGoesOn)
{
    TestServer server;
    RawClient client(server.path());
    for (const char *line : {"[]\n", "null\n", "\"get\"\n", "17\n"}) {
        client.send(line);
        EXPECT_NE(client.line().find("a request is a JSON object"), std::string::npos) << line;
    }
    expect_served(client);
}

TEST(HostileClientTest, AnUnknownCommandIsAnsweredAndTheConnectionGoesOn)
{
    TestServer server;
    RawClient client(server.path());
    client.send("{\"id\":2,\"command\":\"fly\"}\n");
    EXPECT_EQ(client.line(), R"({"error":{"code":"unknown-command","details":[],)"
                             R"("message":"no command \"fly\""},"id":2,"ok":false})");
    expect_served(client);
}

TEST(HostileClientTest, DeepNestingIsAnsweredAndTheConnectionGoesOn)
{
    TestServer server;
    RawClient client(server.path());
    client.send(std::string(3000000, '[') + "\n");
    EXPECT_NE(client.line().find("nested deeper than 64"), std::string::npos);
    expect_served(client);
}

TEST(HostileClientTest, ALineThatIsTooLongIsAnsweredAndEndsTheConnection)
{
    TestServer server({}, {.max_request = 1000});
    RawClient client(server.path());
    client.send(echo_request);
    client.send(std::string(1001, ' '));
    EXPECT_EQ(client.line(), echo_answer) << "what came before is still answered";
    EXPECT_EQ(client.line(),
              R"({"error":{"code":"too-long","details":[],"message":"the request is longer than )"
              R"(1000 bytes: send it in smaller parts"},"id":null,"ok":false})");
    EXPECT_EQ(client.line(), "<end>");
    RawClient other(server.path());
    expect_served(other);
}

TEST(HostileClientTest, ALineOfExactlyTheLimitIsTaken)
{
    const std::string head = R"({"id":1,"command":"echo","text":")";
    const std::string text(1000 - head.size() - 2, 'x');
    TestServer server({}, {.max_request = 1000});
    RawClient client(server.path());
    client.send(head + text + "\"}\n");
    EXPECT_EQ(client.line(), R"({"id":1,"ok":true,"result":{"text":")" + text + "\"}}");
}

TEST(HostileClientTest, AnEndlessLineIsAnsweredToAClientThatIsStillSending)
{
    TestServer server;
    RawClient client(server.path());
    EXPECT_FALSE(client.send(std::string(64UL << 20, 'x'))) << "the server reads without end";
    EXPECT_EQ(client.line(),
              R"({"error":{"code":"too-long","details":[],"message":"the request is )"
              R"(longer than 16777216 bytes: send it in smaller parts"},)"
              R"("id":null,"ok":false})");
    EXPECT_EQ(client.line(), "<end>");
}

TEST(HostileClientTest, AClientThatDoesNotReadIsHeldBackAndLosesNothing)
{
    constexpr int requests = 2000;
    const std::string text(10000, 'y');
    std::atomic<int> handled = 0;
    TestServer server(
        [&](const json &, const ClientInfo &) -> json {
            ++handled;
            return {{"text", text}};
        },
        {.max_waiting = 100000});
    RawClient slow(server.path());
    std::string all;
    for (int i = 0; i < requests; ++i)
        all += "{\"id\":" + std::to_string(i) + ",\"command\":\"get\"}\n";
    ASSERT_TRUE(slow.send(all));

    RawClient other(server.path());
    for (int i = 0; i < 50; ++i) {
        other.send("{\"id\":1,\"command\":\"get\"}\n");
        ASSERT_NE(other.line(), "<end>");
    }
    EXPECT_LT(handled, requests) << "20 MB of answers are kept for one that does not read";
    for (int i = 0; i < requests; ++i)
        ASSERT_EQ(slow.line(), "{\"id\":" + std::to_string(i) +
                                   ",\"ok\":true,\"result\":{\"text\":\"" + text + "\"}}");
}

TEST(HostileClientTest, AClientThatStopsReadingIsDisconnectedInTime)
{
    const std::string large(4UL << 20, 'y');
    TestServer server(
        [&](const json &request, const ClientInfo &) -> json {
            return {{"text", request.at("command") == "get" ? large : "x"}};
        },
        {.stall_timeout = std::chrono::milliseconds(200)});
    RawClient slow(server.path());
    slow.send("{\"id\":1,\"command\":\"get\"}\n");
    RawClient other(server.path());
    expect_served(other);
    EXPECT_TRUE(eventually([&] { return server.client_count() == 1; }));
    const auto lines = server.logged("does not read");
    ASSERT_EQ(lines.size(), 1U);
    EXPECT_NE(lines[0].find("client 1 (pid "), std::string::npos) << lines[0];
    EXPECT_NE(lines[0].find(" bytes waited for 200 ms"), std::string::npos) << lines[0];
    expect_served(other);
}

TEST(HostileClientTest, AClientThatReadsSlowlyButReadsIsNotDisconnected)
{
    const std::string large(4UL << 20, 'y');
    TestServer server(
        [&](const json &, const ClientInfo &) -> json {
            return {{"text", large}};
        },
        {.stall_timeout = std::chrono::milliseconds(600)});
    RawClient slow(server.path());
    slow.send("{\"id\":1,\"command\":\"get\"}\n");
    // Some fifteen pauses: together longer than a client may stand still, each a tenth of it.
    for (std::size_t total = 0; total < large.size();) {
        std::this_thread::sleep_for(std::chrono::milliseconds(60));
        const std::size_t got = slow.skip(std::min<std::size_t>(280000, large.size() - total));
        ASSERT_GT(got, 0U) << "disconnected after " << total << " bytes";
        total += got;
    }
    EXPECT_TRUE(server.logged("does not read").empty());
}

TEST(HostileClientTest, TheTimeARequestTakesIsNotHeldAgainstItsClient)
{
    const std::string large(4UL << 20, 'y');
    std::latch handled(1);
    TestServer server(
        [&](const json &, const ClientInfo &) -> json {
            std::this_thread::sleep_for(std::chrono::milliseconds(1100));
            handled.count_down();
            return {{"text", large}};
        },
        {.stall_timeout = std::chrono::milliseconds(1000)});
    RawClient client(server.path());
    client.send("{\"id\":1,\"command\":\"get\"}\n");
    // Starts to read when the answer began, well before its patience ends.
    handled.wait();
    std::this_thread::sleep_for(std::chrono::milliseconds(100));
    EXPECT_EQ(client.line(), R"({"id":1,"ok":true,"result":{"text":")" + large + "\"}}");
}

TEST(HostileClientTest, AClientThatLeavesWithoutReadingDoesNoHarm)
{
    const std::string large(1UL << 20, 'y');
    TestServer server([&](const json &, const ClientInfo &) -> json { return {{"text", large}}; });
    for (int i = 0; i < 20; ++i) {
        RawClient client(server.path());
        client.send("{\"id\":1,\"command\":\"get\"}\n{\"id\":2,\"command\":\"get\"}\n");
    }
    EXPECT_TRUE(eventually([&] { return server.client_count() == 0; }));
}

TEST(HostileClientTest, ARequestThatIsNotEndedEndsTheConnectionHoweverOftenAPieceComes)
{
    TestServer server({}, {.stall_timeout = std::chrono::milliseconds(300)});
    RawClient slow(server.path());
    expect_served(slow);
    ASSERT_TRUE(slow.send("{\"id\":1,"));
    const auto began = std::chrono::steady_clock::now();
    EXPECT_TRUE(eventually([&] { return !slow.send(" "); }));
    EXPECT_GE(std::chrono::steady_clock::now() - began, std::chrono::milliseconds(250));
    const auto lines = server.logged("has not ended its request");
    ASSERT_EQ(lines.size(), 1U);
    EXPECT_NE(lines[0].find("client 1 (pid "), std::string::npos) << lines[0];
    EXPECT_NE(lines[0].find(" came within 300 ms"), std::string::npos) << lines[0];
    RawClient other(server.path());
    expect_served(other);
}

TEST(HostileClientTest, AClientThatBeginsNoRequestIsNotDisconnected)
{
    TestServer server({}, {.stall_timeout = std::chrono::milliseconds(1000)});
    RawClient quiet(server.path());
    expect_served(quiet);
    // Each request is begun and ended in time, and all of them take longer than one may.
    RawClient slow(server.path());
    const std::string request(echo_request);
    for (int i = 0; i < 6; ++i) {
        ASSERT_TRUE(slow.send(request.substr(0, 10)));
        std::this_thread::sleep_for(std::chrono::milliseconds(200));
        ASSERT_TRUE(slow.send(request.substr(10)));
        EXPECT_EQ(slow.line(), echo_answer);
    }
    expect_served(quiet);
    EXPECT_TRUE(server.logged("disconnected").empty());
}

TEST(HostileClientTest, ARequestThatIsEndedWhileTheServerIsBusyIsServed)
{
    const std::string text(1UL << 20, 'x');
    std::latch at_work(1);
    TestServer server(
        [&](const json &request, const ClientInfo &) -> json {
            if (request.at("command") == "wait") {
                at_work.count_down();
                std::this_thread::sleep_for(std::chrono::milliseconds(1100));
            }
            return {{"length", request.value("text", "").size()}};
        },
        {.stall_timeout = std::chrono::milliseconds(1000)});
    RawClient busy(server.path());
    RawClient client(server.path());
    // The answer tells that the begun request has arrived as well.
    ASSERT_TRUE(client.send("{\"id\":0,\"command\":\"get\"}\n{\"id\":1,\"command\":\"get\","));
    ASSERT_EQ(client.line(), R"({"id":0,"ok":true,"result":{"length":0}})");
    ASSERT_TRUE(busy.send("{\"command\":\"wait\"}\n"));
    at_work.wait();
    ASSERT_TRUE(client.send("\"text\":\"" + text + "\"}\n"));
    EXPECT_EQ(client.line(), R"({"id":1,"ok":true,"result":{"length":1048576}})");
}

TEST(HostileClientTest, TooManyClientsAreTurnedAwayWithAReason)
{
    TestServer server({}, {.max_clients = 2});
    RawClient first(server.path());
    RawClient second(server.path());
    expect_served(first);
    expect_served(second);
    RawClient third(server.path());
    EXPECT_EQ(third.line(), R"({"error":{"code":"busy","details":[],"message":"2 clients are )"
                            R"(connected, no more are taken: try again later"},"id":null,)"
                            R"("ok":false})");
    EXPECT_EQ(third.line(), "<end>");
    expect_served(first);
}

} // namespace
} // namespace ovhost
