// Who uses an interface, the VLAN interfaces, and the enable flag.
#include "orvale/md_tunneld_tunnel_common.h"
#include "tests/library/fault_rows.h"
#include "tests/library/map_changes.h"

namespace ovtest
{

namespace
{

const UnitLines unit("md_tunneld_tunnel_common");

constexpr char check[] = "md_interface_usage_check";
constexpr char to_usertext[] = "md_interface_usage_to_usertext";
constexpr char check_usertext[] = "md_interface_usage_check_usertext";

constexpr char group_node[] = "/ov/wccpd/wccp/srv_grp/config/10/interface";
constexpr char vrrp_node[] = "/ov/redd/net/interface/vrrp/config/vr1";
constexpr char router_node[] = "/ov/tunneld/system/config/mode/router/2/ifname";

void used_by_both(HostFixture &host)
{
    host.set(group_node, bt_string, "wan0");
    host.set(vrrp_node, bt_string, "wan0");
}

void as_it_is(HostFixture &) {}

template <int (*function)(const mdb_db *, char *, tstr_array **)>
std::string answer_about_interface(HostFixture &host)
{
    char ifname[] = "wan0";
    tstr_array *array = nullptr;
    const int status = in_library(function, host.db(), ifname, &array);
    return std::to_string(status) + ' ' + taken(array);
}

When hands_out_nothing_once(Operation operation, unsigned call)
{
    return {operation, call, When::Lasting::once, FaultWay::without_object};
}

// What both checks come to when a query has nothing to hand out: one of the usages is not found,
// or both are not.
std::vector<FailureRow> missing_usages(const std::string &group, const std::string &vrrp)
{
    std::vector<FailureRow> failures;
    for (const Operation query :
         {Operation::mdb_get_tstr_array, Operation::mdb_get_node_value_tstr}) {
        failures.push_back({hands_out_nothing_once(query, 1), {"0 [" + vrrp + "]"}});
        failures.push_back({hands_out_nothing(query, 1), {"0 []"}});
        failures.push_back({hands_out_nothing(query, 2), {"0 [" + group + "]"}});
    }
    return failures;
}

FaultRow check_row()
{
    const Outcome failed = {"{code} null", {unit.bail(check)}};
    std::vector<FailureRow> failures = missing_usages(group_node, vrrp_node);
    failures.insert(failures.end(),
                    {{fails(Operation::tstr_array_new), failed},
                     {fails(Operation::mdb_get_tstr_array), failed},
                     {fails(Operation::smprintf), {"14001 null", {unit.unexpected_null(check)}}},
                     {fails(Operation::mdb_get_node_value_tstr), failed},
                     {fails(Operation::tstr_array_append_str), failed}});
    return {check,
            "by_both",
            used_by_both,
            answer_about_interface<md_interface_usage_check>,
            {std::string("0 [") + group_node + ", " + vrrp_node + "]"},
            failures};
}

template <const char *usage>
std::string usertext(HostFixture &)
{
    tstring *text = nullptr;
    const int status = in_library(md_interface_usage_to_usertext, usage, &text);
    return std::to_string(status) + ' ' + taken(text);
}

// The kinds are tried in order: router, group, VRRP.
std::vector<FaultRow> usertext_rows()
{
    const Operation match = Operation::bn_binding_name_pattern_match;
    const Outcome failed = {"{code} null", {unit.bail(to_usertext)}};
    const Outcome of_group = {"0 wccp group 10"};
    const Outcome of_vrrp = {"0 vrrp interface"};
    const Outcome no_usage = {"0 null"};
    return {{to_usertext,
             "of_the_router",
             as_it_is,
             usertext<router_node>,
             {"0 router interface"},
             {{fails(match), no_usage}, {fails(Operation::ts_new_str), failed}}},
            {to_usertext,
             "of_a_group",
             as_it_is,
             usertext<group_node>,
             of_group,
             {{fails_once(match, 1), of_group},
              {fails(match), no_usage},
              {fails(Operation::bn_binding_name_to_parts), failed},
              {hands_out_nothing(Operation::bn_binding_name_to_parts),
               {"14001 null", {unit.unexpected_null(to_usertext)}}},
              {fails(Operation::ts_new_sprintf), failed}}},
            {to_usertext,
             "of_a_vrrp_entry",
             as_it_is,
             usertext<vrrp_node>,
             of_vrrp,
             {{fails_once(match, 1), of_vrrp},
              {fails_once(match, 2), of_vrrp},
              {fails(match), no_usage},
              {fails(Operation::ts_new_str), failed}}}};
}

// The group's usage is matched by the first two calls, and VRRP's by three more.
FaultRow check_usertext_row()
{
    const Operation match = Operation::bn_binding_name_pattern_match;
    const ExpectedLine bail = unit.bail(check_usertext);
    const Outcome in_check = {"{code} null", {unit.bail(check), bail}};
    const Outcome in_text = {"{code} null", {unit.bail(to_usertext), bail}};
    const Outcome success = {"0 [wccp group 10, vrrp interface]"};
    const Outcome group_only = {"0 [wccp group 10]"};
    std::vector<FailureRow> failures = missing_usages("wccp group 10", "vrrp interface");
    failures.insert(
        failures.end(),
        {{fails(Operation::tstr_array_new, 1), {"{code} null", {bail}}},
         {fails(Operation::tstr_array_new, 2), in_check},
         {fails(Operation::mdb_get_tstr_array), in_check},
         {fails(Operation::smprintf),
          {"14001 null", {unit.unexpected_null(check), unit.bail(check_usertext, 14001)}}},
         {fails(Operation::mdb_get_node_value_tstr), in_check},
         {fails(Operation::tstr_array_append_str, 1), in_check},
         {fails(Operation::tstr_array_append_str, 2), in_check},
         {fails(Operation::tstr_array_append_str), {"{code} null", {bail}}},
         {fails_once(match, 2), {"0 [vrrp interface]"}},
         {fails_once(match, 5), group_only},
         {fails_once(match), success},
         {fails_from(match, 1), {"0 []"}},
         {fails_from(match, 2), {"0 []"}},
         {fails_from(match), group_only},
         {fails(Operation::bn_binding_name_to_parts), in_text},
         {hands_out_nothing(Operation::bn_binding_name_to_parts),
          {"14001 null", {unit.unexpected_null(to_usertext), unit.bail(check_usertext, 14001)}}},
         {fails(Operation::ts_new_sprintf), in_text},
         {fails(Operation::ts_new_str), in_text}});
    return {check_usertext, "by_both",
            used_by_both,   answer_about_interface<md_interface_usage_check_usertext>,
            success,        failures};
}

FaultRow vlan_row()
{
    const char *const function = "md_get_vlan_interfaces";
    const Outcome failed = {"{code} null", {unit.bail(function)}};
    return {function,
            "of_two",
            [](HostFixture &host) {
                host.set("/ov/tunneld/net/interface/tunnel/vlan/config/vlan10", bt_string, "x");
                host.set("/ov/tunneld/net/interface/tunnel/vlan/config/vlan20", bt_string, "x");
            },
            [](HostFixture &host) {
                tstr_array *names = nullptr;
                const int status = in_library(md_get_vlan_interfaces, host.db(), &names);
                return std::to_string(status) + ' ' + taken(names);
            },
            {"0 [vlan10, vlan20]"},
            {{fails(Operation::tstr_array_new), failed},
             {fails(Operation::mdb_get_matching_tstr_array), failed},
             {hands_out_nothing(Operation::mdb_get_matching_tstr_array), {"0 null"}},
             {fails(Operation::bn_binding_name_to_parts), failed},
             {hands_out_nothing(Operation::bn_binding_name_to_parts),
              {"14001 null", {unit.unexpected_null(function)}}},
             {fails(Operation::tstr_array_remove), failed},
             {fails(Operation::tstr_array_append_takeover), failed},
             {fails(Operation::tstr_array_duplicate), failed},
             {hands_out_nothing(Operation::tstr_array_duplicate), {"0 null"}}}};
}

FaultRow enable_row()
{
    const char *const function = "md_set_if_enable";
    const Outcome unchanged = {"0; /net/interface/config/wan0 string wan0"};
    const Outcome failed = {"{code}; /net/interface/config/wan0 string wan0",
                            {unit.bail(function)}};
    const Outcome without_binding = {"14001; /net/interface/config/wan0 string wan0",
                                     {unit.unexpected_null(function)}};
    return {
        function,
        "of_an_interface",
        [](HostFixture &host) {
            host.set("/net/interface/config/wan0", bt_string, "wan0");
            host.db()->writable = true;
        },
        [](HostFixture &host) {
            std::string answer =
                std::to_string(in_library(md_set_if_enable, host.db(), "wan0", true));
            for (const std::string &node : nodes(*host.db(), "/net")) {
                answer += "; " + node;
            }
            return answer;
        },
        {"0; /net/interface/config/wan0 string wan0; /net/interface/config/wan0/enable bool true"},
        {{fails(Operation::mdb_get_node_binding), failed},
         {hands_out_nothing(Operation::mdb_get_node_binding), unchanged},
         {fails(Operation::bn_binding_new_str), failed},
         {hands_out_nothing(Operation::bn_binding_new_str), without_binding},
         {fails(Operation::mdb_set_node_binding), failed}}};
}

} // namespace

std::vector<FaultRow> interface_rows()
{
    std::vector<FaultRow> rows = usertext_rows();
    for (const auto row : {check_row, check_usertext_row, vlan_row, enable_row}) {
        rows.push_back(row());
    }
    return rows;
}

} // namespace ovtest
