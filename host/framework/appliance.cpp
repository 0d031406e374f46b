// The model's side of framework/appliance.h; netif.cpp has the kernel's, and match_string.cpp and
// vlan_name.cpp the parsers.
#include "framework/appliance.h"

#include "framework/logging.h"
#include "host/framework/appliance_config.h"
#include "host/framework/c_boundary.h"
#include "host/framework/log_config.h"
#include "host/framework/model_nodes.h"
#include "host/framework/objects.h"

#include <optional>
#include <utility>

ov_system_info_t ov_system_info = {};

namespace
{

using ovhost::ModelInfo;

struct Appliance {
    std::string given_name;
    ovhost::RunningDbSource running_db;
    ModelInfo model = ovhost::default_model_info();
    std::optional<uint32> settled_tunnel_number;
};

Appliance &appliance()
{
    static Appliance the_one;
    return the_one;
}

const mdb_db *running_db()
{
    const ovhost::RunningDbSource &source = appliance().running_db;
    return source ? source() : nullptr;
}

} // namespace

namespace ovhost
{

void set_config_name(std::string name)
{
    appliance().given_name = std::move(name);
}

void set_running_db_source(RunningDbSource source)
{
    appliance().running_db = std::move(source);
}

} // namespace ovhost

int init_model_info(const mdb_db *db)
{
    return ovhost::at_c_boundary([db]() -> int {
        const mdb_db *source = db != nullptr ? db : running_db();
        if (source == nullptr) {
            ovhost::log_host_line(ov_log_error, "model",
                                  "no database is in force to read the model's nodes from");
            return lc_err_unexpected_null;
        }
        const int status = ovhost::read_model_info(source->tree, appliance().model);
        if (status == lc_err_no_error) {
            ov_system_info.system_max_interfaces = appliance().model.max_interfaces;
            ov_system_info.initialized = 1;
        }
        return status;
    });
}

const char *get_config_name(void)
{
    const Appliance &here = appliance();
    const std::string &name = here.given_name.empty() ? here.model.config_name : here.given_name;
    return name.empty() ? nullptr : name.c_str();
}

uint32 get_max_tunnel_number(void)
{
    Appliance &here = appliance();
    // Tables are laid out by this number: once somebody has seen the model's, it stays, even when a
    // commit changes the node.
    if (!here.settled_tunnel_number && ov_system_info.initialized != 0) {
        here.settled_tunnel_number = here.model.max_tunnels;
    }
    return here.settled_tunnel_number.value_or(here.model.max_tunnels);
}

uint32 get_max_rmap_entries(void)
{
    return appliance().model.max_rmap_entries;
}

uint32 get_max_omap_entries(void)
{
    return appliance().model.max_omap_entries;
}

uint32 get_max_qmap_entries(void)
{
    return appliance().model.max_qmap_entries;
}

uint32 get_max_smap_entries(void)
{
    return appliance().model.max_smap_entries;
}

uint32 get_max_nmap_entries(void)
{
    return appliance().model.max_nmap_entries;
}

uint32 get_max_dns_proxy_map_entries(void)
{
    return appliance().model.max_dns_proxy_map_entries;
}
