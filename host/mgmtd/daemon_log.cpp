#include "host/mgmtd/daemon_log.h"

#include "host/framework/log_config.h"

namespace ovhost
{

void log_line(int level, const std::string &text)
{
    log_host_line(level, "mgmtd", text);
}

std::string failure_text(const CommitReport &report, const char *separator)
{
    if (report.outcome == CommitOutcome::not_stored) {
        return report.store_error;
    }
    std::string text;
    for (const Refusal &refusal : report.refusals) {
        text += (text.empty() ? "" : separator) +
                (refusal.node.empty() ? "" : refusal.node + ": ") + refusal.message + " (" +
                refusal.module + ")";
    }
    return text;
}

} // namespace ovhost
