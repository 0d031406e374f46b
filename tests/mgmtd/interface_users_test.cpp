// WCCP groups, VRRP entries and router mode name interfaces: host/modules/interface_users.h.

#include "host/modules/interface_users.h"

#include "tests/mgmtd/interface_fixture.h"

namespace
{

using namespace ovhost;
using namespace mgmtd_test;

class InterfaceUsers : public InterfaceTest
{
  protected:
    std::string uses(const std::string &name)
    {
        std::string text;
        for (const InterfaceUse &use : interface_uses(configuration_->running_db(), name)) {
            text += use.node + " " + use.text + "\n";
        }
        return text;
    }
};

TEST_F(InterfaceUsers, NameInterfacesThatAreThere)
{
    add_interface("eth0");
    ASSERT_EQ(commit(), "committed");
    for (const std::string &node : {wccp("10"), vrrp("vr1"), router("1")}) {
        set(node, "eth9");
        const std::string refusal = node +
                                    ": there is no interface \"eth9\": add "
                                    "/net/interface/config/eth9 before, or in the same commit "
                                    "(interface-user)\n";
        EXPECT_EQ(commit_in_vain(), refusal);
        set(node, "eth0");
        EXPECT_EQ(commit(), "committed");
        set(node, "eth9");
        EXPECT_EQ(commit_in_vain(), refusal) << "as a modification as well";
    }
}

TEST_F(InterfaceUsers, TakeInterfacesOfAllKindsFromTheirCommitOn)
{
    add_interface("eth0");
    add_vlan("vlan7");
    add_tunnel_interface("tun0");
    set(wccp("10"), "eth0");
    set(wccp("20"), "vlan7");
    set(vrrp("vr1"), "tun0");
    EXPECT_EQ(commit(), "committed");
}

TEST_F(InterfaceUsers, DoNotTakeANodeBelowAnInterfaceForOne)
{
    add_interface("eth0");
    set(record("eth0/enable"), bt_bool, "true");
    ASSERT_EQ(commit(), "committed");
    set(vrrp("vr1"), "eth0/enable");
    EXPECT_EQ(commit_in_vain(), vrrp("vr1") + ": there is no interface \"eth0/enable\": add "
                                              "/net/interface/config/eth0\\/enable before, or in "
                                              "the same commit (interface-user)\n");
}

TEST_F(InterfaceUsers, HaveNamesThatTheLibraryFinds)
{
    add_interface("eth0");
    ASSERT_EQ(commit(), "committed");
    set(wccp("1\\/0"), "eth0");
    EXPECT_EQ(commit_in_vain(), wccp("1\\/0") + ": a WCCP group's name must not hold \"/\": choose "
                                                "another name (interface-user)\n");
    set(vrrp("v*"), "eth0");
    EXPECT_EQ(commit_in_vain(), vrrp("v*") + ": a VRRP entry's name must not hold \"*\": choose "
                                             "another name (interface-user)\n");
}

TEST_F(InterfaceUsers, AreListedInTheLibrarysOrder)
{
    add_interface("eth0");
    add_interface("eth1");
    set(router("1"), "eth0");
    set(router("2"), "eth1");
    set(vrrp("vr1"), "eth0");
    set(wccp("10"), "eth0");
    ASSERT_EQ(commit(), "committed");
    EXPECT_EQ(uses("eth0"), wccp("10") + " wccp group 10\n" + vrrp("vr1") + " vrrp interface\n" +
                                router("1") + " router interface\n");
    EXPECT_EQ(uses("eth1"), router("2") + " router interface\n");
    EXPECT_EQ(uses("eth2"), "");
}

} // namespace
