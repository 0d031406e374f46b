#include "framework/tstr_array.h"

#include "tests/framework/allocation_failure.h"
#include "tests/framework/owned.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <string>

namespace ovhost::test
{
namespace
{

using testing::ElementsAre;
using testing::IsEmpty;

class TStrArray : public testing::Test
{
  protected:
    TStrArray() { EXPECT_EQ(tstr_array_new(arr.out(), nullptr), 0); }

    void fill(std::initializer_list<const char *> texts)
    {
        for (const char *text : texts) {
            ASSERT_EQ(tstr_array_append_str(arr.get(), text), 0);
        }
    }

    void use_policy(int policy)
    {
        tstr_array_options options;
        ASSERT_EQ(array_options_get_defaults(&options), 0);
        options.ao_dup_policy = policy;
        ASSERT_EQ(tstr_array_new(arr.out(), &options), 0);
    }

    OwnedStrings arr;
};

TEST_F(TStrArray, IsNewAndEmpty)
{
    EXPECT_EQ(tstr_array_length_quick(arr.get()), 0);
}

TEST_F(TStrArray, NewWithoutPlaceForTheResultIsRefused)
{
    EXPECT_EQ(tstr_array_new(nullptr, nullptr), 14001);
    EXPECT_EQ(tstr_array_duplicate(arr.get(), nullptr), 14001);
}

TEST_F(TStrArray, FreeNullsAndIsSafeOnNull)
{
    tstr_array *other = nullptr;
    ASSERT_EQ(tstr_array_new(&other, nullptr), 0);
    tstr_array_free(&other);
    EXPECT_EQ(other, nullptr);
    tstr_array_free(&other);
    tstr_array_free(nullptr);
}

TEST_F(TStrArray, AppendCopiesInOrder)
{
    std::string text = "b";
    ASSERT_EQ(tstr_array_append_str(arr.get(), text.c_str()), 0);
    text = "gone";
    fill({"a", ""});
    EXPECT_THAT(texts_of(arr), ElementsAre("b", "a", ""));
}

TEST_F(TStrArray, AppendRefusesNull)
{
    EXPECT_EQ(tstr_array_append_str(nullptr, "x"), 14001);
    EXPECT_EQ(tstr_array_append_str(arr.get(), nullptr), 14001);
    EXPECT_EQ(tstr_array_length_quick(arr.get()), 0);
}

TEST_F(TStrArray, TakeoverNullsTheCallersPointer)
{
    tstring *str = nullptr;
    ASSERT_EQ(ts_new_str(&str, "a text of more than sixteen bytes"), 0);
    ASSERT_EQ(tstr_array_append_takeover(arr.get(), &str), 0);
    EXPECT_EQ(str, nullptr);
    EXPECT_THAT(texts_of(arr), ElementsAre("a text of more than sixteen bytes"));
}

TEST_F(TStrArray, TakeoverRefusesNullAndLeavesTheString)
{
    OwnedString str;
    tstring *none = nullptr;
    ASSERT_EQ(ts_new_str(str.out(), "kept"), 0);
    EXPECT_EQ(tstr_array_append_takeover(nullptr, str.address()), 14001);
    EXPECT_EQ(tstr_array_append_takeover(arr.get(), nullptr), 14001);
    EXPECT_EQ(tstr_array_append_takeover(arr.get(), &none), 14001);
    EXPECT_STREQ(ts_str(str.get()), "kept");
}

TEST_F(TStrArray, RemoveHandsTheStringOut)
{
    fill({"a", "b", "c"});
    OwnedString taken;
    ASSERT_EQ(tstr_array_remove(arr.get(), 1, taken.out()), 0);
    EXPECT_STREQ(ts_str(taken.get()), "b");
    EXPECT_THAT(texts_of(arr), ElementsAre("a", "c"));
}

TEST_F(TStrArray, RemoveFreesTheStringWhenNobodyTakesIt)
{
    fill({"a", "b"});
    ASSERT_EQ(tstr_array_remove(arr.get(), 0, nullptr), 0);
    EXPECT_THAT(texts_of(arr), ElementsAre("b"));
}

TEST_F(TStrArray, RemoveRefusesAnIndexPastTheEndAndNull)
{
    fill({"a"});
    OwnedString taken;
    EXPECT_EQ(tstr_array_remove(arr.get(), 1, taken.out()), 14004);
    EXPECT_EQ(tstr_array_remove(nullptr, 0, taken.out()), 14001);
    EXPECT_EQ(taken.get(), nullptr);
    EXPECT_THAT(texts_of(arr), ElementsAre("a"));
}

TEST_F(TStrArray, DuplicateIsDeep)
{
    fill({"a", "b"});
    OwnedStrings copy;
    ASSERT_EQ(tstr_array_duplicate(arr.get(), copy.out()), 0);
    ASSERT_EQ(tstr_array_remove(arr.get(), 0, nullptr), 0);
    EXPECT_THAT(texts_of(copy), ElementsAre("a", "b"));
}

TEST_F(TStrArray, DuplicateOfNullIsNull)
{
    OwnedStrings copy;
    EXPECT_EQ(tstr_array_duplicate(nullptr, copy.out()), 0);
    EXPECT_EQ(copy.get(), nullptr);
}

TEST_F(TStrArray, KeepsDuplicatesByDefault)
{
    fill({"a", "b", "a"});
    EXPECT_THAT(texts_of(arr), ElementsAre("a", "b", "a"));
}

TEST_F(TStrArray, DeleteOldKeepsTheLastOccurrence)
{
    use_policy(adp_delete_old);
    fill({"a", "b", "c", "a", "c"});
    EXPECT_THAT(texts_of(arr), ElementsAre("b", "a", "c"));
}

TEST_F(TStrArray, DeleteNewKeepsTheFirstOccurrence)
{
    use_policy(adp_delete_new);
    fill({"a", "b", "a"});
    EXPECT_THAT(texts_of(arr), ElementsAre("a", "b"));
}

TEST_F(TStrArray, TakeoverFollowsThePolicyAndTakesTheStringInAnyCase)
{
    use_policy(adp_delete_new);
    fill({"a"});
    OwnedString str;
    ASSERT_EQ(ts_new_str(str.out(), "a"), 0);
    ASSERT_EQ(tstr_array_append_takeover(arr.get(), str.address()), 0);
    EXPECT_EQ(str.get(), nullptr);
    EXPECT_THAT(texts_of(arr), ElementsAre("a"));
}

TEST_F(TStrArray, DuplicateKeepsThePolicy)
{
    use_policy(adp_delete_old);
    fill({"a", "b"});
    OwnedStrings copy;
    ASSERT_EQ(tstr_array_duplicate(arr.get(), copy.out()), 0);
    ASSERT_EQ(tstr_array_append_str(copy.get(), "a"), 0);
    EXPECT_THAT(texts_of(copy), ElementsAre("b", "a"));
}

TEST_F(TStrArray, ReportsLackOfMemory)
{
    const std::string text(100, 'a');
    OwnedStrings other;
    expect_allocation_failures_reported([&] { return tstr_array_new(other.out(), nullptr); });
    expect_allocation_failures_reported(
        [&] { return tstr_array_append_str(arr.get(), text.c_str()); });
    expect_allocation_failures_reported(
        [&] { return tstr_array_duplicate(arr.get(), other.out()); });
    EXPECT_THAT(texts_of(arr), ElementsAre(text));
    EXPECT_THAT(texts_of(other), ElementsAre(text));
}

TEST_F(TStrArray, TakeoverWithoutMemoryLeavesTheString)
{
    const std::string text(100, 'a');
    OwnedString str;
    ASSERT_EQ(ts_new_str(str.out(), text.c_str()), 0);
    {
        AllocationFailure failure(0);
        EXPECT_EQ(tstr_array_append_takeover(arr.get(), str.address()), 14000);
    }
    ASSERT_NE(str.get(), nullptr);
    EXPECT_EQ(ts_str(str.get()), text);
    EXPECT_THAT(texts_of(arr), IsEmpty());
}

TEST_F(TStrArray, RemoveWithoutMemoryLeavesTheArray)
{
    fill({"a"});
    tstring *taken = nullptr;
    {
        AllocationFailure failure(0);
        EXPECT_EQ(tstr_array_remove(arr.get(), 0, &taken), 14000);
    }
    EXPECT_EQ(taken, nullptr);
    EXPECT_THAT(texts_of(arr), ElementsAre("a"));
}

} // namespace
} // namespace ovhost::test
