// The answers about interfaces and their budget: host/mgmtd/show_interfaces.h.

#include "host/mgmtd/show_interfaces.h"

#include "framework/appliance.h"
#include "host/mgmtd/show.h"
#include "tests/mgmtd/interface_fixture.h"

#include <nlohmann/json.hpp>

namespace
{

using namespace ovhost;
using namespace mgmtd_test;
using nlohmann::json;

class ShowInterfaces : public InterfaceTest
{
  protected:
    json ask(const char *what) { return answer_show(*configuration_, {{"what", what}}); }
};

TEST_F(ShowInterfaces, ListsThemWithTheirUsers)
{
    EXPECT_EQ(ask("interfaces").dump(), R"({"interfaces":[]})");
    add_interface("eth1");
    add_interface("eth0");
    set(record("eth0/enable"), bt_bool, "true");
    set(record("eth1/enable"), bt_bool, "false");
    add_vlan("vlan7");
    add_tunnel_interface("tun0");
    set(wccp("10"), "eth0");
    set(vrrp("vr1"), "eth0");
    set(router("1"), "vlan7");
    ASSERT_EQ(commit(), "committed");
    EXPECT_EQ(ask("interfaces").dump(),
              R"({"interfaces":[{"enabled":true,"kind":"interface","name":"eth0","users":[)"
              R"({"node":"/ov/wccpd/wccp/srv_grp/config/10/interface","text":"wccp group 10"},)"
              R"({"node":"/ov/redd/net/interface/vrrp/config/vr1","text":"vrrp interface"}]},)"
              R"({"enabled":false,"kind":"interface","name":"eth1","users":[]},)"
              R"({"enabled":null,"kind":"tunnel","name":"tun0","users":[]},)"
              R"({"enabled":null,"kind":"vlan","name":"vlan7","users":[)"
              R"({"node":"/ov/tunneld/system/config/mode/router/1/ifname",)"
              R"("text":"router interface"}]}]})");
}

TEST_F(ShowInterfaces, ListsAVlanWithARecordOnce)
{
    add_vlan("vlan7");
    set(record("vlan7/enable"), bt_bool, "true");
    ASSERT_EQ(commit(), "committed");
    EXPECT_EQ(ask("interfaces").dump(),
              R"({"interfaces":[{"enabled":true,"kind":"vlan","name":"vlan7","users":[]}]})");
}

TEST_F(ShowInterfaces, TellsTheBudget)
{
    set("/ov/model/limits/max_interfaces", bt_uint32, "4");
    add_vlan("vlan7");
    ASSERT_EQ(commit(), "committed");
    EXPECT_EQ(ask("budget"), (json{{"configured", 1},
                                   {"allowed", 4},
                                   {"in_kernel", ovif_get_ifcount()},
                                   {"index_budget", 128},
                                   {"each_takes", 2},
                                   {"left", 3}}));
}

} // namespace
