// Interfaces in a commit: host/modules/net_interfaces.h.

#include "host/modules/net_interfaces.h"

#include "tests/mgmtd/interface_fixture.h"

namespace
{

using namespace mgmtd_test;

class NetInterfaces : public InterfaceTest
{
  protected:
    /// A deletion, its refusal, and no change of what is in force.
    std::string erase_in_vain(const std::string &node)
    {
        erase(node);
        const std::string text = commit_in_vain();
        EXPECT_NE(value(node), "none");
        return text;
    }

    static std::string refusal(const std::string &node, const std::string &users,
                               const std::string &name, const std::string &nodes)
    {
        return node + ": Cannot delete an interface when used by " + users + ".\n  Please remove " +
               name + " from " + nodes + " first. (interface)\n";
    }
};

TEST_F(NetInterfaces, StayWhileAnythingUsesThem)
{
    add_interface("eth0");
    set(wccp("10"), "eth0");
    set(wccp("20"), "eth0");
    set(vrrp("vr1"), "eth0");
    set(router("2"), "eth0");
    ASSERT_EQ(commit(), "committed");
    EXPECT_EQ(erase_in_vain(record("eth0")),
              refusal(record("eth0"),
                      "wccp group 10, wccp group 20, vrrp interface, router "
                      "interface",
                      "eth0",
                      wccp("10") + ", " + wccp("20") + ", " + vrrp("vr1") + ", " + router("2")));
}

TEST_F(NetInterfaces, StayForEachUserByItself)
{
    struct Row {
        std::string user;
        std::string text;
    };
    for (const Row &row : {Row{wccp("10"), "wccp group 10"}, Row{vrrp("vr1"), "vrrp interface"},
                           Row{router("1"), "router interface"}}) {
        add_interface("eth0");
        set(row.user, "eth0");
        ASSERT_EQ(commit(), "committed");
        EXPECT_EQ(erase_in_vain(record("eth0")),
                  refusal(record("eth0"), row.text, "eth0", row.user));
        erase(row.user);
        ASSERT_EQ(commit(), "committed");
        erase(record("eth0"));
        EXPECT_EQ(commit(), "committed") << row.text;
    }
}

TEST_F(NetInterfaces, OfTunneldStayAsWell)
{
    add_vlan("vlan7");
    add_tunnel_interface("tun0");
    set(wccp("10"), "vlan7");
    set(vrrp("vr1"), "tun0");
    ASSERT_EQ(commit(), "committed");
    EXPECT_EQ(erase_in_vain(vlan("vlan7")),
              refusal(vlan("vlan7"), "wccp group 10", "vlan7", wccp("10")));
    EXPECT_EQ(erase_in_vain(tunnel_interface("tun0")),
              refusal(tunnel_interface("tun0"), "vrrp interface", "tun0", vrrp("vr1")));
}

TEST_F(NetInterfaces, GoTogetherWithTheirUsers)
{
    add_interface("eth0");
    add_interface("eth1");
    set(wccp("10"), "eth0");
    set(vrrp("vr1"), "eth0");
    set(router("1"), "eth0");
    ASSERT_EQ(commit(), "committed");
    erase(record("eth0"));
    erase("/ov/wccpd/wccp/srv_grp/config/10");
    erase(vrrp("vr1"));
    set(router("1"), "eth1");
    EXPECT_EQ(commit(), "committed");
    EXPECT_EQ(value(record("eth0")), "none");
}

TEST_F(NetInterfaces, GoWhenOthersOfLikeNamesAreUsed)
{
    add_interface("eth1");
    add_interface("eth10");
    add_interface("Eth1");
    set(wccp("10"), "eth10");
    set(router("1"), "Eth1");
    ASSERT_EQ(commit(), "committed");
    erase(record("eth1"));
    EXPECT_EQ(commit(), "committed");
}

TEST_F(NetInterfaces, AreThereWithWhatIsBelowThem)
{
    set(record("eth0/enable"), bt_bool, "true");
    set(vlan("vlan7/other"), "x");
    ASSERT_EQ(commit(), "committed");
    EXPECT_EQ(value(record("eth0")), "string eth0");
    EXPECT_EQ(value(vlan("vlan7")), "string vlan7");
    // Replaced, not deleted: its user may stay.
    set(router("1"), "eth0");
    ASSERT_EQ(commit(), "committed");
    erase(record("eth0"));
    set(record("eth0/enable"), bt_bool, "false");
    EXPECT_EQ(commit(), "committed");
    EXPECT_EQ(value(record("eth0")), "string eth0");
    EXPECT_EQ(value(record("eth0/enable")), "bool false");
}

TEST_F(NetInterfaces, HaveNamesThatTheKernelTakes)
{
    add_interface("aaaaaaaaaaaaaaa");
    add_interface("eth0.7");
    EXPECT_EQ(commit(), "committed");
    const auto named = [](const std::string &name) {
        return "\"" + name +
               "\" is not a name that an interface can have: leave out blanks and the characters "
               "/ : % \\ * (interface)\n";
    };
    for (const std::string name : {"a b", "a:b", "a%d", "a*", "..", "a\tb"}) {
        add_interface(name);
        EXPECT_EQ(commit_in_vain(), record(name) + ": " + named(name));
    }
    set(record("a\\/b"), "a/b");
    EXPECT_EQ(commit_in_vain(), record("a\\/b") + ": " + named("a/b"));
    add_tunnel_interface("aaaaaaaaaaaaaaaa");
    EXPECT_EQ(commit_in_vain(), tunnel_interface("aaaaaaaaaaaaaaaa") +
                                    ": an interface's name is 1 to 15 bytes long, not 16 "
                                    "(interface)\n");
}

TEST_F(NetInterfaces, HoldTheirNames)
{
    set(record("eth0"), "eth1");
    EXPECT_EQ(commit_in_vain(),
              record("eth0") + ": must hold the interface's name, \"eth0\" (interface)\n");
}

TEST_F(NetInterfaces, AreOfTwoKinds)
{
    const std::string node = "/ov/tunneld/net/interface/tunnel/bond/config/b0";
    set(node, "b0");
    EXPECT_EQ(commit_in_vain(), node + ": there are no interfaces of kind \"bond\": it is \"vlan\" "
                                       "or \"ip\" (interface)\n");
}

} // namespace
