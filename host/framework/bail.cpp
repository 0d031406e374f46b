#include "framework/bail.h"

#include "host/framework/bail_counts.h"

namespace
{

ovhost::BailCounts counts;

} // namespace

namespace ovhost
{

BailCounts bail_counts()
{
    return counts;
}

} // namespace ovhost

// Not inlined into callers of this folder: a breakpoint on the hook has to see every error exit.
__attribute__((noinline)) void bail_debug(void)
{
    ++counts.reported;
}

__attribute__((noinline)) void bail_quiet_debug(void)
{
    ++counts.quiet;
}
