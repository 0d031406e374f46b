#include "framework/md_commit.h"

#include "host/framework/c_boundary.h"
#include "host/framework/format.h"
#include "host/framework/objects.h"
#include "host/framework/sessions.h"

#include <cstdarg>

namespace
{

int refuse(md_commit &commit, int code, const char *text)
{
    return ovhost::at_c_boundary([&] { return commit.refuse(code, text); });
}

} // namespace

int md_commit_set_return_status_msg(md_commit *commit, int code, const char *text)
{
    if (commit == nullptr || text == nullptr) {
        return lc_err_unexpected_null;
    }
    return refuse(*commit, code, text);
}

int md_commit_set_return_status_msg_fmt(md_commit *commit, int code, const char *format, ...)
{
    if (commit == nullptr || format == nullptr) {
        return lc_err_unexpected_null;
    }
    va_list arguments;
    va_start(arguments, format);
    const ovhost::PrintedText text = ovhost::print_text(format, arguments);
    va_end(arguments);
    return text ? refuse(*commit, code, text.get()) : lc_err_generic_error;
}

int md_gcl_find_session(const char *peer_name, gcl_session **ret)
{
    if (ret == nullptr) {
        return lc_err_unexpected_null;
    }
    *ret = nullptr;
    if (peer_name == nullptr) {
        return lc_err_unexpected_null;
    }
    return ovhost::at_c_boundary([&]() -> int {
        *ret = ovhost::find_session(peer_name);
        return lc_err_no_error;
    });
}
