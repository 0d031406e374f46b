#include "host/support/printable.h"

#include <gtest/gtest.h>

#include <string>

namespace
{

using namespace std::string_literals;
using ovhost::printable;

TEST(Printable, LeavesWhatIsShownAsItIs)
{
    for (const char *text :
         {"", "plain text", "caf\xc3\xa9 \xe2\x82\xac \xf0\x9f\x98\x80", "\xc2\xa0", "\xe2\x80\x8d",
          "\xe2\x80\xaf", "\xe2\x81\xa5", "\xe2\x81\xaa", "a\\nb"}) {
        EXPECT_EQ(printable(text), text);
    }
}

TEST(Printable, EscapesControlCharacters)
{
    EXPECT_EQ(printable("a\nb\tc\rd"), "a\\nb\\tc\\rd");
    EXPECT_EQ(printable("\0\x1b\x1f\x7f"s), "\\x00\\x1b\\x1f\\x7f");
    EXPECT_EQ(printable("\xc2\x80\xc2\x9f"), "\\u0080\\u009f");
}

TEST(Printable, EscapesWhatTurnsTheDirectionOfWriting)
{
    EXPECT_EQ(printable("\xd8\x9c\xe2\x80\x8e\xe2\x80\x8f"), "\\u061c\\u200e\\u200f");
    EXPECT_EQ(printable("\xe2\x80\xa8\xe2\x80\xae"), "\\u2028\\u202e");
    EXPECT_EQ(printable("\xe2\x81\xa6\xe2\x81\xa9"), "\\u2066\\u2069");
}

TEST(Printable, EscapesBytesThatAreNoText)
{
    EXPECT_EQ(printable("\x9b[31m\xff\xc3"), "\\x9b[31m\\xff\\xc3");
    EXPECT_EQ(printable("\xe2\x80"), "\\xe2\\x80");
}

} // namespace
