#include "host/modules/interface_lookup.h"

#include "host/modules/interface_nodes.h"
#include "host/modules/node_access.h"
#include "orvale/md_tunneld_tunnel_common.h"

#include <map>

namespace ovhost
{
namespace
{

std::vector<std::string> vlan_names(const mdb_db *db)
{
    OwnedStrings names;
    require(md_get_vlan_interfaces(db, names.out()), "list the VLAN interfaces");
    return texts_of(names.get());
}

std::optional<bool> enable_flag(const mdb_db *db, const std::string &name)
{
    const std::optional<std::string> flag = node_text(db, interface_record(name) + "/enable");
    return flag ? std::optional(*flag == "true") : std::nullopt;
}

} // namespace

std::vector<InterfaceFacts> list_interfaces(const mdb_db *db)
{
    std::map<std::string, InterfaceFacts> found;
    for (const std::string &name : child_names(db, interface_records_node)) {
        found[name];
    }
    for (const std::string &name : vlan_names(db)) {
        found[name].is_vlan = true;
    }
    for (const std::string &name : child_names(db, tunneld_interfaces_node(tunnel_kind))) {
        found[name].is_tunnel = true;
    }
    std::vector<InterfaceFacts> interfaces;
    for (auto &[name, facts] : found) {
        facts.name = name;
        facts.is_enabled = enable_flag(db, name);
        facts.uses = interface_uses(db, name);
        interfaces.push_back(std::move(facts));
    }
    return interfaces;
}

} // namespace ovhost
