#include "host/support/utf8.h"

#include <gtest/gtest.h>

namespace ovhost
{
namespace
{

using namespace std::string_view_literals;

TEST(Utf8, MeasuresTheFirstCharacter)
{
    EXPECT_EQ(utf8_character_length("a"), 1U);
    EXPECT_EQ(utf8_character_length("\0"sv), 1U);
    EXPECT_EQ(utf8_character_length("\x7f"), 1U);
    EXPECT_EQ(utf8_character_length("\xc2\x80x"), 2U);
    EXPECT_EQ(utf8_character_length("\xdf\xbf"), 2U);
    EXPECT_EQ(utf8_character_length("\xe0\xa0\x80"), 3U);
    EXPECT_EQ(utf8_character_length("\xed\x9f\xbf"), 3U);
    EXPECT_EQ(utf8_character_length("\xee\x80\x80"), 3U);
    EXPECT_EQ(utf8_character_length("\xef\xbf\xbf"), 3U);
    EXPECT_EQ(utf8_character_length("\xf0\x90\x80\x80"), 4U);
    EXPECT_EQ(utf8_character_length("\xf4\x8f\xbf\xbf"), 4U);
}

TEST(Utf8, RefusesIllFormedSequences)
{
    const std::string_view ill_formed[] = {
        "",                 // nothing
        "\x80",             // continuation without a start
        "\xbf\x80",         // the same
        "\xc0\x80",         // overlong NUL
        "\xc1\xbf",         // overlong U+007F
        "\xc2",             // cut short
        "\xc2x",            // second byte is none
        "\xe0\x9f\xbf",     // overlong U+07FF
        "\xe1\x80",         // cut short
        "\xe1\x80x",        // third byte is none
        "\xed\xa0\x80",     // surrogate
        "\xed\xbf\xbf",     // surrogate
        "\xf0\x8f\xbf\xbf", // overlong U+FFFF
        "\xf1\x80\x80",     // cut short
        "\xf1\x80\x80x",    // fourth byte is none
        "\xf4\x90\x80\x80", // beyond U+10FFFF
        "\xf5\x80\x80\x80", // the same
        "\xff",             // never a byte of UTF-8
    };
    for (const std::string_view text : ill_formed) {
        EXPECT_EQ(utf8_character_length(text), 0U) << testing::PrintToString(text);
    }
}

TEST(Utf8, ChecksWholeTexts)
{
    EXPECT_TRUE(is_utf8(""));
    EXPECT_TRUE(is_utf8("plain"));
    EXPECT_TRUE(is_utf8("gr\xc3\xbc\xc3\x9f \xe2\x82\xac \xf0\x9f\x98\x80"));
    EXPECT_FALSE(is_utf8("ab\xc3"));
    EXPECT_FALSE(is_utf8("a\xff"
                         "b"));
}

} // namespace
} // namespace ovhost
