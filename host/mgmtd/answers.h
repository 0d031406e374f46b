#pragma once
// Parts of answers that several requests (requests.h, history_requests.h) have in common.

#include "host/commit/report.h"
#include "host/tree/diff.h"

#include <nlohmann/json_fwd.hpp>

#include <vector>

namespace ovhost
{

[[nodiscard]] nlohmann::json changes_json(const std::vector<Change> &changes);
[[nodiscard]] nlohmann::json warnings_json(const std::vector<Warning> &warnings);

[[noreturn]] void throw_refused(const char *what, const std::vector<Refusal> &refusals);

/// Throws what a commit that was not accepted says; `refusal` sums up what modules refuse.
void throw_unless_accepted(const CommitReport &report, const char *refusal);

} // namespace ovhost
