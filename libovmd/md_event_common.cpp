// Database-change events, built as messages and sent to jsond.
#include "orvale/md_event_common.h"

#include "framework/bail.h"
#include "framework/md_commit.h"
#include "libovmd/frame/owners.h"

#include <cstddef>

using namespace ovmd;

static const char bail_unit[] = "md_event_common";

namespace
{

constexpr char peer_name[] = "jsond";
constexpr char event_name[] = "/mgmtd/notify/dbchange";

struct event_binding {
    const char *name;
    bn_type type;
    const char *failure; // log line for an append that fails
    bool shows_value;    // the value stands in that line, before the code
};

// The order is the message's: the kind of the change stands ahead of its index, and receivers may
// count on it.
constexpr event_binding event_bindings[] = {
    {"/mgmtd/notification/dbchange/0/change_type", bt_string,
     "Cannot add 'type' binding to msg, err=%d", false},
    {"/mgmtd/notification/dbchange/0", bt_uint32, "Cannot add 'dbchange' binding to msg, err=%d",
     false},
    {"/mgmtd/notification/dbchange/0/name", bt_name,
     "Cannot add 'param' binding (%s) to msg, err=%d", true},
    {"/mgmtd/notification/dbchange/0/new_attribs/value", bt_string,
     "Cannot add 'new_value' binding (%s) to msg, err=%d", true},
    {"/mgmtd/notification/dbchange/0/prev_attribs/value", bt_string,
     "Cannot add 'old_value' binding (%s) to msg, err=%d", true},
};
constexpr size_t num_event_bindings = sizeof event_bindings / sizeof event_bindings[0];

// The compiler checks formats only where they are literals of the call.
constexpr bool takes_text(const char *format)
{
    for (; *format != '\0'; ++format) {
        if (format[0] == '%' && format[1] == 's') {
            return true;
        }
    }
    return false;
}

constexpr bool failures_fit_their_arguments()
{
    for (const event_binding &binding : event_bindings) {
        if (takes_text(binding.failure) != binding.shows_value) {
            return false;
        }
    }
    return true;
}
static_assert(failures_fit_their_arguments());

struct dbc_event {
    const char *function; // the exported function, which the error lines name
    const char *change_type;
    const char *param;
    const char *new_value; // null: the binding is left out
    const char *old_value; // likewise
};

bool create_message(owned_request &request)
{
    const int err = bn_event_request_msg_create(request.out(), event_name);
    if (err != 0) {
        OV_LOG(ov_log_error, "Cannot allocate event msg, err=%d ", err);
    }
    return err == 0;
}

bool append_bindings(bn_request *request, const dbc_event &event)
{
    const char *const values[num_event_bindings] = {event.change_type, "0", event.param,
                                                    event.new_value, event.old_value};
    for (size_t i = 0; i < num_event_bindings; ++i) {
        if (values[i] == nullptr) {
            continue;
        }
        const event_binding &binding = event_bindings[i];
        const int err = bn_event_request_msg_append_new_binding(request, 0, binding.name,
                                                                binding.type, values[i], nullptr);
        if (err != 0 && binding.shows_value) {
            OV_LOG(ov_log_error, binding.failure, values[i], err);
        } else if (err != 0) {
            OV_LOG(ov_log_error, binding.failure, err);
        }
        if (err != 0) {
            return false;
        }
    }
    return true;
}

bool deliver(gcl_session *session, bn_request *request, const dbc_event &event)
{
    if (session == nullptr) {
        OV_LOG(ov_log_notice, "Cannot send event to jsond as jsond_session is null");
        return true; // the notice that follows is written for a peer that is away, too
    }
    const int err = bn_request_msg_send(session, request);
    if (err == lc_err_cancelled) {
        bail_quiet_debug();
    } else if (err != 0) {
        (void)BAIL_LOG_AT(event.function, bail_unit, __LINE__, "Cannot send event to jsond, err=%d",
                          err);
        bail_debug();
    }
    return err == 0;
}

void send_event(gcl_session *session, const dbc_event &event)
{
    owned_request request;
    if (create_message(request) && append_bindings(request.get(), event) &&
        deliver(session, request.get(), event)) {
        OV_LOG(ov_log_notice, "DBC event sent: param=%s, old=%s, new=%s", event.param,
               event.old_value, event.new_value);
    }
}

const char *text_or_empty(const char *text)
{
    return text != nullptr ? text : "";
}

} // namespace

void md_send_dbc_event(const char *param, const char *new_value, const char *old_value)
{
    gcl_session *session = nullptr;
    BAIL_ERROR_ANSWER(md_gcl_find_session(peer_name, &session), );

    if (param == nullptr || new_value == nullptr || old_value == nullptr) {
        OV_LOG(ov_log_warning, "DBC event not sent. Reason: Bad content {param=%s, new=%s, old=%s}",
               param, new_value, old_value);
        return;
    }
    send_event(session, {__func__, "modify", param, new_value, old_value});
}

void md_send_dbc_event2(const char *change_type, const char *param, const char *new_value,
                        const char *old_value)
{
    gcl_session *session = nullptr;
    BAIL_ERROR_ANSWER(md_gcl_find_session(peer_name, &session), );

    if (change_type == nullptr || param == nullptr) {
        OV_LOG(ov_log_warning,
               "DBC event not sent. Reason: Bad content {change_type=%s, param=%s, new=%s, old=%s}",
               change_type, param, text_or_empty(new_value), text_or_empty(old_value));
        return;
    }
    send_event(session, {__func__, change_type, param, new_value, old_value});
}
