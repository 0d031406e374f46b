// Addresses of interfaces in a commit, and the routes behind them:
// host/modules/interface_addresses.h.

#include "host/modules/interface_addresses.h"

#include "tests/mgmtd/interface_fixture.h"

namespace
{

using namespace ovhost;
using namespace mgmtd_test;
using testing::Contains;
using testing::ElementsAre;
using testing::IsEmpty;
using testing::Not;

class Addresses : public InterfaceTest
{
  protected:
    static std::string address(const std::string &interface, const std::string &number)
    {
        return record(interface + "/addr/ipv4/static/" + number);
    }

    /// eth0 with 192.0.2.1/24, and what else the test begins with.
    void begin()
    {
        add_interface("eth0");
        set_address("eth0", "1", "192.0.2.1", "24");
        ASSERT_EQ(commit(), "committed");
    }

    /// What the log says of routes that went.
    std::vector<std::string> removals_told() const
    {
        std::vector<std::string> texts;
        for (const ovhost::test::LoggedLine &line : log_.lines) {
            if (line.unit == "interface-address") {
                texts.push_back(line.text);
            }
        }
        return texts;
    }

    /// The names of the nodes of routes in force, "PREFIX" and "PREFIX/nhop/ADDRESS".
    std::vector<std::string> routes() const
    {
        std::vector<std::string> texts;
        const std::string root = route({});
        for (const std::string &node : nodes_of(configuration_->running())) {
            if (node.starts_with(root)) {
                texts.push_back(node.substr(root.size(), node.find(' ') - root.size()));
            }
        }
        return texts;
    }
};

TEST_F(Addresses, TakeTheRoutesBehindThemWithThem)
{
    begin();
    add_route("10.0.0.0/8", "192.0.2.254");
    add_route("10.1.0.0/16", "192.0.2.254");
    add_route("10.1.0.0/16", "198.51.100.1");
    add_route("10.2.0.0/16", "198.51.100.1");
    ASSERT_EQ(commit(), "committed");
    erase(address("eth0", "1"));
    EXPECT_EQ(commit(), "committed");
    EXPECT_THAT(routes(), ElementsAre("10.1.0.0\\/16", "10.1.0.0\\/16/nhop/198.51.100.1",
                                      "10.2.0.0\\/16", "10.2.0.0\\/16/nhop/198.51.100.1"));
    EXPECT_THAT(removals_told(),
                ElementsAre("the address 192.0.2.1/24 is gone, and 2 next hops behind it"));
}

TEST_F(Addresses, GoWithTheirInterface)
{
    begin();
    add_route("10.0.0.0/8", "192.0.2.254");
    ASSERT_EQ(commit(), "committed");
    erase(record("eth0"));
    EXPECT_EQ(commit(), "committed");
    EXPECT_THAT(routes(), IsEmpty());
    EXPECT_THAT(removals_told(),
                ElementsAre("the address 192.0.2.1/24 is gone, and 1 next hop behind it"));
}

TEST_F(Addresses, ThatBecomeOthersLoseTheirRoutes)
{
    begin();
    add_route("10.0.0.0/8", "192.0.2.254");
    ASSERT_EQ(commit(), "committed");
    set(address("eth0", "1") + "/ip", bt_ipv4addr, "198.51.100.1");
    EXPECT_EQ(commit(), "committed");
    EXPECT_THAT(routes(), IsEmpty());
}

TEST_F(Addresses, KeepTheRoutesIntoASubnetThatAnotherAddressLeadsInto)
{
    begin();
    add_route("10.0.0.0/8", "192.0.2.254");
    ASSERT_EQ(commit(), "committed");
    set(address("eth0", "1") + "/ip", bt_ipv4addr, "192.0.2.9");
    ASSERT_EQ(commit(), "committed");
    set(address("eth0", "1") + "/mask_len", bt_uint8, "16");
    ASSERT_EQ(commit(), "committed");
    add_interface("eth1");
    set_address("eth1", "1", "192.0.7.1", "16");
    erase(address("eth0", "1"));
    ASSERT_EQ(commit(), "committed");
    EXPECT_THAT(routes(), ElementsAre("10.0.0.0\\/8", "10.0.0.0\\/8/nhop/192.0.2.254"));
    EXPECT_THAT(removals_told(), IsEmpty());
    // Half of the subnet is not all of it.
    set_address("eth1", "1", "192.0.7.1", "17");
    ASSERT_EQ(commit(), "committed");
    EXPECT_THAT(routes(), IsEmpty());
}

TEST_F(Addresses, TakeTheRoutesOfEveryMaskLength)
{
    struct Row {
        const char *mask_length;
        const char *near;
        const char *far;
    };
    for (const Row &row :
         {Row{"0", "9.9.9.9", ""}, Row{"8", "192.9.9.9", "193.0.2.1"},
          Row{"24", "192.0.2.9", "192.0.3.1"}, Row{"32", "192.0.2.1", "192.0.2.2"}}) {
        add_interface("eth0");
        set_address("eth0", "1", "192.0.2.1", row.mask_length);
        add_route("10.0.0.0/8", row.near);
        if (*row.far != '\0') {
            add_route("11.0.0.0/8", row.far);
        }
        ASSERT_EQ(commit(), "committed");
        erase(address("eth0", "1"));
        ASSERT_EQ(commit(), "committed");
        EXPECT_THAT(routes(), Not(Contains("10.0.0.0\\/8"))) << row.mask_length;
        EXPECT_EQ(routes().size(), *row.far != '\0' ? 2U : 0U) << row.mask_length;
        if (*row.far != '\0') {
            erase(route("11.0.0.0/8"));
        }
    }
}

/// A shorter name that comes after a longer one is not found by the library.
TEST_F(Addresses, TakeRoutesWhateverTheirOrder)
{
    begin();
    for (int round = 0; round < 2; ++round) {
        add_route("192.168.100.0/24", "192.0.2.254");
        add_route("20.0.0.0/8", "192.0.2.254");
        add_route("203.0.113.128/25", "192.0.2.254");
        add_route("30.0.0.0/8", "192.0.2.254");
        set_address("eth0", "1", "192.0.2.1", "24");
        ASSERT_EQ(commit(), "committed");
        erase(address("eth0", "1"));
        EXPECT_EQ(commit(), "committed");
        EXPECT_THAT(routes(), IsEmpty());
        EXPECT_THAT(removals_told(),
                    Contains("the address 192.0.2.1/24 is gone, and 4 next hops behind it"));
        log_.lines.clear();
    }
}

TEST_F(Addresses, OfARefusedCommitKeepTheirRoutes)
{
    begin();
    add_route("10.0.0.0/8", "192.0.2.254");
    ASSERT_EQ(commit(), "committed");
    erase(address("eth0", "1"));
    ASSERT_TRUE(configuration_->check().accepted());
    set("/ov/tunneld/system/config/mode", "no mode");
    EXPECT_EQ(commit_in_vain(), "/ov/tunneld/system/config/mode: must be bridge, router or server, "
                                "not \"no mode\" (schema)\n");
    EXPECT_EQ(routes().size(), 2U);
    EXPECT_THAT(removals_told(), IsEmpty());
}

TEST_F(Addresses, AreWhole)
{
    const std::string half = ": an address is ip and mask_len: " + address("eth0", "1") +
                             " has only one of them (interface-address)\n";
    set(address("eth0", "1") + "/ip", bt_ipv4addr, "192.0.2.1");
    EXPECT_EQ(commit_in_vain(), address("eth0", "1") + "/ip" + half);
    set(address("eth0", "1") + "/mask_len", bt_uint8, "24");
    EXPECT_EQ(commit_in_vain(), address("eth0", "1") + "/mask_len" + half);
    begin();
    erase(address("eth0", "1") + "/mask_len");
    EXPECT_EQ(commit_in_vain(), address("eth0", "1") + "/mask_len" + half);
    set(address("eth0", "1") + "/mask_len", bt_uint8, "33");
    EXPECT_EQ(commit_in_vain(),
              address("eth0", "1") + "/mask_len: must be 0 to 32, not 33 (interface-address)\n");
}

} // namespace
