// Interfaces through the real daemon: who keeps them, the budget, the routes behind an address, and
// what the library does at a client's word.

#include "tests/e2e/harness.h"

#include <csignal>

#include <string>

namespace
{

using namespace e2e;
using testing::AllOf;
using testing::Contains;
using testing::HasSubstr;
using testing::StartsWith;

const std::string records = "/net/interface/config";
const std::string vlans = "/ov/tunneld/net/interface/tunnel/vlan/config";
const std::string prefixes = "/ov/tunneld/net/routes/config/ipv4/prefix";

class Interfaces : public E2eTest
{
  protected:
    void load(const std::string &text) const
    {
        const Outcome outcome = ovctl({"load", "-"}, text);
        ASSERT_EQ(outcome.exit_code, 0) << outcome.err;
    }

    void load_and_commit(const std::string &text) const
    {
        load(text);
        const Outcome outcome = ovctl({"commit"});
        ASSERT_EQ(outcome.exit_code, 0) << outcome.err;
    }

    static std::string vlan_lines(int first, int count)
    {
        std::string text;
        for (int i = first; i < first + count; ++i) {
            const std::string name = "vlan" + std::to_string(i);
            text += vlans + "/" + name + ",string," + name + "\n";
        }
        return text;
    }

    /// A line of the budget.
    std::string budget(const std::string &fact) const
    {
        for (const std::string &line : lines_of(ovctl({"show", "budget"}).out)) {
            if (line.starts_with(fact)) {
                return line.substr(line.find_last_of(' ') + 1);
            }
        }
        return "";
    }
};

TEST_F(Interfaces, StayWhileTheyAreUsed)
{
    start();
    load_and_commit(records + "/eth0,string,eth0\n" +
                    "/ov/wccpd/wccp/srv_grp/config/10/interface,string,eth0\n"
                    "/ov/redd/net/interface/vrrp/config/vr1,string,eth0\n"
                    "/ov/tunneld/system/config/mode/router/1/ifname,string,eth0\n");
    EXPECT_EQ(ovctl({"show", "interfaces"}),
              done("NAME  KIND       ENABLED  USED BY\n"
                   "eth0  interface  -        wccp group 10, vrrp interface, router interface\n"));
    ASSERT_EQ(ovctl({"delete", records + "/eth0"}), done());
    EXPECT_EQ(ovctl({"commit"}),
              refused("mgmtd refused the commit:\n  " + records +
                      "/eth0: Cannot delete an interface when used by wccp group 10, vrrp "
                      "interface, router interface. (interface)\n"
                      "    Please remove eth0 from /ov/wccpd/wccp/srv_grp/config/10/interface, "
                      "/ov/redd/net/interface/vrrp/config/vr1, "
                      "/ov/tunneld/system/config/mode/router/1/ifname first.\n"));
    load("-/ov/wccpd\n-/ov/redd\n-/ov/tunneld/system/config/mode/router\n");
    EXPECT_EQ(ovctl({"commit"}).exit_code, 0);
    EXPECT_EQ(ovctl({"show", "interfaces"}), done("no interfaces\n"));
}

TEST_F(Interfaces, MustBeThereToBeNamed)
{
    start();
    const std::string node = "/ov/redd/net/interface/vrrp/config/vr1";
    ASSERT_EQ(ovctl({"set", node, "string", "eth0"}), done());
    EXPECT_EQ(ovctl({"commit"}), refused("mgmtd refused the commit:\n  " + node +
                                         ": there is no interface \"eth0\": add " + records +
                                         "/eth0 before, or in the same commit (interface-user)\n"));
    ASSERT_EQ(ovctl({"set", records + "/eth0", "string", "eth0"}), done());
    EXPECT_EQ(ovctl({"commit"}).exit_code, 0);
}

TEST_F(Interfaces, KeepToTheBudgetOfTheModel)
{
    install_samples();
    start({"--model", "branch-100"});
    EXPECT_EQ(budget("model's limit"), "16");
    load_and_commit(vlan_lines(1, 15));
    EXPECT_EQ(budget("configured"), "15");
    load(vlan_lines(16, 2));
    EXPECT_EQ(
        ovctl({"commit"}),
        refused("mgmtd refused the commit:\n  cannot add 2 interfaces: 15 are configured, and "
                "the model allows 16: remove others before (interface-budget)\n"));
    EXPECT_EQ(budget("configured"), "15");
    ASSERT_EQ(ovctl({"discard"}).exit_code, 0);
    // What was counted is counted again after the power was cut.
    (void)stop(SIGKILL);
    start({"--model", "branch-100"});
    EXPECT_EQ(budget("configured"), "15");
    ASSERT_EQ(ovctl({"clear", vlans}), done("removed 15 children\n"));
    ASSERT_EQ(ovctl({"commit"}).exit_code, 0);
    EXPECT_EQ(budget("configured"), "0");
}

TEST_F(Interfaces, KeepToTheBudgetOfTheKernel)
{
    start();
    ASSERT_EQ(budget("in the kernel"), "1") << "the daemon's network has lo alone";
    EXPECT_EQ(budget("left"), "63");
    load(vlan_lines(1, 64));
    EXPECT_EQ(ovctl({"commit"}),
              refused("mgmtd refused the commit:\n  cannot add 64 interfaces: each takes 2 of the "
                      "kernel's, which has 1 of 127 (interface-budget)\n"));
    ASSERT_EQ(ovctl({"delete", vlans + "/vlan1"}), done());
    EXPECT_EQ(ovctl({"commit"}).exit_code, 0);
}

TEST_F(Interfaces, TakeTheRoutesBehindTheirAddressWithThem)
{
    start();
    const std::string address = records + "/eth0/addr/ipv4/static/1";
    load_and_commit(records + "/eth0,string,eth0\n" + address + "/ip,ipv4addr,192.0.2.1\n" +
                    address + "/mask_len,uint8,24\n" + prefixes +
                    "/192.168.100.0\\/24/nhop/192.0.2.9,ipv4addr,192.0.2.9\n" + prefixes +
                    "/20.0.0.0\\/8/nhop/192.0.2.9,ipv4addr,192.0.2.9\n" + prefixes +
                    "/30.0.0.0\\/8/nhop/198.51.100.9,ipv4addr,198.51.100.9\n");
    ASSERT_EQ(ovctl({"delete", address}), done());
    // The address' two nodes, and two next hops.
    EXPECT_EQ(ovctl({"commit"}), done("commit 3: 4 changes\n"));
    EXPECT_EQ(ovctl({"get", prefixes, "--subtree"}),
              done(prefixes + "/30.0.0.0\\/8/nhop/198.51.100.9 ipv4addr 198.51.100.9\n"));
    EXPECT_THAT(log_lines(log()),
                Contains("notice interface-address -: the address 192.0.2.1/24 is gone, "
                         "and 2 next hops behind it"));
}

TEST_F(Interfaces, AreEnabledAndDisabled)
{
    start();
    load_and_commit(records + "/eth0,string,eth0\n");
    ASSERT_EQ(ovctl({"enable", "eth0"}), done());
    ASSERT_EQ(ovctl({"commit"}).exit_code, 0);
    EXPECT_EQ(ovctl({"get", records + "/eth0/enable"}), done(records + "/eth0/enable bool true\n"));
    ASSERT_EQ(ovctl({"disable", "eth0"}), done());
    EXPECT_EQ(ovctl({"diff"}), done("~ " + records + "/eth0/enable: true -> false\n"));
    const Outcome unknown = ovctl({"enable", "eth9"});
    EXPECT_EQ(unknown.exit_code, 1);
    EXPECT_THAT(unknown.err, HasSubstr("there is no interface \"eth9\""));
}

TEST_F(Interfaces, LeaveAlarmsInAFile)
{
    start();
    ASSERT_EQ(ovctl({"alarm", "restart the appliance"}), done());
    ASSERT_EQ(ovctl({"alarm", "and again"}), done());
    EXPECT_EQ(read_file(root_ + "/var/opt/tms/output/upgrade_alarms.txt"),
              "restart the appliance\nand again\n");
    EXPECT_THAT(ovctl({"alarm", "two\nlines"}).err, HasSubstr("an alarm is one line"));
}

} // namespace
