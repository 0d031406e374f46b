#include "host/ovctl/render_error.h"

#include "host/control/message.h"
#include "host/ovctl/terminal.h"
#include "host/support/printable.h"

#include <nlohmann/json.hpp>

#include <ostream>
#include <string>
#include <vector>

namespace ovhost
{

namespace
{

/// One at least. What follows the first indents itself by two blanks, as the library's messages do.
std::vector<std::string> lines_of(std::string text)
{
    if (text.ends_with('\n')) {
        text.pop_back();
    }
    std::vector<std::string> lines;
    std::size_t begin = 0;
    for (std::size_t end = text.find('\n'); end != std::string::npos;
         end = text.find('\n', begin)) {
        lines.push_back(text.substr(begin, end - begin));
        begin = end + 1;
    }
    lines.push_back(text.substr(begin));
    return lines;
}

void print_detail(const ErrorDetail &detail, std::ostream &err)
{
    err << "  ";
    if (detail.line > 0) {
        err << "line " << detail.line << ": ";
    }
    if (!detail.node.empty()) {
        err << printable(detail.node) << ": ";
    }
    const std::vector<std::string> lines = lines_of(detail.message);
    err << printable(lines.front());
    if (!detail.module.empty()) {
        err << " (" << printable(detail.module) << ')';
    }
    err << '\n';
    for (auto line = lines.begin() + 1; line != lines.end(); ++line) {
        err << "  " << printable(*line) << '\n';
    }
}

} // namespace

void render_refusal(const RequestError &error, const std::string &subject, std::ostream &err)
{
    const bool failed = error.code() == error_code::internal;
    const std::string verdict = (failed ? "mgmtd failed at " : "mgmtd refused ") + subject + ":";
    err << styled(err, Style::error, verdict);
    // The details say all that the message sums up.
    if (error.details().empty()) {
        err << ' ' << printable(error.what());
    }
    err << '\n';
    for (const ErrorDetail &detail : error.details()) {
        print_detail(detail, err);
    }
}

void render_error_json(const RequestError &error, std::ostream &out)
{
    out << to_line({{"ok", false}, {"error", error_to_json(error)}});
}

} // namespace ovhost
