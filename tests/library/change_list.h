// The changes of a commit, as a host hands them to the library all at once.
#pragma once

#include "host/framework/objects.h"
#include "tests/library/map_changes.h"

#include <list>
#include <string>

namespace ovtest
{

class ChangeList
{
  public:
    void add(int change_type, const std::string &name)
    {
        list_.changes.emplace_back(records_.emplace_back(change_type, name).record(), leave);
    }
    void add_null() { list_.changes.emplace_back(nullptr, leave); }
    void add_nameless(int change_type)
    {
        nameless_.mdc_change_type = change_type;
        list_.changes.emplace_back(&nameless_, leave);
    }

    mdb_db_change_array *get() { return &list_; }

  private:
    // The records are the test's.
    static void leave(mdb_db_change * /*record*/) {}

    std::list<MapChange> records_;
    mdb_db_change nameless_ = {};
    mdb_db_change_array list_;
};

} // namespace ovtest
