#pragma once
// Route maps of many entries, and the owners of what the host hands out about them.

#include "framework/bnode.h"
#include "framework/md_commit.h"
#include "framework/tstr_array.h"
#include "framework/tstring.h"
#include "host/framework/objects.h"

#include <cstdlib>
#include <string>
#include <vector>

namespace ovbench
{

inline constexpr int num_maps = 10; ///< as many as an appliance takes
inline constexpr char route_root[] = "/ov/tunneld/route_map/config/map";

template <typename T, void (*Free)(T **)>
class Owned
{
  public:
    Owned() = default;
    Owned(const Owned &) = delete;
    Owned &operator=(const Owned &) = delete;
    ~Owned() { Free(&object_); }

    T *get() const { return object_; }
    T **out() { return &object_; }

  private:
    T *object_ = nullptr;
};

inline void free_text(char **text)
{
    std::free(*text);
}

using OwnedText = Owned<char, free_text>;
using OwnedString = Owned<tstring, ts_free>;
using OwnedStrings = Owned<tstr_array, tstr_array_free>;
using OwnedBinding = Owned<bn_binding, bn_binding_free>;

void require(bool holds, const char *what);

/// Sets a node.
void set(mdb_db &db, const std::string &node, bn_type type, const std::string &value);

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
    OwnedString name_;
    OwnedStrings parts_;
    bn_attrib_array new_attribs_;
    mdb_db_change record_ = {};
};

} // namespace ovbench
