/*
 * Time since boot, as the host keeps it.
 */
#ifndef FRAMEWORK_SYS_TIME_H
#define FRAMEWORK_SYS_TIME_H

#include "framework/types.h"

OV_C_BEGIN

/* The shared time record; the host may add fields behind the first. */
typedef struct time_info {
    uint64 time_since_boot_ms;
} time_info;

/* The host's time record, kept up to date by the host; null until ctime_init has set it up. */
extern time_info *time_info_ptr;

/* Sets up the time record; it may stay null when that fails. */
void ctime_init(void);

/* Milliseconds since boot, read now. Never fails. */
uint64 sys_time_since_boot_ms(void);

OV_C_END

#endif
