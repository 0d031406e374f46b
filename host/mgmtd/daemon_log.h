#pragma once
// What the daemon itself says in its log (host/framework/log_config.h): lines in its name, and why
// a commit of its own has failed.

#include "host/commit/report.h"

#include <string>

namespace ovhost
{

void log_line(int level, const std::string &text);

/// All that a commit that was not accepted says, for where there is no client to tell: every
/// refusal, with `separator` between them, or what the store says.
[[nodiscard]] std::string failure_text(const CommitReport &report, const char *separator);

} // namespace ovhost
