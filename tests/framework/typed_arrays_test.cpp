#include "framework/typed_arrays.h"

#include "tests/framework/allocation_failure.h"
#include "tests/framework/owned.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <vector>

namespace ovhost::test
{
namespace
{

using testing::ElementsAre;
using testing::IsEmpty;

/// By tens, so that 31 and 35 compare equal but are not the same value.
int compare_tens(const void *left, const void *right)
{
    const uint32 left_tens = *static_cast<const uint32 *>(left) / 10;
    const uint32 right_tens = *static_cast<const uint32 *>(right) / 10;
    return static_cast<int>(left_tens > right_tens) - static_cast<int>(left_tens < right_tens);
}

int assign_plus_one(void *target, const void *source)
{
    *static_cast<uint32 *>(target) = *static_cast<const uint32 *>(source) + 1;
    return 0;
}

int refuse_to_assign(void * /*target*/, const void * /*source*/)
{
    return 14011;
}

std::vector<uint32> values_of(const OwnedIntegers &arr)
{
    std::vector<uint32> values;
    const int32 length = uint32_array_length_quick(arr.get());
    for (int32 index = 0; index < length; ++index) {
        values.push_back(uint32_array_get_quick(arr.get(), static_cast<uint32>(index)));
    }
    return values;
}

class Uint32Array : public testing::Test
{
  protected:
    Uint32Array() { EXPECT_EQ(uint32_array_new_full(arr.out(), nullptr), 0); }

    void make_sorted(int policy, int (*assign)(void *, const void *) = array_std_assign_func)
    {
        const array_options options = {compare_tens, assign, policy};
        ASSERT_EQ(uint32_array_new_full(arr.out(), &options), 0);
    }

    void insert(std::initializer_list<uint32> values)
    {
        for (const uint32 value : values) {
            ASSERT_EQ(uint32_array_insert_sorted(arr.get(), value), 0);
        }
    }

    OwnedIntegers arr;
};

TEST(ArrayOptions, Defaults)
{
    array_options options = {compare_tens, nullptr, 7};
    ASSERT_EQ(array_options_get_defaults(&options), 0);
    EXPECT_EQ(options.ao_elem_compare_func, nullptr);
    EXPECT_EQ(options.ao_elem_assign_func, &array_std_assign_func);
    EXPECT_EQ(options.ao_dup_policy, adp_add);
    EXPECT_EQ(array_options_get_defaults(nullptr), 14001);
}

TEST(ArrayOptions, StandardAssignment)
{
    uint32 target = 0;
    const uint32 source = 4'000'000'000;
    ASSERT_EQ(array_std_assign_func(&target, &source), 0);
    EXPECT_EQ(target, 4'000'000'000);
    EXPECT_EQ(array_std_assign_func(nullptr, &source), 14001);
    EXPECT_EQ(array_std_assign_func(&target, nullptr), 14001);
}

TEST_F(Uint32Array, FreeNullsAndIsSafeOnNull)
{
    uint32_array *other = nullptr;
    ASSERT_EQ(uint32_array_new_full(&other, nullptr), 0);
    uint32_array_free(&other);
    EXPECT_EQ(other, nullptr);
    uint32_array_free(&other);
    uint32_array_free(nullptr);
}

TEST_F(Uint32Array, RefusesNull)
{
    EXPECT_EQ(uint32_array_new_full(nullptr, nullptr), 14001);
    EXPECT_EQ(uint32_array_append(nullptr, 1), 14001);
    EXPECT_EQ(uint32_array_insert_sorted(nullptr, 1), 14001);
    EXPECT_EQ(uint32_array_delete_by_value(nullptr, 1), 14001);
}

TEST_F(Uint32Array, AppendKeepsTheOrderOfTheCalls)
{
    EXPECT_THAT(values_of(arr), IsEmpty());
    for (const uint32 value : {3U, 1U, 3U}) {
        ASSERT_EQ(uint32_array_append(arr.get(), value), 0);
    }
    EXPECT_THAT(values_of(arr), ElementsAre(3, 1, 3));
}

TEST_F(Uint32Array, InsertNeedsAComparison)
{
    EXPECT_EQ(uint32_array_insert_sorted(arr.get(), 1), 14002);
    EXPECT_THAT(values_of(arr), IsEmpty());
}

TEST_F(Uint32Array, InsertFindsThePlace)
{
    make_sorted(adp_add);
    insert({50, 10, 90, 70, 30});
    EXPECT_THAT(values_of(arr), ElementsAre(10, 30, 50, 70, 90));
}

TEST_F(Uint32Array, AddPutsANewEqualElementBehind)
{
    make_sorted(adp_add);
    insert({35, 50, 31, 35});
    EXPECT_THAT(values_of(arr), ElementsAre(35, 31, 35, 50));
}

TEST_F(Uint32Array, DeleteNewKeepsThePresentElement)
{
    make_sorted(adp_delete_new);
    insert({35, 50, 31});
    EXPECT_THAT(values_of(arr), ElementsAre(35, 50));
}

TEST_F(Uint32Array, DeleteOldReplacesThePresentElement)
{
    make_sorted(adp_delete_old);
    insert({35, 50, 31});
    EXPECT_THAT(values_of(arr), ElementsAre(31, 50));
}

TEST_F(Uint32Array, InsertAssignsWithTheOptions)
{
    make_sorted(adp_add, assign_plus_one);
    insert({10});
    EXPECT_THAT(values_of(arr), ElementsAre(11));
}

TEST_F(Uint32Array, InsertAssignsPlainlyWithoutAFunction)
{
    make_sorted(adp_add, nullptr);
    insert({10});
    EXPECT_THAT(values_of(arr), ElementsAre(10));
}

TEST_F(Uint32Array, AFailingAssignmentChangesNothing)
{
    make_sorted(adp_delete_old, refuse_to_assign);
    EXPECT_EQ(uint32_array_insert_sorted(arr.get(), 5), 14011);
    EXPECT_THAT(values_of(arr), IsEmpty());
}

TEST_F(Uint32Array, DeleteIsByValueNotByComparison)
{
    make_sorted(adp_add);
    insert({35, 31, 50, 31});
    ASSERT_EQ(uint32_array_delete_by_value(arr.get(), 31), 0);
    EXPECT_THAT(values_of(arr), ElementsAre(35, 31, 50));
    EXPECT_EQ(uint32_array_delete_by_value(arr.get(), 36), 14004);
    EXPECT_THAT(values_of(arr), ElementsAre(35, 31, 50));
}

TEST_F(Uint32Array, OptionsAreCopied)
{
    array_options options = {compare_tens, array_std_assign_func, adp_add};
    ASSERT_EQ(uint32_array_new_full(arr.out(), &options), 0);
    options.ao_elem_compare_func = nullptr;
    EXPECT_EQ(uint32_array_insert_sorted(arr.get(), 1), 0);
}

TEST_F(Uint32Array, ReportsLackOfMemory)
{
    OwnedIntegers other;
    expect_allocation_failures_reported(
        [&] { return uint32_array_new_full(other.out(), nullptr); });
    expect_allocation_failures_reported([&] { return uint32_array_append(arr.get(), 1); });
    make_sorted(adp_add);
    expect_allocation_failures_reported([&] { return uint32_array_insert_sorted(arr.get(), 1); });
    EXPECT_THAT(values_of(arr), ElementsAre(1));
}

} // namespace
} // namespace ovhost::test
