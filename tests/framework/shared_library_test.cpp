// The framework as a shared library: a program can put its own version of an operation before the
// host's and still reach the host's.
#include "framework/mdb_db.h"
#include "tests/framework/owned.h"

#include <dlfcn.h>

#include <gtest/gtest.h>

namespace
{

int calls_to_fail = 0;

} // namespace

/// Fails the next `calls_to_fail` calls; hands all others to the host.
int ts_new_str(tstring **ret, const char *text)
{
    if (calls_to_fail > 0) {
        --calls_to_fail;
        return 14011;
    }
    const auto real = reinterpret_cast<decltype(&ts_new_str)>(::dlsym(RTLD_NEXT, "ts_new_str"));
    return real == nullptr ? lc_err_not_found : real(ret, text);
}

namespace ovhost::test
{
namespace
{

constexpr const char *host_operations[] = {
    "G_daemon_log_level",
    "G_log_level",
    "array_options_get_defaults",
    "array_std_assign_func",
    "bail_debug",
    "bail_quiet_debug",
    "bn_attrib_array_get_attrib_tstr",
    "bn_binding_free",
    "bn_binding_get_str",
    "bn_binding_get_tbool",
    "bn_binding_get_uint32",
    "bn_binding_name_parts_pattern_match",
    "bn_binding_name_pattern_match",
    "bn_binding_name_to_parts",
    "bn_binding_new_named",
    "bn_binding_new_str",
    "bn_event_request_msg_append_new_binding",
    "bn_event_request_msg_create",
    "bn_request_msg_free",
    "bn_request_msg_send",
    "conf_file_okay",
    "ctime_init",
    "g_ovif_skfd",
    "get_config_name",
    "get_max_dns_proxy_map_entries",
    "get_max_nmap_entries",
    "get_max_omap_entries",
    "get_max_qmap_entries",
    "get_max_rmap_entries",
    "get_max_smap_entries",
    "get_max_tunnel_number",
    "init_model_info",
    "lc_enum_to_string_quiet_null",
    "lc_log_check_level",
    "lc_log_internal",
    "lc_mask_or_masklen_to_masklen_str",
    "lc_string_to_enum",
    "lf_read_file_lines",
    "lf_test_exists",
    "md_commit_set_return_status_msg",
    "md_commit_set_return_status_msg_fmt",
    "md_gcl_find_session",
    "mdb_db_change_array_get_quick",
    "mdb_db_change_array_length_quick",
    "mdb_get_matching_tstr_array",
    "mdb_get_node_binding",
    "mdb_get_node_value_tstr",
    "mdb_get_tstr_array",
    "mdb_set_node_binding",
    "mdb_set_node_str",
    "mgmt_is_same_subnet_using_masklen",
    "ov_acl_validate_matchstr",
    "ov_log_internal",
    "ov_log_module_levels",
    "ov_system_info",
    "ovif_get_ifcount",
    "ovif_network_init_sockets",
    "ovlan_valid_name_check",
    "smprintf",
    "sys_time_since_boot_ms",
    "time_info_ptr",
    "ts_cmp",
    "ts_cmp_str",
    "ts_dup",
    "ts_equal",
    "ts_equal_str",
    "ts_free",
    "ts_length_",
    "ts_new_sprintf",
    "ts_new_str",
    "ts_num_chars",
    "ts_str_",
    "tstr_array_append_str",
    "tstr_array_append_takeover",
    "tstr_array_duplicate",
    "tstr_array_free",
    "tstr_array_get_str_quick",
    "tstr_array_length_quick",
    "tstr_array_new",
    "tstr_array_remove",
    "uint32_array_append",
    "uint32_array_delete_by_value",
    "uint32_array_free",
    "uint32_array_get_quick",
    "uint32_array_insert_sorted",
    "uint32_array_length_quick",
    "uint32_array_new_full",
};

TEST(SharedFramework, HoldsEveryOperationAndVariable)
{
    for (const char *name : host_operations) {
        EXPECT_NE(::dlsym(RTLD_DEFAULT, name), nullptr) << name;
    }
}

TEST(SharedFramework, LetsTheProgramStandBeforeAnOperation)
{
    OwnedString str;
    calls_to_fail = 1;
    EXPECT_EQ(ts_new_str(str.out(), "text"), 14011);
    EXPECT_EQ(str.get(), nullptr);
    EXPECT_EQ(ts_new_str(str.out(), "text"), 0);
    EXPECT_STREQ(ts_str(str.get()), "text");
    EXPECT_EQ(::dlsym(RTLD_DEFAULT, "ts_new_str"), reinterpret_cast<void *>(&ts_new_str));
}

} // namespace
} // namespace ovhost::test
