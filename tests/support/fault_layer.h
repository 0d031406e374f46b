// Stands between the library and the host: the test program defines every host operation itself
// (interposers.cpp), and each passes its call on to the real host. On the way the call is counted
// and recorded, may be made to fail, and the objects it hands out or takes back are kept account
// of. allocation_layer.h does the same for memory.
//
// Only calls made while a function of the library runs are the layer's business: tests call the
// library through in_library(), and use host operations freely outside of it.
#pragma once

#include "tests/support/host_operations.h"

#include <map>
#include <optional>
#include <string>
#include <type_traits>
#include <vector>

namespace ovtest
{

enum class FaultWay {
    fails,         // by the operation's kind: the code, false or null
    without_object // a query answers 0 and hands out null
};

// Which call of an operation fails, counted from 1, and how.
struct Fault {
    Operation operation;
    unsigned call = 1;
    bool and_later = false;
    FaultWay way = FaultWay::fails;
    int code = lc_err_not_found;
};

// Makes calls fail from now on; counts the calls anew.
void arm(const Fault &fault);
void disarm();

// Whether the armed fault has made a call fail.
bool fault_struck();

// Forgets everything that was counted, recorded, armed or planted.
void reset_fault_layer();

// Forgets the calls and log lines counted and recorded so far, but not the objects.
void forget_calls();

// What the host answers, to whomever, in the place of what it knows itself.
struct PlantedAnswers {
    // Of get_max_tunnel_number: one for each call, and the last one for all later calls.
    std::vector<uint32> tunnel_bounds;
    // Of sys_time_since_boot_ms.
    std::optional<uint64> ms_since_boot;
    // ctime_init does nothing.
    bool without_time_info = false;
    // Of get_max_rmap_entries and its like.
    std::map<Operation, uint32> max_entries;
    // Of ovif_get_ifcount.
    std::optional<int> kernel_interfaces;
    // mgmt_is_same_subnet_using_masklen says yes to everything.
    bool one_subnet = false;
    // bn_binding_name_parts_pattern_match says yes to everything.
    bool every_name_matches = false;
    // Of mdb_get_matching_tstr_array.
    std::optional<std::vector<std::string>> matching_names;
    // Of get_config_name, whether or not a host would answer so.
    std::optional<std::string> config_name;
    // ov_acl_validate_matchstr refuses with it, whatever pairs it has handed out.
    std::optional<std::string> match_string_reason;
    // The library's so many-th call of tstr_array_get_str_quick, counted from 1, answers null; 0 is
    // none of them.
    unsigned null_text_at_call = 0;
};
PlantedAnswers &planted();

// Calls since the last reset or arming.
unsigned num_calls(Operation operation);

// The calls of one operation with their arguments: numbers, texts in quotes, "null", and "*" for
// any other pointer. "mdb_get_node_binding(null, *, "/ov/a", 0, *)".
std::vector<std::string> calls_of(Operation operation);

// From now on calls show a pointer to the object as this name.
void name_object(const void *object, const std::string &name);

// The names of all operations that were called, in order.
std::vector<std::string> operations_called();

// Kinds of the objects and texts that the host handed to the library and that are not yet freed,
// one entry each. Texts (char *) are seen to end in builds with the allocation layer only.
std::vector<std::string> live_objects();

// Frees of objects that were not the library's, and questions about a string that is null to an
// operation that need not have an answer, one line each.
std::vector<std::string> misuses();

// All log lines with all their arguments, in order. As error_line() and gated_line() write them.
std::vector<std::string> log_lines();

// A line of lc_log_internal at level 3 as the library has to write it.
std::string error_line(const std::string &unit, const std::string &function,
                       const std::string &text);

// A trace: a line of lc_log_internal at level 7.
std::string debug_line(const std::string &unit, const std::string &function,
                       const std::string &text);

// A line of ov_log_internal; the function is null, or the text of it for the module gate.
std::string gated_line(int level, const std::string &text);
std::string module_line(int level, const std::string &function, const std::string &text);

// While one of these lives, a function of the library is running.
class LibraryScope
{
  public:
    LibraryScope();
    LibraryScope(const LibraryScope &) = delete;
    LibraryScope &operator=(const LibraryScope &) = delete;
    ~LibraryScope();
};

// Calls a function of the library.
template <typename Answer, typename... Parameters>
Answer in_library(Answer (*function)(Parameters...), std::type_identity_t<Parameters>... arguments)
{
    const LibraryScope scope;
    return function(arguments...);
}

} // namespace ovtest
