#include "framework/sys_time.h"

#include "host/framework/time_refresh.h"

#include <ctime>

namespace
{

time_info record;

} // namespace

time_info *time_info_ptr = nullptr;

namespace ovhost
{

void refresh_time_info()
{
    if (time_info_ptr != nullptr) {
        time_info_ptr->time_since_boot_ms = sys_time_since_boot_ms();
    }
}

} // namespace ovhost

void ctime_init(void)
{
    time_info_ptr = &record;
    ovhost::refresh_time_info();
}

uint64 sys_time_since_boot_ms(void)
{
    timespec now = {};
    // Fails for a bad address or an unknown clock only.
    (void)::clock_gettime(CLOCK_BOOTTIME, &now);
    return static_cast<uint64>(now.tv_sec) * 1000 + static_cast<uint64>(now.tv_nsec) / 1'000'000;
}
