#include "tests/framework/allocation_failure.h"

#include <cstdlib>
#include <new>

namespace
{

constexpr int never = -1;
int allocations_left = never;
bool has_failed = false;

void *allocate(std::size_t size)
{
    if (allocations_left == 0) {
        has_failed = true;
        return nullptr;
    }
    if (allocations_left > 0) {
        --allocations_left;
    }
    return std::malloc(size == 0 ? 1 : size);
}

} // namespace

void *operator new(std::size_t size)
{
    if (void *memory = allocate(size)) {
        return memory;
    }
    throw std::bad_alloc();
}

void *operator new[](std::size_t size)
{
    return ::operator new(size);
}

void operator delete(void *memory) noexcept
{
    std::free(memory);
}

void operator delete[](void *memory) noexcept
{
    std::free(memory);
}

void operator delete(void *memory, std::size_t) noexcept
{
    std::free(memory);
}

void operator delete[](void *memory, std::size_t) noexcept
{
    std::free(memory);
}

namespace ovhost::test
{

AllocationFailure::AllocationFailure(int nth)
{
    has_failed = false;
    allocations_left = nth;
}

AllocationFailure::~AllocationFailure()
{
    end();
}

bool AllocationFailure::end()
{
    allocations_left = never;
    return has_failed;
}

} // namespace ovhost::test
