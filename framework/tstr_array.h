/*
 * Arrays of counted strings (tstring.h).
 */
#ifndef FRAMEWORK_TSTR_ARRAY_H
#define FRAMEWORK_TSTR_ARRAY_H

#include "framework/tstring.h"
#include "framework/typed_arrays.h"

OV_C_BEGIN

/* A growing array of strings, which it owns; opaque. */
typedef struct tstr_array tstr_array;
typedef array_options tstr_array_options;

/*
 * A new empty array; `opts` is copied, null means the defaults. Caller frees with tstr_array_free.
 * Returns 0; 14000 when out of memory; 14001 when `ret` is null.
 */
OV_NODISCARD int tstr_array_new(tstr_array **ret, const tstr_array_options *opts);

/* Releases the array with its strings and nulls the caller's pointer. Safe on null, at both
 * levels. */
void tstr_array_free(tstr_array **arr);

/* Number of strings; the array is not null. */
int32 tstr_array_length_quick(const tstr_array *arr);

/* The text at an index in range, borrowed until the array changes; the array is not null. */
const char *tstr_array_get_str_quick(const tstr_array *arr, uint32 index);

/* Adds a copy of the text at the end. Returns 0; 14000 when out of memory; 14001 on a null
 * array or text. */
OV_NODISCARD int tstr_array_append_str(tstr_array *arr, const char *text);

/*
 * Adds the string itself at the end and nulls the caller's pointer: the array owns it from then on.
 * Returns 0; 14000 when out of memory; 14001 on a null array, pointer or string. On failure the
 * caller keeps the string.
 */
OV_NODISCARD int tstr_array_append_takeover(tstr_array *arr, tstring **str);

/*
 * Takes the string at an index out of the array and hands it to the caller, who frees it with
 * ts_free; with `ret` null it is freed. Returns 0; 14004 when the index is past the end; 14001 on a
 * null array.
 */
OV_NODISCARD int tstr_array_remove(tstr_array *arr, uint32 index, tstring **ret);

/* A new array with copies of all strings; of null, null. Caller frees with tstr_array_free.
 * Returns as tstr_array_new. */
OV_NODISCARD int tstr_array_duplicate(const tstr_array *arr, tstr_array **ret);

OV_C_END

#endif
