// Who uses an interface by the automatic choice of a route-map entry.
#include "orvale/md_xmap_common.h"

#include "libovmd/frame/built_path.h"
#include "libovmd/md_xmap_common/catalogue.h"
#include "libovmd/md_xmap_common/unit.h"

#include <cstdio>

using namespace ovmd;

namespace
{

constexpr const map_type &route_map = map_types[MAP_TYPE_R];
static_assert(route_map.mtype == MAP_TYPE_R);

constexpr char set_nodes[] = "/ov/tunneld/route_map/config/map/*/prio/*/set/0";

constexpr uint32 vlan_part = 7;
constexpr size_t vlan_size = 256;
constexpr size_t message_size = 512;

// Asks a parameter of the route-map entries for a value; reports in the exported function's name.
struct parameter_search {
    const char *function;
    const md_dbinfo *dbinfo;
    const char *parameter; // below "set/0"
    const char *value;
};

int list_set_nodes(const parameter_search &search, owned_tstr_array &nodes)
{
    BAIL_ERROR_FOR(search.function,
                   mdb_get_matching_tstr_array(
                       search.dbinfo->commit, search.dbinfo->newdb, set_nodes,
                       mdqf_sel_iterate_subtree | mdqf_sel_class_no_state, nodes.out()));
    return 0;
}

// The entries are those that are to be; what they have set is read as it was.
int has_value(const parameter_search &search, const tstr_array *parts, bool &ret_has_value)
{
    const char *const map = part_of(parts, route_map.map_part);
    BAIL_NULL_FOR(search.function, map);
    const char *const priority = part_of(parts, route_map.priority_part);
    BAIL_NULL_FOR(search.function, priority);
    owned_text node;
    BUILD_PATH_FOR(search.function, node, "%s/%s/prio/%s/set/0/%s", route_map.root, map, priority,
                   search.parameter);
    owned_tstring value;
    BAIL_ERROR_FOR(search.function,
                   mdb_get_node_value_tstr(search.dbinfo->commit, search.dbinfo->olddb, node.get(),
                                           0, nullptr, value.out()));
    ret_has_value = value.get() != nullptr && ts_cmp_str(value.get(), search.value, false) == 0;
    return 0;
}

// The components of the first entry's name that has the value; none when there is no such entry.
int find_entry(const parameter_search &search, const tstr_array *nodes, owned_tstr_array &parts)
{
    const uint32 num_nodes = length_of(nodes);
    for (uint32 i = 0; i < num_nodes; ++i) {
        const char *const node = tstr_array_get_str_quick(nodes, i);
        BAIL_NULL_FOR(search.function, node);
        BAIL_ERROR_FOR(search.function, bn_binding_name_to_parts(node, parts.out(), false));
        bool found = false;
        const int err = has_value(search, parts.get(), found);
        if (err != 0 || found) {
            return err;
        }
    }
    parts.reset();
    return 0;
}

} // namespace

int md_preferred_if_is_used_in_rmap(mdb_db_change * /*change*/, md_dbinfo *dbinfo, tbool *ret_found)
{
    if (ret_found == nullptr) {
        return 0;
    }
    *ret_found = false;
    BAIL_NULL(dbinfo);

    const parameter_search search = {__func__, dbinfo, "auto_mod", "preferred-if"};
    owned_tstr_array nodes;
    int err = list_set_nodes(search, nodes);
    owned_tstr_array entry;
    if (err == 0) {
        err = find_entry(search, nodes.get(), entry);
    }
    if (err != 0 || entry.get() == nullptr) {
        return err;
    }
    *ret_found = true;
    OV_LOG(ov_log_notice, "Found preferred_if in %s:%s.", part_of(entry.get(), route_map.map_part),
           part_of(entry.get(), route_map.priority_part));
    return 0;
}

int md_vlan_is_used_in_rmap(mdb_db_change *change, md_dbinfo *dbinfo)
{
    BAIL_NULL(change);
    if (change->mdc_change_type != mdct_delete) {
        return 0;
    }
    BAIL_NULL(dbinfo);
    const char *const name = part_of(change->mdc_name_parts, vlan_part);
    BAIL_NULL(name);
    char vlan[vlan_size];
    (void)snprintf(vlan, sizeof vlan, "%s", name);

    const parameter_search search = {__func__, dbinfo, "auto_prefif", vlan};
    owned_tstr_array nodes;
    int err = list_set_nodes(search, nodes);
    if (err != 0) {
        return err;
    }
    OV_LOG(ov_log_notice, "Checking %d rmaps entries for VLAN %s.", length_of(nodes.get()), vlan);
    owned_tstr_array entry;
    err = find_entry(search, nodes.get(), entry);
    if (err != 0 || entry.get() == nullptr) {
        return err;
    }
    OV_LOG(ov_log_notice, "Found VLAN %s in %s:%s.", vlan, part_of(entry.get(), route_map.map_part),
           part_of(entry.get(), route_map.priority_part));
    char message[message_size];
    (void)snprintf(message, sizeof message,
                   "Cannot delete a vlan when used by a route-map preferred interface.\n"
                   "  Please remove vlan %s from associated route-map first.",
                   vlan);
    BAIL_ERROR(md_commit_set_return_status_msg(dbinfo->commit, 1, message));
    return 0;
}
