/*
 * Questions about the system mode and the hardware options of the appliance.
 */
#ifndef ORVALE_MD_TUNNELD_TUNNEL_COMMON_H
#define ORVALE_MD_TUNNELD_TUNNEL_COMMON_H

#include "framework/mdb_db.h"
#include "orvale/ov_api.h"

OV_C_BEGIN

/*
 * The deployment mode, "/ov/tunneld/system/config/mode" ("bridge", "router" or "server"; which
 * other texts are valid is the host's to say).
 *
 * db             read only
 * ret_str_value  receives a new text, which the caller releases with free(), or null when the node
 *                is absent; null on failure
 * Returns 0; 14001 when an argument is null, the node holds no text, or memory has run out; a
 * query's code.
 */
OV_NODISCARD OV_API int md_get_db_system_mode(const mdb_db *db, char **ret_str_value);

/*
 * The bridge sub-mode, "/ov/tunneld/system/config/submode".
 *
 * ret_str_value  receives a new text, which the caller releases with free(): "normal" when the node
 *                is absent or holds no text; null on failure
 * Returns 0; 14001 when an argument is null or memory has run out; a query's code.
 */
OV_NODISCARD OV_API int md_get_db_bridge_submode(const mdb_db *db, char **ret_str_value);

/*
 * Whether the appliance runs in bridge, router or server mode. Only the first six characters of the
 * mode are compared, with regard to case: "routers" is router mode. False when there is no mode.
 */
OV_API tbool md_is_db_system_bridge_mode(const mdb_db *db);
OV_API tbool md_is_db_system_router_mode(const mdb_db *db);
OV_API tbool md_is_db_system_server_mode(const mdb_db *db);

/* Whether it runs in router mode with "/ov/tunneld/system/config/routing_inline" true. */
OV_API tbool md_is_db_system_inline_router_mode(const mdb_db *db);

/*
 * The number of router-mode interfaces: the children of "/ov/tunneld/system/config/mode/router".
 *
 * num_routers  receives the number; left alone on failure
 * Returns 0; 14001 when an argument or the child list is null; a query's code.
 */
OV_NODISCARD OV_API int md_get_number_router_mode_interfaces(const mdb_db *db, int *num_routers);

/* Whether 10-gigabit ports are enabled: "/ov/tunneld/system/config/10g". False when absent. */
OV_API tbool md_is_10g_enabled(const mdb_db *db);

/* Whether interface bonding is enabled: "/ov/tunneld/system/config/bonding". False when absent. */
OV_API tbool md_is_bonding_enabled(const mdb_db *db);

OV_C_END

#endif
