#include "framework/tstring.h"

#include "tests/framework/allocation_failure.h"
#include "tests/framework/owned.h"

#include <gtest/gtest.h>

#include <cwchar>
#include <string>

namespace ovhost::test
{
namespace
{

TEST(TString, NewCopiesTheText)
{
    std::string text = "eth0";
    OwnedString str;
    ASSERT_EQ(ts_new_str(str.out(), text.c_str()), 0);
    text = "gone";
    EXPECT_STREQ(ts_str(str.get()), "eth0");
    EXPECT_EQ(ts_length(str.get()), 4);
}

TEST(TString, NewOfNullTextIsEmpty)
{
    OwnedString str;
    ASSERT_EQ(ts_new_str(str.out(), nullptr), 0);
    EXPECT_STREQ(ts_str(str.get()), "");
    EXPECT_EQ(ts_length(str.get()), 0);
    EXPECT_EQ(ts_num_chars(str.get()), 0);
}

TEST(TString, NewWithoutPlaceForTheResultIsRefused)
{
    EXPECT_EQ(ts_new_str(nullptr, "x"), 14001);
    EXPECT_EQ(ts_new_sprintf(nullptr, "%d", 1), 14001);
    EXPECT_EQ(ts_dup(nullptr, nullptr), 14001);
}

TEST(TString, SprintfFormats)
{
    OwnedString str;
    ASSERT_EQ(ts_new_sprintf(str.out(), "%s/%d", "prio", 10), 0);
    EXPECT_STREQ(ts_str(str.get()), "prio/10");
}

TEST(TString, SprintfTextIsNeverCut)
{
    for (const std::size_t length : {511U, 512U, 513U, 100'000U}) {
        const std::string text(length, 'a');
        OwnedString str;
        ASSERT_EQ(ts_new_sprintf(str.out(), "%sz", text.c_str()), 0);
        EXPECT_EQ(ts_str(str.get()), text + "z");
    }
}

TEST(TString, SprintfRefusesNullFormat)
{
    OwnedString str;
    const char *no_format = nullptr;
    EXPECT_EQ(ts_new_sprintf(str.out(), no_format, 1), 14001);
    EXPECT_EQ(str.get(), nullptr);
}

TEST(TString, SprintfReportsAnArgumentThatCannotBePrinted)
{
    OwnedString str;
    constexpr wint_t no_character = 0x7FFFFFFF;
    EXPECT_EQ(ts_new_sprintf(str.out(), "%lc", no_character), 14000);
    EXPECT_EQ(str.get(), nullptr);
    EXPECT_EQ(smprintf("%lc", no_character), nullptr);
}

TEST(TString, FreeNullsAndIsSafeOnNull)
{
    tstring *str = nullptr;
    ASSERT_EQ(ts_new_str(&str, "x"), 0);
    ts_free(&str);
    EXPECT_EQ(str, nullptr);
    ts_free(&str);
    ts_free(nullptr);
}

TEST(TString, DupIsACopy)
{
    OwnedString str;
    OwnedString copy;
    ASSERT_EQ(ts_new_str(str.out(), "text"), 0);
    ASSERT_EQ(ts_dup(str.get(), copy.out()), 0);
    EXPECT_NE(str.get(), copy.get());
    EXPECT_STREQ(ts_str(copy.get()), "text");
}

TEST(TString, DupOfNullIsNull)
{
    OwnedString copy;
    EXPECT_EQ(ts_dup(nullptr, copy.out()), 0);
    EXPECT_EQ(copy.get(), nullptr);
}

TEST(TString, AccessorsOfNull)
{
    EXPECT_EQ(ts_str_(nullptr), nullptr);
    EXPECT_EQ(ts_length_(nullptr), -1);
    EXPECT_EQ(ts_num_chars(nullptr), -1);
}

TEST(TString, NumCharsCountsUtf8Characters)
{
    OwnedString str;
    // One, two, three and four bytes.
    ASSERT_EQ(ts_new_str(str.out(), "a\xC3\xA9\xE2\x82\xAC\xF0\x9F\x98\x80"), 0);
    EXPECT_EQ(ts_length(str.get()), 10);
    EXPECT_EQ(ts_num_chars(str.get()), 4);
}

class TStringPair : public testing::Test
{
  protected:
    TStringPair()
    {
        EXPECT_EQ(ts_new_str(low.out(), "Web"), 0);
        EXPECT_EQ(ts_new_str(high.out(), "web"), 0);
        EXPECT_EQ(ts_new_str(again.out(), "Web"), 0);
    }
    OwnedString low;
    OwnedString high;
    OwnedString again;
};

TEST_F(TStringPair, EqualityIsBytewise)
{
    EXPECT_TRUE(ts_equal(low.get(), again.get()));
    EXPECT_FALSE(ts_equal(low.get(), high.get()));
    for (const bool flag : {false, true}) {
        EXPECT_TRUE(ts_equal_str(low.get(), "Web", flag));
        EXPECT_FALSE(ts_equal_str(low.get(), "web", flag));
        EXPECT_FALSE(ts_equal_str(low.get(), "We", flag));
    }
}

TEST_F(TStringPair, NullEqualsNullOnly)
{
    EXPECT_TRUE(ts_equal(nullptr, nullptr));
    EXPECT_FALSE(ts_equal(low.get(), nullptr));
    EXPECT_FALSE(ts_equal(nullptr, low.get()));
    EXPECT_TRUE(ts_equal_str(nullptr, nullptr, true));
    EXPECT_FALSE(ts_equal_str(low.get(), nullptr, true));
    EXPECT_FALSE(ts_equal_str(nullptr, "", true));
}

TEST_F(TStringPair, OrderIsBytewise)
{
    EXPECT_LT(ts_cmp(low.get(), high.get()), 0);
    EXPECT_GT(ts_cmp(high.get(), low.get()), 0);
    EXPECT_EQ(ts_cmp(low.get(), again.get()), 0);
    for (const bool flag : {false, true}) {
        EXPECT_LT(ts_cmp_str(low.get(), "web", flag), 0);
        EXPECT_GT(ts_cmp_str(low.get(), "We", flag), 0);
        EXPECT_EQ(ts_cmp_str(low.get(), "Web", flag), 0);
    }
}

TEST_F(TStringPair, OrderTakesBytesAsUnsigned)
{
    OwnedString accented;
    ASSERT_EQ(ts_new_str(accented.out(), "\xC3\xA9"), 0);
    EXPECT_GT(ts_cmp(accented.get(), low.get()), 0);
}

TEST_F(TStringPair, NullSortsFirst)
{
    EXPECT_LT(ts_cmp(nullptr, low.get()), 0);
    EXPECT_GT(ts_cmp(low.get(), nullptr), 0);
    EXPECT_EQ(ts_cmp(nullptr, nullptr), 0);
    EXPECT_LT(ts_cmp_str(nullptr, "", true), 0);
    EXPECT_GT(ts_cmp_str(low.get(), nullptr, true), 0);
    EXPECT_EQ(ts_cmp_str(nullptr, nullptr, true), 0);
}

TEST(TString, ReportsLackOfMemory)
{
    OwnedString str;
    OwnedString other;
    const std::string text(100, 'a');
    expect_allocation_failures_reported([&] { return ts_new_str(str.out(), text.c_str()); });
    expect_allocation_failures_reported([&] { return ts_dup(str.get(), other.out()); });
    expect_allocation_failures_reported(
        [&] { return ts_new_sprintf(other.out(), "%s", text.c_str()); });
}

TEST(TString, HandsOutNothingWithoutMemory)
{
    tstring *str = nullptr;
    AllocationFailure failure(0);
    EXPECT_EQ(ts_new_str(&str, "x"), 14000);
    EXPECT_EQ(str, nullptr);
}

TEST(Smprintf, FormatsIntoNewText)
{
    OwnedText text;
    *text.out() = smprintf("%s/%s/prio", "/root", "map1");
    EXPECT_STREQ(text.get(), "/root/map1/prio");
}

TEST(Smprintf, TextIsNeverCut)
{
    const std::string long_text(70'000, 'x');
    OwnedText text;
    *text.out() = smprintf("%s.", long_text.c_str());
    EXPECT_EQ(text.get(), long_text + ".");
}

TEST(Smprintf, NullFormatGivesNull)
{
    const char *no_format = nullptr;
    EXPECT_EQ(smprintf(no_format, 1), nullptr);
}

} // namespace
} // namespace ovhost::test
