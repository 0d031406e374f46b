#include "host/support/printable.h"

#include <cstdio>

namespace ovhost
{

namespace
{

std::string escaped(unsigned char character)
{
    switch (character) {
    case '\n':
        return "\\n";
    case '\r':
        return "\\r";
    case '\t':
        return "\\t";
    default:
        break;
    }
    char code[5];
    std::snprintf(code, sizeof(code), "\\x%02x", character);
    return code;
}

} // namespace

std::string printable(std::string_view text)
{
    std::string result;
    for (const char character : text) {
        const auto byte = static_cast<unsigned char>(character);
        if (byte < 0x20 || byte == 0x7f)
            result += escaped(byte);
        else
            result += character;
    }
    return result;
}

} // namespace ovhost
