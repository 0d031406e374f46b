#include "tests/support/allocation_layer.h"

#include "tests/support/fault_state.h"

#include <cstdlib>

namespace ovtest
{

// A plain array: free() asks it about every block of the process, at any time.
static constexpr std::size_t max_watched = 4096;
static constinit const void *watched[max_watched] = {};
static constinit std::size_t num_watched = 0;

[[maybe_unused]] static void unwatch(const void *block)
{
    for (std::size_t i = 0; i < num_watched; ++i) {
        if (watched[i] == block) {
            watched[i] = watched[--num_watched];
            return;
        }
    }
}

static void watch(const void *block)
{
    if (num_watched == max_watched) {
        abort(); // a test that needs more must say so by raising the limit
    }
    watched[num_watched++] = block;
}

std::size_t live_allocations()
{
    return num_watched;
}

void forget_allocations()
{
    num_watched = 0;
}

void watch_text(const void *text)
{
    if (has_allocation_layer && text != nullptr) {
        watch(text);
    }
}

} // namespace ovtest

#if OVTEST_ALLOCATION_LAYER

extern "C" {
// The C library's own, under the names it offers to those who stand in front of it.
void *__libc_malloc(size_t size);
void *__libc_calloc(size_t count, size_t size);
void *__libc_realloc(void *block, size_t size);
void __libc_free(void *block);
}

namespace
{

// What the library asks for, by whichever name.
template <typename Allocate>
void *allocate(Allocate allocate_really)
{
    if (!ovtest::library_is_running()) {
        return allocate_really();
    }
    if (ovtest::fault_strikes(ovtest::Operation::allocation)) {
        return nullptr;
    }
    void *const block = allocate_really();
    ovtest::watch(block);
    return block;
}

} // namespace

extern "C" {

void *malloc(size_t size)
{
    return allocate([=] { return __libc_malloc(size); });
}

void *calloc(size_t count, size_t size)
{
    return allocate([=] { return __libc_calloc(count, size); });
}

void *realloc(void *block, size_t size)
{
    return allocate([=] {
        ovtest::unwatch(block);
        return __libc_realloc(block, size);
    });
}

void free(void *block)
{
    if (block != nullptr && ovtest::live_allocations() != 0) {
        ovtest::unwatch(block);
    }
    __libc_free(block);
}
}

#endif
