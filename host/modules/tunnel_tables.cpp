#include "host/modules/tunnel_tables.h"

#include "orvale/md_tunbin_ht.h"

#include <algorithm>

namespace ovhost
{

TableFacts measure_table(std::span<const okv_assoc_entry_type> table)
{
    TableFacts facts;
    facts.slots = static_cast<uint32>(table.size());
    for (uint32 slot = 0; slot < facts.slots; ++slot) {
        const okv_assoc_entry_type &entry = table[slot];
        if (entry.value == OKV_INVALID_VALUE) {
            facts.holes += entry.count != 0 ? 1 : 0;
            continue;
        }
        // The table is a ring.
        const uint32 distance = (slot + facts.slots - okv_home(entry.key)) % facts.slots;
        facts.longest_probe = std::max(facts.longest_probe, distance + 1);
        facts.collision_marks += entry.value == TUNBIN_HT_COLLISION ? 1 : 0;
        ++facts.occupied;
    }
    return facts;
}

} // namespace ovhost
