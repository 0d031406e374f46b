#include "host/support/utf8.h"

#include <algorithm>

namespace ovhost
{

namespace
{

/// The well-formed sequences by their first byte. The second byte's range is what rules out
/// overlong forms, surrogates and code points beyond the last; any later byte is 80 to BF.
struct Sequence {
    unsigned char first_low;
    unsigned char first_high;
    unsigned char second_low;
    unsigned char second_high;
    std::size_t length;
};

constexpr Sequence sequences[] = {
    {0x00, 0x7f, 0x00, 0x00, 1}, {0xc2, 0xdf, 0x80, 0xbf, 2}, {0xe0, 0xe0, 0xa0, 0xbf, 3},
    {0xe1, 0xec, 0x80, 0xbf, 3}, {0xed, 0xed, 0x80, 0x9f, 3}, {0xee, 0xef, 0x80, 0xbf, 3},
    {0xf0, 0xf0, 0x90, 0xbf, 4}, {0xf1, 0xf3, 0x80, 0xbf, 4}, {0xf4, 0xf4, 0x80, 0x8f, 4},
};

bool is_between(char byte, unsigned char low, unsigned char high)
{
    const auto value = static_cast<unsigned char>(byte);
    return value >= low && value <= high;
}

bool starts_with(std::string_view text, const Sequence &sequence)
{
    if (text.size() < sequence.length ||
        !is_between(text[0], sequence.first_low, sequence.first_high)) {
        return false;
    }
    if (sequence.length == 1) {
        return true;
    }
    return is_between(text[1], sequence.second_low, sequence.second_high) &&
           std::ranges::all_of(text.substr(2, sequence.length - 2),
                               [](char byte) { return is_between(byte, 0x80, 0xbf); });
}

} // namespace

std::size_t utf8_character_length(std::string_view text)
{
    for (const Sequence &sequence : sequences) {
        if (starts_with(text, sequence)) {
            return sequence.length;
        }
    }
    return 0;
}

bool is_utf8(std::string_view text)
{
    while (!text.empty()) {
        const std::size_t length = utf8_character_length(text);
        if (length == 0) {
            return false;
        }
        text.remove_prefix(length);
    }
    return true;
}

} // namespace ovhost
