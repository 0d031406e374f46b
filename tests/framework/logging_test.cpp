#include "framework/logging.h"

#include "host/framework/log_config.h"
#include "tests/framework/allocation_failure.h"
#include "tests/framework/log_capture.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <chrono>
#include <cwchar>
#include <string>
#include <string_view>
#include <vector>

namespace ovhost::test
{
namespace
{

using testing::ElementsAre;
using testing::IsEmpty;
using testing::MatchesRegex;
using namespace std::string_view_literals;

LogRecord sample_record()
{
    // 2026-02-03T04:05:06.789Z
    const auto time = std::chrono::sys_days(std::chrono::year(2026) / 2 / 3) +
                      std::chrono::hours(4) + std::chrono::minutes(5) + std::chrono::seconds(6) +
                      std::chrono::milliseconds(789);
    return {.time = time,
            .level = 3,
            .function = "db_default_get_all",
            .unit = "md_db_default",
            .line = 57,
            .flags = 2048,
            .zero = 0,
            .text = "Unexpected NULL"};
}

TEST(LogLine, HasTimeLevelUnitLineFunctionAndText)
{
    EXPECT_EQ(format_log_line(sample_record()),
              "2026-02-03T04:05:06.789Z error md_db_default:57 db_default_get_all: "
              "Unexpected NULL\n");
}

TEST(LogLine, MarksWhatTheCallerDoesNotName)
{
    LogRecord record = sample_record();
    record.level = 6;
    record.unit = {};
    record.line = 0;
    EXPECT_EQ(format_log_line(record),
              "2026-02-03T04:05:06.789Z info - db_default_get_all: Unexpected NULL\n");
    record.function = {};
    EXPECT_EQ(format_log_line(record), "2026-02-03T04:05:06.789Z info - -: Unexpected NULL\n");
}

TEST(LogLine, StaysOneLineWhateverTheTextHolds)
{
    LogRecord record = sample_record();
    record.text = "a\nb\tc\r\x1b[0m\x7f\0.\xC3\xA9"sv;
    EXPECT_EQ(format_log_line(record),
              "2026-02-03T04:05:06.789Z error md_db_default:57 db_default_get_all: "
              "a\\nb\\tc\\x0d\\x1b[0m\\x7f\\x00.\xC3\xA9\n");
}

TEST(LogLine, TimeBeforeAFullMillisecondIsCutNotRounded)
{
    LogRecord record = sample_record();
    record.time += std::chrono::microseconds(999);
    EXPECT_EQ(format_log_line(record).substr(0, 24), "2026-02-03T04:05:06.789Z");
}

TEST(LogLevel, Words)
{
    const std::vector<std::string> words = {"emergency", "alert",  "critical", "error",
                                            "warning",   "notice", "info",     "debug"};
    for (int level = 0; level < 8; ++level) {
        const std::string &word = words[static_cast<std::size_t>(level)];
        EXPECT_EQ(log_level_word(level), word);
        EXPECT_EQ(parse_log_level(word), level);
        EXPECT_EQ(parse_log_level(std::to_string(level)), level);
    }
    EXPECT_EQ(log_level_word(8), "level8");
    EXPECT_EQ(log_level_word(-1), "level-1");
}

TEST(LogLevel, ParseRefusesEverythingElse)
{
    for (const char *text : {"", "8", "-1", "03", "Error", "err", "error "}) {
        EXPECT_EQ(parse_log_level(text), std::nullopt) << text;
    }
}

TEST(LcLog, PassesEverythingOn)
{
    LogCapture log;
    EXPECT_EQ(lc_log_internal("read_it", "md_x", 12, 2048, 0, 3, "%s is %d", "a", 5), 0);
    EXPECT_THAT(log.lines, ElementsAre(LoggedLine{3, "read_it", "md_x", 12, 2048, 0, "a is 5"}));
}

TEST(LcLog, IsNotGatedByTheThresholds)
{
    LogCapture log;
    G_log_level = 0;
    G_daemon_log_level = 0;
    (void)lc_log_internal("f", "u", 1, 2048, 0, 7, "trace");
    EXPECT_EQ(log.lines.size(), 1U);
}

TEST(LcLog, TextIsNeverCut)
{
    LogCapture log;
    const std::string text(100'000, 'x');
    (void)lc_log_internal("f", "u", 1, 2048, 0, 3, "%s", text.c_str());
    ASSERT_EQ(log.lines.size(), 1U);
    EXPECT_EQ(log.lines[0].text, text);
}

TEST(LcLog, ToleratesNull)
{
    LogCapture log;
    const char *none = nullptr;
    EXPECT_EQ(lc_log_internal(none, none, 0, 0, 0, 3, "x"), 0);
    EXPECT_EQ(lc_log_internal("f", "u", 1, 0, 0, 3, none, 1), 14001);
    ov_log_internal(6, none, 0, none, 1);
    EXPECT_THAT(log.lines, ElementsAre(LoggedLine{3, "", "", 0, 0, 0, "x"}));
}

TEST(LcLog, ALineThatFindsNoMemoryIsLostAndReported)
{
    LogCapture log;
    log.lines.reserve(1);
    const std::string text(100, 'x');
    {
        AllocationFailure failure(0);
        EXPECT_EQ(lc_log_internal("f", "u", 1, 2048, 0, 3, "%s", text.c_str()), 14000);
        ov_log_internal(3, nullptr, 0, "%s", text.c_str());
        log_host_line(0, "unit", text);
    }
    EXPECT_THAT(log.lines, IsEmpty());
}

TEST(LcLog, ALineThatCannotBePrintedIsLostAndReported)
{
    LogCapture log;
    constexpr wint_t no_character = 0x7FFFFFFF;
    EXPECT_EQ(lc_log_internal("f", "u", 1, 2048, 0, 3, "%lc", no_character), 14000);
    ov_log_internal(3, nullptr, 0, "%lc", no_character);
    EXPECT_THAT(log.lines, IsEmpty());
}

TEST(OvLog, PassesEverythingOn)
{
    LogCapture log;
    ov_log_internal(6, "count_it", 0, "%s: %d", "count_it", 3);
    ov_log_internal(4, nullptr, 0, "plain");
    EXPECT_THAT(log.lines, ElementsAre(LoggedLine{6, "count_it", "", 0, 0, 0, "count_it: 3"},
                                       LoggedLine{4, "", "", 0, 0, 0, "plain"}));
}

TEST(LogThreshold, OfTheDaemonCountsUnlessItIsMinusOne)
{
    LogCapture log;
    G_log_level = 7;
    G_daemon_log_level = 2;
    EXPECT_EQ(ov_log_threshold(), 2);
    EXPECT_TRUE(lc_log_check_level(2));
    EXPECT_FALSE(lc_log_check_level(3));
    G_daemon_log_level = -1;
    EXPECT_EQ(ov_log_threshold(), 7);
    EXPECT_TRUE(lc_log_check_level(7));
    G_log_level = 4;
    EXPECT_TRUE(lc_log_check_level(4));
    EXPECT_FALSE(lc_log_check_level(5));
}

TEST(DirectGate, LetsLinesUpToTheThresholdThrough)
{
    LogCapture log;
    G_daemon_log_level = 5;
    for (const int level : {3, 4, 5, 6, 7}) {
        OV_LOG(level, "level %d", level);
    }
    EXPECT_THAT(log.lines, ElementsAre(LoggedLine{3, "", "", 0, 0, 0, "level 3"},
                                       LoggedLine{4, "", "", 0, 0, 0, "level 4"},
                                       LoggedLine{5, "", "", 0, 0, 0, "level 5"}));
}

TEST(DirectGate, DoesNotEvaluateArgumentsOfASuppressedLine)
{
    LogCapture log;
    int evaluated = 0;
    G_daemon_log_level = 5;
    OV_LOG(6, "%d", ++evaluated);
    EXPECT_EQ(evaluated, 0);
    OV_LOG(5, "%d", ++evaluated);
    EXPECT_EQ(evaluated, 1);
}

/// One line through the module gate, from a function with a name of its own.
void log_with_cap(unsigned cap, int &evaluated)
{
    OV_LOG_MODULE(cap, "%s: %d", __func__, ++evaluated);
}

struct ModuleCase {
    unsigned char module_level;
    unsigned cap;
    int general_threshold;
    signed char daemon_threshold;
    int logged_level; ///< 0 when nothing is logged
};

constexpr ModuleCase module_cases[] = {
    // Above the cap the cap counts, and only a threshold of 6 lets it through.
    {200, 6, 0, 6, 6},
    {200, 6, 0, 5, 0},
    {255, 6, 7, -1, 6},
    {7, 6, 6, -1, 6},
    // Below the cap the module's own level counts.
    {3, 6, 0, 3, 3},
    {3, 6, 7, 2, 0},
    {5, 6, 5, -1, 5},
    {5, 6, 4, -1, 0},
    // Another call site, another cap.
    {6, 5, 0, 5, 5},
    {200, 3, 0, 3, 3},
    // Without a threshold of its own the daemon follows the general one.
    {6, 6, 7, -1, 6},
};

TEST(ModuleGate, LevelsCapsAndThresholds)
{
    for (const ModuleCase &row : module_cases) {
        LogCapture log;
        int evaluated = 0;
        ov_log_module_levels[8] = row.module_level;
        G_log_level = row.general_threshold;
        G_daemon_log_level = row.daemon_threshold;
        log_with_cap(row.cap, evaluated);
        SCOPED_TRACE("module level " + std::to_string(row.module_level) + ", cap " +
                     std::to_string(row.cap));
        if (row.logged_level == 0) {
            EXPECT_THAT(log.lines, IsEmpty());
            EXPECT_EQ(evaluated, 0);
        } else {
            EXPECT_THAT(log.lines, ElementsAre(LoggedLine{row.logged_level, "log_with_cap", "", 0,
                                                          0, 0, "log_with_cap: 1"}));
        }
    }
}

TEST(ModuleGate, EveryModuleLevelPassesWhenTheGeneralThresholdIsSeven)
{
    LogCapture log;
    int evaluated = 0;
    G_log_level = 7;
    G_daemon_log_level = -1;
    for (int level = 0; level <= 255; ++level) {
        ov_log_module_levels[8] = static_cast<unsigned char>(level);
        log_with_cap(6, evaluated);
    }
    EXPECT_EQ(log.lines.size(), 256U);
}

TEST(HostLine, IsGatedAndNamesItsUnit)
{
    LogCapture log;
    G_daemon_log_level = 5;
    log_host_line(5, "store", "opened");
    log_host_line(6, "store", "detail");
    EXPECT_THAT(log.lines, ElementsAre(LoggedLine{5, "", "store", 0, 0, 0, "opened"}));
}

TEST(LogSinkDefault, WritesTheLineToStandardError)
{
    const LogSink former = set_log_sink({});
    testing::internal::CaptureStderr();
    (void)lc_log_internal("f", "unit", 9, 2048, 0, 4, "hello %s", "there");
    const std::string written = testing::internal::GetCapturedStderr();
    set_log_sink(former);
    EXPECT_THAT(written, MatchesRegex("[0-9]{4}-[0-9]{2}-[0-9]{2}T[0-9]{2}:[0-9]{2}:[0-9]{2}"
                                      "\\.[0-9]{3}Z warning unit:9 f: hello there\n"));
}

} // namespace
} // namespace ovhost::test
