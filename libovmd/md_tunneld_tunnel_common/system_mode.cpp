// System mode and hardware options, read from the tunnel daemon's system configuration.
#include "orvale/md_tunneld_tunnel_common.h"

#include "framework/bail.h"
#include "libovmd/frame/owners.h"
#include "libovmd/md_tunneld_tunnel_common/unit.h"

#include <cstring>

using namespace ovmd;

namespace
{

constexpr char mode_node[] = "/ov/tunneld/system/config/mode";
constexpr char submode_node[] = "/ov/tunneld/system/config/submode";
constexpr char routing_inline_node[] = "/ov/tunneld/system/config/routing_inline";
constexpr char router_interfaces_node[] = "/ov/tunneld/system/config/mode/router";
constexpr char ports_10g_node[] = "/ov/tunneld/system/config/10g";
constexpr char bonding_node[] = "/ov/tunneld/system/config/bonding";

constexpr char default_submode[] = "normal";

// Reads a string node; without a node `ret_binding` stays null, without text `ret_text` does.
int read_text(const mdb_db *db, const char *node, owned_binding &ret_binding, owned_text &ret_text)
{
    const int err = mdb_get_node_binding(nullptr, db, node, 0, ret_binding.out());
    if (err != 0 || ret_binding.get() == nullptr) {
        return err;
    }
    return bn_binding_get_str(ret_binding.get(), ba_value, bt_string, 0, ret_text.out());
}

// A flag node on behalf of a yes/no question, which the error lines name; absent means false.
tbool flag_is_set(const char *question, const mdb_db *db, const char *node)
{
    if (db == nullptr) {
        (void)bail_report_null(question, bail_unit, __LINE__);
        return false;
    }
    tbool flag = false;
    owned_binding binding;
    int err = mdb_get_node_binding(nullptr, db, node, 0, binding.out());
    if (err == 0 && binding.get() != nullptr) {
        err = bn_binding_get_tbool(binding.get(), ba_value, 0, &flag);
    }
    if (err != 0) {
        (void)bail_report_error(err, question, bail_unit, __LINE__);
        return false;
    }
    return flag;
}

// Only the word itself is compared, so that a mode with a suffix still counts as the mode.
tbool mode_begins_with(const char *question, const mdb_db *db, const char *word)
{
    owned_text mode;
    const int err = md_get_db_system_mode(db, mode.out());
    if (err != 0) {
        (void)bail_report_error(err, question, bail_unit, __LINE__);
        return false;
    }
    return mode.get() != nullptr && strncmp(mode.get(), word, strlen(word)) == 0;
}

} // namespace

int md_get_db_system_mode(const mdb_db *db, char **ret_str_value)
{
    BAIL_NULL(ret_str_value);
    *ret_str_value = nullptr;
    BAIL_NULL(db);

    owned_text mode;
    owned_binding binding;
    BAIL_ERROR(read_text(db, mode_node, binding, mode));
    if (binding.get() == nullptr) {
        return 0;
    }
    BAIL_NULL(mode.get());
    *ret_str_value = strdup(mode.get());
    BAIL_NULL(*ret_str_value);
    return 0;
}

int md_get_db_bridge_submode(const mdb_db *db, char **ret_str_value)
{
    BAIL_NULL(ret_str_value);
    *ret_str_value = nullptr;
    BAIL_NULL(db);

    owned_text submode;
    owned_binding binding;
    BAIL_ERROR(read_text(db, submode_node, binding, submode));
    *ret_str_value = strdup(submode.get() != nullptr ? submode.get() : default_submode);
    BAIL_NULL(*ret_str_value);
    return 0;
}

tbool md_is_db_system_bridge_mode(const mdb_db *db)
{
    return mode_begins_with(__func__, db, "bridge");
}

tbool md_is_db_system_router_mode(const mdb_db *db)
{
    return mode_begins_with(__func__, db, "router");
}

tbool md_is_db_system_server_mode(const mdb_db *db)
{
    return mode_begins_with(__func__, db, "server");
}

tbool md_is_db_system_inline_router_mode(const mdb_db *db)
{
    return md_is_db_system_router_mode(db) && flag_is_set(__func__, db, routing_inline_node);
}

int md_get_number_router_mode_interfaces(const mdb_db *db, int *num_routers)
{
    BAIL_NULL(db);
    BAIL_NULL(num_routers);

    owned_tstr_array interfaces;
    BAIL_ERROR(mdb_get_tstr_array(nullptr, db, router_interfaces_node, 0, 0, 0, interfaces.out()));
    BAIL_NULL(interfaces.get());
    *num_routers = tstr_array_length_quick(interfaces.get());
    return 0;
}

tbool md_is_10g_enabled(const mdb_db *db)
{
    return flag_is_set(__func__, db, ports_10g_node);
}

tbool md_is_bonding_enabled(const mdb_db *db)
{
    return flag_is_set(__func__, db, bonding_node);
}
