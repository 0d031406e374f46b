#include "host/mgmtd/peer_sessions.h"

#include "host/control/client.h"
#include "host/control/event_loop.h"
#include "host/control/server.h"
#include "host/framework/sessions.h"
#include "tests/support/scratch_dir.h"

#include <gtest/gtest.h>
#include <nlohmann/json.hpp>

#include <future>
#include <thread>

namespace
{

using namespace ovhost;
using nlohmann::json;

class NoRequests : public RequestHandler
{
    json handle(const json &, const ClientInfo &) override { return json::object(); }
};

/// A server in a thread of its own, and the sessions of its peers, which belong to that thread.
class PeerSessionsTest : public testing::Test
{
  protected:
    PeerSessionsTest() : thread_([this] { loop_.run(); }) {}
    ~PeerSessionsTest() override
    {
        loop_.stop();
        thread_.join();
    }

    template <typename Work>
    auto in_loop(Work work)
    {
        std::promise<decltype(work())> done;
        loop_.post([&] { done.set_value(work()); });
        return done.get_future().get();
    }

    std::unique_ptr<ControlClient> join_as(const std::string &peer)
    {
        auto client = std::make_unique<ControlClient>(socket_);
        (void)client->call("hello", {{"peer", peer}});
        return client;
    }

    gcl_session *session(const std::string &peer)
    {
        return in_loop([&] {
            sessions_.update();
            return find_session(peer);
        });
    }

    ovtest::ScratchDir dir_;
    std::string socket_ = (dir_ / "control.sock").string();
    NoRequests handler_;
    EventLoop loop_;
    ControlServer server_{
        loop_, socket_, {}, handler_, [](ControlLogLevel, const std::string &) {}};
    PeerSessions sessions_{server_};
    std::thread thread_;
};

bn_request event()
{
    return {"/event",
            {{"/a", {{{ba_value, {bt_uint32, "5"}}}}}, {"/b", {{{ba_value, {bt_string, ""}}}}}}};
}

TEST_F(PeerSessionsTest, FindsPeersThatAreConnectedAndNoOthers)
{
    EXPECT_EQ(session("jsond"), nullptr);
    auto jsond = join_as("jsond");
    auto other = join_as("other");
    gcl_session *const found = session("jsond");
    EXPECT_NE(found, nullptr);
    EXPECT_NE(session("other"), nullptr);
    EXPECT_NE(session("other"), found);
    EXPECT_EQ(session("nobody"), nullptr);
    EXPECT_EQ(session("jsond"), found) << "a peer that stays keeps its session";
    jsond.reset();
    while (in_loop([&] { return server_.has_peer("jsond"); })) {
        std::this_thread::yield();
    }
    EXPECT_EQ(session("jsond"), nullptr);
    EXPECT_NE(session("other"), nullptr);
}

TEST_F(PeerSessionsTest, SendsBindingsInOrderWithTheirTypes)
{
    auto jsond = join_as("jsond");
    gcl_session *const found = session("jsond");
    ASSERT_NE(found, nullptr);
    EXPECT_TRUE(in_loop([&] { return found->send(event()); }));
    const auto received = jsond->read_event(std::chrono::seconds(10));
    ASSERT_TRUE(received);
    EXPECT_EQ(received->dump(), R"({"bindings":[{"name":"/a","type":"uint32","value":"5"},)"
                                R"({"name":"/b","type":"string","value":""}],"name":"/event"})");
}

TEST_F(PeerSessionsTest, TellsWhenThePeerHasGone)
{
    auto jsond = join_as("jsond");
    gcl_session *const found = session("jsond");
    ASSERT_NE(found, nullptr);
    jsond.reset();
    while (in_loop([&] { return server_.has_peer("jsond"); })) {
        std::this_thread::yield();
    }
    EXPECT_FALSE(in_loop([&] { return found->send(event()); }));
    EXPECT_EQ(in_loop([] { return find_session("jsond"); }), nullptr)
        << "the rest of a commit finds nobody";
}

TEST_F(PeerSessionsTest, FindsAPeerThatCameBackAfterAFailedSend)
{
    auto first = join_as("jsond");
    gcl_session *const found = session("jsond");
    ASSERT_NE(found, nullptr);
    first.reset();
    while (in_loop([&] { return server_.has_peer("jsond"); })) {
        std::this_thread::yield();
    }
    ASSERT_FALSE(in_loop([&] { return found->send(event()); }));
    auto second = join_as("jsond");
    gcl_session *const again = session("jsond");
    ASSERT_NE(again, nullptr);
    EXPECT_TRUE(in_loop([&] { return again->send(event()); }));
    EXPECT_TRUE(second->read_event(std::chrono::seconds(10)));
}

TEST_F(PeerSessionsTest, SendsToThePeerThatCameBack)
{
    auto first = join_as("jsond");
    gcl_session *const found = session("jsond");
    auto second = join_as("jsond");
    ASSERT_NE(found, nullptr);
    EXPECT_TRUE(in_loop([&] { return found->send(event()); }));
    EXPECT_TRUE(second->read_event(std::chrono::seconds(10)));
}

} // namespace
