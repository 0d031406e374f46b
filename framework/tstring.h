/*
 * Counted strings, and printf into new text.
 *
 * tstr_array.h holds arrays of them.
 */
#ifndef FRAMEWORK_TSTRING_H
#define FRAMEWORK_TSTRING_H

#include "framework/types.h"

OV_C_BEGIN

/* Owned text that knows its length; opaque. */
typedef struct tstring tstring;

/*
 * A new string with a copy of `text` (null: an empty string). Caller frees with ts_free.
 * Returns 0; 14000 when out of memory; 14001 when `ret` is null.
 */
OV_NODISCARD int ts_new_str(tstring **ret, const char *text);

/* A new string from a printf format. Caller frees with ts_free. Returns as ts_new_str. */
OV_NODISCARD int ts_new_sprintf(tstring **ret, const char *format, ...) OV_PRINTF(2, 3);

/* Releases the string and nulls the caller's pointer. Safe on null, at both levels. */
void ts_free(tstring **str);

/* A new copy; of null, null. Caller frees with ts_free. Returns as ts_new_str. */
OV_NODISCARD int ts_dup(const tstring *str, tstring **ret);

/* The text, borrowed until the string changes or is freed; null for null. */
const char *ts_str_(const tstring *str);

/* Length in bytes; -1 for null. */
int32 ts_length_(const tstring *str);

/* Length in characters of UTF-8; -1 for null. */
int32 ts_num_chars(const tstring *str);

/* The everyday names of the two above. */
static inline const char *ts_str(const tstring *str)
{
    return ts_str_(str);
}
static inline int32 ts_length(const tstring *str)
{
    return ts_length_(str);
}

/* Byte-wise equality. Two nulls are equal; null and a string are not. */
tbool ts_equal(const tstring *a, const tstring *b);

/* Byte-wise equality with text; `flag` is the host's and does not change the answer here. Null
 * equals null only. */
tbool ts_equal_str(const tstring *str, const char *text, tbool flag);

/* Byte-wise order: negative, 0 or positive. Null sorts before every string. */
int ts_cmp(const tstring *a, const tstring *b);

/* Byte-wise order against text; `flag` as in ts_equal_str. Null sorts before everything else. */
int ts_cmp_str(const tstring *str, const char *text, tbool flag);

/* printf into new text, which the caller releases with free(). Null when out of memory. */
char *smprintf(const char *format, ...) OV_PRINTF(1, 2);

OV_C_END

#endif
