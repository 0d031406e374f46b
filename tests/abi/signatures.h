/*
 * Every host operation and every exported function once more, with the types that hosts have been
 * built with. Included by a C and by a C++ file: a declaration that differs from the headers' does
 * not compile.
 */
#ifndef TESTS_ABI_SIGNATURES_H
#define TESTS_ABI_SIGNATURES_H

#include "framework/addresses.h"
#include "framework/appliance.h"
#include "framework/bail.h"
#include "framework/files.h"
#include "framework/md_commit.h"
#include "framework/sys_time.h"
#include "orvale/md_db_default.h"
#include "orvale/md_dyna_limits.h"
#include "orvale/md_event_common.h"
#include "orvale/md_tunbin_ht.h"
#include "orvale/md_tunneld_tunnel_common.h"
#include "orvale/md_utils.h"
#include "orvale/md_xmap_common.h"

OV_C_BEGIN

int mdb_get_node_value_tstr(md_commit *, const mdb_db *, const char *name, uint32 options,
                            void *further, tstring **ret);
int mdb_get_node_binding(md_commit *, const mdb_db *, const char *name, uint32 options,
                         bn_binding **ret);
int mdb_get_tstr_array(md_commit *, const mdb_db *, const char *parent, uint32, uint32, uint32,
                       tstr_array **ret);
int mdb_get_matching_tstr_array(md_commit *, const mdb_db *, const char *pattern, uint32 options,
                                tstr_array **ret);
int mdb_set_node_str(md_commit *, mdb_db *, int op, uint32 flags, bn_type, const char *value,
                     const char *name_format, ...);
int mdb_set_node_binding(md_commit *, mdb_db *, int op, uint32 flags, const bn_binding *);
int32 mdb_db_change_array_length_quick(const mdb_db_change_array *);
mdb_db_change *mdb_db_change_array_get_quick(const mdb_db_change_array *, uint32 index);
int bn_binding_new_str(bn_binding **ret, const char *name, uint32 attrib_id, bn_type, uint32 flags,
                       const char *value);
int bn_binding_new_named(bn_binding **ret, const char *name);
void bn_binding_free(bn_binding **);
int bn_binding_get_str(const bn_binding *, uint32 attrib_id, bn_type, uint32 flags, char **ret);
int bn_binding_get_uint32(const bn_binding *, uint32 attrib_id, uint32 flags, uint32 *ret);
int bn_binding_get_tbool(const bn_binding *, uint32 attrib_id, uint32 flags, tbool *ret);
int bn_binding_name_to_parts(const char *name, tstr_array **ret, tbool flag);
tbool bn_binding_name_pattern_match(const char *name, const char *pattern);
tbool bn_binding_name_parts_pattern_match(const tstr_array *parts, tbool flag, const char *pattern);
int bn_attrib_array_get_attrib_tstr(const bn_attrib_array *, uint32 attrib_id, tstring **ret);
int bn_event_request_msg_create(bn_request **ret, const char *event_name);
int bn_event_request_msg_append_new_binding(bn_request *, uint32 flags, const char *name, bn_type,
                                            const char *value, uint32 *ret_index);
int bn_request_msg_send(gcl_session *, bn_request *);
void bn_request_msg_free(bn_request **);
int md_commit_set_return_status_msg(md_commit *, int code, const char *text);
int md_commit_set_return_status_msg_fmt(md_commit *, int code, const char *format, ...);
int md_gcl_find_session(const char *peer_name, gcl_session **ret);
int ts_new_str(tstring **ret, const char *);
int ts_new_sprintf(tstring **ret, const char *format, ...);
void ts_free(tstring **);
int ts_dup(const tstring *, tstring **ret);
const char *ts_str_(const tstring *);
int32 ts_length_(const tstring *);
int32 ts_num_chars(const tstring *);
tbool ts_equal(const tstring *, const tstring *);
tbool ts_equal_str(const tstring *, const char *, tbool flag);
int ts_cmp(const tstring *, const tstring *);
int ts_cmp_str(const tstring *, const char *, tbool flag);
int array_options_get_defaults(array_options *);
int array_std_assign_func(void *, const void *);
int tstr_array_new(tstr_array **ret, const array_options *);
void tstr_array_free(tstr_array **);
int32 tstr_array_length_quick(const tstr_array *);
const char *tstr_array_get_str_quick(const tstr_array *, uint32 index);
int tstr_array_append_str(tstr_array *, const char *);
int tstr_array_append_takeover(tstr_array *, tstring **);
int tstr_array_remove(tstr_array *, uint32 index, tstring **ret);
int tstr_array_duplicate(const tstr_array *, tstr_array **ret);
int uint32_array_new_full(uint32_array **ret, const array_options *);
void uint32_array_free(uint32_array **);
int uint32_array_append(uint32_array *, uint32);
int uint32_array_insert_sorted(uint32_array *, uint32);
int uint32_array_delete_by_value(uint32_array *, uint32);
uint32 uint32_array_get_quick(const uint32_array *, uint32 index);
int32 uint32_array_length_quick(const uint32_array *);
char *smprintf(const char *format, ...);
const char *lc_enum_to_string_quiet_null(const lc_enum_string_map *, uint32 code);
int lc_string_to_enum(const lc_enum_string_map *, const char *text, uint32 *ret);
int lc_mask_or_masklen_to_masklen_str(const char *mask_or_length, char **ret);
tbool mgmt_is_same_subnet_using_masklen(const char *addr1, const char *addr2, uint8 masklen1,
                                        uint8 masklen2);
int lf_test_exists(const char *path, tbool *ret);
int lf_read_file_lines(const char *path, tstr_array **ret);
tbool conf_file_okay(const char *path);
int lc_log_internal(const char *function, const char *unit, int line, uint32 flags, uint32 zero,
                    int level, const char *format, ...);
tbool lc_log_check_level(int level);
void ov_log_internal(int level, const char *function, int zero, const char *format, ...);
void bail_debug(void);
void bail_quiet_debug(void);
uint64 sys_time_since_boot_ms(void);
void ctime_init(void);
int init_model_info(const mdb_db *);
const char *get_config_name(void);
uint32 get_max_tunnel_number(void);
int ovif_get_ifcount(void);
int ovif_network_init_sockets(void);
int ov_acl_validate_matchstr(const char *, tstr_array **keys, tstr_array **values, char **reason);
int ovlan_valid_name_check(const char *);
uint32 get_max_rmap_entries(void);
uint32 get_max_omap_entries(void);
uint32 get_max_qmap_entries(void);
uint32 get_max_smap_entries(void);
uint32 get_max_nmap_entries(void);
uint32 get_max_dns_proxy_map_entries(void);
extern int G_log_level;
extern signed char G_daemon_log_level;
extern unsigned char ov_log_module_levels[];
extern time_info *time_info_ptr;
extern ov_system_info_t ov_system_info;
extern int g_ovif_skfd;

int md_get_db_system_mode(const mdb_db *, char **);
int md_get_db_bridge_submode(const mdb_db *, char **);
tbool md_is_db_system_bridge_mode(const mdb_db *);
tbool md_is_db_system_router_mode(const mdb_db *);
tbool md_is_db_system_server_mode(const mdb_db *);
tbool md_is_db_system_inline_router_mode(const mdb_db *);
int md_get_number_router_mode_interfaces(const mdb_db *, int *);
tbool md_is_10g_enabled(const mdb_db *);
tbool md_is_bonding_enabled(const mdb_db *);
int md_find_app_name_in_acl(const char *appName, const mdb_db *, tbool *found, tstr_array *bnames);
int md_find_app_name_in_xxxmap(const char *appName, const mdb_db *, const char *mapNamePrefix,
                               tbool *found, tstr_array *bnames);
int md_find_appname_in_acl_or_xxxmap(const char *appName, const mdb_db *, char **existsInString,
                                     tstr_array **bnames);
int md_get_app_num_rules(const mdb_db *, const char *app_name, int *num_rules);
int md_get_custom_app_names(const mdb_db *, tstr_array **names);
int md_interface_usage_check(const mdb_db *, char *ifname, tstr_array **usages);
int md_interface_usage_to_usertext(const char *usage, tstring **usertext);
int md_interface_usage_check_usertext(const mdb_db *, char *ifname, tstr_array **usertexts);
int md_get_vlan_interfaces(const mdb_db *, tstr_array **ifnames);
int md_set_if_enable(mdb_db *, const char *ifname, tbool is_enabled);
int md_tunneld_delete_dproutes(md_commit *, mdb_db *, const char *ipa, uint8 masklen,
                               uint32 *ret_count);
int md_tunneld_write_sw_upgrade_alarm(const char *alarm_str);
int md_delete_children(md_commit *, const mdb_db *, const char *parent, int *num);
tbool md_ifmgr_can_interface_be_added(mdb_db_change_array *, const char *bpattern, int multiplier);
void md_ifmgr_ifcount_inc(int);
void md_ifmgr_ifcount_dec(int);
int md_ifmgr_get_ifcount(void);
int md_validate_proto(md_dbinfo *, const char *proto, tbool *found);
int md_acl_ref_processing(mdb_db_change *, md_dbinfo *, int mtype);
int md_acl_not_used_in_map(mdb_db_change *, md_dbinfo *, int mtype);
int md_xmap_check_match_exists_for_set(mdb_db_change *, md_dbinfo *, int mtype);
int md_xmap_common_change_check(mdb_db_change *, md_dbinfo *, int mtype, tbool *to_bail);
int md_xmap_validate_match_str(md_dbinfo *, const char *mstr, tbool *ret_valid);
int md_xmap_vlan_check(const mdb_db *, const char *vlan);
tbool md_xmap_iflabel_check(const char *iflabel, const mdb_db *);
int md_xmap_concat_key_value(char *buf, size_t buflen, const char *key, const char *value);
int md_xmap_add_ipver(mdb_db *inout_new_db, const char *pattern);
int md_xmap_delete_match_binding(mdb_db *, const char *bname);
int md_xmap_delete_match_entries(mdb_db *, int mtype, const char *match_root);
int md_xmap_upgrade_to_pattern_match(mdb_db *new_db, const mdb_db *db, int mtype);
int md_preferred_if_is_used_in_rmap(mdb_db_change *, md_dbinfo *, tbool *ret_found);
int md_vlan_is_used_in_rmap(mdb_db_change *, md_dbinfo *);
int db_default_get_all(bn_str_value **, uint32 *, bn_str_value **, uint32 *);
int db_model_def_get_all(bn_str_value **, uint32 *, bn_str_value **, uint32 *);
int db_preserved_get_all(bn_str_value **, uint32 *, bn_str_value **, uint32 *,
                         tbool renameWhenDone);
int db_default_set_all(bn_str_value *, uint32 *);
int bn_str_value_free(bn_str_value **, uint32);
int write_dyna_limits_conf(const mdb_db *);
int md_init_tunnel_id(void);
int md_get_next_n_available_tunnel_ids(uint32, uint32_array *);
int md_set_tunnel_id(uint32 id, const tstring *);
int md_free_tunnel_id(const tstring *);
int md_get_tunnel_id(const tstring *, uint32 *);
int md_get_tunnel_id_sorted(tstring *, uint32 *);
int md_get_tunnel_name_str_sorted(uint32, const char **);
int md_get_total_tunnels(void);
int tunnel_sorted_seq_compare(const void *, const void *);
int md_tunbin_ht_init(void);
int md_tunbin_ht_add(const void *);
int md_tunbin_ht_del(const void *);
tbool md_tunbin_ht_id_has_tunnel(uint32);
const char *md_tunbin_ht_get_name_by_id(uint32);
uint32 md_tunbin_ht_get_id_by_name(const char *);
uint32 md_tunbin_ht_get_id_by_alias(const char *);
void md_tunbin_ht_dump(void);
int tunbin_tunname_ht_init(void);
void tunbin_tunname_ht_add(char *, uint32);
void tunbin_tunname_ht_del(char *);
int tunbin_tunname_ht_find(const char *, uint32 *);
uint32 tunbin_tunname_ht_dump(void);
int tunbin_tunalias_ht_init(void);
void tunbin_tunalias_ht_add(char *, uint32);
void tunbin_tunalias_ht_del(char *);
int tunbin_tunalias_ht_find(const char *, uint32 *);
uint32 tunbin_tunalias_ht_dump(void);
extern okv_assoc_entry tunname_assoc[65536];
extern okv_assoc_entry tunalias_assoc[65536];
void md_send_dbc_event(const char *, const char *, const char *);
void md_send_dbc_event2(const char *, const char *, const char *, const char *);

OV_C_END

#endif
