/*
 * The 128-bit hash of a text, under which ov_kvassoc.h's tables keep tunnel names and aliases.
 *
 * The mixing step is mix64 of the public-domain hash lookup8 (1997), with its golden-ratio
 * constant; how blocks and tail go in and how the 128 bits come out is this hash's own. Texts of
 * under 24 bytes differ in one byte of the low half only: the high half tells them apart.
 */
#ifndef ORVALE_OV_HASH_H
#define ORVALE_OV_HASH_H

#include "framework/types.h"

#include <string.h>

OV_C_BEGIN

/* An unsigned 128-bit number. */
__extension__ typedef unsigned __int128 okv_key;

static inline uint64 okv_key_low(okv_key key)
{
    return (uint64)key;
}

static inline uint64 okv_key_high(okv_key key)
{
    return (uint64)(key >> 64);
}

static inline okv_key okv_key_of(uint64 high, uint64 low)
{
    return ((okv_key)high << 64) | low;
}

/* How a key is printed: high half first. The arguments follow with OKV_KEY_ARGS. */
#define OKV_KEY_FORMAT "%016lx%016lx"
#define OKV_KEY_ARGS(key) okv_key_high(key), okv_key_low(key)

/* Bytes that go into one mixing step. */
enum { hash64_block_size = 24 };

/* What a hashing leaves behind; each user of the hash has one, and every hashing overwrites it. */
typedef struct hash64_state {
    union {
        uint8 bytes[hash64_block_size];
        uint64 words[3];
    } leftover; /* the bytes behind the last whole block, padded with zeros */
    uint64 a;   /* the three words as they stood after the last whole block */
    uint64 b;
    uint64 c;
    int32 nleftover; /* number of bytes in leftover */
} hash64_state;

/* The golden ratio, an arbitrary value that starts the third word. */
#define HASH64_GOLDEN_RATIO 0x9e3779b97f4a7c13u

/*
 * Holds the compiler to forming this sum first. The third word is known last: what does not need it
 * must not wait for it.
 */
static inline uint64 hash64_first(uint64 sum)
{
    __asm__("" : "+r"(sum));
    return sum;
}

static inline void hash64_mix(uint64 *pa, uint64 *pb, uint64 *pc)
{
    uint64 a = *pa;
    uint64 b = *pb;
    uint64 c = *pc;

    a = hash64_first(a - b), a -= c, a ^= c >> 43;
    b -= c, b -= a, b ^= a << 9;
    c -= a, c -= b, c ^= b >> 8;
    a -= b, a -= c, a ^= c >> 38;
    b -= c, b -= a, b ^= a << 23;
    c -= a, c -= b, c ^= b >> 5;
    a -= b, a -= c, a ^= c >> 35;
    b -= c, b -= a, b ^= a << 49;
    c -= a, c -= b, c ^= b >> 11;
    a -= b, a -= c, a ^= c >> 12;
    b -= c, b -= a, b ^= a << 18;
    c -= a, c -= b, c ^= b >> 22;
    *pa = a;
    *pb = b;
    *pc = c;
}

/* All eight bytes of a word, exclusive-ored into one. */
static inline uint64 hash64_fold(uint64 word)
{
    word ^= word >> 32;
    word ^= word >> 16;
    word ^= word >> 8;
    return word & 0xff;
}

static inline uint64 hash64_load(const char *bytes)
{
    uint64 word;

    memcpy(&word, bytes, sizeof word);
    return word;
}

/* The eight bytes of a text from `from` on; those behind its end are zero. */
static inline uint64 hash64_word(const char *text, int32 length, int32 from)
{
    const int32 size = (int32)sizeof(uint64);
    const int32 rest = length - from;
    uint64 word = 0;

    if (rest >= size) {
        return hash64_load(text + from);
    }
    if (rest <= 0) {
        return 0;
    }
    if (length >= size) { /* nothing is read behind the text, and nothing byte by byte */
        return hash64_load(text + length - size) >> (8 * (size - rest));
    }
    for (; from < length; --length) {
        word = word << 8 | (uint8)text[length - 1];
    }
    return word;
}

/*
 * The key of a text.
 *
 * text   read to its NUL; must be shorter than 2 GiB
 * seed   the table's own; the same text has another key under another seed
 * state  receives what the hashing leaves behind
 */
static inline okv_key hash64_key(const char *text, uint64 seed, hash64_state *state)
{
    const int32 length = (int32)strlen(text);
    uint64 a = seed;
    uint64 b = seed;
    uint64 c = HASH64_GOLDEN_RATIO;
    uint64 bytes = 0; /* words of the text, exclusive-ored */
    uint64 low;
    uint64 words[3];
    int32 i = 0;

    for (; i < length - (hash64_block_size - 1); i += hash64_block_size) {
        words[0] = hash64_load(text + i);
        words[1] = hash64_load(text + i + 8);
        words[2] = hash64_load(text + i + 16);
        bytes ^= words[0] ^ words[1] ^ words[2];
        a += words[0];
        b += words[1];
        c += words[2];
        hash64_mix(&a, &b, &c);
    }
    low = b;
    state->a = a;
    state->b = b;
    state->c = c;
    state->nleftover = length - i;
    if (i < length) {
        words[0] = hash64_word(text, length, i);
        words[1] = hash64_word(text, length, i + 8);
        words[2] = hash64_word(text, length, i + 16);
        memcpy(state->leftover.words, words, sizeof words);
        bytes ^= words[0] ^ words[1] ^ words[2];
        a += words[0];
        b += words[1];
        c += hash64_first(words[2] + (uint64)(length - i));
        hash64_mix(&a, &b, &c);
    }
    return okv_key_of(c, low ^ hash64_fold(bytes));
}

OV_C_END

#endif
