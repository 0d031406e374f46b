#pragma once
// The answers to the command "show": what the running configuration amounts to. requests.h has all
// other commands; show_maps.h, show_interfaces.h and history_requests.h have the answers about maps
// and ACLs, interfaces and single commits.

#include <nlohmann/json_fwd.hpp>

namespace ovhost
{

class Configuration;

/// Throws RequestError for a request that makes no sense, or that asks for what is not there.
[[nodiscard]] nlohmann::json answer_show(Configuration &configuration,
                                         const nlohmann::json &request);

} // namespace ovhost
