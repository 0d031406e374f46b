#include "tests/library/tunnel_cache.h"

#include <sys/time.h>

#include <algorithm>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <ctime>
#include <optional>

namespace ovtest
{

namespace
{

constexpr uint64 microseconds_per_second = 1000000;

std::optional<uint64> planted_microseconds;

} // namespace

PlantedTimeOfDay::PlantedTimeOfDay(uint64 microseconds)
{
    planted_microseconds = microseconds;
}

PlantedTimeOfDay::~PlantedTimeOfDay()
{
    planted_microseconds.reset();
}

uint64 seed_at(uint64 microseconds)
{
    srand(static_cast<unsigned>(microseconds));
    return static_cast<uint64>(rand());
}

uint64 time_with_seed_ending(uint32 low_bits, uint32 mask)
{
    // From some day in 2020 on, so that seconds and microseconds both count.
    uint64 microseconds = uint64{1600000000} * microseconds_per_second + 1;
    while ((seed_at(microseconds) & mask) != low_bits) {
        microseconds += 1234567;
    }
    return microseconds;
}

uint64 seed_of(const TableOperations &table)
{
    constexpr uint64 high_half_of_empty_text = 0x9e3779b97f4a7c13;
    constexpr uint32 some_id = 4711;
    char empty[] = "";
    table.add(empty, some_id);
    uint64 seed = 0;
    for (uint32 slot = 0; slot < OKV_ASSOC_SIZE; ++slot) {
        const okv_assoc_entry &entry = table.slots[slot];
        if (entry.value == some_id && okv_key_high(entry.key) == high_half_of_empty_text) {
            seed = okv_key_low(entry.key);
        }
    }
    table.del(empty);
    return seed;
}

tunnel_config_bin_t record_of(const std::string &name, const std::string &alias, uint32 id)
{
    tunnel_config_bin_t record = {};
    memcpy(record.tp_tunnel_name, name.data(), std::min(name.size(), sizeof record.tp_tunnel_name));
    memcpy(record.tp_tunnel_alias, alias.data(),
           std::min(alias.size(), sizeof record.tp_tunnel_alias));
    record.tp_tunnel_id = id;
    return record;
}

std::string key_text(uint64 high, uint64 low)
{
    char text[33];
    (void)snprintf(text, sizeof text, "%016lx%016lx", high, low);
    return text;
}

} // namespace ovtest

// The library finds this one before the C library's.
extern "C" int gettimeofday(struct timeval *now, void *) noexcept
{
    using namespace ovtest;
    if (planted_microseconds) {
        now->tv_sec = static_cast<time_t>(*planted_microseconds / microseconds_per_second);
        now->tv_usec = static_cast<suseconds_t>(*planted_microseconds % microseconds_per_second);
        return 0;
    }
    timespec precise = {};
    const int status = clock_gettime(CLOCK_REALTIME, &precise);
    now->tv_sec = precise.tv_sec;
    now->tv_usec = precise.tv_nsec / 1000;
    return status;
}
