// Memory that the library asks for and releases itself: it can be made to run out (arm() with
// Operation::allocation, see fault_layer.h), and what is not released is known.
//
// The test program's own malloc stands in front of the C library's for this. A sanitizer needs
// that place for itself, so there the layer is absent, and the sanitizer finds what is not
// released.
#pragma once

#include <cstddef>

#if defined(__SANITIZE_ADDRESS__)
#define OVTEST_ALLOCATION_LAYER 0
#elif defined(__has_feature)
#if __has_feature(address_sanitizer)
#define OVTEST_ALLOCATION_LAYER 0
#endif
#endif
#ifndef OVTEST_ALLOCATION_LAYER
#define OVTEST_ALLOCATION_LAYER 1
#endif

namespace ovtest
{

inline constexpr bool has_allocation_layer = OVTEST_ALLOCATION_LAYER;

// Blocks that the library allocated, or that the host handed to it as text, not yet freed.
std::size_t live_allocations();
void forget_allocations();

// The host handed this text to the library.
void watch_text(const void *text);

} // namespace ovtest
