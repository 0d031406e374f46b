// Finds slots of an ov_kvassoc table without walking it.
//
// Names of under 24 bytes share at most 256 home slots, so that a walk from a key's home passes
// thousands of others. What the table holds is fixed to the count; where a key stands that is not
// at home is told here, in constant time on average, and where the next empty slot is, by a search
// over one byte for each slot. The table belongs to one owner, who makes every change through an
// index.
#pragma once

#include "orvale/ov_kvassoc.h"

#include <cstring>

namespace ovmd
{

class slot_index
{
  public:
    static constexpr uint32 no_slot = OKV_ASSOC_SIZE;

    // Empties the table, and the index with it.
    void clear(okv_assoc_entry *table)
    {
        for (uint32 slot = 0; slot < OKV_ASSOC_SIZE; ++slot) {
            table[slot].key = 0;
            table[slot].value = OKV_INVALID_VALUE;
            table[slot].count = 0;
        }
        memset(occupied_, 0, sizeof occupied_);
        memset(buckets_, 0, sizeof buckets_);
    }

    // The slot of a live key, or no_slot.
    uint32 find(const okv_assoc_entry *table, okv_key key) const
    {
        const uint32 home = okv_home(key);
        if (table[home].count == 0) {
            return no_slot;
        }
        if (table[home].key == key && table[home].value != OKV_INVALID_VALUE) {
            return home;
        }
        const uint32 bucket = find_bucket(table, key);
        return bucket != no_bucket ? buckets_[bucket] - 1 : no_slot;
    }

    // Stores a key that is not there. False when the table is full, which leaves it as it was.
    bool insert(okv_assoc_entry *table, okv_key key, okv_value value)
    {
        const uint32 home = okv_home(key);
        const uint32 slot = first_empty_from(home);
        if (slot == no_slot) {
            return false;
        }
        table[slot].key = key;
        table[slot].value = value;
        table[slot].count += 1;
        occupied_[slot] = true;
        if (slot != home) {
            enter(table, key, slot);
        }
        return true;
    }

    // Empties the slot where find() has found the key.
    void remove(okv_assoc_entry *table, okv_key key, uint32 slot)
    {
        if (slot != okv_home(key)) {
            leave(table, key, slot);
        }
        table[slot].value = OKV_INVALID_VALUE;
        table[slot].count -= 1;
        occupied_[slot] = false;
    }

  private:
    // Only keys that are not at home have a bucket: well-spread keys pay for none. A bucket holds a
    // slot, counted from 1; 0 is an empty bucket.
    static constexpr uint32 num_buckets = OKV_ASSOC_SIZE;
    static constexpr uint32 no_bucket = num_buckets;

    // The high half of a key tells apart those that share a home.
    static uint32 first_bucket(okv_key key)
    {
        return static_cast<uint32>(okv_key_high(key)) & (num_buckets - 1);
    }

    static uint32 next_bucket(uint32 bucket) { return (bucket + 1) & (num_buckets - 1); }

    static uint32 distance(uint32 from, uint32 to) { return (to - from) & (num_buckets - 1); }

    // All buckets may be taken when all slots are.
    uint32 find_bucket(const okv_assoc_entry *table, okv_key key) const
    {
        uint32 bucket = first_bucket(key);
        for (uint32 n = 0; n < num_buckets && buckets_[bucket] != 0; ++n) {
            if (table[buckets_[bucket] - 1].key == key) {
                return bucket;
            }
            bucket = next_bucket(bucket);
        }
        return no_bucket;
    }

    // What a key takes that is not at home: a bucket, for which there is always room, and the
    // counts on the way to it. Out of line, as leave() is: spread keys seldom come here.
    [[gnu::noinline]] void enter(okv_assoc_entry *table, okv_key key, uint32 slot)
    {
        add_to_way(table, okv_home(key), slot, 1);
        uint32 bucket = first_bucket(key);
        while (buckets_[bucket] != 0) {
            bucket = next_bucket(bucket);
        }
        buckets_[bucket] = slot + 1;
    }

    // Gives both back. The buckets behind the key's that would no longer be found past the gap move
    // up.
    [[gnu::noinline]] void leave(okv_assoc_entry *table, okv_key key, uint32 slot)
    {
        add_to_way(table, okv_home(key), slot, static_cast<uint32>(-1));
        uint32 gap = find_bucket(table, key);
        buckets_[gap] = 0;
        for (uint32 bucket = next_bucket(gap); buckets_[bucket] != 0;
             bucket = next_bucket(bucket)) {
            const uint32 first = first_bucket(table[buckets_[bucket] - 1].key);
            if (distance(first, bucket) >= distance(gap, bucket)) {
                buckets_[gap] = buckets_[bucket];
                buckets_[bucket] = 0;
                gap = bucket;
            }
        }
    }

    // The first empty slot from `home` on, around the end; no_slot when there is none.
    uint32 first_empty_from(uint32 home) const
    {
        if (!occupied_[home]) {
            return home;
        }
        const void *empty = memchr(occupied_ + home, false, OKV_ASSOC_SIZE - home);
        if (empty == nullptr) {
            empty = memchr(occupied_, false, home);
        }
        return empty != nullptr ? static_cast<uint32>(static_cast<const bool *>(empty) - occupied_)
                                : no_slot;
    }

    // Adds to the counts from a key's home up to but not including its slot.
    static void add_to_way(okv_assoc_entry *table, uint32 home, uint32 slot, uint32 amount)
    {
        if (slot < home) {
            add_to_range(table + home, table + OKV_ASSOC_SIZE, amount);
            home = 0;
        }
        add_to_range(table + home, table + slot, amount);
    }

    static void add_to_range(okv_assoc_entry *first, const okv_assoc_entry *end, uint32 amount)
    {
        for (; first != end; ++first) {
            first->count += amount;
        }
    }

    bool occupied_[OKV_ASSOC_SIZE]; // one for each slot, side by side: emptiness is searched here
    uint32 buckets_[num_buckets];
};

} // namespace ovmd
