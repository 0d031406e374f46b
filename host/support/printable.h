#pragma once
// Text from elsewhere made fit for one line of a terminal.

#include <string>
#include <string_view>

namespace ovhost
{

/// Control characters as \n, \t, \r or \xNN, those beyond ASCII as \u00NN, so that a value is one
/// line and cannot steer the terminal. Everything else stays as it is.
[[nodiscard]] std::string printable(std::string_view text);

} // namespace ovhost
