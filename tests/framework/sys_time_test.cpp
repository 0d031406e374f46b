#include "framework/sys_time.h"

#include "host/framework/time_refresh.h"

#include <gtest/gtest.h>

#include <chrono>
#include <cstdlib>
#include <fstream>
#include <thread>

namespace ovhost::test
{
namespace
{

using std::chrono::milliseconds;

TEST(TimeSinceBoot, AgreesWithTheKernelsUptime)
{
    double uptime_seconds = 0;
    std::ifstream("/proc/uptime") >> uptime_seconds;
    const double now_seconds = static_cast<double>(sys_time_since_boot_ms()) / 1000;
    EXPECT_NEAR(now_seconds, uptime_seconds, 5);
}

TEST(TimeSinceBoot, RunsInMilliseconds)
{
    const uint64 before = sys_time_since_boot_ms();
    std::this_thread::sleep_for(milliseconds(20));
    const uint64 passed = sys_time_since_boot_ms() - before;
    EXPECT_GE(passed, 19U);
    EXPECT_LT(passed, 5000U);
}

TEST(TimeInfo, IsNullUntilItIsSetUp)
{
    // In a process of its own, where no other test has set it up.
    EXPECT_EXIT(
        {
            time_info_ptr = nullptr;
            refresh_time_info();
            const bool stayed_null = time_info_ptr == nullptr;
            ctime_init();
            const bool is_set = time_info_ptr != nullptr && time_info_ptr->time_since_boot_ms > 0;
            std::_Exit(stayed_null && is_set ? 0 : 1);
        },
        testing::ExitedWithCode(0), "");
}

TEST(TimeInfo, ChangesWhenItIsRefreshedOnly)
{
    ctime_init();
    const uint64 first = time_info_ptr->time_since_boot_ms;
    std::this_thread::sleep_for(milliseconds(20));
    EXPECT_EQ(time_info_ptr->time_since_boot_ms, first);
    refresh_time_info();
    EXPECT_GE(time_info_ptr->time_since_boot_ms, first + 19);
    EXPECT_LE(time_info_ptr->time_since_boot_ms, sys_time_since_boot_ms());
}

} // namespace
} // namespace ovhost::test
