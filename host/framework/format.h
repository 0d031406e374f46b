#pragma once
// printf-style arguments to text of any length, for the operations that take a format.

#include <cstdarg>
#include <cstdlib>
#include <memory>

namespace ovhost
{

struct FreeText {
    void operator()(char *text) const noexcept { std::free(text); }
};
using PrintedText = std::unique_ptr<char, FreeText>;

/// Null when out of memory, or when the format or an argument cannot be printed.
[[nodiscard]] __attribute__((format(printf, 1, 0))) PrintedText
print_text(const char *format, va_list arguments) noexcept;

} // namespace ovhost
