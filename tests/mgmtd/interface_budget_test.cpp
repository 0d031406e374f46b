// The interface budget in a commit, and its count: host/modules/interface_budget.h.

#include "host/modules/interface_budget.h"

#include "framework/appliance.h"
#include "orvale/md_utils.h"
#include "tests/commit/support.h"
#include "tests/mgmtd/interface_fixture.h"

namespace
{

using namespace ovhost;
using namespace mgmtd_test;

class Budget : public InterfaceTest
{
  protected:
    void allow(unsigned interfaces)
    {
        set("/ov/model/limits/max_interfaces", bt_uint32, std::to_string(interfaces));
        ASSERT_EQ(commit(), "committed");
    }

    void add_vlans(int first, int count)
    {
        for (int i = first; i < first + count; ++i) {
            add_vlan("vlan" + std::to_string(i));
        }
    }

    /// A refusal is about the commit as a whole.
    static std::string refused(const std::string &text)
    {
        return ": " + text + " (interface-budget)\n";
    }
};

TEST_F(Budget, CountsWhatIsStored)
{
    EXPECT_EQ(md_ifmgr_get_ifcount(), 0);
    add_vlans(1, 2);
    add_tunnel_interface("tun0");
    add_interface("eth0"); // has no part in it
    EXPECT_EQ(md_ifmgr_get_ifcount(), 0) << "nothing is stored yet";
    ASSERT_TRUE(configuration_->check().accepted());
    EXPECT_EQ(md_ifmgr_get_ifcount(), 0) << "a dry run";
    ASSERT_EQ(commit(), "committed");
    EXPECT_EQ(md_ifmgr_get_ifcount(), 3);
    set(vlan("vlan1/other"), "x");
    ASSERT_EQ(commit(), "committed");
    EXPECT_EQ(md_ifmgr_get_ifcount(), 3);
    erase(vlan("vlan2"));
    erase(tunnel_interface("tun0"));
    add_vlans(3, 1);
    ASSERT_EQ(commit(), "committed");
    EXPECT_EQ(md_ifmgr_get_ifcount(), 2);
}

TEST_F(Budget, CountsAfreshAtEachStart)
{
    add_vlans(1, 2);
    add_tunnel_interface("tun0");
    ASSERT_EQ(commit(), "committed");
    restart();
    EXPECT_EQ(md_ifmgr_get_ifcount(), 3);
    // Left behind by something else.
    md_ifmgr_ifcount_dec(40);
    restart();
    EXPECT_EQ(md_ifmgr_get_ifcount(), 3);
}

TEST_F(Budget, DoesNotCountARefusedCommit)
{
    add_vlans(1, 2);
    set("/ov/tunneld/system/config/mode", "no mode");
    EXPECT_NE(commit_in_vain(), "committed");
    EXPECT_EQ(md_ifmgr_get_ifcount(), 0);
}

TEST_F(Budget, DoesNotCountACommitThatIsNotStored)
{
    commit_test::MemoryStore store;
    InterfaceBudgetModule module;
    CommitEngine engine(store);
    engine.add_module(module);
    engine.load();
    engine.start_modules();
    Candidate candidate(engine.running());
    ASSERT_EQ(candidate.set(vlan("vlan1"), bt_string, "vlan1"), std::nullopt);
    store.failure = "the disk is full";
    EXPECT_EQ(engine.commit(candidate, {}).outcome, CommitOutcome::not_stored);
    store.failure.reset();
    EXPECT_EQ(md_ifmgr_get_ifcount(), 0);
    EXPECT_EQ(engine.commit(candidate, {}).outcome, CommitOutcome::committed);
    EXPECT_EQ(md_ifmgr_get_ifcount(), 1);
}

TEST_F(Budget, OfTheModelIsSharedByBothKinds)
{
    allow(3);
    add_vlans(1, 2);
    add_tunnel_interface("tun0");
    add_tunnel_interface("tun1");
    EXPECT_EQ(commit_in_vain(), refused("cannot add 4 interfaces: 0 are configured, and the model "
                                        "allows 3: remove others before"));
    add_vlans(1, 2);
    add_tunnel_interface("tun0");
    ASSERT_EQ(commit(), "committed") << "3 are not too many";
    add_vlans(3, 1);
    EXPECT_EQ(commit_in_vain(), refused("cannot add 1 interface: 3 are configured, and the model "
                                        "allows 3: remove others before"));
    EXPECT_EQ(md_ifmgr_get_ifcount(), 3);
}

TEST_F(Budget, GetsRoomFromRemovedOnesAfterTheCommit)
{
    allow(1);
    add_vlans(1, 1);
    ASSERT_EQ(commit(), "committed");
    erase(vlan("vlan1"));
    add_vlans(2, 1);
    EXPECT_EQ(commit_in_vain(), refused("cannot add 1 interface: 1 are configured, and the model "
                                        "allows 1: those that are removed make room after the "
                                        "commit only, so remove them before"));
    erase(vlan("vlan1"));
    ASSERT_EQ(commit(), "committed");
    add_vlans(2, 1);
    EXPECT_EQ(commit(), "committed");
}

TEST_F(Budget, OfTheKernelIsMeasuredByItsCount)
{
    ASSERT_EQ(ovif_get_ifcount(), 1) << "the program's network has lo alone";
    // Each takes two, and 127 is not too many.
    add_vlans(1, 64);
    EXPECT_EQ(commit_in_vain(), refused("cannot add 64 interfaces: each takes 2 of the kernel's, "
                                        "which has 1 of 127"));
    EXPECT_GE(g_ovif_skfd, 0) << "the library has had the socket opened";
    add_vlans(1, 63);
    EXPECT_EQ(commit(), "committed");
}

TEST_F(Budget, TellsWhatIsLeft)
{
    allow(5);
    add_vlans(1, 2);
    ASSERT_EQ(commit(), "committed");
    const InterfaceBudget budget = measure_interface_budget();
    EXPECT_EQ(budget.configured, 2U);
    EXPECT_EQ(budget.allowed, 5U);
    EXPECT_EQ(budget.in_kernel, 1U);
    EXPECT_EQ(budget.left, 3U);
    allow(1);
    EXPECT_EQ(measure_interface_budget().left, 0U);
    allow(1000);
    EXPECT_EQ(measure_interface_budget().left, 63U);
}

} // namespace
