#include "host/modules/held_ids.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

namespace
{

using namespace ovhost;
using testing::ElementsAre;
using testing::IsEmpty;

TEST(HeldIds, AreHeldForAMinute)
{
    HeldIds held;
    held.freed(7, 1000);
    EXPECT_EQ(held.seconds_left(7, 1000), 61U) << "60001 ms, in whole seconds";
    EXPECT_EQ(held.seconds_left(7, 1001), 60U);
    EXPECT_EQ(held.seconds_left(7, 31000), 31U);
    EXPECT_EQ(held.seconds_left(7, 60001), 1U);
    EXPECT_EQ(held.seconds_left(7, 61000), 1U);
    EXPECT_EQ(held.seconds_left(7, 61001), std::nullopt);
    EXPECT_EQ(held.seconds_left(8, 1000), std::nullopt);
}

TEST(HeldIds, AreListedInTheOrderInWhichTheyAreFree)
{
    HeldIds held;
    held.freed(7, 1000);
    held.freed(5, 3000);
    held.freed(3, 5000);
    EXPECT_THAT(held.list(6000), ElementsAre(HeldId{7, 56}, HeldId{5, 58}, HeldId{3, 60}));
    EXPECT_THAT(held.list(62000), ElementsAre(HeldId{5, 2}, HeldId{3, 4}));
    held.taken(5);
    EXPECT_THAT(held.list(62000), ElementsAre(HeldId{3, 4}));
    held.freed(7, 62000);
    EXPECT_THAT(held.list(62000), ElementsAre(HeldId{3, 4}, HeldId{7, 61}));
    held.clear();
    EXPECT_THAT(held.list(62000), IsEmpty());
}

TEST(HeldIds, FollowTheAllocatorWhenTheClockIsOdd)
{
    HeldIds held;
    held.freed(7, 0);
    EXPECT_EQ(held.seconds_left(7, 0), std::nullopt) << "the allocator takes 0 for never freed";
    held.freed(8, 5000);
    EXPECT_EQ(held.seconds_left(8, 4999), std::nullopt) << "a clock that goes back holds nothing";
}

} // namespace
