#pragma once
// A whole file as one text, byte for byte.

#include <cstddef>
#include <string>

namespace ovhost
{

/// What is left to read of a descriptor, or the first `limit` + 1 bytes when there is more than
/// `limit`: enough to tell. Throws std::system_error.
[[nodiscard]] std::string read_to_end(int fd, std::size_t limit);

} // namespace ovhost
