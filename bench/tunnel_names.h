#pragma once
// Tunnel names of several shapes: what a table's keys are made of, and how they fall on its slots.

#include <cstddef>
#include <string>
#include <vector>

namespace ovbench
{

/// How the names of a table look: the number stands between the two texts.
struct NameShape {
    const char *name;
    const char *label;
    const char *before;
    const char *after;
    /// Names that differ in their last, incomplete block of 24 bytes only share a few home slots.
    bool shares_homes;
};

inline constexpr NameShape name_shapes[] = {
    {"9_bytes", "9 bytes", "tun", "", true},
    {"20_bytes", "20 bytes", "branch-office-", "", true},
    {"32_bytes_tail", "32 bytes, differ in the tail", "tunnel-to-the-branch-offi-", "", true},
    {"64_bytes_tail", "64 bytes, differ in the tail",
     "tunnel-from-the-head-office-to-the-branch-office-of-the-no", "", true},
    {"32_bytes_front", "32 bytes, differ at the front", "", "-branch-office-to-head-off", false},
};

/// Names as the C strings that callers come with, one behind the other in memory.
class NameList
{
  public:
    /// `count` names in a shuffled order; of different `first` (a multiple of `count` apart), other
    /// names.
    NameList(const NameShape &shape, std::size_t count, std::size_t first);

    [[nodiscard]] std::size_t size() const { return count_; }
    [[nodiscard]] char *operator[](std::size_t i) { return texts_.data() + i * stride_; }
    [[nodiscard]] const char *operator[](std::size_t i) const
    {
        return texts_.data() + i * stride_;
    }

  private:
    std::size_t count_;
    std::size_t stride_;
    std::vector<char> texts_;
};

} // namespace ovbench
