// Who uses an application, and the application rules.
#include "orvale/md_tunneld_tunnel_common.h"
#include "tests/library/fault_rows.h"

namespace ovtest
{

namespace
{

const UnitLines unit("md_tunneld_tunnel_common");

constexpr char in_acl[] = "md_find_app_name_in_acl";
constexpr char in_map[] = "md_find_app_name_in_xxxmap";
constexpr char anywhere[] = "md_find_appname_in_acl_or_xxxmap";

constexpr char acl_node[] = "/ov/tunneld/acl/config/a/entry/10/application";
constexpr char map_node[] = "/ov/tunneld/qos_map/config/map/q/prio/10/match/0/application";

template <const char *node>
void with_use(HostFixture &host)
{
    host.set(node, bt_string, "web");
}

tstr_array *new_array()
{
    tstr_array *array = nullptr;
    if (tstr_array_new(&array, nullptr) != 0) {
        throw std::bad_alloc();
    }
    return array;
}

ExpectedLine acls_line(int count)
{
    return gated(6, "md_find_app_name_in_acl: find web in any " + std::to_string(count) +
                        " acl aclNames");
}

ExpectedLine maps_line(int count)
{
    return gated(6, "md_find_app_name_in_xxxmap: find web in any " + std::to_string(count) +
                        " map names");
}

ExpectedLine entries_line()
{
    return gated(6, "md_find_app_name_in_xxxmap: /ov/tunneld/qos_map/config/map map  q has 1 "
                    "entries");
}

FaultRow acl_row()
{
    const ExpectedLine bail = unit.bail(in_acl);
    const Outcome failed = {"{code} no []", {acls_line(1), bail}};
    const Outcome not_found = {"0 no []", {acls_line(1)}};
    return {in_acl,
            "in_one_entry",
            with_use<acl_node>,
            [](HostFixture &host) {
                tbool found = false;
                tstr_array *const bnames = new_array();
                const int status =
                    in_library(md_find_app_name_in_acl, "web", host.db(), &found, bnames);
                return std::to_string(status) + (found ? " yes " : " no ") + taken(bnames);
            },
            {std::string("0 yes [") + acl_node + ']', {acls_line(1)}},
            {{fails(Operation::mdb_get_tstr_array, 1), {"{code} no []", {bail}}},
             {fails(Operation::mdb_get_tstr_array, 2), failed},
             {hands_out_nothing(Operation::mdb_get_tstr_array, 1), {"0 no []", {acls_line(0)}}},
             {hands_out_nothing(Operation::mdb_get_tstr_array, 2), not_found},
             {fails(Operation::mdb_get_node_binding), failed},
             {hands_out_nothing(Operation::mdb_get_node_binding), not_found},
             {fails(Operation::bn_binding_get_str), failed},
             {hands_out_nothing(Operation::bn_binding_get_str), not_found},
             {fails(Operation::tstr_array_append_str), failed}}};
}

FaultRow map_row()
{
    const ExpectedLine bail = unit.bail(in_map);
    const Outcome failed = {"{code} no []", {maps_line(1), entries_line(), bail}};
    const Outcome not_found = {"0 no []", {maps_line(1), entries_line()}};
    return {in_map,
            "in_one_entry",
            with_use<map_node>,
            [](HostFixture &host) {
                tbool found = false;
                tstr_array *const bnames = new_array();
                const int status = in_library(md_find_app_name_in_xxxmap, "web", host.db(),
                                              "/ov/tunneld/qos_map/config/map", &found, bnames);
                return std::to_string(status) + (found ? " yes " : " no ") + taken(bnames);
            },
            {std::string("0 yes [") + map_node + ']', {maps_line(1), entries_line()}},
            {{fails(Operation::mdb_get_tstr_array, 1), {"{code} no []", {bail}}},
             {fails(Operation::mdb_get_tstr_array, 2), {"{code} no []", {maps_line(1), bail}}},
             {hands_out_nothing(Operation::mdb_get_tstr_array, 1), {"0 no []", {maps_line(0)}}},
             {hands_out_nothing(Operation::mdb_get_tstr_array, 2), {"0 no []", {maps_line(1)}}},
             {fails(Operation::mdb_get_node_binding), failed},
             {hands_out_nothing(Operation::mdb_get_node_binding), not_found},
             {fails(Operation::bn_binding_get_str), failed},
             {hands_out_nothing(Operation::bn_binding_get_str), not_found},
             {fails(Operation::tstr_array_append_str), failed}}};
}

// Neither ACLs nor route or optimisation maps, and one QoS map: five lists.
FaultRow anywhere_row()
{
    const std::string used =
        std::string("0 Application name used by a QOS Map. [") + map_node + ']';
    const ExpectedLine bail = unit.bail(anywhere);
    const Lines all = {acls_line(0), maps_line(0), maps_line(0), maps_line(1), entries_line()};
    const auto lines = [&all](std::ptrdiff_t count, const Lines &further) {
        return Lines(all.begin(), all.begin() + count) + further;
    };
    const auto map_failed = [&](std::ptrdiff_t count) -> Outcome {
        return {"{code} null null", lines(count, {unit.bail(in_map), bail})};
    };
    const auto list = Operation::mdb_get_tstr_array;
    const Outcome unused = {"0 null []", all};
    const Outcome no_qos_maps = {"0 null []", lines(3, {maps_line(0)})};
    return {
        anywhere,
        "in_a_qos_map",
        with_use<map_node>,
        [](HostFixture &host) {
            char *message = nullptr;
            tstr_array *bnames = nullptr;
            const int status =
                in_library(md_find_appname_in_acl_or_xxxmap, "web", host.db(), &message, &bnames);
            return std::to_string(status) + ' ' + taken(message) + ' ' + taken(bnames);
        },
        {used, all},
        {{fails(Operation::tstr_array_new), {"{code} null null", {bail}}},
         {fails(list, 1), {"{code} null null", {unit.bail(in_acl), bail}}},
         {fails(list, 2), map_failed(1)},
         {fails(list, 3), map_failed(2)},
         {fails(list, 4), map_failed(3)},
         {fails(list, 5), map_failed(4)},
         {hands_out_nothing(list, 5), {"0 null []", lines(4, {})}},
         {hands_out_nothing(list, 4), no_qos_maps},
         {{list, When::any_call, When::Lasting::and_later, FaultWay::without_object}, no_qos_maps},
         {hands_out_nothing(list), {used, all}},
         {fails(Operation::mdb_get_node_binding), map_failed(5)},
         {hands_out_nothing(Operation::mdb_get_node_binding), unused},
         {fails(Operation::bn_binding_get_str), map_failed(5)},
         {hands_out_nothing(Operation::bn_binding_get_str), unused},
         {fails(Operation::tstr_array_append_str), map_failed(5)},
         {fails(Operation::allocation),
          {"14001 null null", lines(5, {unit.unexpected_null(anywhere)})}}}};
}

void with_rules(HostFixture &host)
{
    host.set("/ov/tunneld/app/config/1/name", bt_string, "a");
    host.set("/ov/tunneld/app/config/2/name", bt_string, "a");
}

FaultRow count_row()
{
    const char *const function = "md_get_app_num_rules";
    const Outcome failed = {"{code} 0", {unit.bail(function)}};
    return {function,
            "of_two_rules",
            with_rules,
            [](HostFixture &host) {
                int number = -7;
                const int status = in_library(md_get_app_num_rules, host.db(), "a", &number);
                return std::to_string(status) + ' ' + std::to_string(number);
            },
            {"0 2"},
            {{fails(Operation::mdb_get_tstr_array), failed},
             {hands_out_nothing(Operation::mdb_get_tstr_array), {"0 0"}},
             {fails(Operation::mdb_get_node_value_tstr), failed},
             {hands_out_nothing(Operation::mdb_get_node_value_tstr),
              {"14001 0", {unit.unexpected_null(function)}}}}};
}

FaultRow names_row()
{
    const char *const function = "md_get_custom_app_names";
    const Outcome failed = {"{code} null", {unit.bail(function)}};
    return {function,
            "of_two_rules",
            with_rules,
            [](HostFixture &host) {
                tstr_array *names = nullptr;
                const int status = in_library(md_get_custom_app_names, host.db(), &names);
                return std::to_string(status) + ' ' + taken(names);
            },
            {"0 [a]"},
            {{fails(Operation::array_options_get_defaults), failed},
             {fails(Operation::tstr_array_new), failed},
             {fails(Operation::mdb_get_tstr_array), failed},
             {hands_out_nothing(Operation::mdb_get_tstr_array), {"0 null"}},
             {fails(Operation::mdb_get_node_value_tstr), failed},
             {hands_out_nothing(Operation::mdb_get_node_value_tstr),
              {"14001 null", {unit.unexpected_null(function)}}},
             {fails(Operation::tstr_array_append_str), failed},
             {fails(Operation::tstr_array_duplicate), failed},
             {hands_out_nothing(Operation::tstr_array_duplicate), {"0 null"}}}};
}

} // namespace

std::vector<FaultRow> application_rows()
{
    return {acl_row(), map_row(), anywhere_row(), count_row(), names_row()};
}

} // namespace ovtest
