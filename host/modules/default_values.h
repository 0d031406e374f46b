#pragma once
// What an empty store begins with: the compiled-in defaults, then the files that the library reads
// (orvale/md_db_default.h): the model's, the debugging defaults, the preserved values. Later ones
// win, and their removals take away what earlier ones have set.

#include "host/commit/candidate.h"
#include "host/modules/default_file.h"

#include <cstddef>
#include <functional>
#include <optional>
#include <string>

namespace ovhost
{

/// What one source has contributed.
struct DefaultsSummary {
    std::string source;
    std::size_t set = 0;
    std::size_t removed = 0;
};

struct DefaultsReport {
    std::function<void(const DefaultsSummary &)> summary;
    /// A line of the debugging or preserved file that is left out: one bad line must not cost the
    /// appliance the rest of them. And a line of any file whose value ends at a comma.
    std::function<void(const std::string &)> warning;
};

/// Why there can be no default file of a model with this name; nothing when there can.
[[nodiscard]] std::optional<std::string> model_name_fault(const std::string &name);

/// Applies all sources to the candidate. Throws DefaultsError when a file that is there cannot be
/// read, and, with every bad line, when the model's file has a fault: an appliance with half of its
/// model's defaults is worse than one that does not start.
void apply_default_values(Candidate &candidate, const DefaultsReport &report);

/// Moves the preserved values aside. To be called once they are stored: until then the file is the
/// only place that has them. It stays, with a warning in the log, when lines of it were left out:
/// for these it still is the only place.
void retire_preserved_values();

} // namespace ovhost
