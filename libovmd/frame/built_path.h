// Paths of any length, and child lists that may be null.
#pragma once

#include "framework/bail.h"
#include "libovmd/frame/owners.h"

// Builds a path and leaves with 14001 when there is no memory for it. A debug line tells each one.
#define BUILD_PATH_FOR(function, path, ...)                                                        \
    do {                                                                                           \
        *(path).out() = smprintf(__VA_ARGS__);                                                     \
        BAIL_NULL_FOR(function, (path).get());                                                     \
        if (lc_log_check_level(ov_log_debug)) {                                                    \
            (void)lc_log_internal((function), bail_unit, __LINE__, lc_log_flags_default, 0,        \
                                  ov_log_debug, "smprintf=%s", (path).get());                      \
        }                                                                                          \
    } while (0)
#define BUILD_PATH(path, ...) BUILD_PATH_FOR(__func__, path, __VA_ARGS__)

namespace ovmd
{

// A list that was not handed out counts as empty.
inline uint32 length_of(const tstr_array *names)
{
    return names != nullptr ? static_cast<uint32>(tstr_array_length_quick(names)) : 0;
}

// Null past the end.
inline const char *part_of(const tstr_array *parts, uint32 index)
{
    return index < length_of(parts) ? tstr_array_get_str_quick(parts, index) : nullptr;
}

} // namespace ovmd
