/*
 * How the library's functions are declared.
 *
 * Rules that hold for every function unless its comment says otherwise:
 * - it is called from the host's configuration thread, one call at a time;
 * - a status is an int: 0 is success, anything else a code of framework/errors.h; a host
 *   operation's code is passed on unchanged, so any code may come back. A failure is logged as
 *   framework/bail.h tells, 14120 ("Operation cancelled") excepted, which passes silently. An
 *   answer that is no failure, such as 14004 for a name that nobody has, is not logged that way;
 * - a null pointer where there must be none is 14001, a broken precondition 14002; a function that
 *   answers neither must not be given one;
 * - a yes/no question never fails: an error is logged and the answer is false;
 * - what an out-pointer receives belongs to the caller, who releases it as the comment says;
 *   nothing is handed out on failure;
 * - input arguments are only read and never kept.
 */
#ifndef ORVALE_OV_API_H
#define ORVALE_OV_API_H

#include "framework/types.h"

/* Exported from libovmd.so. */
#define OV_API __attribute__((visibility("default")))

#endif
