#pragma once
// Where log lines go and what they look like, and the host's own lines. framework/logging.h has the
// operations that the library logs with, and the level variables.
//
// A line reads
//     <time> <level> <unit>:<line> <function>: <text>
// with the time in UTC to the millisecond, for example
//     2026-02-03T04:05:06.789Z error md_db_default:57 db_default_get_all: Unexpected NULL
// A unit or function that the caller does not name is "-", and a line number of 0 is left out with
// its colon. Control characters in a text are written as \n, \t or \xHH: one record is one line.

#include "framework/types.h"

#include <chrono>
#include <functional>
#include <optional>
#include <string>
#include <string_view>

namespace ovhost
{

/// One line on its way to the sink, with everything its caller said. The views are borrowed.
struct LogRecord {
    std::chrono::system_clock::time_point time = {};
    int level = 0;
    std::string_view function = {}; ///< empty when the caller does not name it
    std::string_view unit = {};     ///< empty when the caller does not name it
    int line = 0;
    uint32 flags = 0;
    uint32 zero = 0;
    std::string_view text = {};
};

using LogSink = std::function<void(const LogRecord &record)>;

/// Sends all further lines to the sink and answers the one in force before; an empty one stands for
/// the default, which writes each line to standard error with a single write.
LogSink set_log_sink(LogSink sink);

/// The line of a record, with its line feed.
[[nodiscard]] std::string format_log_line(const LogRecord &record);

/// The word for a level ("error"); of a number that is no level, "level<number>".
[[nodiscard]] std::string log_level_word(int level);

/// The level of a word ("error") or of a digit ("3"); nothing for any other text.
[[nodiscard]] std::optional<int> parse_log_level(std::string_view text);

/// Writes a line of the host itself, when its level is of interest. `unit` says which part of the
/// host speaks.
void log_host_line(int level, std::string_view unit, std::string_view text) noexcept;

} // namespace ovhost
