#pragma once
// Parts of answers that several requests (requests.h, history_requests.h, upgrade_requests.h,
// show.h) have in common, and the errors that they share.

#include "host/commit/report.h"
#include "host/modules/load_text.h"
#include "host/tree/diff.h"

#include <nlohmann/json.hpp>

#include <optional>
#include <string>
#include <vector>

namespace ovhost
{

/// A fact as it is, or null when it is not known.
template <typename Fact>
[[nodiscard]] nlohmann::json or_null(const std::optional<Fact> &fact)
{
    return fact ? nlohmann::json(*fact) : nlohmann::json();
}

/// The member "changes": a list with what each node was and has become, in the order given.
[[nodiscard]] nlohmann::json changes_json(const std::vector<Change> &changes);

/// The member "warnings": a list of texts.
[[nodiscard]] nlohmann::json warnings_json(const std::vector<Warning> &warnings);

/// Throws "refused" with a detail for each refusal; `what` sums them up.
[[noreturn]] void throw_refused(const char *what, const std::vector<Refusal> &refusals);

/// Throws what a commit that was not accepted says; `refusal` sums up what modules refuse.
void throw_unless_accepted(const CommitReport &report, const char *refusal);

/// Throws "bad-lines" with a detail for each fault; `source` is what the text is called.
[[noreturn]] void throw_bad_lines(const std::string &source, const std::vector<LineFault> &faults);

/// Throws "refused" with a detail for each entry of a text that cannot be upgraded.
[[noreturn]] void throw_bad_entries(const std::vector<LineFault> &faults);

} // namespace ovhost
