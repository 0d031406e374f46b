#pragma once
// printf-style arguments to text of any length, for the operations that take a format.

#include <cstdarg>
#include <string>

namespace ovhost
{

/// Throws std::bad_alloc when out of memory, std::invalid_argument when the format or an argument
/// cannot be printed. Leaves `arguments` to the caller's va_end.
[[nodiscard]] __attribute__((format(printf, 1, 0))) std::string format_text(const char *format,
                                                                            va_list arguments);

} // namespace ovhost
