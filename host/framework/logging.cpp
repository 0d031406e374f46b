#include "framework/logging.h"

#include "host/framework/c_boundary.h"
#include "host/framework/format.h"
#include "host/framework/log_config.h"

#include <unistd.h>

#include <algorithm>
#include <array>
#include <cstdarg>
#include <cstdio>
#include <ctime>
#include <utility>

int G_log_level = ov_log_notice;
signed char G_daemon_log_level = -1;
unsigned char ov_log_module_levels[16] = {6, 6, 6, 6, 6, 6, 6, 6, 6, 6, 6, 6, 6, 6, 6, 6};

namespace ovhost
{

namespace
{

/// A level's word stands at its number.
constexpr std::array<std::string_view, 8> level_words = {
    "emergency", "alert", "critical", "error", "warning", "notice", "info", "debug",
};

/// Set by the configuration thread alone, like everything else here.
LogSink &sink_in_force()
{
    static LogSink sink;
    return sink;
}

void write_to_standard_error(const LogRecord &record)
{
    const std::string line = format_log_line(record);
    // There is nowhere to report a log that cannot be written.
    [[maybe_unused]] const ssize_t written = ::write(STDERR_FILENO, line.data(), line.size());
}

/// Sends a line off. One that finds no memory is lost: its caller must go on all the same.
int emit(LogRecord record) noexcept
{
    return at_c_boundary([&record]() -> int {
        record.time = std::chrono::system_clock::now();
        const LogSink &sink = sink_in_force();
        if (sink) {
            sink(record);
        } else {
            write_to_standard_error(record);
        }
        return lc_err_no_error;
    });
}

std::string format_time(std::chrono::system_clock::time_point time)
{
    using namespace std::chrono;
    const auto second = floor<seconds>(time);
    const auto milliseconds_in = duration_cast<milliseconds>(time - second).count();
    const std::time_t seconds_in = system_clock::to_time_t(second);
    std::tm utc = {};
    ::gmtime_r(&seconds_in, &utc);
    std::array<char, 64> text;
    const std::size_t length = std::strftime(text.data(), text.size(), "%Y-%m-%dT%H:%M:%S", &utc);
    std::snprintf(text.data() + length, text.size() - length, ".%03dZ",
                  static_cast<int>(milliseconds_in));
    return text.data();
}

void append_visible(std::string &line, std::string_view text)
{
    for (const char character : text) {
        const auto byte = static_cast<unsigned char>(character);
        if (character == '\n') {
            line += "\\n";
        } else if (character == '\t') {
            line += "\\t";
        } else if (byte < 0x20 || byte == 0x7F) {
            constexpr std::string_view digits = "0123456789abcdef";
            line += {'\\', 'x', digits[byte >> 4U], digits[byte & 0xFU]};
        } else {
            line += character;
        }
    }
}

std::string_view or_dash(std::string_view text)
{
    return text.empty() ? "-" : text;
}

std::string_view or_empty(const char *text)
{
    return text == nullptr ? std::string_view() : text;
}

} // namespace

LogSink set_log_sink(LogSink sink)
{
    return std::exchange(sink_in_force(), std::move(sink));
}

std::string format_log_line(const LogRecord &record)
{
    std::string line = format_time(record.time);
    line += ' ';
    line += log_level_word(record.level);
    line += ' ';
    append_visible(line, or_dash(record.unit));
    if (record.line != 0) {
        line += ':' + std::to_string(record.line);
    }
    line += ' ';
    append_visible(line, or_dash(record.function));
    line += ": ";
    append_visible(line, record.text);
    line += '\n';
    return line;
}

std::string log_level_word(int level)
{
    if (level < 0 || level >= static_cast<int>(level_words.size())) {
        return "level" + std::to_string(level);
    }
    return std::string(level_words[static_cast<std::size_t>(level)]);
}

std::optional<int> parse_log_level(std::string_view text)
{
    if (text.size() == 1 && text.front() >= '0' && text.front() <= '7') {
        return text.front() - '0';
    }
    const auto word = std::ranges::find(level_words, text);
    return word != level_words.end() ? std::optional(static_cast<int>(word - level_words.begin()))
                                     : std::nullopt;
}

void log_host_line(int level, std::string_view unit, std::string_view text) noexcept
{
    if (!lc_log_check_level(level)) {
        return;
    }
    (void)emit({.level = level, .unit = unit, .text = text});
}

} // namespace ovhost

int lc_log_internal(const char *function, const char *unit, int line, uint32 flags, uint32 zero,
                    int level, const char *format, ...)
{
    if (format == nullptr) {
        return lc_err_unexpected_null;
    }
    va_list arguments;
    va_start(arguments, format);
    const ovhost::PrintedText text = ovhost::print_text(format, arguments);
    va_end(arguments);
    if (!text) {
        return lc_err_generic_error;
    }
    return ovhost::emit({.level = level,
                         .function = ovhost::or_empty(function),
                         .unit = ovhost::or_empty(unit),
                         .line = line,
                         .flags = flags,
                         .zero = zero,
                         .text = text.get()});
}

tbool lc_log_check_level(int level)
{
    return ov_log_threshold() >= level;
}

void ov_log_internal(int level, const char *function, int zero, const char *format, ...)
{
    if (format == nullptr) {
        return;
    }
    va_list arguments;
    va_start(arguments, format);
    const ovhost::PrintedText text = ovhost::print_text(format, arguments);
    va_end(arguments);
    if (text) {
        (void)ovhost::emit({.level = level,
                            .function = ovhost::or_empty(function),
                            .zero = static_cast<uint32>(zero),
                            .text = text.get()});
    }
}
