#pragma once
// How commits in a row are named, in the log and by the client.

#include <cstdint>
#include <string>

namespace ovhost
{

/// The commits after `back_to` up to `last`: "commit 3", or "commits 2 to 3".
[[nodiscard]] std::string commit_range(std::uint64_t back_to, std::uint64_t last);

/// The same with a verb: "commit 3 is", or "commits 2 to 3 are".
[[nodiscard]] std::string commit_range(std::uint64_t back_to, std::uint64_t last, const char *one,
                                       const char *several);

} // namespace ovhost
