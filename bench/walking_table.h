#pragma once
// The library's table as it would be without an index: the same slots under the same hash, found
// and changed one by one.

#include "orvale/ov_kvassoc.h"

#include <memory>

namespace ovbench
{

/// No slot lies on two cache lines, as in the library.
struct alignas(64) SlotArray {
    okv_assoc_entry slots[OKV_ASSOC_SIZE] = {};
};

class WalkingTable
{
  public:
    static constexpr const char *name = "walk";

    WalkingTable();

    void add(const char *text, uint32 id);
    void del(const char *text);
    [[nodiscard]] uint32 find(const char *text);

  private:
    static constexpr uint32 no_slot = OKV_ASSOC_SIZE;

    [[nodiscard]] okv_key key_of(const char *text) { return hash64_key(text, seed_, &state_); }
    [[nodiscard]] uint32 slot_of(okv_key key) const;

    uint64 seed_ = 0x2545f491;
    hash64_state state_ = {};
    std::unique_ptr<SlotArray> array_ = std::make_unique<SlotArray>();
    okv_assoc_entry *const slots_ = array_->slots;
};

} // namespace ovbench
