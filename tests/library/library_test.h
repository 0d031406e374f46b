// What every test of the library starts from.
#pragma once

#include "tests/support/allocation_layer.h"
#include "tests/support/fault_layer.h"
#include "tests/support/host_fixture.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

namespace ovtest
{

class LibraryTest : public testing::Test
{
  protected:
    // Whatever a test did: the library has released what it did not hand out, and freed nothing
    // else.
    void TearDown() override
    {
        EXPECT_THAT(live_objects(), testing::IsEmpty());
        EXPECT_THAT(misuses(), testing::IsEmpty());
        EXPECT_EQ(live_allocations(), 0U);
    }

    HostFixture host_;
};

} // namespace ovtest
