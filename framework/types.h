/*
 * Basic types of the host framework, and the few compiler notes its headers use.
 *
 * Rules that hold for every host operation unless its comment says otherwise:
 * - a status is an int: 0 is success, anything else a code of errors.h;
 * - what an operation hands out through an out-pointer belongs to the caller, who releases it with
 *   the free operation of the same family; on failure nothing is handed out;
 * - a free operation takes the address of the pointer, is safe on a null pointer behind it, and
 *   nulls it;
 * - text is NUL-terminated; text that is not copied is borrowed and says so;
 * - pointers are never null unless the comment allows it;
 * - a tbool is one byte;
 * - operations are called from one thread, the host's configuration thread.
 */
#ifndef FRAMEWORK_TYPES_H
#define FRAMEWORK_TYPES_H

#include <stdbool.h>
#include <stddef.h>
#include <stdint.h>

typedef uint8_t uint8;
typedef uint16_t uint16;
typedef uint32_t uint32;
typedef uint64_t uint64;
typedef int32_t int32;
typedef bool tbool;

#ifdef __cplusplus
#define OV_C_BEGIN extern "C" {
#define OV_C_END }
#define OV_NODISCARD [[nodiscard]]
#else
#define OV_C_BEGIN
#define OV_C_END
#define OV_NODISCARD __attribute__((warn_unused_result))
#endif

/* Lets the compiler check printf-style arguments against the format. */
#define OV_PRINTF(format_index, first_argument)                                                    \
    __attribute__((format(printf, format_index, first_argument)))

/* A constant table of a header: every source unit has its own copy and need not use it. */
#define OV_UNIT_TABLE static const __attribute__((unused))

#endif
