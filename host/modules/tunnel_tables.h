#pragma once
// How full the cache's tables of names and aliases are: what `ovctl show tunnel-tables` prints.

#include "orvale/ov_kvassoc.h"

#include <span>

namespace ovhost
{

struct TableFacts {
    uint32 slots = 0;
    uint32 occupied = 0;
    /// Occupied slots that mark a text which several tunnels claim.
    uint32 collision_marks = 0;
    /// Empty slots that searches have to pass.
    uint32 holes = 0;
    /// The most slots that a search for a stored text looks at; 0 when there is none.
    uint32 longest_probe = 0;
};

[[nodiscard]] TableFacts measure_table(std::span<const okv_assoc_entry_type> table);

} // namespace ovhost
