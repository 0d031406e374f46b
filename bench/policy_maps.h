#pragma once
// Route maps of many entries, and commits that change them.

#include "bench/database.h"
#include "framework/md_commit.h"
#include "host/framework/owners.h"

#include <string>
#include <vector>

namespace ovbench
{

inline constexpr int num_maps = 10; ///< as many as an appliance takes
inline constexpr char route_root[] = "/ov/tunneld/route_map/config/map";

/// The first map's name and priorities are entry 0, then come the other maps'.
struct EntryName {
    std::string map;
    std::string priority;

    [[nodiscard]] std::string node() const
    {
        return std::string(route_root) + '/' + map + "/prio/" + priority;
    }
    /// The reference from an ACL.
    [[nodiscard]] std::string reference(const std::string &acl) const
    {
        return "/ov/tunneld/acl/config/" + acl + "/rmap/" + map + "/prio/" + priority;
    }
};

/// So many entries, the same number in each map.
std::vector<EntryName> entry_names(int num_entries);

/// The model allows more entries than any bench has, so that none is refused.
void allow_many_entries();

/// A commit that takes refusals and counts them.
class CountingCommit : public md_commit
{
  public:
    int refuse(int code, std::string message) override;

    unsigned refusals = 0;
};

/// A change of a node; `new_value` may be null.
class NodeChange
{
  public:
    NodeChange(int change_type, const std::string &node, const char *new_value);
    NodeChange(const NodeChange &) = delete;
    NodeChange &operator=(const NodeChange &) = delete;

    [[nodiscard]] mdb_db_change *record() { return &record_; }
    [[nodiscard]] const tstr_array *parts() const { return parts_.get(); }

  private:
    ovhost::OwnedString name_;
    ovhost::OwnedStrings parts_;
    bn_attrib_array new_attribs_;
    mdb_db_change record_ = {};
};

} // namespace ovbench
