#include "host/mgmtd/show_interfaces.h"

#include "host/mgmtd/answers.h"
#include "host/mgmtd/configuration.h"
#include "host/modules/interface_budget.h"
#include "host/modules/interface_lookup.h"
#include "orvale/md_utils.h"

#include <nlohmann/json.hpp>

namespace ovhost
{

using nlohmann::json;

json show_interfaces(Configuration &configuration, const json &)
{
    auto interfaces = json::array();
    for (const InterfaceFacts &facts : list_interfaces(configuration.running_db())) {
        auto users = json::array();
        for (const InterfaceUse &use : facts.uses) {
            users.push_back({{"node", use.node}, {"text", use.text}});
        }
        interfaces.push_back({{"name", facts.name},
                              {"kind", facts.is_vlan     ? "vlan"
                                       : facts.is_tunnel ? "tunnel"
                                                         : "interface"},
                              {"enabled", or_null(facts.is_enabled)},
                              {"users", std::move(users)}});
    }
    return {{"interfaces", std::move(interfaces)}};
}

json show_budget(Configuration &, const json &)
{
    const InterfaceBudget budget = measure_interface_budget();
    return {{"configured", budget.configured},      {"allowed", budget.allowed},
            {"in_kernel", budget.in_kernel},        {"index_budget", MD_IFMGR_IFINDEX_BUDGET},
            {"each_takes", kernel_interfaces_each}, {"left", budget.left}};
}

} // namespace ovhost
