// Texts that ovctl sends: host/ovctl/text_input.h.

#include "host/ovctl/text_input.h"

#include "tests/support/files.h"
#include "tests/support/scratch_dir.h"

#include <gtest/gtest.h>

#include <string>

namespace ovhost
{
namespace
{

std::string fault_of(const std::string &text)
{
    try {
        static_cast<void>(checked_utf8(text, "VALUE"));
    } catch (const UsageError &error) {
        return error.what();
    }
    return "none";
}

TEST(TextInputTest, EveryFormOfUtf8IsTaken)
{
    for (const char *text :
         {"", "plain", "\x7f", "\xc2\x80", "\xdf\xbf", "\xe0\xa0\x80", "\xed\x9f\xbf",
          "\xee\x80\x80", "\xef\xbf\xbf", "\xf0\x90\x80\x80", "\xf4\x8f\xbf\xbf"})
        EXPECT_EQ(fault_of(text), "none") << text;
    EXPECT_EQ(fault_of(std::string("a\0b", 3)), "none");
}

TEST(TextInputTest, WhatIsNotUtf8IsRefusedWithItsLine)
{
    EXPECT_EQ(fault_of("caf\xe9"), "VALUE is not UTF-8 in line 1: convert it first");
    EXPECT_EQ(fault_of("one\ntwo\nthr\xff"), "VALUE is not UTF-8 in line 3: convert it first");
}

TEST(TextInputTest, FormsThatStandForNothingAreRefused)
{
    // A lone continuation; overlong forms; a surrogate; past the last character; cut short.
    for (const char *text : {"\x80", "\xc0\x80", "\xc1\xbf", "\xe0\x9f\xbf", "\xed\xa0\x80",
                             "\xf0\x8f\xbf\xbf", "\xf4\x90\x80\x80", "\xf5\x80\x80\x80", "\xc2",
                             "\xe1\x80", "\xf1\x80\x80", "\xe1\x80g", "\xf1\x80\x80g"})
        EXPECT_NE(fault_of(text), "none") << text;
}

TEST(TextInputTest, AFileHasAName)
{
    try {
        static_cast<void>(read_text(""));
        ADD_FAILURE();
    } catch (const UsageError &error) {
        EXPECT_STREQ(error.what(), "the name of the file is empty; - is standard input");
    }
}

TEST(TextInputTest, ANumberIsWholeAndFits)
{
    EXPECT_EQ(checked_number("0", "N"), 0U);
    EXPECT_EQ(checked_number("007", "N"), 7U);
    EXPECT_EQ(checked_number("4294967295", "N"), 4294967295U);
    for (const char *text : {"", "-1", "+1", " 1", "1 ", "1.5", "0x10", "4294967296", "one"}) {
        try {
            static_cast<void>(checked_number(text, "N"));
            ADD_FAILURE() << text;
        } catch (const UsageError &error) {
            EXPECT_STREQ(error.what(), "N must be a whole number from 0 to 4294967295");
        }
    }
}

TEST(TextInputTest, ANumberIsInItsRange)
{
    EXPECT_EQ(checked_number("1", "N", {1, 3}), 1U);
    EXPECT_EQ(checked_number("3", "N", {1, 3}), 3U);
    for (const char *text : {"0", "4", "x"}) {
        try {
            static_cast<void>(checked_number(text, "N", {1, 3}));
            ADD_FAILURE() << text;
        } catch (const UsageError &error) {
            EXPECT_STREQ(error.what(), "N must be a whole number from 1 to 3");
        }
    }
}

TEST(TextInputTest, AFileIsReadWhole)
{
    const ovtest::ScratchDir dir;
    std::string text;
    for (int i = 0; i < 50000; ++i)
        text += std::to_string(i) + "\n";
    ovtest::write_file(dir.path("f"), text);
    EXPECT_EQ(read_text(dir.path("f")), text);
}

} // namespace
} // namespace ovhost
