#pragma once
// The changes of a commit, both as the tree's diff has them and in the form in which modules get
// them. transaction.h keeps the list up to date while modules amend the commit.

#include "host/framework/objects.h"
#include "host/tree/diff.h"

#include <cstddef>
#include <string>
#include <vector>

namespace ovhost
{

/// How the list differs from what it was.
struct ChangeListUpdate {
    /// Positions of the changes that are new, or lead to another value than before.
    std::vector<std::size_t> fresh;
    /// Names of changes that are no more: the node is again as it was before the commit.
    std::vector<std::vector<std::string>> withdrawn;

    [[nodiscard]] bool empty() const { return fresh.empty() && withdrawn.empty(); }
};

class ChangeList
{
  public:
    /// Takes the place of what was in the list. Records of changes that stay are kept, with what
    /// modules have noted in them (mdc_no_notify).
    ChangeListUpdate replace(std::vector<Change> changes);

    [[nodiscard]] const std::vector<Change> &changes() const { return changes_; }

    /// The full name of the node at a position in range.
    [[nodiscard]] const std::string &name(std::size_t position) const;

    /// The record of the change at a position in range.
    [[nodiscard]] mdb_db_change *record(std::size_t position) const;

    [[nodiscard]] const mdb_db_change_array *array() const { return &records_; }

  private:
    std::vector<Change> changes_;
    mdb_db_change_array records_;
};

} // namespace ovhost
