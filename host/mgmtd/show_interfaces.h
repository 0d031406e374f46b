#pragma once
// The answers to "show" that are about interfaces and their budget. show.h has the others.

#include <nlohmann/json_fwd.hpp>

namespace ovhost
{

class Configuration;

/// All interfaces with their kind, their enable flag and who uses them. Throws std::runtime_error
/// when the library fails.
[[nodiscard]] nlohmann::json show_interfaces(Configuration &configuration,
                                             const nlohmann::json &request);
/// How many VLAN and tunnel interfaces there are, may be, and can be added now.
[[nodiscard]] nlohmann::json show_budget(Configuration &configuration,
                                         const nlohmann::json &request);

} // namespace ovhost
