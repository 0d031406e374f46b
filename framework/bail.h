/*
 * The bail rule: how a function leaves when something it called has failed.
 *
 * The code is logged once at each level it passes, with the function and the source unit, and is
 * returned unchanged. 14120 ("Operation cancelled") passes upward without a line. The macros
 * return, so what a function owns is held by objects whose destructors release it; in C they are
 * for functions that own nothing yet.
 *
 * A source unit names itself once, in scope of its functions:
 *     static const char bail_unit[] = "md_db_default";
 */
#ifndef FRAMEWORK_BAIL_H
#define FRAMEWORK_BAIL_H

#include "framework/errors.h"
#include "framework/logging.h"

OV_C_BEGIN

/* Debugging hooks, called at every error exit; they have no effect on the result. */
void bail_debug(void);
void bail_quiet_debug(void);

/* Writes one error line of a source unit. */
#define BAIL_LOG_AT(function, unit, line, ...)                                                     \
    lc_log_internal((function), (unit), (line), lc_log_flags_default, 0, ov_log_error, __VA_ARGS__)

/* Writes one error line of the calling function. */
#define BAIL_LOG(...) ((void)BAIL_LOG_AT(__func__, bail_unit, __LINE__, __VA_ARGS__))

/* Writes the line of a status, of a cancelled operation too. */
static inline void bail_log_code(int err, const char *function, const char *unit, int line)
{
    const char *const text = lc_enum_to_string_quiet_null(lc_error_code_map, (uint32)err);

    if (text != NULL) {
        BAIL_LOG_AT(function, unit, line, "Error code %d (%s) returned", err, text);
    } else {
        BAIL_LOG_AT(function, unit, line, "Error code %d returned", err);
    }
}

/* Reports a failing status and hands it back; `err` is not 0. */
static inline int bail_report_error(int err, const char *function, const char *unit, int line)
{
    if (err == lc_err_cancelled) {
        bail_quiet_debug();
        return err;
    }
    bail_log_code(err, function, unit, line);
    bail_debug();
    return err;
}

/* Reports a null pointer where there must be none; answers 14001. */
static inline int bail_report_null(const char *function, const char *unit, int line)
{
    BAIL_LOG_AT(function, unit, line, "Unexpected NULL");
    bail_debug();
    return lc_err_unexpected_null;
}

/* Reports a broken precondition; answers 14002. */
static inline int bail_report_condition(const char *function, const char *unit, int line)
{
    BAIL_LOG_AT(function, unit, line, "Required condition was not met");
    bail_debug();
    return lc_err_assertion_failed;
}

/* Reports a failing status of the calling function without leaving it. */
#define BAIL_REPORT(err) bail_report_error((err), __func__, bail_unit, __LINE__)

/* Leaves with the status when it is not 0. With _FOR, one step of a longer function reports in that
 * function's name, and whoever calls it passes the status on without another line. */
#define BAIL_ERROR_FOR(function, err)                                                              \
    do {                                                                                           \
        const int bail_code_ = (err);                                                              \
        if (bail_code_ != 0) {                                                                     \
            return bail_report_error(bail_code_, (function), bail_unit, __LINE__);                 \
        }                                                                                          \
    } while (0)
#define BAIL_ERROR(err) BAIL_ERROR_FOR(__func__, err)

/* Leaves with 14001 when the pointer is null. */
#define BAIL_NULL_FOR(function, pointer)                                                           \
    do {                                                                                           \
        if ((pointer) == NULL) {                                                                   \
            return bail_report_null((function), bail_unit, __LINE__);                              \
        }                                                                                          \
    } while (0)
#define BAIL_NULL(pointer) BAIL_NULL_FOR(__func__, pointer)

/* Leaves with 14002 when the condition does not hold. */
#define BAIL_REQUIRE(condition)                                                                    \
    do {                                                                                           \
        if (!(condition)) {                                                                        \
            return bail_report_condition(__func__, bail_unit, __LINE__);                           \
        }                                                                                          \
    } while (0)

/* The same two for a function that answers something else than a status: it leaves with `answer`,
 * which is empty in a function that returns nothing. */
#define BAIL_ERROR_ANSWER(err, answer)                                                             \
    do {                                                                                           \
        const int bail_code_ = (err);                                                              \
        if (bail_code_ != 0) {                                                                     \
            (void)bail_report_error(bail_code_, __func__, bail_unit, __LINE__);                    \
            return answer;                                                                         \
        }                                                                                          \
    } while (0)

#define BAIL_NULL_ANSWER(pointer, answer)                                                          \
    do {                                                                                           \
        if ((pointer) == NULL) {                                                                   \
            (void)bail_report_null(__func__, bail_unit, __LINE__);                                 \
            return answer;                                                                         \
        }                                                                                          \
    } while (0)

OV_C_END

#endif
