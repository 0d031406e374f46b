#pragma once
// A legacy configuration, in which the entries of maps have one node for each field that they
// match, as edits of a candidate in which they match by match strings. The library converts the
// entries (orvale/md_xmap_common.h); load_text.h reads the text.
//
// The file counts over what is in force: each of its nodes is set, what it removes is removed, and
// the match of each of its entries takes the place of the one in force, unless the file says
// nothing of it. Everything else stays. The text's entries are converted by themselves, for the
// conversion of an entry that has a match string already would leave it with "any".

#include "host/commit/candidate.h"
#include "host/modules/load_text.h"

#include <cstddef>
#include <string_view>
#include <vector>

namespace ovhost
{

struct LegacyUpgrade {
    std::size_t converted = 0; ///< entries that match by a match string now
    std::size_t by_acl = 0;    ///< entries that match by an ACL, as before; others keep their match
    /// All that is wrong with the lines, or else with the entries: these have no line.
    std::vector<LineFault> line_faults;
    std::vector<LineFault> entry_faults;

    [[nodiscard]] bool is_done() const { return line_faults.empty() && entry_faults.empty(); }
};

/// Applies the upgraded text to the candidate, or leaves the candidate alone when anything has a
/// fault.
[[nodiscard]] LegacyUpgrade upgrade_legacy(Candidate &candidate, std::string_view text);

} // namespace ovhost
