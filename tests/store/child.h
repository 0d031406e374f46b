// Runs a part of a test in a child process: what it does to its user, its limits or its mounts
// ends with it.
#pragma once

#include <sys/types.h>

#include <functional>
#include <string>

namespace ovtest
{

// Runs the function in a child process and answers what it answered. When it throws, the answer
// is "exception: " and its text; when the child dies, "died".
[[nodiscard]] std::string in_child(const std::function<std::string()> &run);

// Makes this process an unprivileged user. Only root changes: another user is one already.
void become_unprivileged();

inline constexpr uid_t kUnprivilegedUser = 65534;

} // namespace ovtest
