#include "framework/bnode.h"

#include "host/framework/objects.h"
#include "tests/framework/allocation_failure.h"
#include "tests/framework/owned.h"

#include <gtest/gtest.h>

#include <stdexcept>
#include <string>
#include <vector>

namespace ovhost::test
{
namespace
{

class FakePeer : public gcl_session
{
  public:
    bool send(const bn_request &request) override
    {
        if (is_open) {
            sent.push_back(request);
        }
        return is_open;
    }

    bool is_open = true;
    std::vector<bn_request> sent;
};

class EventMessage : public testing::Test
{
  protected:
    EventMessage() { EXPECT_EQ(bn_event_request_msg_create(message.out(), "/notify/change"), 0); }

    int append(const char *name, bn_type type, const char *value, uint32 *ret_index = nullptr)
    {
        return bn_event_request_msg_append_new_binding(message.get(), 0, name, type, value,
                                                       ret_index);
    }

    OwnedRequest message;
};

TEST_F(EventMessage, IsNewAndEmpty)
{
    EXPECT_EQ(message.get()->event_name, "/notify/change");
    EXPECT_TRUE(message.get()->bindings.empty());
}

TEST_F(EventMessage, HoldsBindingsInTheOrderOfTheCalls)
{
    uint32 index = 99;
    ASSERT_EQ(append("/n/0/type", bt_string, "modify"), 0);
    ASSERT_EQ(append("/n/0", bt_uint32, "0", &index), 0);
    EXPECT_EQ(index, 1U);
    ASSERT_EQ(append("/n/0/name", bt_name, "/ov/a", &index), 0);
    EXPECT_EQ(index, 2U);
    const auto &bindings = message.get()->bindings;
    ASSERT_EQ(bindings.size(), 3U);
    EXPECT_EQ(bindings[0].name, "/n/0/type");
    EXPECT_EQ(bindings[0].attribs.attribs.at(ba_value), (Value{bt_string, "modify"}));
    EXPECT_EQ(bindings[1].name, "/n/0");
    EXPECT_EQ(bindings[1].attribs.attribs.at(ba_value), (Value{bt_uint32, "0"}));
    EXPECT_EQ(bindings[2].name, "/n/0/name");
    EXPECT_EQ(bindings[2].attribs.attribs.at(ba_value), (Value{bt_name, "/ov/a"}));
}

TEST_F(EventMessage, AppendRefusesWhatIsWrongAndChangesNothing)
{
    uint32 index = 99;
    EXPECT_EQ(append("n", bt_string, "x", &index), 14009);
    EXPECT_EQ(append("/n", bt_uint32, "x", &index), 14020);
    EXPECT_EQ(append(nullptr, bt_string, "x", &index), 14001);
    EXPECT_EQ(append("/n", bt_string, nullptr, &index), 14001);
    EXPECT_EQ(bn_event_request_msg_append_new_binding(nullptr, 0, "/n", bt_string, "x", &index),
              14001);
    EXPECT_EQ(index, 99U);
    EXPECT_TRUE(message.get()->bindings.empty());
}

TEST_F(EventMessage, CreateAndFreeAreSafeOnNull)
{
    OwnedRequest other;
    EXPECT_EQ(bn_event_request_msg_create(nullptr, "/e"), 14001);
    EXPECT_EQ(bn_event_request_msg_create(other.out(), nullptr), 14001);
    EXPECT_EQ(other.get(), nullptr);
    bn_request *request = nullptr;
    ASSERT_EQ(bn_event_request_msg_create(&request, "/e"), 0);
    bn_request_msg_free(&request);
    EXPECT_EQ(request, nullptr);
    bn_request_msg_free(&request);
    bn_request_msg_free(nullptr);
}

TEST_F(EventMessage, SendLeavesTheMessageWithTheCaller)
{
    FakePeer peer;
    ASSERT_EQ(append("/n", bt_string, "x"), 0);
    ASSERT_EQ(bn_request_msg_send(&peer, message.get()), 0);
    ASSERT_EQ(peer.sent.size(), 1U);
    EXPECT_EQ(peer.sent[0].event_name, "/notify/change");
    EXPECT_EQ(peer.sent[0].bindings.size(), 1U);
    EXPECT_EQ(message.get()->bindings.size(), 1U);
}

TEST_F(EventMessage, SendToAClosedSessionIsReported)
{
    FakePeer peer;
    peer.is_open = false;
    EXPECT_EQ(bn_request_msg_send(&peer, message.get()), 14016);
}

TEST_F(EventMessage, SendRefusesNull)
{
    FakePeer peer;
    EXPECT_EQ(bn_request_msg_send(nullptr, message.get()), 14001);
    EXPECT_EQ(bn_request_msg_send(&peer, nullptr), 14001);
    EXPECT_TRUE(peer.sent.empty());
}

TEST_F(EventMessage, SendLetsNoExceptionOut)
{
    struct ThrowingPeer : gcl_session {
        bool send(const bn_request & /*request*/) override { throw std::runtime_error("queue"); }
    } peer;
    EXPECT_EQ(bn_request_msg_send(&peer, message.get()), 14000);
}

TEST_F(EventMessage, ReportsLackOfMemory)
{
    const std::string name = "/n/" + std::string(100, 'n');
    const std::string value(100, 'v');
    OwnedRequest other;
    expect_allocation_failures_reported(
        [&] { return bn_event_request_msg_create(other.out(), name.c_str()); });
    expect_allocation_failures_reported(
        [&] { return append(name.c_str(), bt_string, value.c_str()); });
    EXPECT_EQ(message.get()->bindings.size(), 1U);
}

} // namespace
} // namespace ovhost::test
