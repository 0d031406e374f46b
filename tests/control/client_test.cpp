// The client's side of the socket: host/control/client.h.

#include "host/control/client.h"

#include "host/control/listen_socket.h"
#include "host/control/socket_address.h"
#include "tests/control/test_server.h"
#include "tests/support/eventually.h"
#include "tests/support/files.h"
#include "tests/support/scratch_dir.h"

#include <gtest/gtest.h>
#include <poll.h>
#include <sys/socket.h>

#include <chrono>
#include <functional>
#include <string>
#include <thread>

namespace ovhost
{
namespace
{

using nlohmann::json;
using ovtest::eventually;
using ovtest::ScratchDir;
using std::chrono::milliseconds;
using test::TestServer;
using Kind = ClientError::Kind;

/// A server that sends the same bytes to its one client, whatever that asks, and closes.
class CannedServer
{
  public:
    explicit CannedServer(const std::string &answer)
        : socket_(dir_.path("socket")), thread_([this, answer] { serve(answer); })
    {
    }
    ~CannedServer() { thread_.join(); }
    CannedServer(const CannedServer &) = delete;
    CannedServer &operator=(const CannedServer &) = delete;

    [[nodiscard]] std::string path() const { return dir_.path("socket"); }

  private:
    void serve(const std::string &answer) const
    {
        pollfd waiting{.fd = socket_.fd(), .events = POLLIN, .revents = 0};
        ::poll(&waiting, 1, 10000);
        const UniqueFd client(::accept(socket_.fd(), nullptr, nullptr));
        char request[4096];
        static_cast<void>(::recv(client.get(), request, sizeof(request), 0));
        static_cast<void>(::send(client.get(), answer.data(), answer.size(), MSG_NOSIGNAL));
    }

    ScratchDir dir_;
    ListenSocket socket_;
    std::thread thread_;
};

struct Fault {
    Kind kind;
    std::string message;
};

Fault fault_of(const std::function<void()> &action)
{
    try {
        action();
    } catch (const ClientError &error) {
        return {error.kind(), error.what()};
    }
    ADD_FAILURE() << "nothing was thrown";
    return {Kind::protocol, ""};
}

Fault fault_of_answer(const std::string &answer)
{
    const CannedServer server(answer);
    ControlClient client(server.path());
    return fault_of([&] { client.call("status"); });
}

TEST(ClientTest, CallsAndGetsTheResult)
{
    TestServer server;
    ControlClient client(server.path());
    EXPECT_EQ(client.call("echo", {{"text", "a"}}), json({{"text", "a"}}));
    EXPECT_EQ(client.call("echo", {{"text", "b"}}), json({{"text", "b"}}));
}

TEST(ClientTest, ARefusalIsARequestError)
{
    TestServer server([](const json &, const ClientInfo &) -> json {
        throw RequestError("refused", "no", {{"/a", "too large", "limits", 3}});
    });
    ControlClient client(server.path());
    try {
        client.call("commit");
        FAIL() << "the refusal was lost";
    } catch (const RequestError &error) {
        EXPECT_EQ(error.code(), "refused");
        EXPECT_STREQ(error.what(), "no");
        ASSERT_EQ(error.details().size(), 1U);
        EXPECT_EQ(error.details()[0], (ErrorDetail{"/a", "too large", "limits", 3}));
    }
}

TEST(ClientTest, ARequestThatIsTooLongIsRefusedWithTheReason)
{
    TestServer server({}, {.max_request = 100000});
    ControlClient client(server.path());
    try {
        client.call("echo", {{"text", std::string(5000000, 'x')}});
        FAIL() << "the refusal was lost";
    } catch (const RequestError &error) {
        EXPECT_EQ(error.code(), "too-long");
    }
}

TEST(ClientTest, WithoutADaemonItSaysWhatToDo)
{
    const ScratchDir dir;
    const std::string path = dir.path("socket");
    const Fault missing = fault_of([&] { const ControlClient client(path); });
    EXPECT_EQ(missing.kind, Kind::unreachable);
    EXPECT_EQ(missing.message, "cannot connect to " + path +
                                   ": No such file or directory; is mgmtd running, and is this "
                                   "its --socket?");

    ovtest::write_file(path, "");
    const Fault refused = fault_of([&] { const ControlClient client(path); });
    EXPECT_EQ(refused.kind, Kind::unreachable);
    EXPECT_EQ(refused.message, "cannot connect to " + path +
                                   ": Connection refused; no mgmtd listens there: start it");
}

TEST(ClientTest, APathCanBeTooLong)
{
    EXPECT_THROW(const ControlClient client(std::string(108, 'x')), std::runtime_error);
}

TEST(ClientTest, ADaemonThatTakesNoConnectionsIsNotWaitedForForEver)
{
    const ScratchDir dir;
    const UniqueFd busy = new_socket();
    const sockaddr_un address = socket_address(dir.path("socket"));
    ASSERT_EQ(::bind(busy.get(), reinterpret_cast<const sockaddr *>(&address), sizeof(address)), 0);
    ASSERT_EQ(::listen(busy.get(), 0), 0);
    const ControlClient first(dir.path("socket"));
    const Fault fault =
        fault_of([&] { const ControlClient second(dir.path("socket"), milliseconds(50)); });
    EXPECT_EQ(fault.kind, Kind::unreachable);
    EXPECT_NE(fault.message.find("mgmtd is there but takes no connections"), std::string::npos);
}

TEST(ClientTest, AnAnswerThatDoesNotComeIsATimeout)
{
    const ScratchDir dir;
    const ListenSocket silent(dir.path("socket"));
    ControlClient client(dir.path("socket"), milliseconds(50));
    const Fault fault = fault_of([&] { client.call("commit"); });
    EXPECT_EQ(fault.kind, Kind::timeout);
    EXPECT_EQ(fault.message,
              "mgmtd did not answer \"commit\" within 50 ms; it may still be at work on it");
}

TEST(ClientTest, ARequestThatIsNotTakenIsATimeout)
{
    const ScratchDir dir;
    const ListenSocket silent(dir.path("socket"));
    ControlClient client(dir.path("socket"), milliseconds(1000));
    const Fault fault = fault_of([&] {
        client.call("load", {{"text", std::string(5000000, 'x')}});
    });
    EXPECT_EQ(fault.kind, Kind::timeout);
    EXPECT_EQ(fault.message, "mgmtd did not take the request within 1 s");
}

TEST(ClientTest, ADaemonThatClosesInsteadOfAnswering)
{
    const Fault fault = fault_of_answer("");
    EXPECT_EQ(fault.kind, Kind::closed);
    EXPECT_EQ(fault.message, "mgmtd closed the connection");
}

TEST(ClientTest, AnswersThatAreNotOfTheProtocol)
{
    const std::string lead = "mgmtd sent something that is not of the protocol: ";
    for (const char *answer :
         {"hello\n", "[]\n", "7\n", "{}\n", "{\"id\":1,\"ok\":1,\"result\":{}}\n",
          "{\"id\":1,\"ok\":true}\n", "{\"id\":1,\"ok\":false}\n",
          "{\"id\":1,\"ok\":false,\"error\":{}}\n",
          "{\"id\":1,\"ok\":false,\"error\":{\"code\":\"x\",\"message\":5}}\n",
          "{\"goodbye\":5}\n"}) {
        const Fault fault = fault_of_answer(answer);
        EXPECT_EQ(fault.kind, Kind::protocol) << answer;
        EXPECT_EQ(fault.message.substr(0, lead.size()), lead) << answer;
    }
    EXPECT_EQ(fault_of_answer("{\"id\":5,\"ok\":true,\"result\":{}}\n").message,
              lead + "an answer to request 5, request 1 is waiting");
}

TEST(ClientTest, EventsBetweenAnswersAreKept)
{
    TestServer *running = nullptr;
    TestServer server([&](const json &, const ClientInfo &client) -> json {
        running->server().send_to_peer(client.peer, "one");
        running->server().send_to_peer(client.peer, "two");
        return json::object();
    });
    running = &server;
    ControlClient client(server.path());
    client.call("hello", {{"peer", "p"}});
    client.call("commit");
    EXPECT_EQ(client.read_event(milliseconds(0)), json("one"));
    EXPECT_EQ(client.read_event(milliseconds(0)), json("two"));
    EXPECT_EQ(client.read_event(milliseconds(20)), std::nullopt);
}

TEST(ClientTest, TheReasonOfAGoodbyeIsTold)
{
    TestServer server;
    ControlClient first(server.path());
    first.call("hello", {{"peer", "p"}});
    ControlClient second(server.path());
    second.call("hello", {{"peer", "p"}});
    const Fault replaced =
        fault_of([&] { static_cast<void>(first.read_event(milliseconds(10000))); });
    EXPECT_EQ(replaced.kind, Kind::replaced);
    EXPECT_EQ(replaced.message, "mgmtd closed the connection: another peer registered as p");

    server.stop();
    const Fault stopped =
        fault_of([&] { static_cast<void>(second.read_event(milliseconds(10000))); });
    EXPECT_EQ(stopped.kind, Kind::stopping);
    EXPECT_EQ(stopped.message, "mgmtd closed the connection: mgmtd is stopping");
}

TEST(ClientTest, ADescriptorCanEndTheWaitForEvents)
{
    TestServer server;
    ControlClient client(server.path());
    client.call("hello", {{"peer", "p"}});
    int ends[2];
    ASSERT_EQ(::pipe(ends), 0);
    const UniqueFd read_end(ends[0]);
    {
        const UniqueFd write_end(ends[1]);
        client.wake_on(read_end.get());
        EXPECT_EQ(client.read_event(milliseconds(10)), std::nullopt);
    }
    // The pipe's end is readable as well; an hour would be noticed.
    EXPECT_EQ(client.read_event(std::chrono::hours(1)), std::nullopt);
}

TEST(ClientTest, TextThatIsNotUtf8IsSentWithReplacements)
{
    TestServer server;
    ControlClient client(server.path());
    EXPECT_EQ(client.call("echo", {{"text", "caf\xe9"}}), json({{"text", "caf\xef\xbf\xbd"}}));
}

TEST(ClientTest, TheWritingSideCanBeShutDown)
{
    TestServer server;
    ControlClient client(server.path());
    client.send_line(R"({"id":1,"command":"echo","text":"x"})");
    client.shut_down_writing();
    EXPECT_EQ(client.read_line(milliseconds(10000)), R"({"id":1,"ok":true,"result":{"text":"x"}})");
    EXPECT_EQ(fault_of([&] { static_cast<void>(client.read_line(milliseconds(10000))); }).kind,
              Kind::closed);
}

} // namespace
} // namespace ovhost
