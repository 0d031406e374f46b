#include "host/framework/format.h"

#include <cstdio>

namespace ovhost
{

PrintedText print_text(const char *format, va_list arguments) noexcept
{
    char *text = nullptr;
    return PrintedText(::vasprintf(&text, format, arguments) < 0 ? nullptr : text);
}

} // namespace ovhost
