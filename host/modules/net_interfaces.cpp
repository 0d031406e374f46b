#include "host/modules/net_interfaces.h"

#include "host/modules/commit_access.h"
#include "host/modules/interface_nodes.h"
#include "host/modules/interface_users.h"
#include "host/modules/node_access.h"

namespace ovhost
{
namespace
{

constexpr std::size_t record_name_part = 3;
constexpr std::size_t tunneld_kind_part = 5;
constexpr std::size_t tunneld_name_part = 7;

/// A changed node of an interface, taken apart.
struct InterfaceChange {
    std::string node; ///< the interface's own
    std::string name;
    std::string kind; ///< empty for a record
    bool is_itself;
};

InterfaceChange interface_change(const mdb_db_change *change)
{
    const std::vector<std::string> parts = name_parts(change);
    const bool is_record = parts.front() == "net";
    const std::size_t name_part = is_record ? record_name_part : tunneld_name_part;
    const std::string &name = parts[name_part];
    const std::string kind = is_record ? "" : parts[tunneld_kind_part];
    return {is_record ? interface_record(name) : tunneld_interface(kind, name), name, kind,
            parts.size() == name_part + 1};
}

std::optional<std::string> fault_of(const InterfaceChange &changed, const mdb_db_change *change)
{
    if (!changed.kind.empty() && changed.kind != vlan_kind && changed.kind != tunnel_kind) {
        return "there are no interfaces of kind \"" + changed.kind + "\": it is \"" + vlan_kind +
               "\" or \"" + tunnel_kind + "\"";
    }
    // The names of VLANs have rules, and a module, of their own.
    if (changed.kind != vlan_kind) {
        if (auto fault = interface_name_fault(changed.name)) {
            return fault;
        }
    }
    return own_name_fault("the interface's name", changed.name, change);
}

std::string join(const std::vector<InterfaceUse> &uses, std::string InterfaceUse::*member)
{
    std::string list;
    for (const InterfaceUse &use : uses) {
        list += (list.empty() ? "" : ", ") + use.*member;
    }
    return list;
}

int check_deletion(md_dbinfo *dbinfo, const InterfaceChange &changed)
{
    if (bring_back_replaced(dbinfo, changed.node, bt_string, changed.name)) {
        return 0;
    }
    const std::vector<InterfaceUse> uses = interface_uses(dbinfo->newdb, changed.name);
    return uses.empty() ? 0
                        : refuse(dbinfo, "Cannot delete an interface when used by " +
                                             join(uses, &InterfaceUse::text) +
                                             ".\n  Please remove " + changed.name + " from " +
                                             join(uses, &InterfaceUse::node) + " first.");
}

} // namespace

std::vector<std::string> NetInterfacesModule::patterns() const
{
    return {std::string(interface_records_node) + "/**", tunneld_interfaces_node("*") + "/**"};
}

int NetInterfacesModule::check_change(md_dbinfo *dbinfo, mdb_db_change *change)
{
    const InterfaceChange changed = interface_change(change);
    if (!changed.is_itself) {
        if (!is_deleted(change)) {
            propose_missing(dbinfo, changed.node, bt_string, changed.name);
        }
        return 0;
    }
    if (is_deleted(change)) {
        return check_deletion(dbinfo, changed);
    }
    const std::optional<std::string> fault = fault_of(changed, change);
    return fault ? refuse(dbinfo, *fault) : 0;
}

} // namespace ovhost
