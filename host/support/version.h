#pragma once
// The version that every program of the host answers to --version.

namespace ovhost
{

[[nodiscard]] const char *program_version();

} // namespace ovhost
