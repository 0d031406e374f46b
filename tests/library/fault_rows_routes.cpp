// The removal of routes, and the file of alarms.
#include "orvale/md_tunneld_tunnel_common.h"
#include "tests/library/fault_rows.h"
#include "tests/library/map_changes.h"

#include <filesystem>

namespace ovtest
{

namespace
{

const UnitLines unit("md_tunneld_tunnel_common");

constexpr char prefix_root[] = "/ov/tunneld/net/routes/config/ipv4/prefix";
constexpr char alarm_dir[] = "/var/opt/tms/output";
constexpr char alarm_file[] = "/var/opt/tms/output/upgrade_alarms.txt";

// Of the first prefix all next hops go, and the prefix with them; of the second one of two.
void with_two_prefixes(HostFixture &host)
{
    for (const char *nhop : {"10.1.0.0\\/16/nhop/192.0.2.1", "10.2.0.0\\/16/nhop/192.0.2.2",
                             "10.2.0.0\\/16/nhop/198.51.100.1"}) {
        host.set(std::string(prefix_root) + '/' + nhop, bt_string, "x");
    }
    host.db()->writable = true;
}

std::string deletion(HostFixture &host)
{
    uint32 count = 7;
    const int status = in_library(md_tunneld_delete_dproutes, &host.commit(), host.db(),
                                  "192.0.2.9", uint8{24}, &count);
    std::string answer = std::to_string(status) + ' ' + std::to_string(count);
    for (const std::string &node : nodes(*host.db(), prefix_root)) {
        answer += ' ' + node.substr(node.find("/nhop/") + 6);
    }
    return answer;
}

FaultRow deletion_row()
{
    const char *const function = "md_tunneld_delete_dproutes";
    const ExpectedLine bail = unit.bail(function);
    const ExpectedLine first = gated(6, std::string("DPR/VLAN ") + prefix_root +
                                            "/10.1.0.0\\/16/nhop/192.0.2.1 deleted\n");
    const ExpectedLine second = gated(6, std::string("DPR/VLAN ") + prefix_root +
                                             "/10.2.0.0\\/16/nhop/192.0.2.2 deleted\n");
    const Outcome success = {"0 2 198.51.100.1 string x", {first, second}};
    const Outcome of_second = {"0 1 192.0.2.1 string x 198.51.100.1 string x", {second}};
    const Outcome of_first = {"0 1 192.0.2.2 string x 198.51.100.1 string x", {first}};
    const std::string all = " 192.0.2.1 string x 192.0.2.2 string x 198.51.100.1 string x";
    const std::string later = " 192.0.2.2 string x 198.51.100.1 string x";
    const Operation list = Operation::mdb_get_tstr_array;
    const Operation same = Operation::mgmt_is_same_subnet_using_masklen;
    std::vector<FailureRow> failures = {
        {fails(list, 1), {"{code} 0" + all, {bail}}},
        {hands_out_nothing(list, 1), {"0 0" + all}},
        {fails(list, 2), {"{code} 0" + all, {bail}}},
        {{list, 2, When::Lasting::once, FaultWay::without_object}, of_second},
        {hands_out_nothing(list, 2), {"0 0" + all}},
        {fails(list, 3), {"{code} 0" + later, {first, bail}}},
        {hands_out_nothing(list, 3), of_first},
        {fails_once(same, 1), of_second},
        {fails_from(same, 1), {"0 0" + all}},
        {fails(same, 2), of_first},
        {fails(same, 3), success},
    };
    for (const Operation step : {Operation::bn_binding_new_str, Operation::mdb_set_node_binding}) {
        failures.push_back({fails(step, 1), {"{code} 0" + all, {bail}}});
        failures.push_back({fails(step, 2), {"{code} 0" + later, {first, bail}}});
        failures.push_back({fails(step, 3), {"{code} 0" + later, {first, bail}}});
    }
    const Operation binding = Operation::bn_binding_new_str;
    const ExpectedLine null = unit.unexpected_null(function);
    failures.push_back({hands_out_nothing(binding, 1), {"14001 0" + all, {null}}});
    failures.push_back({hands_out_nothing(binding, 2), {"14001 0" + later, {first, null}}});
    failures.push_back({hands_out_nothing(binding, 3), {"14001 0" + later, {first, null}}});
    return {function, "of_two_prefixes", with_two_prefixes, deletion, success, failures};
}

FaultRow alarm_row()
{
    const char *const function = "md_tunneld_write_sw_upgrade_alarm";
    const ExpectedLine writing = gated(6, std::string(function) + ": writing alarm no room");
    const Outcome success = {"0 before\nno room\n", {writing}};
    return {function,
            "of_one_alarm",
            [](HostFixture &) {
                std::filesystem::create_directory(alarm_dir);
                write_file(alarm_file, "before\n");
            },
            [](HostFixture &) {
                const int status = in_library(md_tunneld_write_sw_upgrade_alarm, "no room");
                return std::to_string(status) + ' ' + read_file(alarm_file).value_or("no file");
            },
            success,
            {// Without memory for the stream the file is not opened; without any for its buffer the
             // line is written piece by piece.
             {fails(Operation::allocation, 1),
              {"14010 before\n",
               {writing, gated(3, std::string("Write error opening ") + alarm_file)}}},
             {fails(Operation::allocation, 2), success}}};
}

} // namespace

std::vector<FaultRow> route_rows()
{
    return {deletion_row(), alarm_row()};
}

} // namespace ovtest
