// Match strings, edits of the older form of a match, and the guards of interfaces and VLANs;
// fault_rows_xmap_upgrade.cpp has the conversion of the older form.
#include "orvale/md_xmap_common.h"
#include "tests/library/fault_rows.h"
#include "tests/library/map_changes.h"

namespace ovtest
{

namespace
{

const UnitLines unit("md_xmap_common");

const std::string route_root = "/ov/tunneld/route_map/config/map";
const std::string match_node = route_root + "/m/prio/10/match/0/";

// A proposed database that is still what the old one was.
mdb_db writable_copy(HostFixture &host)
{
    mdb_db copy = *host.db();
    copy.writable = true;
    return copy;
}

md_dbinfo dbinfo_of(HostFixture &host)
{
    return {.commit = &host.commit(), .olddb = host.db(), .newdb = host.db()};
}

void nothing(HostFixture &) {}

std::string validated(HostFixture &host, const char *match_string)
{
    md_dbinfo dbinfo = dbinfo_of(host);
    tbool valid = false;
    const int status = in_library(md_xmap_validate_match_str, &dbinfo, match_string, &valid);
    return std::to_string(status) + (valid ? " valid, " : " not valid, ") +
           std::to_string(host.commit().refusals.size()) + " refused";
}

std::vector<FaultRow> validation_rows()
{
    const char *const function = "md_xmap_validate_match_str";
    const Lines label_failed = {unit.bail("md_xmap_iflabel_check")};
    return {
        {function,
         "of_a_vlan",
         nothing,
         [](HostFixture &host) { return validated(host, "vlan:vlan7"); },
         {"0 valid, 0 refused"},
         {{fails(Operation::ov_acl_validate_matchstr), {"0 not valid, 1 refused"}},
          {fails(Operation::mdb_get_matching_tstr_array), {"0 valid, 0 refused", label_failed}},
          {hands_out_nothing(Operation::mdb_get_matching_tstr_array), {"0 valid, 0 refused"}},
          {fails(Operation::ovlan_valid_name_check),
           {"-1 valid, 0 refused", {unit.bail(function, -1)}}}}},
        {function,
         "of_a_bad_pair",
         nothing,
         [](HostFixture &host) { return validated(host, "colour:red"); },
         {"0 not valid, 1 refused"},
         {{fails(Operation::ov_acl_validate_matchstr), {"0 not valid, 1 refused"}},
          {fails(Operation::md_commit_set_return_status_msg_fmt),
           {"{code} valid, 0 refused", {unit.bail(function)}}}}},
        {"md_xmap_vlan_check",
         "of_a_vlan",
         nothing,
         [](HostFixture &host) {
             return std::to_string(in_library(md_xmap_vlan_check, host.db(), "vlan7"));
         },
         {"0"},
         {{fails(Operation::mdb_get_matching_tstr_array), {"0", label_failed}},
          {hands_out_nothing(Operation::mdb_get_matching_tstr_array), {"0"}},
          {fails(Operation::ovlan_valid_name_check), {"-1"}}}},
        {"md_xmap_iflabel_check",
         "of_a_label",
         [](HostFixture &host) { host.set("/ov/iflabels/config/wan/mpls", bt_string, "x"); },
         [](HostFixture &host) -> std::string {
             return in_library(md_xmap_iflabel_check, "mpls", host.db()) ? "yes" : "no";
         },
         {"yes"},
         {{fails(Operation::mdb_get_matching_tstr_array), {"no", label_failed}},
          {hands_out_nothing(Operation::mdb_get_matching_tstr_array), {"no"}}}},
        {"md_xmap_concat_key_value",
         "of_a_second_pair",
         nothing,
         [](HostFixture &) {
             char buffer[32] = "dscp:ef";
             const int status =
                 in_library(md_xmap_concat_key_value, buffer, sizeof buffer, "vlan", "wan0");
             return std::to_string(status) + ' ' + buffer;
         },
         {"0 dscp:ef,vlan:wan0"}},
    };
}

FaultRow ipver_row()
{
    const char *const function = "md_xmap_add_ipver";
    const ExpectedLine one_map = gated(6, "md_xmap_add_ipver: num maps: 1");
    const ExpectedLine two_entries = gated(6, "md_xmap_add_ipver: num prios for m: 2");
    const ExpectedLine prio = unit.debug(function, "smprintf=" + route_root + "/m/prio");
    const ExpectedLine first =
        unit.debug(function, "smprintf=" + route_root + "/m/prio/10/match/0/ipver");
    const ExpectedLine second =
        unit.debug(function, "smprintf=" + route_root + "/m/prio/65535/match/0/ipver");
    const ExpectedLine bail = unit.bail(function);
    const ExpectedLine null = unit.unexpected_null(function);
    const Lines at_first = {one_map, prio, two_entries, first};
    const Lines at_second = at_first + Lines{second};
    return {
        function,
        "of_two_entries",
        [](HostFixture &host) {
            host.set(route_root + "/m/prio/10/seq", bt_string, "x");
            host.set(route_root + "/m/prio/65535/seq", bt_string, "x");
        },
        [](HostFixture &host) {
            mdb_db db = writable_copy(host);
            std::string answer =
                std::to_string(in_library(md_xmap_add_ipver, &db, route_root.c_str()));
            for (const char *priority : {"10", "65535"}) {
                const std::string entry = route_root + "/m/prio/" + priority + "/match/0/ipver";
                for (const std::string &node : nodes(db, entry)) {
                    answer += std::string(", ") + priority + node.substr(entry.size());
                }
            }
            return answer;
        },
        {"0, 10 string ipv4, 65535 string any", at_second},
        {{fails(Operation::mdb_get_tstr_array, 1), {"{code}", {bail}}},
         {fails(Operation::mdb_get_tstr_array, 2), {"{code}", {one_map, prio, bail}}},
         {hands_out_nothing(Operation::mdb_get_tstr_array, 1),
          {"0", {gated(6, "md_xmap_add_ipver: num maps: 0")}}},
         {hands_out_nothing(Operation::mdb_get_tstr_array, 2),
          {"0", {one_map, prio, gated(6, "md_xmap_add_ipver: num prios for m: 0")}}},
         {fails(Operation::smprintf, 1), {"14001", {one_map, null}}},
         {fails(Operation::smprintf, 2), {"14001", {one_map, prio, two_entries, null}}},
         {fails(Operation::smprintf, 3), {"14001, 10 string ipv4", at_first + Lines{null}}},
         {fails_once(Operation::lc_log_check_level, 1),
          {"0, 10 string ipv4, 65535 string any", {one_map, two_entries, first, second}}},
         {fails_once(Operation::lc_log_check_level, 2),
          {"0, 10 string ipv4, 65535 string any", {one_map, prio, two_entries, second}}},
         {fails_from(Operation::lc_log_check_level, 1),
          {"0, 10 string ipv4, 65535 string any", {one_map, two_entries}}},
         {fails_from(Operation::lc_log_check_level, 2),
          {"0, 10 string ipv4, 65535 string any", {one_map, prio, two_entries}}},
         {fails(Operation::lc_log_check_level, 3),
          {"0, 10 string ipv4, 65535 string any", at_first}},
         {fails(Operation::bn_binding_new_str, 1), {"{code}", at_first + Lines{bail}}},
         {fails(Operation::bn_binding_new_str, 2),
          {"{code}, 10 string ipv4", at_second + Lines{bail}}},
         {hands_out_nothing(Operation::bn_binding_new_str, 1), {"14001", at_first + Lines{null}}},
         {hands_out_nothing(Operation::bn_binding_new_str, 2),
          {"14001, 10 string ipv4", at_second + Lines{null}}},
         {fails(Operation::mdb_set_node_binding, 1), {"{code}", at_first + Lines{bail}}},
         {fails(Operation::mdb_set_node_binding, 2),
          {"{code}, 10 string ipv4", at_second + Lines{bail}}}}};
}

void with_application(HostFixture &host)
{
    host.set(match_node + "application", bt_string, "web");
}

std::string left_in(const mdb_db &db)
{
    return nodes(db, match_node + "application").empty() ? " gone" : " there";
}

std::vector<FaultRow> removal_rows()
{
    const char *const function = "md_xmap_delete_match_binding";
    const Lines logged = {unit.bail(function)};
    const Lines logged_twice = {unit.bail(function), unit.bail("md_xmap_delete_match_entries")};
    return {
        {function,
         "of_a_node",
         with_application,
         [](HostFixture &host) {
             mdb_db db = writable_copy(host);
             const int status = in_library(md_xmap_delete_match_binding, &db,
                                           (match_node + "application").c_str());
             return std::to_string(status) + left_in(db);
         },
         {"0 gone"},
         {{fails(Operation::mdb_get_node_binding), {"{code} there", logged}},
          {hands_out_nothing(Operation::mdb_get_node_binding), {"0 there"}},
          {fails(Operation::mdb_set_node_binding), {"{code} there", logged}}}},
        {"md_xmap_delete_match_entries",
         "of_an_entry",
         with_application,
         [](HostFixture &host) {
             mdb_db db = writable_copy(host);
             const std::string match_root = match_node.substr(0, match_node.size() - 1);
             const int status =
                 in_library(md_xmap_delete_match_entries, &db, MAP_TYPE_R, match_root.c_str());
             return std::to_string(status) + left_in(db);
         },
         {"0 gone"},
         {{fails(Operation::mdb_get_node_binding, 1), {"{code} there", logged_twice}},
          {fails(Operation::mdb_get_node_binding), {"{code} gone", logged_twice}},
          {{Operation::mdb_get_node_binding, 1, When::Lasting::and_later, FaultWay::without_object},
           {"0 there"}},
          {hands_out_nothing(Operation::mdb_get_node_binding), {"0 gone"}},
          {fails(Operation::mdb_set_node_binding), {"{code} there", logged_twice}}}}};
}

// Two entries of a route map, of which the second one is found.
struct Guard {
    const char *function;
    const char *parameter;
    std::string found; // how an answer ends, found or not
    std::string not_found;
    Lines before; // any entry is looked at
    ExpectedLine finds;
};

std::vector<FailureRow> guard_failures(const Guard &guard)
{
    const auto path = [&guard](const std::string &entry) {
        return unit.debug(guard.function,
                          "smprintf=" + route_root + entry + "/set/0/" + guard.parameter);
    };
    const ExpectedLine first = path("/a/prio/10");
    const ExpectedLine second = path("/a/prio/20");
    const ExpectedLine bail = unit.bail(guard.function);
    const ExpectedLine null = unit.unexpected_null(guard.function);
    const std::string failed = "{code}" + guard.not_found;
    const std::string found = "0" + guard.found;
    const auto read = Operation::mdb_get_node_value_tstr;
    const auto check = Operation::lc_log_check_level;
    const auto lines = [&guard](const Lines &further) { return guard.before + further; };
    return {
        {fails(Operation::mdb_get_matching_tstr_array), {failed, {bail}}},
        {fails(Operation::bn_binding_name_to_parts, 1), {failed, lines({bail})}},
        {fails(Operation::bn_binding_name_to_parts, 2), {failed, lines({first, bail})}},
        {hands_out_nothing(Operation::bn_binding_name_to_parts, 1),
         {"14001" + guard.not_found, lines({null})}},
        {hands_out_nothing(Operation::bn_binding_name_to_parts, 2),
         {"14001" + guard.not_found, lines({first, null})}},
        {fails(Operation::smprintf, 1), {"14001" + guard.not_found, lines({null})}},
        {fails(Operation::smprintf, 2), {"14001" + guard.not_found, lines({first, null})}},
        {fails_once(check, 1), {found, lines({second, guard.finds})}},
        {fails_from(check, 1), {found, lines({guard.finds})}},
        {fails(check, 2), {found, lines({first, guard.finds})}},
        {fails(read, 1), {failed, lines({first, bail})}},
        {fails(read, 2), {failed, lines({first, second, bail})}},
        {{read, 1, When::Lasting::once, FaultWay::without_object},
         {found, lines({first, second, guard.finds})}},
        {hands_out_nothing(read), {"0" + guard.not_found, lines({first, second})}},
    };
}

Lines guard_lines(const Guard &guard)
{
    const std::string path = "smprintf=" + route_root + "/a/prio/";
    const std::string end = std::string("/set/0/") + guard.parameter;
    return guard.before + Lines{unit.debug(guard.function, path + "10" + end),
                                unit.debug(guard.function, path + "20" + end), guard.finds};
}

FaultRow preferred_interface_row()
{
    const Guard guard = {"md_preferred_if_is_used_in_rmap",      "auto_mod", " yes", " no", {},
                         gated(5, "Found preferred_if in a:20.")};
    std::vector<FailureRow> failures = guard_failures(guard);
    failures.push_back({hands_out_nothing(Operation::mdb_get_matching_tstr_array), {"0 no"}});
    return {guard.function,
            "with_two_entries",
            [](HostFixture &host) {
                host.set(route_root + "/a/prio/10/set/0/auto_mod", bt_string, "other");
                host.set(route_root + "/a/prio/20/set/0/auto_mod", bt_string, "preferred-if");
            },
            [](HostFixture &host) {
                md_dbinfo dbinfo = dbinfo_of(host);
                tbool found = true;
                const int status =
                    in_library(md_preferred_if_is_used_in_rmap, nullptr, &dbinfo, &found);
                return std::to_string(status) + (found ? " yes" : " no");
            },
            {"0 yes", guard_lines(guard)},
            failures};
}

FaultRow vlan_row()
{
    const Guard guard = {"md_vlan_is_used_in_rmap",
                         "auto_prefif",
                         ", refused: 1 Cannot delete a vlan when used by a route-map preferred "
                         "interface.\n  Please remove vlan vlan7 from associated route-map first.",
                         "",
                         {gated(5, "Checking 2 rmaps entries for VLAN vlan7.")},
                         gated(5, "Found VLAN vlan7 in a:20.")};
    std::vector<FailureRow> failures = guard_failures(guard);
    failures.push_back({hands_out_nothing(Operation::mdb_get_matching_tstr_array),
                        {"0", {gated(5, "Checking 0 rmaps entries for VLAN vlan7.")}}});
    failures.push_back({fails(Operation::md_commit_set_return_status_msg),
                        {"{code}", guard_lines(guard) + Lines{unit.bail(guard.function)}}});
    return {guard.function,
            "with_two_entries",
            [](HostFixture &host) {
                host.set(route_root + "/a/prio/10/set/0/auto_prefif", bt_string, "vlan8");
                host.set(route_root + "/a/prio/20/set/0/auto_prefif", bt_string, "vlan7");
            },
            [](HostFixture &host) {
                md_dbinfo dbinfo = dbinfo_of(host);
                MapChange removal(mdct_delete, "/a/b/c/d/e/f/g/vlan7");
                std::string answer =
                    std::to_string(in_library(md_vlan_is_used_in_rmap, removal.record(), &dbinfo));
                for (const std::string &refusal : host.commit().refusals) {
                    answer += ", refused: " + refusal;
                }
                return answer;
            },
            {"0" + guard.found, guard_lines(guard)},
            failures};
}

} // namespace

std::vector<FaultRow> xmap_match_rows()
{
    std::vector<FaultRow> rows = validation_rows();
    for (FaultRow &row : removal_rows()) {
        rows.push_back(std::move(row));
    }
    for (FaultRow &row :
         std::vector<FaultRow>{ipver_row(), preferred_interface_row(), vlan_row()}) {
        rows.push_back(std::move(row));
    }
    return rows;
}

} // namespace ovtest
