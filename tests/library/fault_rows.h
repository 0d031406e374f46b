// The table of the fault loop: for every exported function at least one situation, what the call
// answers when nothing fails, and what it answers and logs when one of the host operations that it
// calls does. fault_loop_test.cpp runs it; fault_rows_UNIT.cpp has a unit's rows.
//
// A row says what the caller of the function sees, as text: its `call` puts status, out-parameters
// and what is left of files into words. In an expected text "{code}" stands for the failing code.
#pragma once

#include "tests/support/fault_layer.h"
#include "tests/support/host_fixture.h"

#include <ostream>
#include <string>
#include <vector>

namespace ovtest
{

// A line that is expected in the log. For a cancelled operation only what is told, gated lines and
// traces are written.
struct ExpectedLine {
    enum class Kind {
        bail,        // the code by the bail rule
        bail_text,   // a text of its own in place of the code's, by the bail rule
        unexpected,  // "Unexpected NULL"
        error,       // an error line that is not itself an error exit
        told,        // the code as by the bail rule, cancelled or not, without an error exit
        passed_over, // the same, but for a cancelled operation
        debug,       // a trace
        gated,       // ov_log_internal
        by_module,   // the same with the function, by the module gate
    };
    Kind kind;
    std::string unit;
    std::string function;
    std::string text = {};
    int level = 0; // of a gated line, by either gate
    int code = 0;  // of a bail line; 0 means the failing code
};

// Makes the lines of one unit.
class UnitLines
{
  public:
    explicit UnitLines(std::string unit) : unit_(std::move(unit)) {}

    ExpectedLine bail(const std::string &function, int code = 0) const
    {
        return {ExpectedLine::Kind::bail, unit_, function, {}, 0, code};
    }
    ExpectedLine bail_text(const std::string &function, const std::string &text) const
    {
        return {ExpectedLine::Kind::bail_text, unit_, function, text};
    }
    ExpectedLine unexpected_null(const std::string &function) const
    {
        return {ExpectedLine::Kind::unexpected, unit_, function};
    }
    ExpectedLine error(const std::string &function, const std::string &text) const
    {
        return {ExpectedLine::Kind::error, unit_, function, text};
    }
    ExpectedLine told(const std::string &function) const
    {
        return {ExpectedLine::Kind::told, unit_, function};
    }
    ExpectedLine passed_over(const std::string &function) const
    {
        return {ExpectedLine::Kind::passed_over, unit_, function};
    }
    ExpectedLine debug(const std::string &function, const std::string &text) const
    {
        return {ExpectedLine::Kind::debug, unit_, function, text};
    }

  private:
    std::string unit_;
};

inline ExpectedLine gated(int level, const std::string &text)
{
    return {ExpectedLine::Kind::gated, {}, {}, text, level};
}

using Lines = std::vector<ExpectedLine>;

inline Lines operator+(Lines lines, const Lines &further)
{
    lines.insert(lines.end(), further.begin(), further.end());
    return lines;
}

// What a call answers and logs.
struct Outcome {
    std::string answer;
    Lines log = {};
};

// Which failures an outcome is about.
struct When {
    Operation operation;
    unsigned call = any_call;
    enum class Lasting { either, once, and_later } lasting = Lasting::either;
    FaultWay way = FaultWay::fails;

    static constexpr unsigned any_call = 0;
};

inline When fails(Operation operation, unsigned call = When::any_call)
{
    return {operation, call};
}
inline When fails_once(Operation operation, unsigned call = When::any_call)
{
    return {operation, call, When::Lasting::once};
}
inline When fails_from(Operation operation, unsigned call = When::any_call)
{
    return {operation, call, When::Lasting::and_later};
}
// The query succeeds and hands out null.
inline When hands_out_nothing(Operation operation, unsigned call = When::any_call)
{
    return {operation, call, When::Lasting::either, FaultWay::without_object};
}

struct FailureRow {
    When when;
    Outcome outcome;
};

struct FaultRow {
    std::string function;  // the exported function
    std::string situation; // an identifier
    void (*set_up)(HostFixture &);
    std::string (*call)(HostFixture &);
    Outcome without_fault;
    std::vector<FailureRow> failures = {}; // the first that fits counts
    void (*clean_up)() = nullptr;          // releases what the library keeps from call to call
};

// How GoogleTest shows a row.
inline void PrintTo(const FaultRow &row, std::ostream *out)
{
    *out << row.function << ' ' << row.situation;
}

// All rows of all units.
const std::vector<FaultRow> &fault_rows();

} // namespace ovtest
