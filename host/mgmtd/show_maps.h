#pragma once
// The answers to "show" that are about maps, ACLs and the references between them. show.h has the
// others.

#include <nlohmann/json_fwd.hpp>

namespace ovhost
{

class Configuration;

/// All maps, kind by kind, with what their entries match.
[[nodiscard]] nlohmann::json show_maps(Configuration &configuration, const nlohmann::json &request);

/// Throws RequestError for an ACL that is not there.
[[nodiscard]] nlohmann::json show_acl(Configuration &configuration, const nlohmann::json &request);

/// With "check": how the records compare with the maps.
[[nodiscard]] nlohmann::json show_references(Configuration &configuration,
                                             const nlohmann::json &request);

} // namespace ovhost
