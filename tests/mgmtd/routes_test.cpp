// Routes in a commit: host/modules/routes.h.

#include "host/modules/routes.h"

#include "tests/mgmtd/interface_fixture.h"

namespace
{

using namespace ovhost;
using namespace mgmtd_test;
using testing::ElementsAre;
using testing::IsEmpty;

class Routes : public InterfaceTest
{
};

TEST_F(Routes, HaveProperPrefixesAndNextHops)
{
    for (const std::string prefix :
         {"0.0.0.0/0", "10.0.0.0/8", "10.1.0.0/16", "192.0.2.128/25", "192.0.2.1/32"}) {
        add_route(prefix, "192.0.2.254");
        EXPECT_EQ(commit(), "committed") << prefix;
    }
}

TEST_F(Routes, WithoutAProperPrefixAreRefused)
{
    for (const std::string prefix :
         {"10.0.0.0", "10.0.0/8", "10.0.0.0/33", "2001:db8::/32", "x/8"}) {
        const std::string node = route(prefix, "192.0.2.1");
        set(node, bt_ipv4addr, "192.0.2.1");
        EXPECT_EQ(commit_in_vain(), node + ": \"" + prefix +
                                        "\" is not an IPv4 prefix: write it as 10.0.0.0\\/8 "
                                        "(route)\n");
    }
    const std::string node = route("10.1.2.3/8", "192.0.2.1");
    set(node, bt_ipv4addr, "192.0.2.1");
    EXPECT_EQ(commit_in_vain(),
              node + ": \"10.1.2.3/8\" is to be written as \"10.0.0.0/8\" (route)\n");
    const std::string zero = route("10.0.0.0/08", "192.0.2.1");
    set(zero, bt_ipv4addr, "192.0.2.1");
    EXPECT_EQ(commit_in_vain(),
              zero + ": \"10.0.0.0/08\" is to be written as \"10.0.0.0/8\" (route)\n");
}

TEST_F(Routes, WithoutAProperNextHopAreRefused)
{
    for (const std::string hop : {"192.0.2", "eth0", "2001:db8::1", "192.0.2.256"}) {
        const std::string node = route("10.0.0.0/8", hop);
        set(node + "/preferred_if", "wan0");
        EXPECT_EQ(commit_in_vain(), node + "/preferred_if: \"" + hop +
                                        "\" is not the IPv4 address of a next hop (route)\n");
    }
}

TEST_F(Routes, HoldTheirNames)
{
    set(route("10.0.0.0/8"), bt_ipv4prefix, "11.0.0.0/8");
    EXPECT_EQ(commit_in_vain(),
              route("10.0.0.0/8") + ": must hold the prefix, \"10.0.0.0/8\" (route)\n");
    set(route("10.0.0.0/8", "192.0.2.1"), bt_ipv4addr, "192.0.2.2");
    EXPECT_EQ(commit_in_vain(), route("10.0.0.0/8", "192.0.2.1") +
                                    ": must hold the next hop, \"192.0.2.1\" (route)\n");
}

TEST_F(Routes, AreFoundByTheSubnetOfTheirNextHops)
{
    add_route("10.0.0.0/8", "192.0.2.1");
    add_route("10.0.0.0/8", "192.0.2.129");
    add_route("10.1.0.0/16", "192.0.3.1");
    add_route("10.2.0.0/16", "193.0.2.1");
    ASSERT_EQ(commit(), "committed");
    const auto in = [this](const std::string &address, uint8 mask_length) {
        return next_hops_in(configuration_->running_db(), {address, mask_length});
    };
    EXPECT_THAT(in("192.0.2.1", 32), ElementsAre(route("10.0.0.0/8", "192.0.2.1")));
    EXPECT_THAT(in("192.0.2.2", 32), IsEmpty());
    EXPECT_THAT(in("192.0.2.2", 25), ElementsAre(route("10.0.0.0/8", "192.0.2.1")));
    EXPECT_THAT(in("192.0.2.2", 24),
                ElementsAre(route("10.0.0.0/8", "192.0.2.1"), route("10.0.0.0/8", "192.0.2.129")));
    EXPECT_EQ(in("192.9.9.9", 8).size(), 3U);
    EXPECT_EQ(in("1.2.3.4", 0).size(), 4U);
}

} // namespace
