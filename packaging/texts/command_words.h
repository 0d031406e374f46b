#pragma once
// The command table of ovctl (host/ovctl/command_table.h) as completions and the manual need it.

#include "host/ovctl/command_table.h"

#include <map>
#include <span>
#include <string>
#include <vector>

namespace ovhost
{

/// The options that every command takes.
[[nodiscard]] std::span<const ArgumentSpec> global_options();

[[nodiscard]] bool is_option(const ArgumentSpec &argument);
[[nodiscard]] bool takes_value(const ArgumentSpec &argument);

/// A word that can come next, and what it is for.
struct Word {
    std::string text;
    std::string help;
};

/// The words after each beginning: after "" the commands and groups, after a group its commands.
[[nodiscard]] std::map<std::string, std::vector<Word>> words_after();

/// "--name" for each option, the global ones too, that is followed by a value.
[[nodiscard]] std::vector<std::string> options_with_values();

/// The commands whose first positional argument is a file.
[[nodiscard]] std::vector<std::string> commands_with_file();

} // namespace ovhost
