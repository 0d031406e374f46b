#pragma once
// What an empty store begins with: the compiled-in defaults, then the files that the library reads
// (orvale/md_db_default.h): the model's, the debugging defaults, the preserved values. Later ones
// win, and their removals take away what earlier ones have set.

#include "host/commit/candidate.h"

#include <cstddef>
#include <functional>
#include <stdexcept>
#include <string>

namespace ovhost
{

/// A source that cannot be used; the message names it and says what to do.
class DefaultsError : public std::runtime_error
{
  public:
    using std::runtime_error::runtime_error;
};

/// What one source has contributed.
struct DefaultsSummary {
    std::string source;
    std::size_t set = 0;
    std::size_t removed = 0;
};

struct DefaultsReport {
    std::function<void(const DefaultsSummary &)> summary;
    /// A line of the debugging or preserved file that is left out: one bad line must not cost the
    /// appliance the rest of them.
    std::function<void(const std::string &)> warning;
};

/// Applies all sources to the candidate. Throws DefaultsError, with every bad line, when the model's
/// file has a fault: an appliance with half of its model's defaults is worse than one that does not
/// start.
void apply_default_values(Candidate &candidate, const DefaultsReport &report);

/// Moves the preserved values aside. To be called once they are stored: until then the file is the
/// only place that has them.
void retire_preserved_values();

} // namespace ovhost
