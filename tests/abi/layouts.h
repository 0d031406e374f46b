/*
 * The widths, offsets and values that the library and its host have to agree on. Included by a C
 * and by a C++ file: a difference does not compile.
 */
#ifndef TESTS_ABI_LAYOUTS_H
#define TESTS_ABI_LAYOUTS_H

#include "framework/appliance.h"
#include "framework/bnode.h"
#include "framework/errors.h"
#include "framework/logging.h"
#include "framework/md_commit.h"
#include "framework/mdb_db.h"
#include "framework/sys_time.h"
#include "framework/tstr_array.h"
#include "framework/typed_arrays.h"
#include "orvale/md_db_default.h"
#include "orvale/md_tunbin_ht.h"
#include "orvale/md_tunneld_defs.h"
#include "orvale/md_utils.h"
#include "orvale/md_xmap_common.h"
#include "orvale/opkt_proto.h"
#include "orvale/ov_xmap.h"

#include <assert.h>
#include <stdalign.h>

#define SIZE_IS(type, size) static_assert(sizeof(type) == (size), #type " is " #size " bytes wide")
#define OFFSET_IS(type, member, offset)                                                            \
    static_assert(offsetof(type, member) == (offset), #type "." #member " is at " #offset)
#define VALUE_IS(name, value) static_assert((name) == (value), #name " is " #value)

SIZE_IS(uint8, 1);
SIZE_IS(uint16, 2);
SIZE_IS(uint32, 4);
SIZE_IS(uint64, 8);
SIZE_IS(int32, 4);
SIZE_IS(tbool, 1);
SIZE_IS(bn_type, 4);

SIZE_IS(lc_enum_string_map, 16);
OFFSET_IS(lc_enum_string_map, lesm_enum, 0);
OFFSET_IS(lc_enum_string_map, lesm_string, 8);

SIZE_IS(md_dbinfo, 24);
OFFSET_IS(md_dbinfo, commit, 0);
OFFSET_IS(md_dbinfo, olddb, 8);
OFFSET_IS(md_dbinfo, newdb, 16);

SIZE_IS(mdb_db_change, 40);
OFFSET_IS(mdb_db_change, mdc_name, 0);
OFFSET_IS(mdb_db_change, mdc_name_parts, 8);
OFFSET_IS(mdb_db_change, mdc_change_type, 16);
OFFSET_IS(mdb_db_change, mdc_no_notify, 20);
OFFSET_IS(mdb_db_change, mdc_old_attribs, 24);
OFFSET_IS(mdb_db_change, mdc_new_attribs, 32);

SIZE_IS(array_options, 24);
SIZE_IS(tstr_array_options, 24);
OFFSET_IS(array_options, ao_elem_compare_func, 0);
OFFSET_IS(array_options, ao_elem_assign_func, 8);
OFFSET_IS(array_options, ao_dup_policy, 16);

OFFSET_IS(time_info, time_since_boot_ms, 0);

OFFSET_IS(ov_system_info_t, initialized, 0);
OFFSET_IS(ov_system_info_t, system_max_interfaces, 4);

SIZE_IS(bn_str_value, 24);
OFFSET_IS(bn_str_value, bv_name, 0);
OFFSET_IS(bn_str_value, bv_type, 8);
OFFSET_IS(bn_str_value, bv_value, 16);

SIZE_IS(tunnel_config_bin_t, 328);
OFFSET_IS(tunnel_config_bin_t, tp_tunnel_name, 0);
OFFSET_IS(tunnel_config_bin_t, tp_tunnel_alias, 65);
OFFSET_IS(tunnel_config_bin_t, tp_tunnel_id, 324);

SIZE_IS(okv_key, 16);
SIZE_IS(okv_assoc_entry, 32);
SIZE_IS(okv_assoc_entry_type, 32);
VALUE_IS(alignof(okv_assoc_entry), 16);
OFFSET_IS(okv_assoc_entry, key, 0);
OFFSET_IS(okv_assoc_entry, value, 16);
OFFSET_IS(okv_assoc_entry, count, 20);
SIZE_IS(tunname_assoc, 2097152);
SIZE_IS(tunalias_assoc, 2097152);

VALUE_IS(sizeof lc_error_code_map / sizeof lc_error_code_map[0], 40);
VALUE_IS(sizeof bn_type_map / sizeof bn_type_map[0], 45);

SIZE_IS(opkt_proto_map, 4112);
VALUE_IS(sizeof opkt_proto_map / sizeof opkt_proto_map[0], 257);

VALUE_IS(ba_value, 1);
VALUE_IS(bt_uint32, 5);
VALUE_IS(bt_bool, 9);
VALUE_IS(bt_string, 101);
VALUE_IS(bt_name, 121);
VALUE_IS(bsso_create, 1);
VALUE_IS(bsso_delete, 2);
VALUE_IS(bsso_modify, 4);
VALUE_IS(mdqf_sel_class_no_state, 512);
VALUE_IS(mdqf_sel_iterate_subtree, 4096);
VALUE_IS(adp_add, 0);
VALUE_IS(adp_delete_new, 1);
VALUE_IS(adp_delete_old, 2);
VALUE_IS(mdct_add, 1);
VALUE_IS(mdct_modify, 2);
VALUE_IS(mdct_delete, 3);
VALUE_IS(lc_err_generic_error, 14000);
VALUE_IS(lc_err_unexpected_null, 14001);
VALUE_IS(lc_err_assertion_failed, 14002);
VALUE_IS(lc_err_not_found, 14004);
VALUE_IS(lc_err_exists, 14005);
VALUE_IS(lc_err_bad_path, 14009);
VALUE_IS(lc_err_bad_file, 14010);
VALUE_IS(lc_err_parse_error, 14012);
VALUE_IS(lc_err_file_not_found, 14013);
VALUE_IS(lc_err_io_error, 14014);
VALUE_IS(lc_err_bad_type, 14020);
VALUE_IS(lc_err_cancelled, 14120);
VALUE_IS(OKV_ASSOC_SIZE, 65536);
VALUE_IS(OKV_INVALID_VALUE, 65535);
VALUE_IS(TUNBIN_HT_COLLISION, 65534);
VALUE_IS(MD_TUNBIN_HT_SIZE, 10022);
VALUE_IS(TUNNEL_ID_NONE, 65535);
VALUE_IS(TUNNEL_ID_RESERVE, 20);
VALUE_IS(TUNNEL_ID_QUARANTINE_MS, 60000);
VALUE_IS(ov_log_error, 3);
VALUE_IS(ov_log_warning, 4);
VALUE_IS(ov_log_notice, 5);
VALUE_IS(ov_log_info, 6);
VALUE_IS(ov_log_debug, 7);
VALUE_IS(lc_log_flags_default, 2048);
VALUE_IS(ov_log_module_ovmd, 8);
VALUE_IS(MAP_TYPE_R, 0);
VALUE_IS(MAP_TYPE_O, 1);
VALUE_IS(MAP_TYPE_Q, 2);
VALUE_IS(MAP_TYPE_S, 3);
VALUE_IS(MAP_TYPE_N, 4);
VALUE_IS(MAP_TYPE_SEC, 5);
VALUE_IS(MAP_TYPE_RTMAP, 6);
VALUE_IS(MAP_TYPE_DNS_PROXY, 7);
VALUE_IS(MD_XMAP_REFUSED, 80000);
VALUE_IS(MD_IFMGR_IFINDEX_BUDGET, 128);
VALUE_IS(MD_XMAP_MATCHSTR_SIZE, 1024);

#endif
