/*
 * Files, read by the host on the library's behalf.
 */
#ifndef FRAMEWORK_FILES_H
#define FRAMEWORK_FILES_H

#include "framework/tstr_array.h"

OV_C_BEGIN

/*
 * Whether something exists at the path (symbolic links followed).
 * Returns 0; 14001 on a null argument; 14014 when it cannot be told.
 */
OV_NODISCARD int lf_test_exists(const char *path, tbool *ret);

/*
 * All lines of a regular file (symbolic links followed), line ends removed; a last line need not
 * have one. An empty file gives an empty array. Never waits for a writer. Caller frees with
 * tstr_array_free.
 * Returns 0; 14001 on a null argument; 14013 when there is no such file; 14014 when it is not a
 * regular file or cannot be read; 14000 when out of memory.
 */
OV_NODISCARD int lf_read_file_lines(const char *path, tstr_array **ret);

/* Whether the configuration file may be used; the answer is final. False for null. */
tbool conf_file_okay(const char *path);

OV_C_END

#endif
