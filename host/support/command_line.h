#pragma once
// What the programs of the host check alike on their command lines.

#include <CLI/CLI.hpp>

namespace ovhost
{

/// A path or a name that is given must be one: what an empty variable of a script leaves behind is
/// not "the default".
[[nodiscard]] inline CLI::Validator not_empty()
{
    return {[](const std::string &text) {
                return std::string(text.empty() ? "must not be empty" : "");
            },
            ""};
}

} // namespace ovhost
