// The interface budget, and the removal of all children of a node.
#include "framework/appliance.h"
#include "orvale/md_utils.h"
#include "tests/library/change_list.h"
#include "tests/library/fault_rows.h"

#include <unistd.h>

namespace ovtest
{

namespace
{

const UnitLines unit("md_utils");

constexpr char admission[] = "md_ifmgr_can_interface_be_added";
constexpr char vlan_pattern[] = "/ov/tunneld/net/interface/tunnel/vlan/config/*";

void as_it_is(HostFixture &) {}

ExpectedLine by_module(int level, const std::string &function, const std::string &text)
{
    return {ExpectedLine::Kind::by_module, {}, function, text, level};
}

void forget_count()
{
    md_ifmgr_ifcount_dec(md_ifmgr_get_ifcount());
    ::close(g_ovif_skfd);
    g_ovif_skfd = -1;
}

std::string count_after(void (*step)(int), int count)
{
    in_library(step, count);
    return std::to_string(in_library(md_ifmgr_get_ifcount));
}

std::vector<FaultRow> count_rows()
{
    return {{"md_ifmgr_ifcount_inc",
             "from_none",
             as_it_is,
             [](HostFixture &) { return count_after(md_ifmgr_ifcount_inc, 3); },
             {"3",
              {by_module(6, "md_ifmgr_ifcount_inc",
                         "md_ifmgr_ifcount_inc: Incrementing interface count from 0 to 3")}},
             {},
             forget_count},
            {"md_ifmgr_ifcount_dec",
             "from_none",
             as_it_is,
             [](HostFixture &) { return count_after(md_ifmgr_ifcount_dec, 3); },
             {"-3",
              {by_module(6, "md_ifmgr_ifcount_dec",
                         "md_ifmgr_ifcount_dec: Decrementing interface count from 0 to -3")}},
             {},
             forget_count},
            {"md_ifmgr_get_ifcount",
             "of_none",
             as_it_is,
             [](HostFixture &) { return std::to_string(in_library(md_ifmgr_get_ifcount)); },
             {"0"}}};
}

ExpectedLine added(int place, int count)
{
    return by_module(6, admission,
                     "Interfaces /ov/tunneld/net/interface/tunnel/vlan/config/vlan" +
                         std::to_string(place) + " being added. count=" + std::to_string(count));
}

ExpectedLine summary(int count, int max)
{
    return by_module(5, admission,
                     std::string(admission) + ": Interface " + std::to_string(count) +
                         " changes; cur l3:0 ifidx:5 mult:3 max:" + std::to_string(max));
}

// Two are added where the model allows two. The model's information is asked for by the summary
// and, when it did not come, by the budget once more.
FaultRow admission_row()
{
    const Operation match = Operation::bn_binding_name_pattern_match;
    const Operation get = Operation::mdb_db_change_array_get_quick;
    const ExpectedLine first = added(1, 1);
    const Outcome success = {"yes", {first, added(2, 2), summary(2, 2)}};
    const Outcome first_only = {"yes", {first, summary(1, 2)}};
    const Outcome second_only = {"yes", {added(2, 1), summary(1, 2)}};
    const ExpectedLine refusal =
        by_module(3, admission,
                  std::string(admission) + ": Adding 2 interfaces to current l3 ifs:0 exceeds max");
    return {
        admission,
        "of_two",
        [](HostFixture &host) {
            host.set("/ov/model/limits/max_interfaces", bt_uint32, "2");
            planted().kernel_interfaces = 5;
        },
        [](HostFixture &) -> std::string {
            ChangeList changes;
            changes.add(mdct_add, "/ov/tunneld/net/interface/tunnel/vlan/config/vlan1");
            changes.add(mdct_add, "/ov/tunneld/net/interface/tunnel/vlan/config/vlan2");
            const bool fits =
                in_library(md_ifmgr_can_interface_be_added, changes.get(), vlan_pattern, 3);
            return fits ? "yes" : "no";
        },
        success,
        {{fails_once(get, 1), second_only},
         {fails_from(get, 1), {"yes"}},
         {fails(get, 2), first_only},
         {fails_once(match, 1), second_only},
         {fails_from(match, 1), {"yes"}},
         {fails(match, 2), first_only},
         {fails(Operation::ovif_network_init_sockets), success},
         {fails_once(Operation::init_model_info, 1), {"yes", {first, added(2, 2), summary(2, 0)}}},
         {fails(Operation::init_model_info), {"no", {first, added(2, 2), summary(2, 0), refusal}}}},
        forget_count};
}

FaultRow children_row()
{
    const char *const function = "md_delete_children";
    const ExpectedLine bail = unit.bail(function);
    const ExpectedLine first = gated(6, "Child 1 removed");
    const std::string both =
        "; /ov/list/1 string x; /ov/list/1/below string x; /ov/list/2 string x";
    return {function,
            "of_two",
            [](HostFixture &host) {
                for (const char *node : {"/ov/list/1", "/ov/list/1/below", "/ov/list/2"}) {
                    host.set(node, bt_string, "x");
                }
                host.db()->writable = true;
            },
            [](HostFixture &host) {
                int num = -7;
                const int status =
                    in_library(md_delete_children, &host.commit(), host.db(), "/ov/list", &num);
                std::string answer = std::to_string(status) + ' ' + std::to_string(num);
                for (const std::string &node : nodes(*host.db(), "/ov/list")) {
                    answer += "; " + node;
                }
                return answer;
            },
            {"0 2", {first, gated(6, "Child 2 removed")}},
            {{fails(Operation::mdb_get_tstr_array), {"{code} 0" + both, {bail}}},
             {hands_out_nothing(Operation::mdb_get_tstr_array), {"0 0" + both}},
             {fails(Operation::mdb_set_node_str, 1), {"{code} 0" + both, {bail}}},
             {fails(Operation::mdb_set_node_str, 2),
              {"{code} 1; /ov/list/2 string x", {first, bail}}}}};
}

} // namespace

std::vector<FaultRow> md_utils_rows()
{
    std::vector<FaultRow> rows = count_rows();
    rows.push_back(admission_row());
    rows.push_back(children_row());
    return rows;
}

} // namespace ovtest
