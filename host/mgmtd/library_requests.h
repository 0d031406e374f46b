#pragma once
// The requests that the library carries out: those that edit the candidate, and the alarm of a
// software upgrade. requests.h has all other commands.

#include <nlohmann/json_fwd.hpp>

namespace ovhost
{

class Configuration;

/// All throw RequestError for a request that makes no sense or asks for what is not there.
[[nodiscard]] nlohmann::json answer_enable(Configuration &configuration,
                                           const nlohmann::json &request);
[[nodiscard]] nlohmann::json answer_clear(Configuration &configuration,
                                          const nlohmann::json &request);
[[nodiscard]] nlohmann::json answer_alarm(const nlohmann::json &request);

} // namespace ovhost
