#include "host/modules/model.h"

#include "framework/appliance.h"
#include "framework/logging.h"
#include "host/framework/log_config.h"
#include "host/framework/model_nodes.h"
#include "host/modules/node_access.h"

#include <algorithm>

namespace ovhost
{

std::optional<uint32> allowed_tunnels(const mdb_db *db)
{
    const std::optional<std::string> text = node_text(db, max_tunnels_node);
    const std::optional<uint32> number =
        text ? parse_number(*text) : default_model_info().max_tunnels;
    return number ? std::optional(std::min(*number, most_tunnels)) : std::nullopt;
}

std::vector<std::string> ModelModule::patterns() const
{
    return {model_name_node, "/ov/model/limits/*"};
}

int ModelModule::apply(const md_dbinfo *dbinfo, const mdb_db_change_array *)
{
    const int err = init_model_info(dbinfo->newdb);
    const uint32 in_force = get_max_tunnel_number();
    const uint32 wanted = allowed_tunnels(dbinfo->newdb).value_or(in_force);
    if (wanted != in_force) {
        log_host_line(ov_log_warning, "model",
                      std::string(max_tunnels_node) +
                          " counts from the next start on: until then " + std::to_string(in_force) +
                          " tunnels are allowed, not " + std::to_string(wanted));
    }
    return err;
}

} // namespace ovhost
