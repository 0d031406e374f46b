// Many clients at once, some of them greedy: everyone gets the right answers and nobody waits for
// long. host/control/connection.h is what shares the daemon out.

#include "host/control/client.h"
#include "tests/control/raw_client.h"
#include "tests/control/test_server.h"

#include <gtest/gtest.h>

#include <atomic>
#include <chrono>
#include <future>
#include <latch>
#include <memory>
#include <string>
#include <thread>
#include <vector>

namespace ovhost
{
namespace
{

using nlohmann::json;
using std::chrono::milliseconds;
using test::RawClient;
using test::TestServer;

constexpr int clients = 100;
constexpr int requests_each = 50;

/// How many of one client's answers are its own.
int ask_on_and_on(const std::string &path, int number, std::latch &all_connected)
{
    ControlClient client(path, std::chrono::seconds(60));
    all_connected.arrive_and_wait();
    int right = 0;
    for (int i = 0; i < requests_each; ++i) {
        const std::string text = std::to_string(number) + "/" + std::to_string(i);
        const json result = client.call("echo", {{"text", text}});
        right += result.at("text") == text ? 1 : 0;
    }
    return right;
}

TEST(CrowdTest, AHundredClientsAskAtOnceAndEachGetsItsOwnAnswers)
{
    TestServer server;
    std::latch all_connected(clients);
    std::vector<std::future<int>> right;
    for (int i = 0; i < clients; ++i) {
        right.push_back(std::async(
            std::launch::async, [&, i] { return ask_on_and_on(server.path(), i, all_connected); }));
    }
    for (std::future<int> &answers : right) {
        EXPECT_EQ(answers.get(), requests_each);
    }
}

TEST(CrowdTest, OneThatAsksWithoutEndDoesNotKeepTheOthersWaiting)
{
    constexpr int greedy_requests = 400;
    std::atomic<int> handled = 0;
    TestServer server([&](const json &request, const ClientInfo &) -> json {
        if (request.at("command") == "echo")
            return {{"handled", handled.load()}};
        std::this_thread::sleep_for(milliseconds(5));
        ++handled;
        return json::object();
    });
    // All in one piece: two seconds of work.
    RawClient greedy(server.path());
    std::string all;
    for (int i = 0; i < greedy_requests; ++i)
        all += "{\"id\":" + std::to_string(i) + ",\"command\":\"work\"}\n";
    ASSERT_TRUE(greedy.send(all));

    ControlClient other(server.path());
    for (int i = 0; i < 10; ++i) {
        EXPECT_LT(other.call("echo").at("handled").get<int>(), greedy_requests)
            << "the other one waited until the greedy one was done, answer " << i;
    }
    for (int i = 0; i < greedy_requests; ++i)
        ASSERT_EQ(greedy.line(), "{\"id\":" + std::to_string(i) + ",\"ok\":true,\"result\":{}}");
}

TEST(CrowdTest, OneThatIsServedInTurnsGetsAllItsAnswersAfterTheEndOfItsInput)
{
    TestServer server(
        [](const json &, const ClientInfo &) -> json {
            std::this_thread::sleep_for(milliseconds(1));
            return json::object();
        },
        {.turn = milliseconds(0)});
    RawClient client(server.path());
    for (int i = 0; i < 20; ++i)
        client.send("{\"id\":" + std::to_string(i) + ",\"command\":\"work\"}\n");
    client.send("{\"id\":20,\"command\":\"work\"}");
    client.shut_down_writing();
    for (int i = 0; i <= 20; ++i)
        EXPECT_EQ(client.line(), "{\"id\":" + std::to_string(i) + ",\"ok\":true,\"result\":{}}");
    EXPECT_EQ(client.line(), "<end>");
}

TEST(CrowdTest, UnfinishedRequestsTogetherHaveABound)
{
    TestServer server({}, {.max_unserved = 3000000});
    const std::string head = R"({"id":1,"command":"echo","text":")";
    RawClient modest(server.path());
    ASSERT_TRUE(modest.send(head + std::string(1000000, 'x')));
    // The second one is the larger one when the bound is passed.
    RawClient greedy(server.path());
    greedy.send(head + std::string(2500000, 'y'));
    const std::string refusal = greedy.line();
    EXPECT_NE(refusal.find(R"("code":"busy")"), std::string::npos) << refusal;
    EXPECT_NE(refusal.find("no more than 3000000 may: try again later"), std::string::npos)
        << refusal;
    EXPECT_EQ(greedy.line(), "<end>");

    ASSERT_TRUE(modest.send("\"}\n"));
    EXPECT_EQ(modest.line().size(),
              std::string(R"({"id":1,"ok":true,"result":{"text":""}})").size() + 1000000);
    // What both of them had left is free again.
    RawClient later(server.path());
    ASSERT_TRUE(later.send(head + std::string(2900000, 'z') + "\"}\n"));
    EXPECT_NE(later.line().find(R"("ok":true)"), std::string::npos);
    EXPECT_EQ(server.logged("turned away").size(), 1U);
}

TEST(CrowdTest, ClientsThatLeaveUnfinishedRequestsBehindAreForgotten)
{
    TestServer server({}, {.max_unserved = 300000});
    const std::string head = R"({"id":1,"command":"echo","text":")";
    for (int i = 0; i < 20; ++i) {
        RawClient client(server.path());
        ASSERT_TRUE(client.send(head + std::string(100000, 'x')));
        client.shut_down_writing();
        ASSERT_NE(client.line().find("bad-json"), std::string::npos);
        ASSERT_EQ(client.line(), "<end>");
    }
    EXPECT_TRUE(server.logged("turned away").empty());
}

} // namespace
} // namespace ovhost
