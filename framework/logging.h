/*
 * The two log entry points of the host and the two gates in front of the second.
 *
 * lc_log_internal is for the lines of the bail rule (bail.h) and for debug traces: it writes
 * whatever it is given, so the caller of a trace asks lc_log_check_level first. ov_log_internal is
 * for all other lines; its caller decides with OV_LOG or OV_LOG_MODULE whether the line is emitted
 * at all.
 *
 * A %s argument of a line may be null, and a host writes "(null)" for it, as glibc does.
 */
#ifndef FRAMEWORK_LOGGING_H
#define FRAMEWORK_LOGGING_H

#include "framework/types.h"

OV_C_BEGIN

/* Levels of a log line; a lower number is more urgent. */
enum { ov_log_error = 3, ov_log_warning = 4, ov_log_notice = 5, ov_log_info = 6, ov_log_debug = 7 };

/* The flag word that goes with every line of lc_log_internal. */
enum { lc_log_flags_default = 2048 };

/* Index of this library in ov_log_module_levels. */
enum { ov_log_module_ovmd = 8 };

/* The host's general threshold: lines up to this level are of interest. */
extern int G_log_level;

/* The daemon's own threshold, or -1 to follow G_log_level. */
extern signed char G_daemon_log_level;

/* One level byte for each module of the host; at least 9 entries. */
extern unsigned char ov_log_module_levels[];

/*
 * Writes one line on behalf of a source unit. All pointers are borrowed; `zero` is always 0.
 * The result tells nothing that a caller could act on.
 */
int lc_log_internal(const char *function, const char *unit, int line, uint32 flags, uint32 zero,
                    int level, const char *format, ...) OV_PRINTF(7, 8);

/* Whether a line of this level is of interest: lets a caller skip it and building its arguments. */
tbool lc_log_check_level(int level);

/* Writes one line. `function` may be null; `zero` is always 0. */
void ov_log_internal(int level, const char *function, int zero, const char *format, ...)
    OV_PRINTF(4, 5);

/* The threshold in force. */
static inline int ov_log_threshold(void)
{
    return G_daemon_log_level == -1 ? G_log_level : G_daemon_log_level;
}

/* A module's level byte, lowered to the call site's cap. */
static inline int ov_log_capped_level(unsigned module, unsigned cap)
{
    const unsigned level = ov_log_module_levels[module];
    return (int)(level > cap ? cap : level);
}

/*
 * Direct gate: a line of a fixed level. The arguments are evaluated only when the line is emitted.
 */
#define OV_LOG(level, ...)                                                                         \
    do {                                                                                           \
        if (ov_log_threshold() >= (level)) {                                                       \
            ov_log_internal((level), NULL, 0, __VA_ARGS__);                                        \
        }                                                                                          \
    } while (0)

/*
 * Module gate: a line whose level is the library's own module level, capped for this call site.
 * The level of the module is the level of its messages: that is how an operator turns them up.
 */
#define OV_LOG_MODULE(cap, ...)                                                                    \
    do {                                                                                           \
        const int ov_log_level_ = ov_log_capped_level(ov_log_module_ovmd, (cap));                  \
        if (ov_log_level_ <= ov_log_threshold()) {                                                 \
            ov_log_internal(ov_log_level_, __func__, 0, __VA_ARGS__);                              \
        }                                                                                          \
    } while (0)

OV_C_END

#endif
