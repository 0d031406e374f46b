#pragma once
// A text in the format of the default databases (orvale/md_db_default.h) as edits of a candidate.

#include "host/commit/candidate.h"
#include "orvale/ov_defdb_line.h"

#include <string>
#include <string_view>
#include <vector>

namespace ovhost
{

/// What is wrong with one line, counted from 1.
struct LineFault {
    long line = 0;
    std::string node; ///< empty when the line has none
    std::string message;

    bool operator==(const LineFault &) const = default;
};

/// What becomes of a line whose value holds a comma. The format has no quoting: the value ends
/// there. To people who write lines it is a loss, and a match string that ends early matches more.
enum class CommaRule { is_fault, ends_value };

struct LoadResult {
    std::size_t set = 0;
    std::size_t removed = 0;
    std::vector<LineFault> faults;
    std::vector<LineFault> cut; ///< lines whose values have ended at a comma, by that rule
};

/// What the readers of the default databases make of a line, which to them ends at a NUL byte: an
/// entry of this kind. One that they leave out counts as a comment.
[[nodiscard]] ov_defdb_line_kind entry_kind(const char *line);

/// Applies the text to the candidate, or leaves the candidate alone when any line has a fault; then
/// all of them are told. Removing a node that is not there is no fault.
[[nodiscard]] LoadResult load_text(Candidate &candidate, std::string_view text,
                                   CommaRule rule = CommaRule::is_fault);

} // namespace ovhost
