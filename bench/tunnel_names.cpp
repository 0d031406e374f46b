#include "bench/tunnel_names.h"

#include <algorithm>
#include <cstdio>
#include <cstring>
#include <numeric>
#include <random>

namespace ovbench
{

constexpr std::size_t num_digits = 6;

NameList::NameList(const NameShape &shape, std::size_t count, std::size_t first)
    : count_(count), stride_(std::strlen(shape.before) + num_digits + std::strlen(shape.after) + 1),
      texts_(count * stride_)
{
    std::vector<std::size_t> numbers(count);
    std::iota(numbers.begin(), numbers.end(), first);
    std::ranges::shuffle(numbers, std::mt19937_64(count)); // the same order in every run
    for (std::size_t i = 0; i < count; ++i) {
        (void)std::snprintf((*this)[i], stride_, "%s%06zu%s", shape.before, numbers[i],
                            shape.after);
    }
}

} // namespace ovbench
