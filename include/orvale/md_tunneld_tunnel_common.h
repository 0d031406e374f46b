/*
 * Questions about the system mode and the hardware options of the appliance, and the tunnel IDs.
 */
#ifndef ORVALE_MD_TUNNELD_TUNNEL_COMMON_H
#define ORVALE_MD_TUNNELD_TUNNEL_COMMON_H

#include "framework/mdb_db.h"
#include "framework/typed_arrays.h"
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

/*
 * The tunnel ID allocator.
 *
 * IDs run from 0 to get_max_tunnel_number() - 1, a bound that must not change for the life of the
 * process and must stay below 65536. An ID is in use while a tunnel's name is bound to it. Free IDs
 * are offered in the order in which they became free, never-used ones first in ascending order, and
 * a freed one only after 60 seconds. Names are compared byte for byte.
 *
 * Order of calls: md_init_tunnel_id once; then for each commit md_get_next_n_available_tunnel_ids
 * for its new tunnels, md_set_tunnel_id for each, and md_free_tunnel_id for each removed one.
 */

/*
 * Makes all IDs free and never used.
 * Returns 0; 14001 when there is no memory for the records. That the sequence of names could not be
 * made is logged only: there are then no IDs by name order, and binding an ID fails.
 */
OV_NODISCARD OV_API int md_init_tunnel_id(void);

/*
 * Offers free IDs. Nothing is taken: asking again offers the same ones until md_set_tunnel_id takes
 * them. The last 20 IDs of the space are never offered.
 *
 * num_tunnels  how many
 * tun_ids      receives the IDs at its end, and must be empty; null: nothing is offered
 * Returns 0 when exactly so many were offered, or when there was nothing to offer; 1 otherwise: not
 * enough spare IDs, the next one was freed 60000 ms ago or less, or tun_ids could not take them.
 * IDs appended before a failure stay there.
 */
OV_NODISCARD OV_API int md_get_next_n_available_tunnel_ids(uint32 num_tunnels,
                                                           uint32_array *tun_ids);

/*
 * Binds an ID to a tunnel's name, taking it from the free ones; an ID in use is bound to the new
 * name instead. The name "default" is not bound, and that is no error. Neither the 60 seconds nor a
 * second ID of the same name are checked.
 *
 * tun_name  copied
 * Returns 0; 14001 when tun_name is null or before md_init_tunnel_id; 14002 for an ID past the
 * bound; the code of ts_dup or of the array of names. After such a code the ID may be without its
 * old name and not among the free ones.
 */
OV_NODISCARD OV_API int md_set_tunnel_id(uint32 id, const tstring *tun_name);

/*
 * Frees a tunnel's ID and holds it back for 60 seconds.
 * Returns 0; 14001 when tun_name is null or before md_init_tunnel_id; 14004 when no ID has the
 * name; the code of the array of names, which does not keep the ID from being freed.
 */
OV_NODISCARD OV_API int md_free_tunnel_id(const tstring *tun_name);

/*
 * The lowest ID that is bound to a name.
 *
 * id  left alone on failure
 * Returns 0; 14004 when there is none; 14001 when an argument is null or before md_init_tunnel_id.
 */
OV_NODISCARD OV_API int md_get_tunnel_id(const tstring *tun_name, uint32 *id);

/*
 * The same for callers that walk the tunnels in the order of their names: the search goes on where
 * the last one ended.
 *
 * ret_tun_id  receives 65535 on failure
 * Returns 0; 14004 when there is none; 14001 when ret_tun_id is null or before md_init_tunnel_id;
 * 14002 when the sequence of names holds an ID past the bound.
 */
OV_NODISCARD OV_API int md_get_tunnel_id_sorted(tstring *tunname, uint32 *ret_tun_id);

/*
 * The name at a position of the order of names, counted from 0.
 *
 * tun_name  receives the text, borrowed until its ID is bound anew or freed; left alone on failure
 * Returns 0; 14004 for a position past the end; 14001 when tun_name is null or before
 * md_init_tunnel_id.
 */
OV_NODISCARD OV_API int md_get_tunnel_name_str_sorted(uint32 idx, const char **tun_name);

/* The number of IDs in use; 0 before md_init_tunnel_id. */
OV_API int md_get_total_tunnels(void);

/*
 * Orders two IDs by the names bound to them, for a sorted array of IDs. IDs past the bound stand
 * before all others, and a null pointer before those.
 *
 * id1, id2  pointers to uint32
 * Returns a negative number, 0 or a positive one.
 */
OV_API int tunnel_sorted_seq_compare(const void *id1, const void *id2);

OV_C_END

#endif
