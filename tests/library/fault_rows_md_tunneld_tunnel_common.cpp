#include "orvale/md_tunneld_tunnel_common.h"
#include "tests/library/fault_rows.h"

namespace ovtest
{

namespace
{

const UnitLines unit("md_tunneld_tunnel_common");

void in_inline_router_mode(HostFixture &host)
{
    host.set("/ov/tunneld/system/config/mode", bt_string, "router");
    host.set("/ov/tunneld/system/config/routing_inline", bt_bool, "true");
}

template <const char *mode>
void in_mode(HostFixture &host)
{
    host.set("/ov/tunneld/system/config/mode", bt_string, mode);
}

template <const char *node>
void with_flag(HostFixture &host)
{
    host.set(node, bt_bool, "true");
}

constexpr char bridge[] = "bridge";
constexpr char router[] = "router";
constexpr char server[] = "server";
constexpr char ports_10g[] = "/ov/tunneld/system/config/10g";
constexpr char bonding[] = "/ov/tunneld/system/config/bonding";

template <int (*getter)(const mdb_db *, char **)>
std::string text_answer(HostFixture &host)
{
    char *text = nullptr;
    const int status = in_library(getter, host.db(), &text);
    return std::to_string(status) + ' ' + taken(text);
}

template <tbool (*question)(const mdb_db *)>
std::string yes_or_no(HostFixture &host)
{
    return in_library(question, host.db()) ? "yes" : "no";
}

std::string interface_count(HostFixture &host)
{
    int count = -7;
    const int status = in_library(md_get_number_router_mode_interfaces, host.db(), &count);
    return std::to_string(status) + ' ' + std::to_string(count);
}

// A failure of reading the mode passes through two functions.
std::vector<FailureRow> mode_failures(const std::string &question)
{
    const std::vector<ExpectedLine> passed_up = {unit.bail("md_get_db_system_mode"),
                                                 unit.bail(question)};
    const std::vector<ExpectedLine> null_text = {unit.unexpected_null("md_get_db_system_mode"),
                                                 unit.bail(question, 14001)};
    return {
        {fails(Operation::mdb_get_node_binding, 1), {"no", passed_up}},
        {hands_out_nothing(Operation::mdb_get_node_binding, 1), {"no"}},
        {fails(Operation::bn_binding_get_str), {"no", passed_up}},
        {hands_out_nothing(Operation::bn_binding_get_str), {"no", null_text}},
        {fails(Operation::allocation), {"no", null_text}},
    };
}

std::vector<FailureRow> inline_failures()
{
    std::vector<FailureRow> failures = mode_failures("md_is_db_system_router_mode");
    const std::vector<ExpectedLine> logged = {unit.bail("md_is_db_system_inline_router_mode")};
    failures.insert(failures.end(),
                    {{fails(Operation::mdb_get_node_binding, 2), {"no", logged}},
                     {hands_out_nothing(Operation::mdb_get_node_binding, 2), {"no"}},
                     {fails(Operation::bn_binding_get_tbool), {"no", logged}}});
    return failures;
}

std::vector<FailureRow> flag_failures(const std::string &question)
{
    return {
        {fails(Operation::mdb_get_node_binding), {"no", {unit.bail(question)}}},
        {hands_out_nothing(Operation::mdb_get_node_binding), {"no"}},
        {fails(Operation::bn_binding_get_tbool), {"no", {unit.bail(question)}}},
    };
}

std::vector<FaultRow> text_rows()
{
    const Outcome mode_passed_up = {"{code} null", {unit.bail("md_get_db_system_mode")}};
    const Outcome mode_null = {"14001 null", {unit.unexpected_null("md_get_db_system_mode")}};
    const Outcome submode_passed_up = {"{code} null", {unit.bail("md_get_db_bridge_submode")}};
    const Outcome submode_null = {"14001 null", {unit.unexpected_null("md_get_db_bridge_submode")}};
    return {
        {"md_get_db_system_mode",
         "of_a_router",
         in_mode<router>,
         text_answer<md_get_db_system_mode>,
         {"0 router"},
         {{fails(Operation::mdb_get_node_binding), mode_passed_up},
          {hands_out_nothing(Operation::mdb_get_node_binding), {"0 null"}},
          {fails(Operation::bn_binding_get_str), mode_passed_up},
          {hands_out_nothing(Operation::bn_binding_get_str), mode_null},
          {fails(Operation::allocation), mode_null}}},
        {"md_get_db_bridge_submode",
         "of_a_bridge",
         [](HostFixture &host) { host.set("/ov/tunneld/system/config/submode", bt_string, "odd"); },
         text_answer<md_get_db_bridge_submode>,
         {"0 odd"},
         {{fails(Operation::mdb_get_node_binding), submode_passed_up},
          {hands_out_nothing(Operation::mdb_get_node_binding), {"0 normal"}},
          {fails(Operation::bn_binding_get_str), submode_passed_up},
          {hands_out_nothing(Operation::bn_binding_get_str), {"0 normal"}},
          {fails(Operation::allocation), submode_null}}},
    };
}

} // namespace

std::vector<FaultRow> md_tunneld_tunnel_common_rows()
{
    std::vector<FaultRow> rows = text_rows();
    rows.insert(
        rows.end(),
        {{"md_is_db_system_bridge_mode",
          "of_a_bridge",
          in_mode<bridge>,
          yes_or_no<md_is_db_system_bridge_mode>,
          {"yes"},
          mode_failures("md_is_db_system_bridge_mode")},
         {"md_is_db_system_router_mode",
          "of_a_router",
          in_mode<router>,
          yes_or_no<md_is_db_system_router_mode>,
          {"yes"},
          mode_failures("md_is_db_system_router_mode")},
         {"md_is_db_system_server_mode",
          "of_a_server",
          in_mode<server>,
          yes_or_no<md_is_db_system_server_mode>,
          {"yes"},
          mode_failures("md_is_db_system_server_mode")},
         {"md_is_db_system_inline_router_mode",
          "of_an_inline_router",
          in_inline_router_mode,
          yes_or_no<md_is_db_system_inline_router_mode>,
          {"yes"},
          inline_failures()},
         {"md_is_10g_enabled",
          "with_the_flag",
          with_flag<ports_10g>,
          yes_or_no<md_is_10g_enabled>,
          {"yes"},
          flag_failures("md_is_10g_enabled")},
         {"md_is_bonding_enabled",
          "with_the_flag",
          with_flag<bonding>,
          yes_or_no<md_is_bonding_enabled>,
          {"yes"},
          flag_failures("md_is_bonding_enabled")},
         {"md_get_number_router_mode_interfaces",
          "with_one",
          [](HostFixture &host) {
              host.set("/ov/tunneld/system/config/mode/router/wan0", bt_bool, "true");
          },
          interface_count,
          {"0 1"},
          {{fails(Operation::mdb_get_tstr_array),
            {"{code} -7", {unit.bail("md_get_number_router_mode_interfaces")}}},
           {hands_out_nothing(Operation::mdb_get_tstr_array),
            {"14001 -7", {unit.unexpected_null("md_get_number_router_mode_interfaces")}}}}}});
    return rows;
}

} // namespace ovtest
