#pragma once
// What an output stream leads to: a terminal of some width, with or without colour, or something
// that takes texts as they are. Renderers need not know: table.h and styled() ask the stream.

#include <cstddef>
#include <iosfwd>
#include <string>

namespace ovhost
{

struct Terminal {
    /// Columns; 0 when it is no terminal, and everything is printed whole.
    std::size_t width = 0;
    bool colour = false;

    bool operator==(const Terminal &) const = default;
};

/// Looks at a descriptor and at the environment: COLUMNS goes before the terminal's own width;
/// NO_COLOR with a value, or a TERM that cannot show any, turns colour off.
[[nodiscard]] Terminal look_at_terminal(int fd);

/// Tells a stream what it leads to. Without, it is no terminal.
void set_terminal(std::ostream &stream, const Terminal &terminal);
[[nodiscard]] Terminal terminal_of(std::ostream &stream);

enum class Style { heading, added, removed, modified, warning, error };

/// The text as the stream's terminal shows that style: unchanged where there is no colour.
[[nodiscard]] std::string styled(std::ostream &stream, Style style, const std::string &text);

} // namespace ovhost
