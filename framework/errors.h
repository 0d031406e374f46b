/*
 * Status codes, their texts, and tables of codes and texts in general.
 *
 * bail.h logs these codes; bnode.h has the other table of the framework, the value types.
 */
#ifndef FRAMEWORK_ERRORS_H
#define FRAMEWORK_ERRORS_H

#include "framework/types.h"

OV_C_BEGIN

/* One row of a table of codes and texts; a table ends with the row {0, NULL}. */
typedef struct lc_enum_string_map {
    uint32 lesm_enum;
    const char *lesm_string;
} lc_enum_string_map;

/* The status codes that have names. Codes are the host's; a function may return any of them. */
enum {
    lc_err_no_error = 0,
    lc_err_generic_error = 14000,
    lc_err_unexpected_null = 14001,
    lc_err_assertion_failed = 14002,
    lc_err_not_found = 14004,
    lc_err_exists = 14005,
    lc_err_bad_path = 14009,
    lc_err_bad_file = 14010,
    lc_err_parse_error = 14012,
    lc_err_file_not_found = 14013,
    lc_err_io_error = 14014,
    lc_err_closed = 14016,
    lc_err_bad_type = 14020,
    /* A quiet failure: passed upward like any other code, never logged. */
    lc_err_cancelled = 14120,
    lc_err_bad_name = 14501
};

/* Texts of the status codes, for the log line of the bail rule alone. */
OV_UNIT_TABLE lc_enum_string_map lc_error_code_map[] = {
    {0, "no error"},
    {14000, "generic error"},
    {14001, "unexpected NULL"},
    {14002, "assertion failed"},
    {14003, "not yet implemented"},
    {14004, "item not found"},
    {14005, "item unexpectedly already exists"},
    {14006, "expected single item, found multiple"},
    {14007, "unexpected EOF"},
    {14008, "unknown command line argument"},
    {14009, "invalid path name"},
    {14010, "invalid file"},
    {14011, "buffer space exhausted"},
    {14012, "generic parser error"},
    {14013, "file or path not found"},
    {14014, "generic IO error"},
    {14015, "IO source/sink would block"},
    {14016, "IO source/sink is closed"},
    {14017, "IO operation timed out"},
    {14018, "IO operation had unexpected file existence"},
    {14019, "unexpected case in switch statement"},
    {14020, "type conversion failed"},
    {14021, "bad UTF-8 character sequence"},
    {14022, "divide by zero"},
    {14023, "filesystem out of space"},
    {14090, "tree: tried to delete node with children"},
    {14091, "tree: node is not an ancestor"},
    {14092, "tree: no preexisting path to specified node"},
    {14100, "foreach: delete current element"},
    {14101, "foreach: remove current element"},
    {14102, "foreach: halt iteration with error"},
    {14103, "foreach: halt iteration without error"},
    {14110, "CLI shell: reset timer for event callback"},
    {14111, "CLI shell: delete event callback registration"},
    {14115, "CLI shell func called but not available"},
    {14120, "Operation cancelled"},
    {14500, "Invalid user/password for login"},
    {14501, "Invalid string name was passed in."},
    {14502, "Upgrade failed, no continue."},
    {0, NULL},
};

/*
 * The text of a code. Borrowed from the table; null when no row has the code. Never logs.
 * `map` ends with {0, NULL}.
 */
const char *lc_enum_to_string_quiet_null(const lc_enum_string_map *map, uint32 code);

/*
 * The code of a text, compared byte for byte with the rows in order; the first match counts.
 * `ret` receives the code on success and is left alone on failure.
 * Returns 0; lc_err_bad_type (14020) when no row has the text; 14001 on a null argument.
 */
OV_NODISCARD int lc_string_to_enum(const lc_enum_string_map *map, const char *text, uint32 *ret);

OV_C_END

#endif
