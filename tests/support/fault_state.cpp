#include "tests/support/fault_state.h"

#include "tests/support/allocation_layer.h"

#include <array>
#include <map>
#include <optional>
#include <utility>

namespace ovtest
{

namespace
{

// These are looked at by malloc, from the first one of the process on: no constructor may be due.
constinit bool library_runs = false;
constinit unsigned host_depth = 0;
constinit std::optional<Fault> fault;
constinit bool struck = false;
constinit std::array<unsigned, num_operations> counts = {};

struct Records {
    std::vector<std::pair<Operation, std::string>> calls;
    std::vector<std::string> log;
    std::map<const void *, const char *> objects;
    std::map<const void *, std::string> names;
    std::vector<std::string> misuses;
};

Records &records()
{
    static Records all;
    return all;
}

std::string quoted(const char *text)
{
    return text != nullptr ? '"' + std::string(text) + '"' : "null";
}

} // namespace

LibraryScope::LibraryScope()
{
    library_runs = true;
}

LibraryScope::~LibraryScope()
{
    library_runs = false;
}

HostScope::HostScope()
{
    ++host_depth;
}

HostScope::~HostScope()
{
    --host_depth;
}

bool host_is_at_work()
{
    return host_depth != 0;
}

bool library_is_running()
{
    return library_runs && host_depth == 0;
}

void arm(const Fault &new_fault)
{
    counts = {};
    struck = false;
    fault = new_fault;
}

void disarm()
{
    fault.reset();
}

bool fault_struck()
{
    return struck;
}

const Fault &armed_fault()
{
    return *fault;
}

bool fault_strikes(Operation operation)
{
    const unsigned call = ++counts[static_cast<std::size_t>(operation)];
    if (!fault || fault->operation != operation || call < fault->call ||
        (call > fault->call && !fault->and_later)) {
        return false;
    }
    struck = true;
    return true;
}

void reset_fault_layer()
{
    counts = {};
    struck = false;
    fault.reset();
    records() = {};
    planted() = {};
    forget_allocations();
}

void forget_calls()
{
    counts = {};
    records().calls.clear();
    records().log.clear();
}

PlantedAnswers &planted()
{
    static PlantedAnswers answers;
    return answers;
}

unsigned num_calls(Operation operation)
{
    return counts[static_cast<std::size_t>(operation)];
}

std::vector<std::string> calls_of(Operation operation)
{
    std::vector<std::string> found;
    for (const auto &[called, call] : records().calls) {
        if (called == operation) {
            found.push_back(call);
        }
    }
    return found;
}

void name_object(const void *object, const std::string &name)
{
    records().names[object] = name;
}

std::string name_of_object(const void *object)
{
    const auto found = records().names.find(object);
    return found != records().names.end() ? found->second : std::string();
}

std::vector<std::string> operations_called()
{
    std::vector<std::string> names;
    for (const auto &[called, call] : records().calls) {
        names.emplace_back(row_of(called).name);
    }
    return names;
}

std::vector<std::string> live_objects()
{
    std::vector<std::string> kinds;
    for (const auto &[object, kind] : records().objects) {
        kinds.emplace_back(kind);
    }
    return kinds;
}

std::vector<std::string> misuses()
{
    return records().misuses;
}

std::vector<std::string> log_lines()
{
    return records().log;
}

void note_call(Operation operation, std::string call)
{
    records().calls.emplace_back(operation, std::move(call));
}

void note_log_line(std::string line)
{
    records().log.push_back(std::move(line));
}

void note_object(const void *object, const char *kind)
{
    records().objects[object] = kind;
}

bool forget_object(const void *object)
{
    return records().objects.erase(object) != 0;
}

void note_misuse(std::string what)
{
    records().misuses.push_back(std::move(what));
}

// A line's number is the source's business; that there is one is told by "LINE".
std::string unit_log_line(const char *function, const char *unit, int line, uint32 flags,
                          uint32 zero, int level, const char *text)
{
    return "lc_log_internal(" + quoted(function) + ", " + quoted(unit) + ", " +
           (line > 0 ? "LINE" : std::to_string(line)) + ", " + std::to_string(flags) + ", " +
           std::to_string(zero) + ", " + std::to_string(level) + "): " + text;
}

std::string ov_log_line(int level, const char *function, int zero, const char *text)
{
    return "ov_log_internal(" + std::to_string(level) + ", " + quoted(function) + ", " +
           std::to_string(zero) + "): " + text;
}

std::string error_line(const std::string &unit, const std::string &function,
                       const std::string &text)
{
    return unit_log_line(function.c_str(), unit.c_str(), 1, 2048, 0, 3, text.c_str());
}

std::string debug_line(const std::string &unit, const std::string &function,
                       const std::string &text)
{
    return unit_log_line(function.c_str(), unit.c_str(), 1, 2048, 0, 7, text.c_str());
}

std::string gated_line(int level, const std::string &text)
{
    return ov_log_line(level, nullptr, 0, text.c_str());
}

std::string module_line(int level, const std::string &function, const std::string &text)
{
    return ov_log_line(level, function.c_str(), 0, text.c_str());
}

} // namespace ovtest
