#pragma once
// Alarms of software upgrades: lines of a file that the appliance's upgrade reads.

#include <optional>
#include <string>

namespace ovhost
{

inline constexpr const char *upgrade_alarms_file = "/var/opt/tms/output/upgrade_alarms.txt";

/// What is wrong with an alarm's text: it must be one line.
[[nodiscard]] std::optional<std::string> alarm_fault(const std::string &text);

/// Appends an alarm. Answers what went wrong.
[[nodiscard]] std::optional<std::string> write_alarm(const std::string &text);

} // namespace ovhost
