/*
 * Questions about the system mode and the hardware options of the appliance, the tunnel IDs, and
 * who uses an application.
 */
#ifndef ORVALE_MD_TUNNELD_TUNNEL_COMMON_H
#define ORVALE_MD_TUNNELD_TUNNEL_COMMON_H

#include "framework/md_commit.h"
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
 * a freed one only when more than 60 seconds have passed by the host's time since boot; one freed
 * at time 0 counts as never used. Names are compared byte for byte.
 *
 * Order of calls: md_init_tunnel_id once; then for each commit md_get_next_n_available_tunnel_ids
 * for its new tunnels, md_set_tunnel_id for each, and md_free_tunnel_id for each removed one.
 */

/*
 * Makes all IDs free and never used.
 * Returns 0; 14001 when there is no memory for the records. That the sequence of names could not be
 * made is no failure of this call, and is logged unless its code is 14120: there are then no IDs by
 * name order, the number of IDs in use reads 0, and binding an ID fails.
 */
OV_NODISCARD OV_API int md_init_tunnel_id(void);

/*
 * Offers free IDs. Nothing is taken: asking again offers the same ones until md_set_tunnel_id takes
 * them. Refused when fewer than 20 IDs would stay unused; with a bound below 20 there is no such
 * margin.
 *
 * num_tunnels  how many
 * tun_ids      receives the IDs at its end, and must be empty; null: nothing is offered
 * Returns 0 when exactly so many were offered, and when none were asked for or tun_ids is null; 1
 * otherwise: too few IDs are unused, the next one was freed 60000 ms ago or less, or tun_ids was
 * not empty or could not take them. IDs appended before a failure stay there.
 */
OV_NODISCARD OV_API int md_get_next_n_available_tunnel_ids(uint32 num_tunnels,
                                                           uint32_array *tun_ids);

/*
 * Binds an ID to a tunnel's name, taking it from the free ones; an ID in use is bound to the new
 * name instead. The name "default" is not bound, and that is no error, before md_init_tunnel_id
 * either. Neither the 60 seconds nor a second ID of the same name are checked.
 *
 * tun_name  copied
 * Returns 0; 14001 when tun_name is null or before md_init_tunnel_id; 14002 for an ID past the
 * bound; the code of ts_dup or of the sequence of names. A code of these last leaves the work half
 * done: the old name could not be taken out of the sequence, and the ID is without a name, not
 * among the free ones, and still in the sequence; or the name could not be copied, and it is in
 * neither; or it could not be put in the sequence, and the ID is bound but has no place in the
 * order of names and is not counted.
 */
OV_NODISCARD OV_API int md_set_tunnel_id(uint32 id, const tstring *tun_name);

/*
 * Frees a tunnel's ID and holds it back for 60 seconds.
 * Returns 0; 14001 when tun_name is null or before md_init_tunnel_id; 14004 when no ID has the
 * name; the code of the sequence of names, which does not keep the ID from being freed. That code
 * may be 14004, too, when the ID had no place in the sequence.
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
 * The ID of a name for callers that walk the tunnels in the order of their names: the search begins
 * where the last one that found its name has found it, and goes around once. Where several IDs
 * share a name, the first that is met counts.
 *
 * ret_tun_id  receives 65535 on failure
 * Returns 0; 14004 when there is none; 14001 when ret_tun_id is null or before md_init_tunnel_id;
 * 14002 when the sequence of names holds an ID past the bound.
 */
OV_NODISCARD OV_API int md_get_tunnel_id_sorted(tstring *tunname, uint32 *ret_tun_id);

/*
 * The name at a position of the order of names, counted from 0.
 *
 * tun_name  receives the text, borrowed until its ID is bound anew or freed; null for an ID that an
 *           earlier failure has left in the sequence without its name; left alone on failure
 * Returns 0; 14004 for a position past the end, before md_init_tunnel_id for every one; 14001 when
 * tun_name is null.
 */
OV_NODISCARD OV_API int md_get_tunnel_name_str_sorted(uint32 idx, const char **tun_name);

/* The number of IDs in use, by the sequence of their names; 0 before md_init_tunnel_id. */
OV_API int md_get_total_tunnels(void);

/*
 * Orders two IDs by the names bound to them, for a sorted array of IDs. IDs past the bound stand
 * before all others, and a null pointer before those.
 *
 * id1, id2  pointers to uint32
 * Returns a negative number, 0 or a positive one.
 */
OV_API int tunnel_sorted_seq_compare(const void *id1, const void *id2);

/*
 * Who uses an application. Names are compared byte for byte. Of maps, the entries' node
 * "match/0/application" is looked at, not their match strings.
 */

/*
 * Whether an entry of an ACL is about an application. A null name finds nothing.
 *
 * found   may be null; left alone on failure
 * bnames  receives the full names of the nodes that name it at its end; null: the search ends at
 *         the first. Names appended before a failure stay there.
 * Returns 0; 14001 when db is null; the code of a query or of bnames.
 */
OV_NODISCARD OV_API int md_find_app_name_in_acl(const char *appName, const mdb_db *db, tbool *found,
                                                tstr_array *bnames);

/*
 * The same for the entries of the maps under a root.
 *
 * mapNamePrefix  the root, such as "/ov/tunneld/route_map/config/map"; null is 14001
 */
OV_NODISCARD OV_API int md_find_app_name_in_xxxmap(const char *appName, const mdb_db *db,
                                                   const char *mapNamePrefix, tbool *found,
                                                   tstr_array *bnames);

/*
 * Whether an ACL, a route map, an optimisation map or a QoS map uses an application; maps of other
 * kinds are not searched.
 *
 * existsInString  may be null; receives a new text for the user that tells the first of these that
 *                 does, which the caller releases with free(), or null when there is none
 * bnames          may be null; receives a new array of the full names of all nodes that name it,
 *                 which the caller releases with tstr_array_free
 * Both receive null on failure.
 * Returns 0; 14001 when db is null or memory has run out; the code of a query or array.
 */
OV_NODISCARD OV_API int md_find_appname_in_acl_or_xxxmap(const char *appName, const mdb_db *db,
                                                         char **existsInString,
                                                         tstr_array **bnames);

/*
 * The number of application rules, "/ov/tunneld/app/config/RULE/name", that carry a name.
 *
 * num_rules  receives the number, 0 on failure; left alone when an argument is null
 * Returns 0; 14001 when an argument is null or a rule has no name; the code of a query.
 */
OV_NODISCARD OV_API int md_get_app_num_rules(const mdb_db *db, const char *app_name,
                                             int *num_rules);

/*
 * The names that application rules carry, each once, at the place of its last rule.
 *
 * names  receives a new array, which the caller releases with tstr_array_free; left alone when
 *        there are no rules and on failure
 * Returns 0; 14001 when an argument is null or a rule has no name; the code of a query or array.
 */
OV_NODISCARD OV_API int md_get_custom_app_names(const mdb_db *db, tstr_array **names);

/*
 * Who uses an interface. A usage is the full name of the node that names it.
 */

/*
 * The usages of an interface by WCCP service groups ("/ov/wccpd/wccp/srv_grp/config/X/interface")
 * and then by VRRP entries ("/ov/redd/net/interface/vrrp/config/X"), both in the database's order.
 * Names are compared as ts_equal_str does it.
 *
 * usages  receives a new array, empty when there are none, which the caller releases with
 *         tstr_array_free; null on failure
 * Returns 0; 14001 when an argument is null or memory has run out; the code of a query or array.
 */
OV_NODISCARD OV_API int md_interface_usage_check(const mdb_db *db, char *ifname,
                                                 tstr_array **usages);

/*
 * What a usage is called for the user: "router interface", "wccp group NAME" or "vrrp interface".
 *
 * usertext  receives a new string, which the caller releases with ts_free; null when the name is no
 *           usage (not an error), and on failure
 * Returns 0; 14001 when an argument is null; the code of bn_binding_name_to_parts or
 * ts_new_sprintf.
 */
OV_NODISCARD OV_API int md_interface_usage_to_usertext(const char *usage, tstring **usertext);

/*
 * Both in one: what the usages of an interface are called, in their order.
 *
 * usertexts  receives a new array, empty when there are none, which the caller releases with
 *            tstr_array_free; null on failure
 * Returns as these two.
 */
OV_NODISCARD OV_API int md_interface_usage_check_usertext(const mdb_db *db, char *ifname,
                                                          tstr_array **usertexts);

/*
 * The names of the VLAN interfaces, children of "/ov/tunneld/net/interface/tunnel/vlan/config".
 *
 * ifnames  receives a new array, which the caller releases with tstr_array_free; null when the
 *          database has no list of them to give (not an error), and on failure
 * Returns 0; 14001 when an argument or a name is null; the code of a query or array.
 */
OV_NODISCARD OV_API int md_get_vlan_interfaces(const mdb_db *db, tstr_array **ifnames);

/*
 * Sets an interface's flag "/net/interface/config/NAME/enable". One that has no node
 * "/net/interface/config/NAME" is left alone; both names are cut at 255 characters.
 *
 * Returns 0; 14001 when a pointer is null; the code of the query or write.
 */
OV_NODISCARD OV_API int md_set_if_enable(mdb_db *db, const char *ifname, tbool is_enabled);

/*
 * Removes the next hops of all route prefixes
 * ("/ov/tunneld/net/routes/config/ipv4/prefix/X/nhop/Y") that lie in the subnet of an address, and
 * the prefixes that are left with none by it.
 *
 * A prefix's name is escaped for the node's name without a terminating NUL: one that is shorter
 * than another before it ends in what that one has left, and is then not found. Node names are cut
 * at 199 (of a prefix's next hops) and 255 characters.
 *
 * commit     may be null
 * ipa        an IPv4 address
 * masklen    length of the subnet's prefix in bits; mgmt_is_same_subnet_using_masklen says what 0
 *            and more than 32 mean
 * ret_count  may be null; receives the number of next hops removed, 0 on failure
 * Returns 0; 14001 when db, ipa or a name is null; 14002 for a prefix whose escaped name has more
 * than 255 characters; the code of a query or write. What was removed before a failure stays so.
 */
OV_NODISCARD OV_API int md_tunneld_delete_dproutes(md_commit *commit, mdb_db *db, const char *ipa,
                                                   uint8 masklen, uint32 *ret_count);

/*
 * Appends a line to the file of the alarms of software upgrades,
 * "/var/opt/tms/output/upgrade_alarms.txt", which is created when it is not there. Whether the line
 * got there is not known: an error in writing shows nowhere.
 *
 * Returns 0; 14001 when alarm_str is null; 14010 when the file cannot be opened.
 */
OV_NODISCARD OV_API int md_tunneld_write_sw_upgrade_alarm(const char *alarm_str);

OV_C_END

#endif
