// Event messages of framework/bnode.h; binding.cpp has what they consist of.
#include "framework/bnode.h"

#include "host/framework/binding_build.h"
#include "host/framework/c_boundary.h"
#include "host/framework/objects.h"

#include <utility>

using ovhost::at_c_boundary;

int bn_event_request_msg_create(bn_request **ret, const char *event_name)
{
    if (ret == nullptr) {
        return lc_err_unexpected_null;
    }
    *ret = nullptr;
    if (event_name == nullptr) {
        return lc_err_unexpected_null;
    }
    return at_c_boundary([&] { return ovhost::hand_out(ret, bn_request{event_name, {}}); });
}

int bn_event_request_msg_append_new_binding(bn_request *request, uint32 /*flags*/, const char *name,
                                            bn_type type, const char *value, uint32 *ret_index)
{
    if (request == nullptr || name == nullptr || value == nullptr) {
        return lc_err_unexpected_null;
    }
    return at_c_boundary([&] {
        bn_binding binding;
        const int status = ovhost::build_binding(name, ba_value, type, value, binding);
        if (status != lc_err_no_error) {
            return status;
        }
        request->bindings.push_back(std::move(binding));
        if (ret_index != nullptr) {
            *ret_index = static_cast<uint32>(request->bindings.size() - 1);
        }
        return status;
    });
}

int bn_request_msg_send(gcl_session *session, bn_request *request)
{
    if (session == nullptr || request == nullptr) {
        return lc_err_unexpected_null;
    }
    return at_c_boundary(
        [&]() -> int { return session->send(*request) ? lc_err_no_error : lc_err_closed; });
}

void bn_request_msg_free(bn_request **request)
{
    ovhost::release(request);
}
