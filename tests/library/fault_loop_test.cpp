// Runs every row of the fault table with every host operation that it calls failing in turn: the
// first call, the second, and so on until a run ends without the fault being struck.
#include "tests/library/fault_rows.h"
#include "tests/library/map_changes.h"
#include "tests/support/allocation_layer.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <fstream>
#include <iterator>
#include <optional>
#include <set>

using namespace ovtest;

namespace
{

constexpr int code_of_table = 14004;
constexpr int code_cancelled = 14120;
constexpr int code_without_text = 13999;

void replace_all(std::string &text, const std::string &from, const std::string &to)
{
    for (std::size_t at = text.find(from); at != std::string::npos; at = text.find(from)) {
        text.replace(at, from.size(), to);
    }
}

std::string with_code(std::string text, int code)
{
    replace_all(text, "{code}", std::to_string(code));
    return text;
}

std::string bail_text(int code)
{
    const std::string number = std::to_string(code);
    switch (code) {
    case 14001:
        return "Error code 14001 (unexpected NULL) returned";
    case 14002:
        return "Error code 14002 (assertion failed) returned";
    case code_of_table:
        return "Error code 14004 (item not found) returned";
    case code_cancelled:
        return "Error code 14120 (Operation cancelled) returned";
    default:
        return "Error code " + number + " returned";
    }
}

// The lines and error exits that an outcome stands for when `code` is the failing code.
struct ExpectedTrace {
    std::vector<std::string> lines;
    unsigned exits = 0;
    unsigned quiet_exits = 0;

    void add(const ExpectedLine &line, int failing_code)
    {
        using Kind = ExpectedLine::Kind;
        const int code = line.code != 0 ? line.code : failing_code;
        const std::string text = with_code(line.text, code);
        if (line.kind == Kind::gated) {
            lines.push_back(gated_line(line.level, text));
        } else if (line.kind == Kind::by_module) {
            lines.push_back(module_line(line.level, line.function, text));
        } else if (line.kind == Kind::debug) {
            lines.push_back(debug_line(line.unit, line.function, text));
        } else if (line.kind == Kind::told) {
            lines.push_back(error_line(line.unit, line.function, bail_text(code)));
        } else if (line.kind == Kind::unexpected) {
            lines.push_back(error_line(line.unit, line.function, "Unexpected NULL"));
            ++exits;
        } else {
            const bool is_exit = line.kind == Kind::bail || line.kind == Kind::bail_text;
            const bool is_code = line.kind == Kind::bail || line.kind == Kind::passed_over;
            if (code == code_cancelled) {
                quiet_exits += is_exit ? 1 : 0;
            } else {
                lines.push_back(
                    error_line(line.unit, line.function, is_code ? bail_text(code) : text));
                exits += is_exit ? 1 : 0;
            }
        }
    }
};

const Outcome *find_outcome(const FaultRow &row, const Fault &fault)
{
    using Lasting = When::Lasting;
    for (const auto &[when, outcome] : row.failures) {
        const bool fits = when.operation == fault.operation && when.way == fault.way &&
                          (when.call == When::any_call || when.call == fault.call) &&
                          (when.lasting == Lasting::either ||
                           when.lasting == (fault.and_later ? Lasting::and_later : Lasting::once));
        if (fits) {
            return &outcome;
        }
    }
    return nullptr;
}

std::string describe(const Fault &fault)
{
    return std::string(row_of(fault.operation).name) +
           (fault.way == FaultWay::without_object ? " hands out nothing" : " fails") + " at call " +
           std::to_string(fault.call) + (fault.and_later ? " and later" : "") + " with code " +
           std::to_string(fault.code);
}

// A situation that is set up, and the call in it.
class Attempt
{
  public:
    explicit Attempt(const FaultRow &row) : row_(row)
    {
        row.set_up(host_);
        is_writable_ = host_.db()->writable;
        before_ = nodes(*host_.db(), "/");
        forget_calls();
    }

    std::string call() { return row_.call(host_); }

    // A database that may not be written, an old one above all, stays as it was.
    bool leaves_database_alone()
    {
        return is_writable_ ||
               (nodes(*host_.db(), "/") == before_ && host_.db()->refused_writes == 0);
    }

  private:
    const FaultRow &row_;
    HostFixture host_;
    bool is_writable_ = false;
    std::vector<std::string> before_;
};

void expect_outcome(const FaultRow &row, const Outcome &outcome, Attempt &attempt,
                    const std::string &answer, int code)
{
    ExpectedTrace expected;
    for (const ExpectedLine &line : outcome.log) {
        expected.add(line, code);
    }
    EXPECT_EQ(answer, with_code(outcome.answer, code));
    EXPECT_TRUE(attempt.leaves_database_alone());
    EXPECT_EQ(log_lines(), expected.lines);
    EXPECT_EQ(num_calls(Operation::bail_debug), expected.exits);
    EXPECT_EQ(num_calls(Operation::bail_quiet_debug), expected.quiet_exits);
    if (row.clean_up != nullptr) {
        row.clean_up();
    }
    // The row's call has freed what was handed to it.
    EXPECT_THAT(live_objects(), testing::IsEmpty());
    EXPECT_THAT(misuses(), testing::IsEmpty());
    EXPECT_EQ(live_allocations(), 0U);
}

// Runs the row once; false when the fault was not struck.
bool run_with(const FaultRow &row, const Fault &fault)
{
    SCOPED_TRACE(describe(fault));
    Attempt attempt(row);
    arm(fault);
    const std::string answer = attempt.call();
    disarm();
    if (!fault_struck()) {
        expect_outcome(row, row.without_fault, attempt, answer, 0);
        return false;
    }
    const Outcome *const outcome = find_outcome(row, fault);
    if (outcome == nullptr) {
        ADD_FAILURE() << "the row does not say what comes of it; the answer was " << answer;
        return true;
    }
    expect_outcome(row, *outcome, attempt, answer, fault.code);
    return true;
}

// The ways in which an operation of this kind can fail.
std::vector<Fault> ways_to_fail(Operation operation)
{
    std::vector<Fault> ways;
    for (const bool and_later : {false, true}) {
        switch (row_of(operation).kind) {
        case OperationKind::steady:
            break;
        case OperationKind::query:
            ways.push_back({operation, 1, and_later, FaultWay::without_object, 0});
            [[fallthrough]];
        case OperationKind::status:
            for (const int code : {code_of_table, code_cancelled, code_without_text}) {
                ways.push_back({operation, 1, and_later, FaultWay::fails, code});
            }
            break;
        case OperationKind::yes_no:
        case OperationKind::pointer:
            ways.push_back({operation, 1, and_later, FaultWay::fails, 0});
            break;
        }
    }
    return ways;
}

// The operations that the row calls when nothing fails.
std::vector<Operation> operations_called(const FaultRow &row)
{
    Attempt attempt(row);
    const std::string answer = attempt.call();
    std::vector<Operation> called;
    for (std::size_t i = 0; i < num_operations; ++i) {
        if (num_calls(static_cast<Operation>(i)) != 0) {
            called.push_back(static_cast<Operation>(i));
        }
    }
    expect_outcome(row, row.without_fault, attempt, answer, 0);
    return called;
}

// How a row is named in a list of tests.
std::string name_of(const testing::TestParamInfo<FaultRow> &about)
{
    return about.param.function + "__" + about.param.situation;
}

class FaultLoop : public testing::TestWithParam<FaultRow>
{
};

TEST_P(FaultLoop, EveryCallFailsInTurn)
{
    constexpr unsigned too_many = 1000;
    for (const Operation operation : operations_called(GetParam())) {
        for (Fault fault : ways_to_fail(operation)) {
            while (run_with(GetParam(), fault)) {
                ASSERT_LT(++fault.call, too_many) << "the call never ends without the fault";
            }
            EXPECT_GT(fault.call, 1U) << "no call of " << row_of(operation).name << " failed";
        }
    }
}

INSTANTIATE_TEST_SUITE_P(Exported, FaultLoop, testing::ValuesIn(fault_rows()), name_of);

TEST(FaultTable, HasARowForEveryExportedFunction)
{
    std::ifstream file(OVTEST_EXPORTED_SYMBOLS);
    std::set<std::string> exported{std::istream_iterator<std::string>(file), {}};
    ASSERT_FALSE(exported.empty()) << OVTEST_EXPORTED_SYMBOLS;
    for (const char *variable : {"tunalias_assoc", "tunname_assoc"}) {
        EXPECT_EQ(exported.erase(variable), 1U) << variable;
    }
    std::set<std::string> in_table;
    for (const FaultRow &row : fault_rows()) {
        in_table.insert(row.function);
    }
    EXPECT_EQ(in_table, exported);
}

} // namespace
