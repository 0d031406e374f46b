// Who uses an application, and which applications the application rules name.
#include "orvale/md_tunneld_tunnel_common.h"

#include "libovmd/frame/built_path.h"
#include "libovmd/md_tunneld_tunnel_common/unit.h"
#include "libovmd/md_xmap_common/catalogue.h"

#include <cstdio>
#include <cstring>

using namespace ovmd;

namespace
{

constexpr char app_root[] = "/ov/tunneld/app/config";

constexpr size_t list_path_size = 512;
constexpr size_t node_size = 1024;
constexpr size_t rule_node_size = 256;

// A kind of thing whose entries may name an application, in the order in which they are searched.
struct app_user {
    const char *root; // null: the ACLs
    const char *message;
};

constexpr app_user app_users[] = {
    {nullptr, "Application name used by an ACL."},
    {find_map_type(MAP_TYPE_R)->root, "Application name used by a Route Map."},
    {find_map_type(MAP_TYPE_O)->root, "Application name used by an Opt Map."},
    {find_map_type(MAP_TYPE_Q)->root, "Application name used by a QOS Map."},
};

// A search for the nodes that name an application; reports in the exported function's name.
struct app_search {
    const char *function;
    const char *app_name;
    const mdb_db *db;
    tstr_array *bnames; // null: the first use is enough
    bool found;

    bool is_over() const { return found && bnames == nullptr; }
};

int search_node(app_search &search, const char *node)
{
    owned_binding binding;
    BAIL_ERROR_FOR(search.function,
                   mdb_get_node_binding(nullptr, search.db, node, 0, binding.out()));
    owned_text value;
    if (binding.get() != nullptr) {
        BAIL_ERROR_FOR(search.function,
                       bn_binding_get_str(binding.get(), ba_value, bt_string, 0, value.out()));
    }
    if (search.app_name == nullptr || value.get() == nullptr ||
        strcmp(value.get(), search.app_name) != 0) {
        return 0;
    }
    search.found = true;
    if (search.bnames != nullptr) {
        BAIL_ERROR_FOR(search.function, tstr_array_append_str(search.bnames, node));
    }
    return 0;
}

int list_children(const app_search &search, const char *parent, owned_tstr_array &children)
{
    BAIL_ERROR_FOR(search.function,
                   mdb_get_tstr_array(nullptr, search.db, parent, 0, 0, 0, children.out()));
    return 0;
}

// The entries of one ACL or map; `leaf` is the node below an entry.
int search_entries(app_search &search, const char *entries_path, const tstr_array *entries,
                   const char *leaf)
{
    const uint32 num_entries = length_of(entries);
    for (uint32 i = 0; i < num_entries && !search.is_over(); ++i) {
        const char *const entry = tstr_array_get_str_quick(entries, i);
        BAIL_NULL_FOR(search.function, entry);
        char node[node_size];
        (void)snprintf(node, sizeof node, "%s/%s/%s", entries_path, entry, leaf);
        const int err = search_node(search, node);
        if (err != 0) {
            return err;
        }
    }
    return 0;
}

int search_acl(app_search &search, const char *root, const char *acl)
{
    BAIL_NULL_FOR(search.function, acl);
    char path[list_path_size];
    (void)snprintf(path, sizeof path, "%s/%s/entry", root, acl);
    owned_tstr_array entries;
    const int err = list_children(search, path, entries);
    return err != 0 ? err : search_entries(search, path, entries.get(), "application");
}

int search_map(app_search &search, const char *root, const char *map)
{
    BAIL_NULL_FOR(search.function, map);
    char path[list_path_size];
    (void)snprintf(path, sizeof path, "%s/%s/prio", root, map);
    owned_tstr_array entries;
    const int err = list_children(search, path, entries);
    if (err != 0) {
        return err;
    }
    const uint32 num_entries = length_of(entries.get());
    if (num_entries != 0) {
        OV_LOG(ov_log_info, "%s: %s map  %s has %d entries", search.function, root, map,
               num_entries);
    }
    return search_entries(search, path, entries.get(), "match/0/application");
}

// What is searched one by one: the ACLs, or one kind's maps.
struct app_holders {
    const char *root;
    const char *plural;
    int (*search)(app_search &search, const char *root, const char *holder);
};

int search_holders(app_search &search, const app_holders &holders, tbool *ret_found)
{
    owned_tstr_array names;
    int err = list_children(search, holders.root, names);
    if (err != 0) {
        return err;
    }
    const uint32 num_names = length_of(names.get());
    OV_LOG(ov_log_info, "%s: find %s in any %d %s", search.function, search.app_name, num_names,
           holders.plural);
    for (uint32 i = 0; i < num_names && !search.is_over(); ++i) {
        err = holders.search(search, holders.root, tstr_array_get_str_quick(names.get(), i));
        if (err != 0) {
            return err;
        }
    }
    if (ret_found != nullptr) {
        *ret_found = search.found;
    }
    return 0;
}

int read_rule_name(const char *function, const mdb_db *db, const char *rule, owned_tstring &name)
{
    BAIL_NULL_FOR(function, rule);
    char node[rule_node_size];
    (void)snprintf(node, sizeof node, "%s/%s/name", app_root, rule);
    BAIL_ERROR_FOR(function, mdb_get_node_value_tstr(nullptr, db, node, 0, nullptr, name.out()));
    BAIL_NULL_FOR(function, name.get());
    return 0;
}

} // namespace

int md_find_app_name_in_acl(const char *appName, const mdb_db *db, tbool *found, tstr_array *bnames)
{
    BAIL_NULL(db);
    app_search search = {__func__, appName, db, bnames, false};
    return search_holders(search, {acl_root, "acl aclNames", search_acl}, found);
}

int md_find_app_name_in_xxxmap(const char *appName, const mdb_db *db, const char *mapNamePrefix,
                               tbool *found, tstr_array *bnames)
{
    BAIL_NULL(db);
    BAIL_NULL(mapNamePrefix);
    app_search search = {__func__, appName, db, bnames, false};
    return search_holders(search, {mapNamePrefix, "map names", search_map}, found);
}

int md_find_appname_in_acl_or_xxxmap(const char *appName, const mdb_db *db, char **existsInString,
                                     tstr_array **bnames)
{
    if (existsInString != nullptr) {
        *existsInString = nullptr;
    }
    owned_tstr_array uses;
    if (bnames != nullptr) {
        *bnames = nullptr;
    }
    BAIL_NULL(db);
    if (bnames != nullptr) {
        BAIL_ERROR(tstr_array_new(uses.out(), nullptr));
    }
    owned_text message;
    for (const app_user &user : app_users) {
        tbool found = false;
        BAIL_ERROR(user.root == nullptr
                       ? md_find_app_name_in_acl(appName, db, &found, uses.get())
                       : md_find_app_name_in_xxxmap(appName, db, user.root, &found, uses.get()));
        if (found && message.get() == nullptr) {
            *message.out() = strdup(user.message);
            BAIL_NULL(message.get());
        }
        if (found && bnames == nullptr) {
            break;
        }
    }
    if (existsInString != nullptr) {
        *existsInString = message.release();
    }
    if (bnames != nullptr) {
        *bnames = uses.release();
    }
    return 0;
}

int md_get_app_num_rules(const mdb_db *db, const char *app_name, int *num_rules)
{
    BAIL_NULL(app_name);
    BAIL_NULL(db);
    BAIL_NULL(num_rules);
    *num_rules = 0;

    owned_tstr_array rules;
    BAIL_ERROR(mdb_get_tstr_array(nullptr, db, app_root, 0, 0, 0, rules.out()));
    int count = 0;
    const uint32 length = length_of(rules.get());
    for (uint32 i = 0; i < length; ++i) {
        owned_tstring name;
        const int err =
            read_rule_name(__func__, db, tstr_array_get_str_quick(rules.get(), i), name);
        if (err != 0) {
            return err;
        }
        count += strcmp(ts_str(name.get()), app_name) == 0 ? 1 : 0;
    }
    *num_rules = count;
    return 0;
}

int md_get_custom_app_names(const mdb_db *db, tstr_array **names)
{
    BAIL_NULL(names);
    BAIL_NULL(db);

    array_options options = {};
    BAIL_ERROR(array_options_get_defaults(&options));
    options.ao_dup_policy = adp_delete_old;
    owned_tstr_array found;
    BAIL_ERROR(tstr_array_new(found.out(), &options));
    owned_tstr_array rules;
    BAIL_ERROR(mdb_get_tstr_array(nullptr, db, app_root, 0, 0, 0, rules.out()));
    const uint32 length = length_of(rules.get());
    if (length == 0) {
        return 0;
    }
    for (uint32 i = 0; i < length; ++i) {
        owned_tstring name;
        const int err =
            read_rule_name(__func__, db, tstr_array_get_str_quick(rules.get(), i), name);
        if (err != 0) {
            return err;
        }
        BAIL_ERROR(tstr_array_append_str(found.get(), ts_str(name.get())));
    }
    // Not the working array, as in md_get_vlan_interfaces.
    tstr_array *copy = nullptr;
    BAIL_ERROR(tstr_array_duplicate(found.get(), &copy));
    *names = copy;
    return 0;
}
