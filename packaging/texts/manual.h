#pragma once
// The manual page of ovctl: its commands come from the command table, the rest from a template.

#include <iosfwd>

namespace ovhost
{

/// Copies the template, with a description of every command in place of the line
/// `.\" COMMANDS`. False when there is no such line.
[[nodiscard]] bool print_manual(std::istream &page, std::ostream &out);

} // namespace ovhost
