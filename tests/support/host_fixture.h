// A host for one test: an empty in-memory database, a commit, a peer that may connect, thresholds,
// and the library's fixed directories, empty and private to the test program (test_main.cpp).
//
// What the library did with it is asked of fault_layer.h.
#pragma once

#include "framework/sys_time.h"
#include "host/framework/objects.h"
#include "tests/support/files.h"

#include <string>
#include <vector>

namespace ovtest
{

// A peer daemon that takes what it is sent.
class TestSession : public gcl_session
{
  public:
    bool send(const bn_request &request) override;

    // An event's name, and its bindings as "NAME TYPE VALUE".
    using Event = std::vector<std::string>;

    std::vector<Event> events;
    bool gone = false; // takes nothing any more
};

// A commit that takes refusals: "CODE TEXT", one each.
class TestCommit : public md_commit
{
  public:
    int refuse(int code, std::string message) override;

    std::vector<std::string> refusals;
};

class HostFixture
{
  public:
    HostFixture();
    HostFixture(const HostFixture &) = delete;
    HostFixture &operator=(const HostFixture &) = delete;
    ~HostFixture();

    mdb_db *db() { return &db_; }
    TestCommit &commit() { return commit_; }

    void set(const std::string &node, bn_type type, const std::string &value);

    // The peer "jsond", connected from now on.
    TestSession &connect_jsond();
    const TestSession &jsond() const { return jsond_; }

    // The threshold in force; by default everything is logged.
    void set_log_level(int level);

    // The time record says so many milliseconds since boot; without this there is none until
    // ctime_init is called.
    void set_time(uint64 ms_since_boot);

  private:
    mdb_db db_;
    TestCommit commit_;
    TestSession jsond_;
    time_info time_ = {};
};

// A text that the library handed out, which is freed; "null" when there is none.
std::string taken(char *text);
std::string taken(tstring *text);

// The same of an array: "[first, second]".
std::string taken(tstr_array *array);

} // namespace ovtest
