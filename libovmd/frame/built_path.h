// Paths of any length; absent.h has the lists that they lead to.
#pragma once

#include "framework/bail.h"
#include "libovmd/frame/absent.h"
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
