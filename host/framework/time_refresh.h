#pragma once
// Keeps the shared time record of framework/sys_time.h up to date.

namespace ovhost
{

/// Puts the present time into the record; the event loop calls this each time it wakes up. Does
/// nothing before ctime_init.
void refresh_time_info();

} // namespace ovhost
