#include "orvale/md_event_common.h"
#include "tests/library/fault_rows.h"

namespace ovtest
{

namespace
{

const UnitLines unit("md_event_common");

constexpr char sent_notice[] = "DBC event sent: param=/ov/a, old=1, new=2";

void with_peer(HostFixture &host)
{
    host.connect_jsond();
}

std::string sent(HostFixture &host)
{
    return std::to_string(host.jsond().events.size()) + " sent";
}

FailureRow append_failure(unsigned call, const std::string &text)
{
    return {fails(Operation::bn_event_request_msg_append_new_binding, call),
            {"0 sent", {gated(3, text)}}};
}

// Nothing is sent when anything fails, and everything that failed is logged.
FaultRow event_row(const std::string &function, std::string (*call)(HostFixture &))
{
    return {function,
            "to_a_peer",
            with_peer,
            call,
            {"1 sent", {gated(5, sent_notice)}},
            {{fails(Operation::md_gcl_find_session), {"0 sent", {unit.bail(function)}}},
             {hands_out_nothing(Operation::md_gcl_find_session),
              {"0 sent",
               {gated(5, "Cannot send event to jsond as jsond_session is null"),
                gated(5, sent_notice)}}},
             {fails(Operation::bn_event_request_msg_create),
              {"0 sent", {gated(3, "Cannot allocate event msg, err={code} ")}}},
             append_failure(1, "Cannot add 'type' binding to msg, err={code}"),
             append_failure(2, "Cannot add 'dbchange' binding to msg, err={code}"),
             append_failure(3, "Cannot add 'param' binding (/ov/a) to msg, err={code}"),
             append_failure(4, "Cannot add 'new_value' binding (2) to msg, err={code}"),
             append_failure(5, "Cannot add 'old_value' binding (1) to msg, err={code}"),
             {fails(Operation::bn_request_msg_send),
              {"0 sent", {unit.bail_text(function, "Cannot send event to jsond, err={code}")}}}}};
}

} // namespace

std::vector<FaultRow> md_event_common_rows()
{
    return {
        event_row("md_send_dbc_event",
                  [](HostFixture &host) {
                      in_library(md_send_dbc_event, "/ov/a", "2", "1");
                      return sent(host);
                  }),
        event_row("md_send_dbc_event2",
                  [](HostFixture &host) {
                      in_library(md_send_dbc_event2, "delete", "/ov/a", "2", "1");
                      return sent(host);
                  }),
    };
}

} // namespace ovtest
