#pragma once
// The module that keeps what the library knows of the model (framework/appliance.h) in step with
// the configuration.

#include "host/commit/module.h"

#include <optional>

namespace ovhost
{

inline constexpr const char *max_tunnels_node = "/ov/model/limits/max_tunnels";

/// How many tunnels the model of a database allows from the next start on; nothing when the node
/// makes no sense.
[[nodiscard]] std::optional<uint32> allowed_tunnels(const mdb_db *db);

class ModelModule : public Module
{
  public:
    [[nodiscard]] std::string name() const override { return "model"; }
    [[nodiscard]] std::vector<std::string> patterns() const override;

    /// Reads the model information anew. The number of tunnels stays what it is until the next
    /// start, which the log tells.
    int apply(const md_dbinfo *dbinfo, const mdb_db_change_array *changes) override;
};

} // namespace ovhost
