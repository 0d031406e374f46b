// The one list of the host operations that the library may call. The interposers, the fault loop
// and the list of names in tests/abi/ follow it: an operation more is a row more.
//
// fault_layer.h says what the kinds mean when an operation is made to fail.
#pragma once

#include "framework/addresses.h"
#include "framework/appliance.h"
#include "framework/bail.h"
#include "framework/bnode.h"
#include "framework/errors.h"
#include "framework/files.h"
#include "framework/logging.h"
#include "framework/md_commit.h"
#include "framework/mdb_db.h"
#include "framework/sys_time.h"
#include "framework/tstr_array.h"
#include "framework/tstring.h"
#include "framework/typed_arrays.h"

#include <cstddef>

namespace ovtest
{

enum class OperationKind {
    status,  // answers a code
    query,   // answers a code, and may succeed without handing anything out
    yes_no,  // answers false
    pointer, // answers null
    steady,  // cannot fail
};

// ROW(kind, name, number of parameters), and VARIADIC(kind, name) for those that take a format.
#define OVTEST_HOST_OPERATIONS(ROW, VARIADIC)                                                      \
    ROW(query, mdb_get_node_value_tstr, 6)                                                         \
    ROW(query, mdb_get_node_binding, 5)                                                            \
    ROW(query, mdb_get_tstr_array, 7)                                                              \
    ROW(query, mdb_get_matching_tstr_array, 5)                                                     \
    VARIADIC(status, mdb_set_node_str)                                                             \
    ROW(status, mdb_set_node_binding, 5)                                                           \
    ROW(steady, mdb_db_change_array_length_quick, 1)                                               \
    ROW(pointer, mdb_db_change_array_get_quick, 2)                                                 \
    ROW(query, bn_binding_new_str, 6)                                                              \
    ROW(query, bn_binding_new_named, 2)                                                            \
    ROW(steady, bn_binding_free, 1)                                                                \
    ROW(query, bn_binding_get_str, 5)                                                              \
    ROW(status, bn_binding_get_uint32, 4)                                                          \
    ROW(status, bn_binding_get_tbool, 4)                                                           \
    ROW(query, bn_binding_name_to_parts, 3)                                                        \
    ROW(yes_no, bn_binding_name_pattern_match, 2)                                                  \
    ROW(yes_no, bn_binding_name_parts_pattern_match, 3)                                            \
    ROW(query, bn_attrib_array_get_attrib_tstr, 3)                                                 \
    ROW(status, bn_event_request_msg_create, 2)                                                    \
    ROW(status, bn_event_request_msg_append_new_binding, 6)                                        \
    ROW(status, bn_request_msg_send, 2)                                                            \
    ROW(steady, bn_request_msg_free, 1)                                                            \
    ROW(status, md_commit_set_return_status_msg, 3)                                                \
    VARIADIC(status, md_commit_set_return_status_msg_fmt)                                          \
    ROW(query, md_gcl_find_session, 2)                                                             \
    ROW(status, ts_new_str, 2)                                                                     \
    VARIADIC(status, ts_new_sprintf)                                                               \
    ROW(steady, ts_free, 1)                                                                        \
    ROW(query, ts_dup, 2)                                                                          \
    ROW(steady, ts_str_, 1)                                                                        \
    ROW(steady, ts_length_, 1)                                                                     \
    ROW(steady, ts_num_chars, 1)                                                                   \
    ROW(steady, ts_equal, 2)                                                                       \
    ROW(steady, ts_equal_str, 3)                                                                   \
    ROW(steady, ts_cmp, 2)                                                                         \
    ROW(steady, ts_cmp_str, 3)                                                                     \
    ROW(status, array_options_get_defaults, 1)                                                     \
    ROW(status, array_std_assign_func, 2)                                                          \
    ROW(status, tstr_array_new, 2)                                                                 \
    ROW(steady, tstr_array_free, 1)                                                                \
    ROW(steady, tstr_array_length_quick, 1)                                                        \
    ROW(steady, tstr_array_get_str_quick, 2)                                                       \
    ROW(status, tstr_array_append_str, 2)                                                          \
    ROW(status, tstr_array_append_takeover, 2)                                                     \
    ROW(status, tstr_array_remove, 3)                                                              \
    ROW(query, tstr_array_duplicate, 2)                                                            \
    ROW(status, uint32_array_new_full, 2)                                                          \
    ROW(steady, uint32_array_free, 1)                                                              \
    ROW(status, uint32_array_append, 2)                                                            \
    ROW(status, uint32_array_insert_sorted, 2)                                                     \
    ROW(status, uint32_array_delete_by_value, 2)                                                   \
    ROW(steady, uint32_array_get_quick, 2)                                                         \
    ROW(steady, uint32_array_length_quick, 1)                                                      \
    VARIADIC(pointer, smprintf)                                                                    \
    ROW(pointer, lc_enum_to_string_quiet_null, 2)                                                  \
    ROW(status, lc_string_to_enum, 3)                                                              \
    ROW(query, lc_mask_or_masklen_to_masklen_str, 2)                                               \
    ROW(yes_no, mgmt_is_same_subnet_using_masklen, 4)                                              \
    ROW(status, lf_test_exists, 2)                                                                 \
    ROW(query, lf_read_file_lines, 2)                                                              \
    ROW(yes_no, conf_file_okay, 1)                                                                 \
    VARIADIC(steady, lc_log_internal)                                                              \
    ROW(yes_no, lc_log_check_level, 1)                                                             \
    VARIADIC(steady, ov_log_internal)                                                              \
    ROW(steady, bail_debug, 0)                                                                     \
    ROW(steady, bail_quiet_debug, 0)                                                               \
    ROW(steady, sys_time_since_boot_ms, 0)                                                         \
    ROW(steady, ctime_init, 0)                                                                     \
    ROW(status, init_model_info, 1)                                                                \
    ROW(pointer, get_config_name, 0)                                                               \
    ROW(steady, get_max_tunnel_number, 0)                                                          \
    ROW(steady, get_max_rmap_entries, 0)                                                           \
    ROW(steady, get_max_omap_entries, 0)                                                           \
    ROW(steady, get_max_qmap_entries, 0)                                                           \
    ROW(steady, get_max_smap_entries, 0)                                                           \
    ROW(steady, get_max_nmap_entries, 0)                                                           \
    ROW(steady, get_max_dns_proxy_map_entries, 0)                                                  \
    ROW(steady, ovif_get_ifcount, 0)                                                               \
    ROW(status, ovif_network_init_sockets, 0)                                                      \
    ROW(status, ov_acl_validate_matchstr, 4)                                                       \
    ROW(status, ovlan_valid_name_check, 1)

enum class Operation : unsigned {
#define OVTEST_ENUMERATOR(kind, name, ...) name,
    OVTEST_HOST_OPERATIONS(OVTEST_ENUMERATOR, OVTEST_ENUMERATOR)
#undef OVTEST_ENUMERATOR
    // Not the host's, but it fails in the same way: memory that the library itself asks for.
    allocation,
};

struct OperationRow {
    const char *name;
    OperationKind kind;
};

inline constexpr OperationRow operation_rows[] = {
#define OVTEST_OPERATION_ROW(kind, name, ...) {#name, OperationKind::kind},
    OVTEST_HOST_OPERATIONS(OVTEST_OPERATION_ROW, OVTEST_OPERATION_ROW)
#undef OVTEST_OPERATION_ROW
        {"allocation", OperationKind::pointer},
};

inline constexpr std::size_t num_operations = sizeof operation_rows / sizeof operation_rows[0];

constexpr const OperationRow &row_of(Operation operation)
{
    return operation_rows[static_cast<std::size_t>(operation)];
}

} // namespace ovtest
