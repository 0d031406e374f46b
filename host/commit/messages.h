#pragma once
// The words of the commit engine to client and log, in one place so that they stay alike.
// report.h carries them.

#include "host/commit/module.h"

#include <set>
#include <string>

namespace ovhost
{

/// A check that failed without a message of its own; an empty node means the commit as a whole.
[[nodiscard]] std::string check_failed_message(const std::string &module, const std::string &node,
                                               int code);

/// What the client hears when a check cancels the commit quietly.
[[nodiscard]] std::string cancelled_message();

/// "a, b": modules as a message lists them.
[[nodiscard]] std::string join_names(const std::set<std::string> &modules);

/// Modules that still write after the last round of checks; `node` is one of what they write.
[[nodiscard]] std::string unsettled_message(const std::set<std::string> &modules,
                                            const std::string &node, unsigned rounds);

[[nodiscard]] std::string apply_failed_message(const std::string &module, int code);

/// An exception in apply or notify; `reason` may be empty.
[[nodiscard]] std::string exception_message(const std::string &module, Phase phase,
                                            const std::string &reason);

/// A module that broke its duty; `deed` continues "module NAME".
[[nodiscard]] std::string breach_message(const std::string &module, Phase phase,
                                         const std::string &deed);

} // namespace ovhost
