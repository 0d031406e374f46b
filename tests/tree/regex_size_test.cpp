#include "host/tree/regex_size.h"

#include <gtest/gtest.h>

#include <string>

namespace ovhost
{
namespace
{

TEST(RegexSize, CountsWhatMatchesOneCharacter)
{
    EXPECT_EQ(unrolled_regex_size(""), 0U);
    EXPECT_EQ(unrolled_regex_size("abc"), 3U);
    EXPECT_EQ(unrolled_regex_size("a*b?"), 2U);
    EXPECT_EQ(unrolled_regex_size(R"(\{\\x)"), 3U);
    EXPECT_EQ(unrolled_regex_size("[abc]d"), 2U);
    EXPECT_EQ(unrolled_regex_size("[]a]d"), 2U);
    EXPECT_EQ(unrolled_regex_size("[^]a]d"), 2U);
    EXPECT_EQ(unrolled_regex_size("[[:alpha:]]d"), 2U);
    EXPECT_EQ(unrolled_regex_size("[[a]d"), 2U);
    EXPECT_EQ(unrolled_regex_size("[({9}]d"), 2U);
}

TEST(RegexSize, UnrollsRepetitions)
{
    EXPECT_EQ(unrolled_regex_size("a{3}"), 3U);
    EXPECT_EQ(unrolled_regex_size("a{2,5}"), 5U);
    EXPECT_EQ(unrolled_regex_size("a{,5}"), 5U);
    EXPECT_EQ(unrolled_regex_size("a{3,}"), 4U);
    EXPECT_EQ(unrolled_regex_size("a{0}"), 1U);
    EXPECT_EQ(unrolled_regex_size("a+"), 2U);
    EXPECT_EQ(unrolled_regex_size("xa{3}y"), 5U);
}

TEST(RegexSize, MultipliesNestedRepetitions)
{
    EXPECT_EQ(unrolled_regex_size("((ab){3}){10}"), 60U);
    EXPECT_EQ(unrolled_regex_size("((a{255}){255}){255}"), 255U * 255U * 255U);
    EXPECT_EQ(unrolled_regex_size("a{100}{100}"), 10000U);
    EXPECT_EQ(unrolled_regex_size("a{100}*{100}"), 10000U);
    EXPECT_EQ(unrolled_regex_size("((((((((((a+)+)+)+)+)+)+)+)+)+"), 1024U);
    EXPECT_EQ(unrolled_regex_size("(a|b){5}"), 15U);
}

TEST(RegexSize, AddsWhatStandsSideBySide)
{
    EXPECT_EQ(unrolled_regex_size(R"(([0-9]{1,3}\.){3}[0-9]{1,3})"), 15U);
    EXPECT_EQ(unrolled_regex_size("x{8}-x{4}-x{4}-x{4}-x{12}"), 36U);
}

TEST(RegexSize, NeverOverflows)
{
    std::string nested = "a";
    for (int depth = 0; depth < 100; ++depth) {
        nested = "(" + nested + "){99999}";
    }
    EXPECT_GT(unrolled_regex_size(nested), 1000000U);
}

TEST(RegexSize, EndsOnAnyText)
{
    for (const char *text : {"(", ")", "[", "[^", "[]", "[[:", "[[:a", "\\", "{", "{3", "{x}", "}",
                             "*", "+", "{3}", "((a", "a))"}) {
        EXPECT_LE(unrolled_regex_size(text), 4U) << text;
    }
}

} // namespace
} // namespace ovhost
