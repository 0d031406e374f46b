// Who uses an interface, the VLAN interfaces, and an interface's enable flag.
#include "orvale/md_tunneld_tunnel_common.h"

#include "libovmd/frame/built_path.h"
#include "libovmd/md_tunneld_tunnel_common/unit.h"

#include <cstdio>

using namespace ovmd;

namespace
{

constexpr char service_groups[] = "/ov/wccpd/wccp/srv_grp/config";
constexpr char vrrp_entries[] = "/ov/redd/net/interface/vrrp/config";
constexpr char vlan_nodes[] = "/ov/tunneld/net/interface/tunnel/vlan/config/*";

constexpr uint32 group_part = 5;
constexpr uint32 vlan_part = 7;
constexpr size_t interface_node_size = 256;

// A feature that names interfaces, and where: PARENT/CHILD and what is behind it.
struct interface_user {
    const char *parent;
    const char *leaf;
};

constexpr interface_user interface_users[] = {{service_groups, "/interface"}, {vrrp_entries, ""}};

// What a usage is called.
struct usage_kind {
    const char *pattern;
    const char *usertext;
    bool names_group; // the text takes the name of the group
};

constexpr usage_kind usage_kinds[] = {
    {"/ov/tunneld/system/config/mode/router/*/ifname", "router interface", false},
    {"/ov/wccpd/wccp/srv_grp/config/*/interface", "wccp group %s", true},
    {"/ov/redd/net/interface/vrrp/config/*", "vrrp interface", false},
};

const usage_kind *find_kind(const char *usage)
{
    for (const usage_kind &kind : usage_kinds) {
        if (bn_binding_name_pattern_match(usage, kind.pattern)) {
            return &kind;
        }
    }
    return nullptr;
}

// A search for the nodes that name an interface; reports in the exported function's name.
struct usage_search {
    const char *function;
    const mdb_db *db;
    const char *ifname;
    tstr_array *usages;
};

int search_node(const usage_search &search, const char *node)
{
    owned_tstring value;
    BAIL_ERROR_FOR(search.function,
                   mdb_get_node_value_tstr(nullptr, search.db, node, 0, nullptr, value.out()));
    if (value.get() != nullptr && ts_equal_str(value.get(), search.ifname, true)) {
        BAIL_ERROR_FOR(search.function, tstr_array_append_str(search.usages, node));
    }
    return 0;
}

int search_user(const usage_search &search, const interface_user &user)
{
    owned_tstr_array children;
    BAIL_ERROR_FOR(search.function,
                   mdb_get_tstr_array(nullptr, search.db, user.parent, 0, 0, 0, children.out()));
    const uint32 num_children = length_of(children.get());
    for (uint32 i = 0; i < num_children; ++i) {
        const char *const child = tstr_array_get_str_quick(children.get(), i);
        BAIL_NULL_FOR(search.function, child);
        owned_text node;
        *node.out() = smprintf("%s/%s%s", user.parent, child, user.leaf);
        BAIL_NULL_FOR(search.function, node.get());
        const int err = search_node(search, node.get());
        if (err != 0) {
            return err;
        }
    }
    return 0;
}

// Takes the VLAN's name out of a node's name and puts it at the end of the names.
int add_vlan_name(const char *function, const char *node, tstr_array *names)
{
    BAIL_NULL_FOR(function, node);
    owned_tstr_array parts;
    BAIL_ERROR_FOR(function, bn_binding_name_to_parts(node, parts.out(), false));
    BAIL_NULL_FOR(function, parts.get());
    owned_tstring name;
    BAIL_ERROR_FOR(function, tstr_array_remove(parts.get(), vlan_part, name.out()));
    BAIL_NULL_FOR(function, name.get());
    BAIL_ERROR_FOR(function, tstr_array_append_takeover(names, name.address()));
    return 0;
}

} // namespace

int md_interface_usage_check(const mdb_db *db, char *ifname, tstr_array **usages)
{
    BAIL_NULL(usages);
    *usages = nullptr;
    BAIL_NULL(db);
    BAIL_NULL(ifname);

    owned_tstr_array found;
    BAIL_ERROR(tstr_array_new(found.out(), nullptr));
    BAIL_NULL(found.get());
    for (const interface_user &user : interface_users) {
        const int err = search_user({__func__, db, ifname, found.get()}, user);
        if (err != 0) {
            return err;
        }
    }
    *usages = found.release();
    return 0;
}

int md_interface_usage_to_usertext(const char *usage, tstring **usertext)
{
    BAIL_NULL(usertext);
    *usertext = nullptr;
    BAIL_NULL(usage);

    const usage_kind *const kind = find_kind(usage);
    if (kind == nullptr) {
        return 0;
    }
    owned_tstring text;
    if (kind->names_group) {
        owned_tstr_array parts;
        BAIL_ERROR(bn_binding_name_to_parts(usage, parts.out(), false));
        const char *const group = part_of(parts.get(), group_part);
        BAIL_NULL(group);
        BAIL_ERROR(ts_new_sprintf(text.out(), kind->usertext, group));
    } else {
        BAIL_ERROR(ts_new_str(text.out(), kind->usertext));
    }
    *usertext = text.release();
    return 0;
}

int md_interface_usage_check_usertext(const mdb_db *db, char *ifname, tstr_array **usertexts)
{
    BAIL_NULL(usertexts);
    *usertexts = nullptr;
    BAIL_NULL(db);
    BAIL_NULL(ifname);

    owned_tstr_array texts;
    BAIL_ERROR(tstr_array_new(texts.out(), nullptr));
    BAIL_NULL(texts.get());
    owned_tstr_array usages;
    BAIL_ERROR(md_interface_usage_check(db, ifname, usages.out()));
    const uint32 num_usages = length_of(usages.get());
    for (uint32 i = 0; i < num_usages; ++i) {
        owned_tstring text;
        BAIL_ERROR(
            md_interface_usage_to_usertext(tstr_array_get_str_quick(usages.get(), i), text.out()));
        if (text.get() != nullptr) {
            BAIL_ERROR(tstr_array_append_str(texts.get(), ts_str(text.get())));
        }
    }
    *usertexts = texts.release();
    return 0;
}

int md_get_vlan_interfaces(const mdb_db *db, tstr_array **ifnames)
{
    BAIL_NULL(ifnames);
    *ifnames = nullptr;
    BAIL_NULL(db);

    owned_tstr_array names;
    BAIL_ERROR(tstr_array_new(names.out(), nullptr));
    BAIL_NULL(names.get());
    owned_tstr_array nodes;
    BAIL_ERROR(
        mdb_get_matching_tstr_array(nullptr, db, vlan_nodes, mdqf_sel_class_no_state, nodes.out()));
    if (nodes.get() == nullptr) {
        return 0;
    }
    const uint32 num_nodes = length_of(nodes.get());
    for (uint32 i = 0; i < num_nodes; ++i) {
        const int err =
            add_vlan_name(__func__, tstr_array_get_str_quick(nodes.get(), i), names.get());
        if (err != 0) {
            return err;
        }
    }
    // Not the working array: that the host makes the caller's, and may fail to, is part of what
    // this function does for it.
    owned_tstr_array copy;
    BAIL_ERROR(tstr_array_duplicate(names.get(), copy.out()));
    *ifnames = copy.release();
    return 0;
}

// An interface that is not there is not created.
int md_set_if_enable(mdb_db *db, const char *ifname, tbool is_enabled)
{
    BAIL_NULL(db);
    BAIL_NULL(ifname);

    char node[interface_node_size];
    (void)snprintf(node, sizeof node, "/net/interface/config/%s", ifname);
    owned_binding interface;
    BAIL_ERROR(mdb_get_node_binding(nullptr, db, node, 0, interface.out()));
    if (interface.get() == nullptr) {
        return 0;
    }
    (void)snprintf(node, sizeof node, "/net/interface/config/%s/enable", ifname);
    owned_binding enable;
    BAIL_ERROR(bn_binding_new_str(enable.out(), node, ba_value, bt_bool, 0,
                                  is_enabled ? "true" : "false"));
    BAIL_NULL(enable.get());
    BAIL_ERROR(mdb_set_node_binding(nullptr, db, bsso_modify, 0, enable.get()));
    return 0;
}
