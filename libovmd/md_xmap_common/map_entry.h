// Which map entry a changed node belongs to.
#pragma once

#include "libovmd/frame/built_path.h"
#include "libovmd/md_xmap_common/catalogue.h"

#include <cstring>

namespace ovmd
{

struct map_entry {
    const map_type &type;
    const char *map; // borrowed from the change
    const char *priority;
};

// Of a node whose name is too short for them, map and priority are null.
inline map_entry entry_of(const map_type &type, const mdb_db_change *change)
{
    return {type, part_of(change->mdc_name_parts, type.map_part),
            part_of(change->mdc_name_parts, type.priority_part)};
}

// Of an entry that has a priority.
inline bool is_default(const map_entry &entry)
{
    return strcmp(entry.priority, default_priority) == 0;
}

inline bool name_matches(const mdb_db_change *change, const char *pattern)
{
    return bn_binding_name_parts_pattern_match(change->mdc_name_parts, true, pattern);
}

} // namespace ovmd

// Leaves with 14001 without map or priority: which names match a pattern is the host's to say, and
// one may be too short all the same.
#define BAIL_NO_ENTRY_FOR(function, entry)                                                         \
    do {                                                                                           \
        BAIL_NULL_FOR(function, (entry).map);                                                      \
        BAIL_NULL_FOR(function, (entry).priority);                                                 \
    } while (0)

// The node of the ACL that an entry names.
#define BUILD_ACL_PATH_FOR(function, path, type, map, priority)                                    \
    BUILD_PATH_FOR(function, path, "%s/%s/prio/%s/%s", (type).root, (map), (priority),             \
                   (type).acl_leaf)
