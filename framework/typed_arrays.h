/*
 * Array options and arrays of integers. tstr_array.h has the arrays of strings.
 */
#ifndef FRAMEWORK_TYPED_ARRAYS_H
#define FRAMEWORK_TYPED_ARRAYS_H

#include "framework/types.h"

OV_C_BEGIN

/* What uint32_array_insert_sorted does with an element that compares equal to a present one. */
enum {
    adp_add = 0,        /* keep both, the new one behind */
    adp_delete_new = 1, /* keep the present one */
    adp_delete_old = 2  /* the new one takes its place */
};

/* How an array treats its elements. Callbacks get pointers to two elements. */
typedef struct array_options {
    int (*ao_elem_compare_func)(const void *, const void *);
    int (*ao_elem_assign_func)(void *, const void *);
    int ao_dup_policy;
} array_options;

/* Fills the options with the host's defaults: no comparison, standard assignment, adp_add.
 * Returns 0; 14001 when `opts` is null. */
OV_NODISCARD int array_options_get_defaults(array_options *opts);

/* The standard assignment of a uint32 element. Returns 0; 14001 on a null pointer. */
int array_std_assign_func(void *target, const void *source);

/* A growing array of unsigned 32-bit integers; opaque. */
typedef struct uint32_array uint32_array;

/*
 * A new empty array; `opts` is copied, null means the defaults. Caller frees with
 * uint32_array_free. Returns 0; 14000 when out of memory; 14001 when `ret` is null.
 */
OV_NODISCARD int uint32_array_new_full(uint32_array **ret, const array_options *opts);

/* Releases the array and nulls the caller's pointer. Safe on null, at both levels. */
void uint32_array_free(uint32_array **arr);

/* Adds a value at the end. Returns 0; 14000 when out of memory; 14001 on a null array. */
OV_NODISCARD int uint32_array_append(uint32_array *arr, uint32 value);

/*
 * Inserts a value at its place in an array that the options' comparison has in order.
 * Returns 0; 14000 when out of memory; 14001 on a null array; 14002 when the array has no
 * comparison; a failing assignment's code.
 */
OV_NODISCARD int uint32_array_insert_sorted(uint32_array *arr, uint32 value);

/*
 * Removes the first element with this value (by value, not by the options' comparison).
 * Returns 0; 14004 when there is none; 14001 on a null array.
 */
OV_NODISCARD int uint32_array_delete_by_value(uint32_array *arr, uint32 value);

/* The element at an index in range; the array is not null. */
uint32 uint32_array_get_quick(const uint32_array *arr, uint32 index);

/* Number of elements; the array is not null. */
int32 uint32_array_length_quick(const uint32_array *arr);

OV_C_END

#endif
