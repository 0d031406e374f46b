// What the tests of the tunnel cache and its two tables share.
#pragma once

#include "orvale/md_tunbin_ht.h"

#include <string>

namespace ovtest
{

// Both tables have the same operations.
struct TableOperations {
    const char *word; // "tunname": what the table is called in its messages
    int (*init)();
    void (*add)(char *, uint32);
    void (*del)(char *);
    int (*find)(const char *, uint32 *);
    uint32 (*dump)();
    okv_assoc_entry_type *slots;

    std::string name_of(const std::string &operation) const
    {
        return std::string("tunbin_") + word + "_ht_" + operation;
    }
};

inline constexpr TableOperations table_operations[] = {
    {"tunname", tunbin_tunname_ht_init, tunbin_tunname_ht_add, tunbin_tunname_ht_del,
     tunbin_tunname_ht_find, tunbin_tunname_ht_dump, tunname_assoc},
    {"tunalias", tunbin_tunalias_ht_init, tunbin_tunalias_ht_add, tunbin_tunalias_ht_del,
     tunbin_tunalias_ht_find, tunbin_tunalias_ht_dump, tunalias_assoc},
};

// Makes srand begin with the same number at every init of a table while it lives: the tables ask
// for the time of day, which is then this.
class PlantedTimeOfDay
{
  public:
    explicit PlantedTimeOfDay(uint64 microseconds);
    PlantedTimeOfDay(const PlantedTimeOfDay &) = delete;
    PlantedTimeOfDay &operator=(const PlantedTimeOfDay &) = delete;
    ~PlantedTimeOfDay();
};

// The seed of a table that is initialised at that time.
uint64 seed_at(uint64 microseconds);

// A time whose seed has these low 16 bits.
uint64 time_with_seed_ending(uint32 low_bits, uint32 mask);

// The seed of the table, told by the key of the empty text; the table must not hold that text, and
// is left as it was but for the key that stays behind in an empty slot.
uint64 seed_of(const TableOperations &table);

// A record of the cache.
tunnel_config_bin_t record_of(const std::string &name, const std::string &alias, uint32 id);

// A key as the messages show it.
std::string key_text(uint64 high, uint64 low);

} // namespace ovtest
