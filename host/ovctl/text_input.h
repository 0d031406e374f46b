#pragma once
// Texts from the command line and from files, checked before they are sent.

#include <cstdint>
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

/// A whole number from 0 to 4294967295. Throws UsageError that names `what`.
[[nodiscard]] std::uint32_t checked_number(const std::string &text, const std::string &what);

} // namespace ovhost
