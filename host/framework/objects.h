#pragma once
// What is inside the host objects that framework/ hands to the library as opaque pointers.
//
// The framework's own sources look in here, and whoever makes or implements an object: the commit
// engine its databases, changes and commits; a module a database beside the commit's, or a commit
// that takes the words of a refusal; the daemon its databases and the session of a peer. Whoever
// is handed an object goes through the operations.

#include "framework/bnode.h"
#include "framework/md_commit.h"
#include "framework/mdb_db.h"
#include "framework/tstr_array.h"
#include "framework/tstring.h"
#include "framework/typed_arrays.h"
#include "host/tree/tree.h"

#include <map>
#include <memory>
#include <memory_resource>
#include <span>
#include <string>
#include <string_view>
#include <vector>

struct tstring {
    std::string text;
};

/// The texts lie in blocks that go with the array, so that the lines of a file need no allocation
/// each. A text that leaves the array leaves its bytes behind until then.
struct tstr_array {
    tstr_array() = default;
    explicit tstr_array(std::span<const std::string> texts);

    /// Room for text of the array's own, which the caller fills before anything else is added.
    char *claim(std::size_t size);

    /// Adds a copy at the end.
    void append(std::string_view text);

    // A null entry never occurs; every access goes through a valid element.
    std::vector<const char *> texts;
    // Of the options only the duplicate policy is looked at; zero is adp_add.
    array_options options = {};

  private:
    std::unique_ptr<std::pmr::monotonic_buffer_resource> blocks_;
};

struct uint32_array {
    array_options options;
    std::vector<uint32> elements;
};

struct bn_attrib_array {
    std::map<uint32, ovhost::Value> attribs;
};

struct bn_binding {
    std::string name;
    bn_attrib_array attribs;
};

struct bn_request {
    std::string event_name;
    std::vector<bn_binding> bindings;
};

/// A peer daemon's session: the control socket's side implements it.
struct gcl_session {
    virtual ~gcl_session() = default;
    /// Queues the message without waiting; false when the peer has gone.
    virtual bool send(const bn_request &request) = 0;
};

/// A database handle: a snapshot, and whether this handle may be written at this moment.
struct mdb_db {
    ovhost::Tree tree;
    bool writable = false;
    /// Writes that were tried while the handle was not writable; the commit engine tells the
    /// module.
    unsigned refused_writes = 0;
};

/// A commit in progress: where a check's refusal goes. The commit engine implements it.
struct md_commit {
    virtual ~md_commit() = default;
    /// Records the refusal of the check that is running; 14002 when none is running.
    virtual int refuse(int code, std::string message) = 0;
};

struct mdb_db_change_array {
    // A null entry stands for a change that a module has dropped from the list.
    std::vector<std::unique_ptr<mdb_db_change, void (*)(mdb_db_change *)>> changes;
};
