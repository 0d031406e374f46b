// What the interposers and the allocation layer share: whether the library is running, and whether
// it is the library or the host that makes a call.
#pragma once

#include "tests/support/fault_layer.h"

namespace ovtest
{

// True while library code itself runs: not the test's, and not the host's on behalf of a call.
bool library_is_running();

// Counts one call and says whether it is to fail. Allocates nothing.
bool fault_strikes(Operation operation);

const Fault &armed_fault();

// While one of these lives, the host is at work: what it calls or allocates is its own business.
class HostScope
{
  public:
    HostScope();
    HostScope(const HostScope &) = delete;
    HostScope &operator=(const HostScope &) = delete;
    ~HostScope();
};

// Whether a host operation is being worked on: a call from within is the host's own.
bool host_is_at_work();

// Empty for an object without a name.
std::string name_of_object(const void *object);

void note_call(Operation operation, std::string call);
void note_log_line(std::string line);

// Accounts of objects; `kind` is their type's name.
void note_object(const void *object, const char *kind);
// Whether the object was on the account; it is off it from now on.
bool forget_object(const void *object);
void note_misuse(std::string what);

std::string unit_log_line(const char *function, const char *unit, int line, uint32 flags,
                          uint32 zero, int level, const char *text);
std::string ov_log_line(int level, const char *function, int zero, const char *text);

} // namespace ovtest
