#pragma once
// Users and groups of the machine by name.

#include <sys/types.h>

#include <optional>
#include <string>

namespace ovhost
{

/// The user's name; the number itself when the machine knows none for it.
[[nodiscard]] std::string user_name(uid_t user);

/// The group of that name; nothing when the machine knows none.
[[nodiscard]] std::optional<gid_t> find_group(const std::string &name);

} // namespace ovhost
