#pragma once
// Reads the command line of ovctl, which is made from the rows of command_table.h.

#include "host/ovctl/command_table.h"

#include <optional>
#include <string>

namespace ovhost
{

struct Options {
    std::string socket;
    bool json = false;
    double timeout_seconds = 120;
};

/// A command line that was understood.
struct Invocation {
    Options options;
    const Command *command = nullptr;
    Arguments arguments;
};

/// Nothing when there is no command to carry out: help was asked for (printed to `out`, `exit_code`
/// 0) or the command line is wrong (said on `err`, `exit_code` that of usage).
[[nodiscard]] std::optional<Invocation> read_command_line(int argc, const char *const *argv,
                                                          std::ostream &out, std::ostream &err,
                                                          int &exit_code);

} // namespace ovhost
