#pragma once
// The reason behind the answer of conf_file_okay() (framework/files.h), for whoever has to tell it.

#include <optional>
#include <string>

namespace ovhost
{

/// Why the configuration file may not be used; nothing when it may. `path` is not null.
[[nodiscard]] std::optional<std::string> conf_file_refusal(const char *path);

} // namespace ovhost
