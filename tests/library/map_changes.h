// What the tests of maps and ACLs share: a commit in progress with the database before it and the
// proposed one, and the changes that a host calls the library with.
//
// map_kinds.h has the kinds of maps.
#pragma once

#include "framework/md_commit.h"
#include "host/framework/objects.h"
#include "tests/support/host_fixture.h"

#include <optional>
#include <string>
#include <vector>

namespace ovtest
{

// Sets a node; its parents come into being.
void set_node(mdb_db &db, const std::string &name, const std::string &value,
              bn_type type = bt_string);

// The nodes at and below a name that hold a value, each as "NAME TYPE VALUE", in order.
std::vector<std::string> nodes(const mdb_db &db, const std::string &below);

// A component as it is written in a node's name.
std::string written(const std::string &component);

// A commit whose proposed database may be written.
struct MapCommit {
    MapCommit();

    void set_old(const std::string &name, const std::string &value);
    void set_new(const std::string &name, const std::string &value);
    void set_both(const std::string &name, const std::string &value);

    // From now on calls show which is which: "commit", "olddb" and "newdb".
    void name_handles();

    mdb_db olddb;
    mdb_db newdb;
    TestCommit commit;
    md_dbinfo dbinfo;
};

// A record of one changed node.
class MapChange
{
  public:
    // `new_value` is that of the attribute ba_value; without one, there are no new attributes.
    MapChange(int change_type, const std::string &name,
              const std::optional<std::string> &new_value = {});
    MapChange(const MapChange &) = delete;
    MapChange &operator=(const MapChange &) = delete;
    ~MapChange();

    mdb_db_change *record() { return &record_; }

  private:
    bn_attrib_array new_attribs_;
    mdb_db_change record_ = {};
};

} // namespace ovtest
