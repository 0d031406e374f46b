#pragma once
// Text from elsewhere made fit for one line of a terminal.

#include <string>
#include <string_view>

namespace ovhost
{

/// Control characters as \n, \t, \r or \xNN, those beyond ASCII and those that turn the direction
/// of writing as \uNNNN, bytes that are no UTF-8 as \xNN: a value is one line, cannot steer the
/// terminal and looks like no other one. Everything else stays as it is.
[[nodiscard]] std::string printable(std::string_view text);

} // namespace ovhost
