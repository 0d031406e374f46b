#include "framework/appliance.h"

#include <gtest/gtest.h>

namespace ovhost::test
{
namespace
{

TEST(VlanName, MayBe)
{
    for (const char *name : {"v",
                             "vlan",
                             "vlan1",
                             "vlan4094",
                             "vlan0007",
                             "vlanA",
                             "vlan5x",
                             "eth0.1",
                             "eth0.4094",
                             "eth0.",
                             "bond0.a1",
                             "a.b.7",
                             "abcdefghijklmno",
                             "wan-1_2",
                             "vlan5.7",
                             ".a",
                             "Vlan5000",
                             "1",
                             "100",
                             "4094",
                             "0007",
                             "1a",
                             "a*b",
                             "\xc3\xa9"}) {
        EXPECT_EQ(ovlan_valid_name_check(name), 0) << name;
    }
}

TEST(VlanName, MayNotBe)
{
    for (const char *name : {"",           ".",         "..",       "abcdefghijklmnop",
                             "a/b",        "a:b",       "a b",      "a\tb",
                             "a\nb",       "vlan0",     "vlan4095", "vlan99999999",
                             "eth0.0",     "eth0.4095", "a.b.0",    "vlan5.0",
                             "vlan5.5000", "0",         "4095",     "123456789012345",
                             "a%b",        "a%d",       "\xc3\xa0"}) {
        EXPECT_EQ(ovlan_valid_name_check(name), 14501) << name;
    }
    EXPECT_EQ(ovlan_valid_name_check(nullptr), 14001);
}

} // namespace
} // namespace ovhost::test
