#pragma once
// Texts from the command line and from files, checked before they are sent.

#include <cstdint>
#include <limits>
#include <stdexcept>
#include <string>

namespace ovhost
{

/// Something the user has to change: ends ovctl with the exit code of usage.
class UsageError : public std::runtime_error
{
  public:
    using std::runtime_error::runtime_error;
};

/// The whole text of a file, of standard input for "-". Throws UsageError when it cannot be read,
/// is longer than mgmtd takes or is not UTF-8.
[[nodiscard]] std::string read_text(const std::string &file);

/// `text`, when it is UTF-8: JSON carries nothing else, and a byte that changes on its way would
/// end up in the configuration. Throws UsageError that names `what` and the line.
[[nodiscard]] std::string checked_utf8(std::string text, const std::string &what);

/// The bounds of a number, both of them in it.
struct NumberRange {
    std::uint32_t first = 0;
    std::uint32_t last = std::numeric_limits<std::uint32_t>::max();
};

/// A whole number of the range. Throws UsageError that names `what` and the range.
[[nodiscard]] std::uint32_t checked_number(const std::string &text, const std::string &what,
                                           const NumberRange &range = {});

} // namespace ovhost
