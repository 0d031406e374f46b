#include "host/framework/format.h"

#include <cstdio>

namespace ovhost
{

OwnedText print_text(const char *format, va_list arguments) noexcept
{
    char *text = nullptr;
    return OwnedText(::vasprintf(&text, format, arguments) < 0 ? nullptr : text);
}

} // namespace ovhost
