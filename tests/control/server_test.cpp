// Requests and answers: host/control/server.h. hostile_client_test.cpp has clients that misbehave,
// peer_test.cpp those that take events.

#include "host/control/server.h"

#include "tests/control/raw_client.h"
#include "tests/control/test_server.h"
#include "tests/support/eventually.h"

#include <gtest/gtest.h>
#include <pwd.h>
#include <sys/resource.h>
#include <unistd.h>

#include <memory>
#include <stdexcept>
#include <string>
#include <vector>

namespace ovhost
{
namespace
{

using nlohmann::json;
using ovtest::eventually;
using test::RawClient;
using test::TestServer;

std::string echo_line(int id, const std::string &text)
{
    return R"({"id":)" + std::to_string(id) + R"(,"command":"echo","text":")" + text + "\"}\n";
}

std::string echo_answer(int id, const std::string &text)
{
    return R"({"id":)" + std::to_string(id) + R"(,"ok":true,"result":{"text":")" + text + "\"}}";
}

TEST(ServerTest, AnswersARequest)
{
    TestServer server;
    RawClient client(server.path());
    client.send(echo_line(1, "hello"));
    EXPECT_EQ(client.line(), R"({"id":1,"ok":true,"result":{"text":"hello"}})");
}

TEST(ServerTest, AnswersComeInTheOrderOfTheRequests)
{
    TestServer server;
    RawClient client(server.path());
    std::string requests;
    for (int i = 0; i < 1000; ++i)
        requests += echo_line(i, "x");
    client.send(requests);
    for (int i = 0; i < 1000; ++i)
        ASSERT_EQ(client.line(), echo_answer(i, "x"));
}

TEST(ServerTest, ARequestMayArriveByteByByte)
{
    TestServer server;
    RawClient client(server.path());
    for (const char byte : echo_line(1, "slow"))
        client.send({&byte, 1});
    EXPECT_EQ(client.line(), echo_answer(1, "slow"));
}

TEST(ServerTest, BlankLinesAndCarriageReturnsDoNoHarm)
{
    TestServer server;
    RawClient client(server.path());
    client.send("\n\r\n  \n{\"id\":1,\"command\":\"echo\",\"text\":\"x\"}\r\n");
    EXPECT_EQ(client.line(), echo_answer(1, "x"));
}

TEST(ServerTest, ARefusalReachesTheClientWhole)
{
    TestServer server([](const json &, const ClientInfo &) -> json {
        throw RequestError("refused", "one check refuses", {{"/a", "too large", "limits", 0}});
    });
    RawClient client(server.path());
    client.send("{\"id\":5,\"command\":\"commit\"}\n");
    EXPECT_EQ(client.line(),
              R"({"error":{"code":"refused","details":[{"message":"too large","module":"limits",)"
              R"("node":"/a"}],"message":"one check refuses"},"id":5,"ok":false})");
}

TEST(ServerTest, AHandlerThatFailsIsAnInternalErrorAndALogLine)
{
    TestServer server([](const json &, const ClientInfo &) -> json {
        throw std::runtime_error("the disk is on fire");
    });
    RawClient client(server.path());
    client.send("{\"id\":5,\"command\":\"commit\"}\n");
    EXPECT_EQ(client.line(), R"({"error":{"code":"internal","details":[],)"
                             R"("message":"the disk is on fire"},"id":5,"ok":false})");
    EXPECT_EQ(server.logged("the disk is on fire").size(), 1U);
    client.send("{\"id\":6,\"command\":\"commit\"}\n");
    EXPECT_NE(client.line().find("\"id\":6"), std::string::npos);
}

TEST(ServerTest, TheHandlerKnowsWhoAsks)
{
    TestServer server([](const json &, const ClientInfo &client) -> json {
        return {{"pid", client.pid},
                {"uid", client.uid},
                {"gid", client.gid},
                {"user", client.user},
                {"peer", client.peer}};
    });
    RawClient client(server.path());
    client.send("{\"id\":1,\"command\":\"who\"}\n{\"command\":\"hello\",\"peer\":\"p\"}\n"
                "{\"id\":2,\"command\":\"who\"}\n");
    const passwd *const entry = ::getpwuid(::getuid());
    const std::string user = entry != nullptr ? entry->pw_name : std::to_string(::getuid());
    const std::string pid = "\"pid\":" + std::to_string(::getpid());
    const std::string rest =
        pid + ",\"uid\":" + std::to_string(::getuid()) + ",\"user\":\"" + user + "\"}}";
    const std::string gid = "{\"gid\":" + std::to_string(::getgid());
    EXPECT_EQ(client.line(), "{\"id\":1,\"ok\":true,\"result\":" + gid + ",\"peer\":\"\"," + rest);
    EXPECT_EQ(client.line(), R"({"id":null,"ok":true,"result":{"peer":"p","protocol":1}})");
    EXPECT_EQ(client.line(), "{\"id\":2,\"ok\":true,\"result\":" + gid + ",\"peer\":\"p\"," + rest);
}

TEST(ServerTest, AClientThatShutsDownWritingGetsItsAnswers)
{
    TestServer server;
    RawClient client(server.path());
    client.send(echo_line(1, "a") + echo_line(2, "b"));
    client.shut_down_writing();
    EXPECT_EQ(client.line(), echo_answer(1, "a"));
    EXPECT_EQ(client.line(), echo_answer(2, "b"));
    EXPECT_EQ(client.line(), "<end>");
    EXPECT_TRUE(eventually([&] { return server.client_count() == 0; }));
}

TEST(ServerTest, TheLastLineNeedsNoNewline)
{
    TestServer server;
    RawClient client(server.path());
    std::string request = echo_line(1, "a");
    request.pop_back();
    client.send(request);
    client.shut_down_writing();
    EXPECT_EQ(client.line(), echo_answer(1, "a"));
    EXPECT_EQ(client.line(), "<end>");
}

TEST(ServerTest, ALargeAnswerToAClientThatShutDownWritingArrivesWhole)
{
    const std::string large(20UL << 20, 'x');
    TestServer server([&](const json &, const ClientInfo &) -> json { return {{"text", large}}; });
    RawClient client(server.path());
    client.send("{\"id\":1,\"command\":\"get\"}\n");
    client.shut_down_writing();
    EXPECT_EQ(client.line(), echo_answer(1, large));
    EXPECT_EQ(client.line(), "<end>");
}

TEST(ServerTest, AClientThatLeavesIsForgotten)
{
    TestServer server;
    {
        RawClient client(server.path());
        client.send(echo_line(1, "a"));
        ASSERT_EQ(client.line(), echo_answer(1, "a"));
        EXPECT_EQ(server.client_count(), 1U);
    }
    EXPECT_TRUE(eventually([&] { return server.client_count() == 0; }));
}

TEST(ServerTest, AHundredClientsAreServedAtOnce)
{
    TestServer server;
    std::vector<std::unique_ptr<RawClient>> clients;
    for (int i = 0; i < 100; ++i)
        clients.push_back(std::make_unique<RawClient>(server.path()));
    for (int round = 0; round < 5; ++round) {
        for (int i = 0; i < 100; ++i)
            clients[static_cast<std::size_t>(i)]->send(echo_line(i, std::to_string(round)));
        for (int i = 99; i >= 0; --i)
            ASSERT_EQ(clients[static_cast<std::size_t>(i)]->line(),
                      echo_answer(i, std::to_string(round)));
    }
    EXPECT_EQ(server.client_count(), 100U);
}

/// Leaves the process one more descriptor until it goes.
class OneMoreDescriptor
{
  public:
    OneMoreDescriptor()
    {
        ::getrlimit(RLIMIT_NOFILE, &before_);
        const UniqueFd lowest_free(::dup(STDIN_FILENO));
        rlimit tight = before_;
        tight.rlim_cur = static_cast<rlim_t>(lowest_free.get()) + 1;
        ::setrlimit(RLIMIT_NOFILE, &tight);
    }
    ~OneMoreDescriptor() { ::setrlimit(RLIMIT_NOFILE, &before_); }
    OneMoreDescriptor(const OneMoreDescriptor &) = delete;
    OneMoreDescriptor &operator=(const OneMoreDescriptor &) = delete;

  private:
    rlimit before_{};
};

TEST(ServerTest, AClientIsTakenOnceThereAreDescriptorsAgain)
{
    TestServer server;
    // The server's thread is running from here on: its start may need a descriptor of its own.
    RawClient early(server.path());
    early.send(echo_line(1, "early"));
    ASSERT_EQ(early.line(), echo_answer(1, "early"));
    std::unique_ptr<RawClient> client;
    {
        const OneMoreDescriptor limit;
        client = std::make_unique<RawClient>(server.path());
        ASSERT_TRUE(eventually([&] { return !server.logged("cannot accept").empty(); }));
        client->send(echo_line(1, "a"));
    }
    EXPECT_EQ(client->line(), echo_answer(1, "a"));
    EXPECT_EQ(server.logged("cannot accept a client: Too many open files; trying again in 1 s"),
              server.logged("cannot accept"));
    EXPECT_EQ(server.logged("cannot accept").size(), 1U) << "the loop ran hot";
}

TEST(ServerTest, ASecondServerOnTheSamePathIsRefused)
{
    TestServer first;
    try {
        TestServer second({}, {}, first.path());
        FAIL() << "the second server started";
    } catch (const std::runtime_error &error) {
        EXPECT_EQ(error.what(), "socket in use by another mgmtd (" + first.path() +
                                    "): stop it or choose another --socket");
    }
    RawClient client(first.path());
    client.send(echo_line(1, "still here"));
    EXPECT_EQ(client.line(), echo_answer(1, "still here"));
}

TEST(ServerTest, AServerThatStopsClosesItsClients)
{
    TestServer server;
    RawClient client(server.path());
    client.send(echo_line(1, "a"));
    ASSERT_EQ(client.line(), echo_answer(1, "a"));
    server.stop();
    EXPECT_EQ(client.line(), "<end>");
}

} // namespace
} // namespace ovhost
