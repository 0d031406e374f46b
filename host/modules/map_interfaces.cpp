#include "host/modules/map_interfaces.h"

#include "framework/appliance.h"
#include "host/framework/match_string.h"
#include "host/modules/commit_access.h"
#include "host/modules/interface_nodes.h"
#include "host/modules/match_strings.h"
#include "host/modules/node_access.h"
#include "host/modules/plain_names.h"
#include "orvale/md_xmap_common.h"

namespace ovhost
{
namespace
{

constexpr const char *label_pattern = "/ov/iflabels/config/*/*";
constexpr const char *preferred_pattern =
    "/ov/tunneld/net/routes/config/ipv4/prefix/*/nhop/*/preferred_if";

} // namespace

std::vector<std::string> VlansModule::patterns() const
{
    // The library takes component 7 for the VLAN's name.
    return {tunneld_interfaces_node(vlan_kind) + "/*"};
}

int VlansModule::check_change(md_dbinfo *dbinfo, mdb_db_change *change)
{
    if (is_deleted(change)) {
        // Refused, the words are those of the library.
        return md_vlan_is_used_in_rmap(change, dbinfo);
    }
    const std::string name = name_parts(change).back();
    return ovlan_valid_name_check(name.c_str()) == 0
               ? 0
               : refuse(dbinfo, "\"" + name + "\" is not a name that a VLAN can have");
}

std::vector<std::string> InterfaceLabelsModule::patterns() const
{
    return {label_pattern};
}

int InterfaceLabelsModule::check_change(md_dbinfo *dbinfo, mdb_db_change *change)
{
    const std::string label = name_parts(change).back();
    if (!is_deleted(change)) {
        const auto fault = plain_name_fault("an interface label", label, longest_label);
        return fault ? refuse(dbinfo, *fault) : 0;
    }
    // Another category may still have it.
    const std::optional<MatchingEntry> user = md_xmap_iflabel_check(label.c_str(), dbinfo->newdb)
                                                  ? std::nullopt
                                                  : entry_that_matches_vlan(dbinfo->newdb, label);
    return user ? refuse(dbinfo, "Cannot delete an interface label when used by " + user->owner +
                                     ".\n  Please remove vlan:" + label + " from " + user->entry +
                                     " first.")
                : 0;
}

std::vector<std::string> PreferredInterfacesModule::patterns() const
{
    return {preferred_pattern};
}

int PreferredInterfacesModule::check_change(md_dbinfo *dbinfo, mdb_db_change *change)
{
    if (!is_deleted(change) || !matching_nodes(dbinfo->newdb, preferred_pattern).empty()) {
        return 0;
    }
    tbool is_used = false;
    const int err = md_preferred_if_is_used_in_rmap(change, dbinfo, &is_used);
    return err == 0 && is_used
               ? refuse(dbinfo, "Cannot delete the last preferred interface when used by a "
                                "route-map.\n  Please change auto_mod \"preferred-if\" of the "
                                "route-map's entries first, in a commit of its own.")
               : err;
}

} // namespace ovhost
