/*
 * A fixed table of 65536 slots from a 128-bit key (ov_hash.h) to a 16-bit value.
 *
 * Open addressing, linear probing with wrap-around: a key's home slot is the low 16 bits of its low
 * half, and a key stands in the first slot from there on that was empty when it was stored. Every
 * slot from a key's home to the key itself has a count raised by one for it. A slot whose count is
 * 0 therefore ends every search; an empty slot with a count is a hole that other keys' paths cross.
 *
 * The table is the caller's, an array of OKV_ASSOC_SIZE entries. okv_assoc_add_or_replace is the
 * whole operation, for any table; who keeps a table alone may find slots by other means and must
 * leave the same contents behind.
 */
#ifndef ORVALE_OV_KVASSOC_H
#define ORVALE_OV_KVASSOC_H

#include "orvale/ov_hash.h"

#include <stdio.h>
#include <stdlib.h>

OV_C_BEGIN

#define OKV_ASSOC_SIZE 65536u

/* A value; 16 bits are used. */
typedef uint32 okv_value;

/* The value that marks a slot as empty; it is never stored. */
#define OKV_INVALID_VALUE 65535u

typedef struct okv_assoc_entry {
    okv_key key; /* means something only while the slot is not empty */
    okv_value value;
    uint32 count; /* keys whose path from home covers this slot */
} okv_assoc_entry;
typedef okv_assoc_entry okv_assoc_entry_type;

/* The slot where the search for a key begins. */
static inline uint32 okv_home(okv_key key)
{
    return (uint32)(okv_key_low(key) & (OKV_ASSOC_SIZE - 1));
}

static inline uint32 okv_next_slot(uint32 slot)
{
    return (slot + 1) & (OKV_ASSOC_SIZE - 1);
}

/* Adds to the count of every slot from `from` up to but not including `to`; nothing when equal. */
static inline void okv_add_to_counts(okv_assoc_entry *table, uint32 from, uint32 to, uint32 amount)
{
    for (; from != to; from = okv_next_slot(from)) {
        table[from].count += amount;
    }
}

/*
 * A broken assertion ends the process in every build: a table that has stored the mark of an empty
 * slot has lost a key, and nothing that it answers from then on can be trusted.
 */
static inline void okv_assert(bool holds, const char *text, int line)
{
    if (!holds) {
        (void)fprintf(stderr, "ov_kvassoc.h:%d: Assertion `%s' failed.\n", line, text);
        abort();
    }
}

/* The line that a broken assertion on the value names. */
enum { okv_value_assertion_line = 99 };

/*
 * Maps a key to a value.
 *
 * table      OKV_ASSOC_SIZE entries
 * v          not OKV_INVALID_VALUE, or the process is aborted
 * out_old_v  receives the value that the key had, or OKV_INVALID_VALUE when it was not there
 * Returns 1 when the key now maps to v; 0 when the table is full, and the table is then unchanged.
 */
static inline int okv_assoc_add_or_replace(okv_assoc_entry *table, okv_key k, okv_value v,
                                           okv_value *out_old_v)
{
    const uint32 home = okv_home(k);
    uint32 slot = home;
    uint32 beyond;

    okv_assert(v != OKV_INVALID_VALUE, "v!=OKV_INVALID_VALUE", okv_value_assertion_line);
    *out_old_v = OKV_INVALID_VALUE;
    while (table[slot].value != OKV_INVALID_VALUE) {
        if (table[slot].key == k) {
            okv_add_to_counts(table, home, slot, (uint32)-1); /* raised below on the way here */
            *out_old_v = table[slot].value;
            table[slot].value = v;
            return 1;
        }
        table[slot].count += 1;
        slot = okv_next_slot(slot);
        if (slot == home) {
            for (slot = 0; slot < OKV_ASSOC_SIZE; ++slot) {
                table[slot].count -= 1;
            }
            return 0;
        }
    }

    /* The key may still stand further along, past this hole: it moves up. */
    for (beyond = okv_next_slot(slot); beyond != home && table[beyond].count != 0;
         beyond = okv_next_slot(beyond)) {
        if (table[beyond].value != OKV_INVALID_VALUE && table[beyond].key == k) {
            *out_old_v = table[beyond].value;
            table[beyond].value = OKV_INVALID_VALUE;
            table[beyond].count -= 1;
            okv_add_to_counts(table, home, beyond, (uint32)-1);
            break;
        }
    }
    table[slot].count += 1;
    table[slot].value = v;
    table[slot].key = k;
    return 1;
}

OV_C_END

#endif
