#include "host/ovctl/render_error.h"

#include "host/control/message.h"
#include "host/support/printable.h"

#include <nlohmann/json.hpp>

#include <ostream>

namespace ovhost
{

namespace
{

void print_detail(const ErrorDetail &detail, std::ostream &err)
{
    err << "  ";
    if (detail.line > 0)
        err << "line " << detail.line << ": ";
    if (!detail.node.empty())
        err << printable(detail.node) << ": ";
    err << printable(detail.message);
    if (!detail.module.empty())
        err << " (" << printable(detail.module) << ')';
    err << '\n';
}

} // namespace

void render_refusal(const RequestError &error, const std::string &subject, std::ostream &err)
{
    const bool failed = error.code() == error_code::internal;
    err << (failed ? "mgmtd failed at " : "mgmtd refused ") << subject << ':';
    // The details say all that the message sums up.
    if (error.details().empty())
        err << ' ' << printable(error.what());
    err << '\n';
    for (const ErrorDetail &detail : error.details())
        print_detail(detail, err);
}

void render_error_json(const RequestError &error, std::ostream &out)
{
    out << to_line({{"ok", false}, {"error", error_to_json(error)}});
}

} // namespace ovhost
