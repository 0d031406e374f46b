#include "host/framework/format.h"

#include <array>
#include <cstddef>
#include <cstdio>
#include <stdexcept>

namespace ovhost
{

std::string format_text(const char *format, va_list arguments)
{
    // Nearly every text fits; only longer ones are printed twice.
    std::array<char, 512> nearly_always_enough;
    va_list first_pass;
    va_copy(first_pass, arguments);
    const int length = std::vsnprintf(nearly_always_enough.data(), nearly_always_enough.size(),
                                      format, first_pass);
    va_end(first_pass);
    if (length < 0) {
        throw std::invalid_argument("format cannot be printed");
    }
    const auto size = static_cast<std::size_t>(length);
    if (size < nearly_always_enough.size()) {
        return {nearly_always_enough.data(), size};
    }
    std::string text(size, '\0');
    std::vsnprintf(text.data(), size + 1, format, arguments);
    return text;
}

} // namespace ovhost
