#include "host/modules/held_ids.h"

#include "framework/sys_time.h"
#include "orvale/md_tunneld_defs.h"

#include <algorithm>

namespace ovhost
{
namespace
{

/// The allocator's own rule: an ID is free again when more than the quarantine has passed, or when
/// the clock has gone back.
std::optional<uint64> seconds_after(uint64 freed_at, uint64 now)
{
    const uint64 passed = now - freed_at;
    if (passed > TUNNEL_ID_QUARANTINE_MS) {
        return std::nullopt;
    }
    return (TUNNEL_ID_QUARANTINE_MS - passed) / 1000 + 1;
}

} // namespace

uint64 present_ms()
{
    if (time_info_ptr == nullptr) {
        ctime_init();
    }
    return time_info_ptr != nullptr ? time_info_ptr->time_since_boot_ms : sys_time_since_boot_ms();
}

void HeldIds::freed(uint32 id, uint64 now)
{
    // Those that are free again are of no more interest.
    std::erase_if(freed_at_, [now](const auto &held) { return !seconds_after(held.second, now); });
    // To the allocator this time says that the ID was never freed.
    if (now != 0) {
        freed_at_[id] = now;
    }
}

std::optional<uint64> HeldIds::seconds_left(uint32 id, uint64 now) const
{
    const auto held = freed_at_.find(id);
    return held != freed_at_.end() ? seconds_after(held->second, now) : std::nullopt;
}

std::vector<HeldId> HeldIds::list(uint64 now) const
{
    std::vector<HeldId> held;
    for (const auto &[id, freed_at] : freed_at_) {
        if (const std::optional<uint64> seconds = seconds_after(freed_at, now)) {
            held.push_back({id, *seconds});
        }
    }
    std::ranges::stable_sort(held, {}, &HeldId::seconds);
    return held;
}

} // namespace ovhost
