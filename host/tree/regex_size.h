#pragma once
// How large a regular expression grows when its repetitions are unrolled, which is what compiling
// it does. value_format.h asks before it compiles: "((a{255}){255}){255}" is twenty characters, and
// compiling it would take the daemon's memory.

#include <cstddef>
#include <string_view>

namespace ovhost
{

/// About how many single-character matches a POSIX extended regular expression unrolls into; never
/// less than that short of billions. Text that is no regular expression gets some number too.
[[nodiscard]] std::size_t unrolled_regex_size(std::string_view regex);

} // namespace ovhost
