#include "framework/bail.h"

#include "host/framework/bail_counts.h"
#include "tests/framework/log_capture.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

namespace ovhost::test
{
namespace
{

using testing::ElementsAre;
using testing::IsEmpty;

constexpr char bail_unit[] = "md_sample";

/// Counts of the hooks' calls since it was made.
class HookCalls
{
  public:
    [[nodiscard]] uint64 reported() const { return bail_counts().reported - before_.reported; }
    [[nodiscard]] uint64 quiet() const { return bail_counts().quiet - before_.quiet; }

  private:
    BailCounts before_ = bail_counts();
};

// Where the macro of the function that ran last stands.
int line_of_exit = 0;

int leave_with(int err, bool &went_on)
{
    went_on = false;
    line_of_exit = __LINE__ + 1;
    BAIL_ERROR(err);
    went_on = true;
    return 0;
}

int leave_if_null(const void *pointer)
{
    line_of_exit = __LINE__ + 1;
    BAIL_NULL(pointer);
    return 0;
}

int leave_unless(bool condition)
{
    line_of_exit = __LINE__ + 1;
    BAIL_REQUIRE(condition);
    return 0;
}

bool answer_unless_failed(int err)
{
    line_of_exit = __LINE__ + 1;
    BAIL_ERROR_ANSWER(err, false);
    return true;
}

void count_unless_null(const void *pointer, int &count)
{
    line_of_exit = __LINE__ + 1;
    BAIL_NULL_ANSWER(pointer, );
    ++count;
}

int report_and_stay(int err, int &count)
{
    line_of_exit = __LINE__ + 1;
    const int reported = BAIL_REPORT(err);
    ++count;
    return reported;
}

LoggedLine error_line(const char *function, const char *text)
{
    return {3, function, "md_sample", line_of_exit, 2048, 0, text};
}

TEST(BailError, GoesOnWithZero)
{
    LogCapture log;
    HookCalls hooks;
    bool went_on = false;
    EXPECT_EQ(leave_with(0, went_on), 0);
    EXPECT_TRUE(went_on);
    EXPECT_THAT(log.lines, IsEmpty());
    EXPECT_EQ(hooks.reported() + hooks.quiet(), 0U);
}

TEST(BailError, NamesACodeOfTheTable)
{
    LogCapture log;
    HookCalls hooks;
    bool went_on = true;
    EXPECT_EQ(leave_with(14004, went_on), 14004);
    EXPECT_FALSE(went_on);
    EXPECT_THAT(log.lines, ElementsAre(error_line("leave_with",
                                                  "Error code 14004 (item not found) returned")));
    EXPECT_EQ(hooks.reported(), 1U);
    EXPECT_EQ(hooks.quiet(), 0U);
}

TEST(BailError, LogsOtherCodesInTheShortForm)
{
    LogCapture log;
    HookCalls hooks;
    bool went_on = true;
    EXPECT_EQ(leave_with(13999, went_on), 13999);
    EXPECT_THAT(log.lines, ElementsAre(error_line("leave_with", "Error code 13999 returned")));
    EXPECT_EQ(leave_with(-1, went_on), -1);
    EXPECT_EQ(log.lines.back(), error_line("leave_with", "Error code -1 returned"));
    EXPECT_EQ(hooks.reported(), 2U);
}

TEST(BailError, IsQuietWhenCancelled)
{
    LogCapture log;
    HookCalls hooks;
    bool went_on = true;
    EXPECT_EQ(leave_with(14120, went_on), 14120);
    EXPECT_FALSE(went_on);
    EXPECT_THAT(log.lines, IsEmpty());
    EXPECT_EQ(hooks.reported(), 0U);
    EXPECT_EQ(hooks.quiet(), 1U);
}

TEST(BailError, IsLoggedWhateverTheThresholds)
{
    LogCapture log;
    G_log_level = 0;
    G_daemon_log_level = 0;
    bool went_on = true;
    EXPECT_EQ(leave_with(14000, went_on), 14000);
    EXPECT_THAT(log.lines,
                ElementsAre(error_line("leave_with", "Error code 14000 (generic error) returned")));
}

TEST(BailNull, AnswersUnexpectedNull)
{
    LogCapture log;
    HookCalls hooks;
    EXPECT_EQ(leave_if_null(&log), 0);
    EXPECT_THAT(log.lines, IsEmpty());
    EXPECT_EQ(leave_if_null(nullptr), 14001);
    EXPECT_THAT(log.lines, ElementsAre(error_line("leave_if_null", "Unexpected NULL")));
    EXPECT_EQ(hooks.reported(), 1U);
}

TEST(BailRequire, AnswersAssertionFailed)
{
    LogCapture log;
    HookCalls hooks;
    EXPECT_EQ(leave_unless(true), 0);
    EXPECT_THAT(log.lines, IsEmpty());
    EXPECT_EQ(leave_unless(false), 14002);
    EXPECT_THAT(log.lines,
                ElementsAre(error_line("leave_unless", "Required condition was not met")));
    EXPECT_EQ(hooks.reported(), 1U);
}

TEST(BailAnswer, ReportsAndAnswersSomethingElse)
{
    LogCapture log;
    EXPECT_TRUE(answer_unless_failed(0));
    EXPECT_FALSE(answer_unless_failed(14014));
    EXPECT_THAT(log.lines, ElementsAre(error_line("answer_unless_failed",
                                                  "Error code 14014 (generic IO error) returned")));
    EXPECT_FALSE(answer_unless_failed(14120));
    EXPECT_EQ(log.lines.size(), 1U);
}

TEST(BailAnswer, LeavesAFunctionThatReturnsNothing)
{
    LogCapture log;
    int count = 0;
    count_unless_null(&log, count);
    EXPECT_EQ(count, 1);
    count_unless_null(nullptr, count);
    EXPECT_EQ(count, 1);
    EXPECT_THAT(log.lines, ElementsAre(error_line("count_unless_null", "Unexpected NULL")));
}

TEST(BailReport, ReportsAndStays)
{
    LogCapture log;
    int count = 0;
    EXPECT_EQ(report_and_stay(14020, count), 14020);
    EXPECT_EQ(count, 1);
    EXPECT_THAT(log.lines,
                ElementsAre(error_line("report_and_stay",
                                       "Error code 14020 (type conversion failed) returned")));
}

} // namespace
} // namespace ovhost::test
