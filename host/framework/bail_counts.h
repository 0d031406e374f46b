#pragma once
// How often functions have left by an error exit: the only trace that framework/bail.h's debugging
// hooks leave. A debugger sets its breakpoint on the hooks themselves.

#include "framework/types.h"

namespace ovhost
{

struct BailCounts {
    uint64 reported = 0; ///< bail_debug
    uint64 quiet = 0;    ///< bail_quiet_debug
};

[[nodiscard]] BailCounts bail_counts();

} // namespace ovhost
