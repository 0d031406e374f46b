#include "host/mgmtd/module_set.h"

#include "host/commit/engine.h"
#include "host/modules/acls.h"
#include "host/modules/applications.h"
#include "host/modules/change_events.h"
#include "host/modules/dns_proxy_maps.h"
#include "host/modules/interface_addresses.h"
#include "host/modules/interface_budget.h"
#include "host/modules/interface_users.h"
#include "host/modules/limits.h"
#include "host/modules/map_interfaces.h"
#include "host/modules/maps.h"
#include "host/modules/model.h"
#include "host/modules/net_interfaces.h"
#include "host/modules/routes.h"
#include "host/modules/schema.h"
#include "host/modules/tunnels.h"

#include <vector>

namespace ovhost
{

struct ModuleSet::Modules {
    SchemaModule schema;
    ModelModule model;
    TunnelsModule tunnels;
    AclsModule acls;
    ApplicationsModule applications;
    NetInterfacesModule interfaces;
    InterfaceUsersModule interface_users;
    RoutesModule routes;
    InterfaceAddressesModule addresses;
    InterfaceBudgetModule interface_budget;
    VlansModule vlans;
    InterfaceLabelsModule labels;
    PreferredInterfacesModule preferred_interfaces;
    std::vector<MapsModule> maps{map_kinds.begin(), map_kinds.end()};
    DnsProxyMapsModule dns_proxy_maps;
    LimitsModule limits;
    ChangeEventsModule events;
};

ModuleSet::ModuleSet() : modules_(std::make_unique<Modules>()) {}

ModuleSet::~ModuleSet() = default;

void ModuleSet::add_to(CommitEngine &engine)
{
    // Order counts: checks refuse before anything follows, and events tell of what is done.
    engine.add_module(modules_->schema);
    engine.add_module(modules_->model);
    engine.add_module(modules_->tunnels);
    // Maps look for the ACLs that they name.
    engine.add_module(modules_->acls);
    engine.add_module(modules_->applications);
    engine.add_module(modules_->interfaces);
    engine.add_module(modules_->interface_users);
    engine.add_module(modules_->routes);
    engine.add_module(modules_->addresses);
    engine.add_module(modules_->interface_budget);
    engine.add_module(modules_->vlans);
    engine.add_module(modules_->labels);
    engine.add_module(modules_->preferred_interfaces);
    for (MapsModule &maps : modules_->maps) {
        engine.add_module(maps);
    }
    engine.add_module(modules_->dns_proxy_maps);
    engine.add_module(modules_->limits);
    engine.add_module(modules_->events);
}

const HeldIds &ModuleSet::held_ids() const
{
    return modules_->tunnels.held_ids();
}

} // namespace ovhost
