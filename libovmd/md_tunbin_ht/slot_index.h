// Finds slots of an ov_kvassoc table without walking it.
//
// Names of under 24 bytes share at most 256 home slots, so that a walk from a key's home passes
// thousands of others. What the table holds is fixed to the count; where a key stands, and where
// the next empty slot is, is told here in constant time. The table belongs to one owner, who makes
// every change through an index.
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
        return bucket != no_bucket ? slot_in(buckets_[bucket]) : no_slot;
    }

    // Stores a key that is not there. False when the table is full, which leaves it as it was.
    bool insert(okv_assoc_entry *table, okv_key key, okv_value value)
    {
        const uint32 home = okv_home(key);
        const uint32 slot = first_empty_from(home);
        if (slot == no_slot) {
            return false;
        }
        add_to_path(table, home, slot, 1);
        table[slot].key = key;
        table[slot].value = value;
        occupied_[slot] = true;
        if (slot != home) {
            enter(key, slot);
        }
        return true;
    }

    // Empties the slot where find() has found the key.
    void remove(okv_assoc_entry *table, okv_key key, uint32 slot)
    {
        const uint32 home = okv_home(key);
        if (slot != home) {
            leave(table, find_bucket(table, key));
        }
        table[slot].value = OKV_INVALID_VALUE;
        occupied_[slot] = false;
        add_to_path(table, home, slot, static_cast<uint32>(-1));
    }

  private:
    static constexpr uint32 num_buckets = OKV_ASSOC_SIZE;
    static constexpr uint32 no_bucket = num_buckets;
    static constexpr uint32 slot_bits = 17;

    // A bucket holds a slot, counted from 1, under 15 bits of its key; 0 is an empty bucket. The
    // high half of a key is well mixed: its lowest bits choose the bucket, the next ones the tag.
    static uint32 first_bucket(okv_key key)
    {
        return static_cast<uint32>(okv_key_high(key)) & (num_buckets - 1);
    }
    static uint32 next_bucket(uint32 bucket) { return (bucket + 1) & (num_buckets - 1); }
    static uint32 tag_of(okv_key key)
    {
        return static_cast<uint32>(okv_key_high(key) >> 16) << slot_bits;
    }
    static uint32 slot_in(uint32 content) { return (content & ((1u << slot_bits) - 1)) - 1; }
    static bool has_tag(uint32 content, uint32 tag) { return ((content ^ tag) >> slot_bits) == 0; }

    uint32 find_bucket(const okv_assoc_entry *table, okv_key key) const
    {
        const uint32 tag = tag_of(key);
        uint32 bucket = first_bucket(key);
        for (uint32 n = 0; n < num_buckets && buckets_[bucket] != 0; ++n) {
            if (has_tag(buckets_[bucket], tag) && table[slot_in(buckets_[bucket])].key == key) {
                return bucket;
            }
            bucket = next_bucket(bucket);
        }
        return no_bucket;
    }

    // There is always room: a key in the table has one bucket at most.
    void enter(okv_key key, uint32 slot)
    {
        uint32 bucket = first_bucket(key);
        while (buckets_[bucket] != 0) {
            bucket = next_bucket(bucket);
        }
        buckets_[bucket] = tag_of(key) | (slot + 1);
    }

    // Empties a bucket and moves up those behind it that would no longer be found past the gap.
    void leave(const okv_assoc_entry *table, uint32 gap)
    {
        uint32 bucket = next_bucket(gap);
        for (; buckets_[bucket] != 0 && bucket != gap; bucket = next_bucket(bucket)) {
            const uint32 first = first_bucket(table[slot_in(buckets_[bucket])].key);
            const uint32 from_first = (bucket - first) & (num_buckets - 1);
            const uint32 from_gap = (bucket - gap) & (num_buckets - 1);
            if (from_first >= from_gap) {
                buckets_[gap] = buckets_[bucket];
                gap = bucket;
            }
        }
        buckets_[gap] = 0;
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
        return empty != nullptr
                   ? static_cast<uint32>(static_cast<const bool *>(empty) - occupied_)
                   : no_slot;
    }

    // Adds to the counts from a key's home to its slot, both included.
    static void add_to_path(okv_assoc_entry *table, uint32 home, uint32 slot, uint32 amount)
    {
        if (slot < home) {
            add_to_range(table + home, table + OKV_ASSOC_SIZE, amount);
            home = 0;
        }
        add_to_range(table + home, table + slot + 1, amount);
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
