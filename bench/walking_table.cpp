#include "bench/walking_table.h"

#include "orvale/tunnel_defs.h"

namespace ovbench
{

WalkingTable::WalkingTable()
{
    for (okv_assoc_entry &entry : array_->slots) {
        entry.value = OKV_INVALID_VALUE;
    }
}

void WalkingTable::add(const char *text, uint32 id)
{
    const okv_key key = key_of(text);
    okv_value old_value = OKV_INVALID_VALUE;
    if (slot_of(key) == no_slot) {
        (void)okv_assoc_add_or_replace(slots_, key, id, &old_value);
    }
}

void WalkingTable::del(const char *text)
{
    const okv_key key = key_of(text);
    const uint32 slot = slot_of(key);
    if (slot != no_slot) {
        slots_[slot].value = OKV_INVALID_VALUE;
        slots_[slot].count -= 1;
        okv_add_to_counts(slots_, okv_home(key), slot, static_cast<uint32>(-1));
    }
}

uint32 WalkingTable::find(const char *text)
{
    const uint32 slot = slot_of(key_of(text));
    return slot != no_slot ? slots_[slot].value : TUNNEL_ID_NONE;
}

uint32 WalkingTable::slot_of(okv_key key) const
{
    const uint32 home = okv_home(key);
    uint32 slot = home;
    while (slots_[slot].count != 0) {
        if (slots_[slot].key == key && slots_[slot].value != OKV_INVALID_VALUE) {
            return slot;
        }
        slot = okv_next_slot(slot);
        if (slot == home) {
            break;
        }
    }
    return no_slot;
}

} // namespace ovbench
