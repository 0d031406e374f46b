// What every test of the library starts from.
#pragma once

#include "tests/support/allocation_layer.h"
#include "tests/support/fault_layer.h"
#include "tests/support/host_fixture.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <cstddef>
#include <filesystem>
#include <iterator>
#include <string>
#include <vector>

namespace ovtest
{

// A line of the log by its place, counted from 0, and the last one; empty where there is none.
inline std::string log_line(std::size_t place)
{
    const std::vector<std::string> lines = log_lines();
    return place < lines.size() ? lines[place] : "";
}
inline std::string last_log_line()
{
    const std::vector<std::string> lines = log_lines();
    return lines.empty() ? "" : lines.back();
}

inline std::ptrdiff_t num_open_descriptors()
{
    return std::distance(std::filesystem::directory_iterator("/proc/self/fd"),
                         std::filesystem::directory_iterator());
}

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
