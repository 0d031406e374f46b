#include "orvale/md_event_common.h"

#include "framework/logging.h"
#include "tests/library/library_test.h"

#include <string>
#include <vector>

using namespace ovtest;
using testing::ElementsAre;
using testing::IsEmpty;

namespace
{

constexpr char change_type_binding[] = "/mgmtd/notification/dbchange/0/change_type string ";
constexpr char index_binding[] = "/mgmtd/notification/dbchange/0 uint32 0";
constexpr char name_binding[] = "/mgmtd/notification/dbchange/0/name name ";
constexpr char new_binding[] = "/mgmtd/notification/dbchange/0/new_attribs/value string ";
constexpr char old_binding[] = "/mgmtd/notification/dbchange/0/prev_attribs/value string ";
constexpr char no_session[] = "Cannot send event to jsond as jsond_session is null";

std::string line_of(const std::string &function, const std::string &text)
{
    return error_line("md_event_common", function, text);
}

void send(const char *param, const char *new_value, const char *old_value)
{
    in_library(md_send_dbc_event, param, new_value, old_value);
}

void send2(const char *change_type, const char *param, const char *new_value, const char *old_value)
{
    in_library(md_send_dbc_event2, change_type, param, new_value, old_value);
}

class Event : public LibraryTest
{
  protected:
    std::vector<TestSession::Event> sent() const { return host_.jsond().events; }
};

TEST_F(Event, AModificationHasFiveBindings)
{
    host_.connect_jsond();
    send("/ov/a", "2", "1");
    EXPECT_THAT(sent(), ElementsAre(TestSession::Event{
                            "/mgmtd/notify/dbchange", std::string(change_type_binding) + "modify",
                            index_binding, std::string(name_binding) + "/ov/a",
                            std::string(new_binding) + "2", std::string(old_binding) + "1"}));
    EXPECT_THAT(log_lines(),
                ElementsAre(gated_line(5, "DBC event sent: param=/ov/a, old=1, new=2")));
}

TEST_F(Event, TheHostIsCalledAsItExpectsIt)
{
    host_.connect_jsond();
    send("/ov/a", "2", "1");
    EXPECT_THAT(calls_of(Operation::md_gcl_find_session),
                ElementsAre("md_gcl_find_session(\"jsond\", *)"));
    EXPECT_THAT(calls_of(Operation::bn_event_request_msg_create),
                ElementsAre("bn_event_request_msg_create(*, \"/mgmtd/notify/dbchange\")"));
    const std::string append = "bn_event_request_msg_append_new_binding(*, 0, "
                               "\"/mgmtd/notification/dbchange/0";
    EXPECT_THAT(calls_of(Operation::bn_event_request_msg_append_new_binding),
                ElementsAre(append + "/change_type\", 101, \"modify\", null)",
                            append + "\", 5, \"0\", null)",
                            append + "/name\", 121, \"/ov/a\", null)",
                            append + "/new_attribs/value\", 101, \"2\", null)",
                            append + "/prev_attribs/value\", 101, \"1\", null)"));
    EXPECT_THAT(calls_of(Operation::bn_request_msg_send), ElementsAre("bn_request_msg_send(*, *)"));
    EXPECT_EQ(num_calls(Operation::bn_request_msg_free), 1U);
}

TEST_F(Event, EmptyValuesAreValues)
{
    host_.connect_jsond();
    send("/ov/a", "", "");
    EXPECT_THAT(sent(), ElementsAre(testing::SizeIs(6)));
    EXPECT_THAT(log_lines(), ElementsAre(gated_line(5, "DBC event sent: param=/ov/a, old=, new=")));
}

TEST_F(Event, AChangeOfAnyKind)
{
    host_.connect_jsond();
    send2("delete", "/ov/a", "2", "1");
    EXPECT_THAT(sent(), ElementsAre(TestSession::Event{
                            "/mgmtd/notify/dbchange", std::string(change_type_binding) + "delete",
                            index_binding, std::string(name_binding) + "/ov/a",
                            std::string(new_binding) + "2", std::string(old_binding) + "1"}));
    EXPECT_THAT(log_lines(),
                ElementsAre(gated_line(5, "DBC event sent: param=/ov/a, old=1, new=2")));
}

TEST_F(Event, AnAdditionWithoutValuesHasThreeBindings)
{
    host_.connect_jsond();
    send2("add", "/ov/a", nullptr, nullptr);
    EXPECT_THAT(sent(), ElementsAre(TestSession::Event{
                            "/mgmtd/notify/dbchange", std::string(change_type_binding) + "add",
                            index_binding, std::string(name_binding) + "/ov/a"}));
    EXPECT_THAT(log_lines(),
                ElementsAre(gated_line(5, "DBC event sent: param=/ov/a, old=(null), new=(null)")));
}

TEST_F(Event, EachValueIsLeftOutByItself)
{
    host_.connect_jsond();
    send2("add", "/ov/a", "2", nullptr);
    send2("delete", "/ov/a", nullptr, "1");
    EXPECT_THAT(sent(),
                ElementsAre(TestSession::Event{"/mgmtd/notify/dbchange",
                                               std::string(change_type_binding) + "add",
                                               index_binding, std::string(name_binding) + "/ov/a",
                                               std::string(new_binding) + "2"},
                            TestSession::Event{"/mgmtd/notify/dbchange",
                                               std::string(change_type_binding) + "delete",
                                               index_binding, std::string(name_binding) + "/ov/a",
                                               std::string(old_binding) + "1"}));
    EXPECT_THAT(log_lines(),
                ElementsAre(gated_line(5, "DBC event sent: param=/ov/a, old=(null), new=2"),
                            gated_line(5, "DBC event sent: param=/ov/a, old=1, new=(null)")));
}

TEST_F(Event, BadContentIsNotSent)
{
    host_.connect_jsond();
    send(nullptr, "2", "1");
    send("/ov/a", nullptr, "1");
    send("/ov/a", "2", nullptr);
    EXPECT_THAT(sent(), IsEmpty());
    const std::string reason = "DBC event not sent. Reason: Bad content ";
    EXPECT_THAT(log_lines(),
                ElementsAre(gated_line(4, reason + "{param=(null), new=2, old=1}"),
                            gated_line(4, reason + "{param=/ov/a, new=(null), old=1}"),
                            gated_line(4, reason + "{param=/ov/a, new=2, old=(null)}")));
    EXPECT_EQ(num_calls(Operation::bn_event_request_msg_create), 0U);
    EXPECT_EQ(num_calls(Operation::md_gcl_find_session), 3U);
}

TEST_F(Event, BadContentOfAChangeOfAnyKindIsNotSent)
{
    host_.connect_jsond();
    send2(nullptr, "/ov/a", "2", "1");
    send2("add", nullptr, nullptr, nullptr);
    send2("add", nullptr, "2", nullptr);
    send2("add", nullptr, nullptr, "1");
    EXPECT_THAT(sent(), IsEmpty());
    const std::string reason = "DBC event not sent. Reason: Bad content ";
    EXPECT_THAT(
        log_lines(),
        ElementsAre(gated_line(4, reason + "{change_type=(null), param=/ov/a, new=2, old=1}"),
                    gated_line(4, reason + "{change_type=add, param=(null), new=, old=}"),
                    gated_line(4, reason + "{change_type=add, param=(null), new=2, old=}"),
                    gated_line(4, reason + "{change_type=add, param=(null), new=, old=1}")));
}

TEST_F(Event, BadContentIsGatedAboveThreshold3)
{
    host_.set_log_level(3);
    send("/ov/a", "2", nullptr);
    send2(nullptr, "/ov/a", "2", "1");
    EXPECT_THAT(log_lines(), IsEmpty());
    host_.set_log_level(4);
    send("/ov/a", "2", nullptr);
    send2(nullptr, "/ov/a", "2", "1");
    EXPECT_THAT(log_lines(), testing::SizeIs(2));
}

TEST_F(Event, WithoutSessionBothNoticesAreWritten)
{
    send("/ov/a", "2", "1");
    send2("add", "/ov/b", "3", "4");
    EXPECT_THAT(sent(), IsEmpty());
    EXPECT_THAT(log_lines(),
                ElementsAre(gated_line(5, no_session),
                            gated_line(5, "DBC event sent: param=/ov/a, old=1, new=2"),
                            gated_line(5, no_session),
                            gated_line(5, "DBC event sent: param=/ov/b, old=4, new=3")));
    EXPECT_EQ(num_calls(Operation::bn_request_msg_send), 0U);
    EXPECT_EQ(num_calls(Operation::bn_request_msg_free), 2U);
}

TEST_F(Event, BelowNoticesSendingIsSilent)
{
    host_.connect_jsond();
    host_.set_log_level(4);
    send("/ov/a", "2", "1");
    EXPECT_THAT(sent(), testing::SizeIs(1));
    EXPECT_THAT(log_lines(), IsEmpty());
    host_.set_log_level(5);
    send("/ov/a", "2", "1");
    EXPECT_THAT(log_lines(), testing::SizeIs(1));
}

TEST_F(Event, BelowNoticesAnAbsentSessionIsSilent)
{
    host_.set_log_level(4);
    send("/ov/a", "2", "1");
    EXPECT_THAT(log_lines(), IsEmpty());
}

TEST_F(Event, TheDaemonsThresholdComesFirst)
{
    host_.connect_jsond();
    G_log_level = 7;
    G_daemon_log_level = 4;
    send("/ov/a", "2", "1");
    EXPECT_THAT(log_lines(), IsEmpty());
    G_log_level = 0;
    G_daemon_log_level = 5;
    send("/ov/a", "2", "1");
    EXPECT_THAT(log_lines(), testing::SizeIs(1));
}

TEST_F(Event, AFailingSessionLookupEndsTheCall)
{
    arm({.operation = Operation::md_gcl_find_session, .and_later = true, .code = 14004});
    send("/ov/a", "2", "1");
    send2("add", "/ov/a", "2", "1");
    // The content is looked at only after the session.
    send(nullptr, nullptr, nullptr);
    constexpr char error[] = "Error code 14004 (item not found) returned";
    EXPECT_THAT(log_lines(), ElementsAre(line_of("md_send_dbc_event", error),
                                         line_of("md_send_dbc_event2", error),
                                         line_of("md_send_dbc_event", error)));
    EXPECT_EQ(num_calls(Operation::bail_debug), 3U);
    EXPECT_EQ(num_calls(Operation::bn_event_request_msg_create), 0U);
}

TEST_F(Event, ACancelledSessionLookupIsSilent)
{
    arm({.operation = Operation::md_gcl_find_session, .and_later = true, .code = 14120});
    send("/ov/a", "2", "1");
    send2("add", "/ov/a", "2", "1");
    EXPECT_THAT(log_lines(), IsEmpty());
    EXPECT_EQ(num_calls(Operation::bail_quiet_debug), 2U);
    EXPECT_EQ(num_calls(Operation::bn_event_request_msg_create), 0U);
}

TEST_F(Event, AMessageThatCannotBeMadeIsLogged)
{
    host_.connect_jsond();
    arm({.operation = Operation::bn_event_request_msg_create, .and_later = true, .code = 14000});
    send("/ov/a", "2", "1");
    send2("add", "/ov/a", "2", "1");
    EXPECT_THAT(log_lines(), ElementsAre(gated_line(3, "Cannot allocate event msg, err=14000 "),
                                         gated_line(3, "Cannot allocate event msg, err=14000 ")));
    EXPECT_THAT(sent(), IsEmpty());
}

// The first binding finds out.
TEST_F(Event, AMessageThatDoesNotComeIsLogged)
{
    host_.connect_jsond();
    arm({.operation = Operation::bn_event_request_msg_create,
         .and_later = true,
         .way = FaultWay::without_object});
    send("/ov/a", "2", "1");
    send2("add", "/ov/a", nullptr, nullptr);
    const std::string line = gated_line(3, "Cannot add 'type' binding to msg, err=14001");
    EXPECT_THAT(log_lines(), ElementsAre(line, line));
    EXPECT_THAT(sent(), IsEmpty());
    EXPECT_EQ(num_calls(Operation::bn_request_msg_send), 0U);
}

TEST_F(Event, AMessageThatCannotBeMadeIsGated)
{
    host_.set_log_level(2);
    arm({.operation = Operation::bn_event_request_msg_create, .code = 14000});
    send("/ov/a", "2", "1");
    EXPECT_THAT(log_lines(), IsEmpty());
}

TEST_F(Event, EachBindingsFailureHasItsLine)
{
    host_.connect_jsond();
    const char *const messages[] = {
        "Cannot add 'type' binding to msg, err=14020",
        "Cannot add 'dbchange' binding to msg, err=14020",
        "Cannot add 'param' binding (/ov/a) to msg, err=14020",
        "Cannot add 'new_value' binding (2) to msg, err=14020",
        "Cannot add 'old_value' binding (1) to msg, err=14020",
    };
    std::vector<std::string> expected;
    unsigned call = 0;
    for (const char *message : messages) {
        arm({.operation = Operation::bn_event_request_msg_append_new_binding,
             .call = ++call,
             .code = 14020});
        send("/ov/a", "2", "1");
        EXPECT_EQ(num_calls(Operation::bn_event_request_msg_append_new_binding), call);
        expected.push_back(gated_line(3, message));
    }
    EXPECT_EQ(log_lines(), expected);
    EXPECT_THAT(sent(), IsEmpty());
}

// With one value left out, the line is the failing binding's own.
TEST_F(Event, AFailureIsNamedByTheBindingAndNotByItsPlace)
{
    arm({.operation = Operation::bn_event_request_msg_append_new_binding,
         .call = 4,
         .code = 14000});
    send2("delete", "/ov/a", nullptr, "1");
    EXPECT_THAT(log_lines(),
                ElementsAre(gated_line(3, "Cannot add 'old_value' binding (1) to msg, err=14000")));
}

TEST_F(Event, ABindingsFailureIsGated)
{
    host_.set_log_level(2);
    arm({.operation = Operation::bn_event_request_msg_append_new_binding, .code = 14000});
    send("/ov/a", "2", "1");
    EXPECT_THAT(log_lines(), IsEmpty());
}

TEST_F(Event, ANameThatTheHostRefusesIsLogged)
{
    host_.connect_jsond();
    send("no node name", "2", "1");
    EXPECT_THAT(sent(), IsEmpty());
    EXPECT_THAT(
        log_lines(),
        ElementsAre(gated_line(3, "Cannot add 'param' binding (no node name) to msg, err=14020")));
}

TEST_F(Event, ASendThatFailsIsAnErrorLine)
{
    host_.connect_jsond().gone = true;
    send("/ov/a", "2", "1");
    send2("add", "/ov/a", "2", "1");
    EXPECT_THAT(
        log_lines(),
        ElementsAre(line_of("md_send_dbc_event", "Cannot send event to jsond, err=14016"),
                    line_of("md_send_dbc_event2", "Cannot send event to jsond, err=14016")));
    EXPECT_EQ(num_calls(Operation::bn_request_msg_free), 2U);
}

TEST_F(Event, ASendThatFailsIsLoggedWhateverTheThreshold)
{
    host_.connect_jsond().gone = true;
    host_.set_log_level(0);
    send("/ov/a", "2", "1");
    EXPECT_THAT(log_lines(),
                ElementsAre(line_of("md_send_dbc_event", "Cannot send event to jsond, err=14016")));
}

TEST_F(Event, ACancelledSendIsSilent)
{
    host_.connect_jsond();
    arm({.operation = Operation::bn_request_msg_send, .and_later = true, .code = 14120});
    send("/ov/a", "2", "1");
    send2("add", "/ov/a", "2", "1");
    EXPECT_THAT(log_lines(), IsEmpty());
    EXPECT_EQ(num_calls(Operation::bail_debug), 0U);
    EXPECT_EQ(num_calls(Operation::bn_request_msg_free), 2U);
}

} // namespace
