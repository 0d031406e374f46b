#pragma once
// The answer to the command "upgrade": a configuration of the older form is converted and committed
// in one go (host/modules/legacy_upgrade.h). requests.h has all other commands.

#include <nlohmann/json_fwd.hpp>

namespace ovhost
{

class Configuration;
struct ClientInfo;

/// Throws RequestError for a text that cannot be converted, a commit that is refused, and when the
/// candidate has edits. The candidate has none at the end, whatever that is.
[[nodiscard]] nlohmann::json answer_upgrade(Configuration &configuration,
                                            const nlohmann::json &request,
                                            const ClientInfo &client);

} // namespace ovhost
