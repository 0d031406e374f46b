#pragma once
// The answers to "show" that are about interfaces and their budget. show.h has the others.

#include <nlohmann/json_fwd.hpp>

namespace ovhost
{

class Configuration;

[[nodiscard]] nlohmann::json show_interfaces(Configuration &configuration,
                                             const nlohmann::json &request);
[[nodiscard]] nlohmann::json show_budget(Configuration &configuration,
                                         const nlohmann::json &request);

} // namespace ovhost
