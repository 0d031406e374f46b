#pragma once
// Writing to someone who may be slow to read, without being stuck there.

#include <string_view>

namespace ovhost
{

/// Writes all of `text`. False when `stop_fd` became readable while nothing could be written: part
/// of the text may be out then. Throws std::system_error.
[[nodiscard]] bool write_unless_stopped(int fd, std::string_view text, int stop_fd);

} // namespace ovhost
