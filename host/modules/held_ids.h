#pragma once
// When tunnel IDs were freed. The library's allocator holds a freed ID back for a while and says no
// more than that it does; whoever is refused an ID wants to know for how long.

#include "framework/types.h"

#include <map>
#include <optional>
#include <vector>

namespace ovhost
{

/// The time by which the allocator goes, in milliseconds since boot.
[[nodiscard]] uint64 present_ms();

struct HeldId {
    uint32 id = 0;
    /// Whole seconds after which it is free again; 1 or more.
    uint64 seconds = 0;

    bool operator==(const HeldId &) const = default;
};

class HeldIds
{
  public:
    void freed(uint32 id, uint64 now);
    void taken(uint32 id) { freed_at_.erase(id); }
    void clear() { freed_at_.clear(); }

    /// For how long an ID is held back; nothing when it is not.
    [[nodiscard]] std::optional<uint64> seconds_left(uint32 id, uint64 now) const;

    /// All that are held back, the one that is free first in front.
    [[nodiscard]] std::vector<HeldId> list(uint64 now) const;

  private:
    std::map<uint32, uint64> freed_at_;
};

} // namespace ovhost
