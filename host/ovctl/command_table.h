#pragma once
// The commands of ovctl, one row each. options.h makes the command line from the rows, run.h
// carries one out, render.h prints the results. A new command is a new row.

#include <nlohmann/json_fwd.hpp>

#include <iosfwd>
#include <map>
#include <span>
#include <string>

namespace ovhost
{

/// What the user gave, by argument name. A flag is there when it was given.
using Arguments = std::map<std::string, std::string>;

struct ArgumentSpec {
    enum class Kind {
        positional, ///< always needed
        optional,   ///< positional too, may be left out
        text,       ///< --name TEXT
        number,     ///< --name N
        flag,       ///< --name
    };

    Kind kind;
    const char *name;
    const char *help;
};

struct Command {
    /// As typed; two words make a command of a group ("show mode").
    const char *name;
    const char *help;
    const char *example;
    std::span<const ArgumentSpec> arguments;
    /// The command of the control protocol, and the arguments sent with it. `build` may throw
    /// UsageError (text_input.h).
    const char *request;
    nlohmann::json (*build)(const Arguments &arguments);
    /// Prints a result for people.
    void (*render)(const nlohmann::json &result, std::ostream &out);
    /// What is refused when the command is: "mgmtd refused the commit: ...".
    const char *subject;
    /// Whether a result is itself bad news, so that the exit code is that of a refusal; null: none
    /// is.
    bool (*is_bad)(const nlohmann::json &result) = nullptr;
    /// Whether it goes on with the events that mgmtd sends after the answer (follow.h): `render`
    /// then prints those, and the answer says nothing.
    bool follows = false;
};

[[nodiscard]] std::span<const Command> commands();

/// What the words that lead a group of commands say in the help.
[[nodiscard]] const char *group_help(const std::string &group);

} // namespace ovhost
