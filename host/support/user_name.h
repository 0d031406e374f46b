#pragma once
// Users of the machine by name.

#include <sys/types.h>

#include <string>

namespace ovhost
{

/// The user's name; the number itself when the machine knows none for it.
[[nodiscard]] std::string user_name(uid_t user);

} // namespace ovhost
