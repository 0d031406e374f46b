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

// The node's name matches one of the kind's patterns, so that it has both components.
inline map_entry entry_of(const map_type &type, const mdb_db_change *change)
{
    return {type, part_of(change->mdc_name_parts, type.map_part),
            part_of(change->mdc_name_parts, type.priority_part)};
}

inline bool is_default(const map_entry &entry)
{
    return strcmp(entry.priority, default_priority) == 0;
}

inline bool name_matches(const mdb_db_change *change, const char *pattern)
{
    return bn_binding_name_parts_pattern_match(change->mdc_name_parts, true, pattern);
}

} // namespace ovmd

// The node of the ACL that an entry names.
#define BUILD_ACL_PATH_FOR(function, path, type, map, priority)                                    \
    BUILD_PATH_FOR(function, path, "%s/%s/prio/%s/%s", (type).root, (map), (priority),             \
                   (type).acl_leaf)
