#pragma once
// Takes log records out of the log while it lives, and restores sink and levels behind it.

#include "framework/logging.h"
#include "host/framework/log_config.h"

#include <string>
#include <utility>
#include <vector>

namespace ovhost::test
{

struct LoggedLine {
    int level;
    std::string function;
    std::string unit;
    int line;
    uint32 flags;
    uint32 zero;
    std::string text;

    bool operator==(const LoggedLine &) const = default;
};

class LogCapture
{
  public:
    LogCapture()
    {
        former_ = set_log_sink([this](const LogRecord &record) {
            lines.push_back({record.level, std::string(record.function), std::string(record.unit),
                             record.line, record.flags, record.zero, std::string(record.text)});
        });
    }
    LogCapture(const LogCapture &) = delete;
    LogCapture &operator=(const LogCapture &) = delete;
    ~LogCapture()
    {
        set_log_sink(std::move(former_));
        G_log_level = log_level_;
        G_daemon_log_level = daemon_log_level_;
        ov_log_module_levels[ov_log_module_ovmd] = module_level_;
    }

    /// Texts of the lines of one level.
    [[nodiscard]] std::vector<std::string> texts(int level) const
    {
        std::vector<std::string> found;
        for (const LoggedLine &line : lines) {
            if (line.level == level) {
                found.push_back(line.text);
            }
        }
        return found;
    }

    std::vector<LoggedLine> lines;

  private:
    LogSink former_;
    int log_level_ = G_log_level;
    signed char daemon_log_level_ = G_daemon_log_level;
    unsigned char module_level_ = ov_log_module_levels[ov_log_module_ovmd];
};

} // namespace ovhost::test
