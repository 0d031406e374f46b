// VLANs, interface labels and preferred interfaces in a commit: host/modules/map_interfaces.h.

#include "host/modules/map_interfaces.h"

#include "tests/mgmtd/map_fixture.h"

namespace
{

using namespace ovhost;
using namespace mgmtd_test;

class Vlans : public MapTest
{
  protected:
    static std::string vlan(const std::string &name)
    {
        return "/ov/tunneld/net/interface/tunnel/vlan/config/" + name;
    }

    void prefer(const std::string &name)
    {
        set(rmap("m1/prio/10/match/0/matchstr"), "any");
        set(rmap("m1/prio/10/set/0/auto_prefif"), name);
    }
};

TEST_F(Vlans, HaveNamesThatVlansCanHave)
{
    set(vlan("vlan4094"), "vlan4094");
    set(vlan("wan0"), "wan0");
    EXPECT_EQ(commit(), "committed");
    for (const std::string name : {"vlan0", "vlan4095", "a name with blanks", "aaaaaaaaaaaaaaaa"}) {
        set(vlan(name), name);
        EXPECT_EQ(commit_in_vain(),
                  vlan(name) + ": \"" + name + "\" is not a name that a VLAN can have (vlan)\n");
    }
}

TEST_F(Vlans, StayWhileARouteMapPrefersThem)
{
    set(vlan("vlan7"), "vlan7");
    set(vlan("vlan70"), "vlan70");
    prefer("vlan7");
    ASSERT_EQ(commit(), "committed");
    const std::string refusal =
        vlan("vlan7") + ": Cannot delete a vlan when used by a route-map preferred interface.\n"
                        "  Please remove vlan vlan7 from associated route-map first. (vlan)\n";
    erase(vlan("vlan7"));
    EXPECT_EQ(commit_in_vain(), refusal);
    erase(vlan("vlan70"));
    EXPECT_EQ(commit(), "committed");
    // The entry's choice is read as it was before the commit.
    erase(vlan("vlan7"));
    prefer("vlan70");
    EXPECT_EQ(commit_in_vain(), refusal);
    prefer("vlan70");
    ASSERT_EQ(commit(), "committed");
    erase(vlan("vlan7"));
    EXPECT_EQ(commit(), "committed");
}

TEST_F(Vlans, GoWithTheEntryThatPrefersThem)
{
    set(vlan("vlan7"), "vlan7");
    prefer("vlan7");
    ASSERT_EQ(commit(), "committed");
    erase(vlan("vlan7"));
    erase(rmap("m1/prio/10"));
    EXPECT_EQ(commit(), "committed");
}

class InterfaceLabels : public EveryMapKind
{
  protected:
    static std::string label(const std::string &category, const std::string &name)
    {
        return "/ov/iflabels/config/" + category + "/" + name;
    }
};

INSTANTIATE_TEST_SUITE_P(Kinds, InterfaceLabels, testing::ValuesIn(map_kinds), key_of);

TEST_P(InterfaceLabels, StayWhileAMatchStringHasThem)
{
    const std::string name = kind().name;
    set(label("lan", "inside"), "1");
    set(label("wan", "inside"), "2");
    set(label("wan", "outside"), "3");
    set(match("m1", "10", "matchstr"), "dst_port:80,VLAN:inside");
    set(match("m1", "20", "matchstr"), "application:outside");
    ASSERT_EQ(commit(), "committed");
    erase(label("lan", "inside"));
    EXPECT_EQ(commit(), "committed") << "another category still has it";
    erase(label("wan", "outside"));
    EXPECT_EQ(commit(), "committed") << "nothing has it for a label";
    erase(label("wan", "inside"));
    EXPECT_EQ(commit_in_vain(), label("wan", "inside") +
                                    ": Cannot delete an interface label when used by a " + name +
                                    ".\n  Please remove vlan:inside from " + name +
                                    " m1, entry 10 first. (interface-label)\n");
    erase(label("wan", "inside"));
    set(match("m1", "10", "matchstr"), "dst_port:80");
    EXPECT_EQ(commit(), "committed");
}

class InterfaceLabelNames : public MapTest
{
};

TEST_F(InterfaceLabelNames, ArePlain)
{
    set("/ov/iflabels/config/lan/a\\/b", "1");
    EXPECT_EQ(commit_in_vain(), "/ov/iflabels/config/lan/a\\/b: an interface label must not hold "
                                "\"/\": choose another name (interface-label)\n");
    set("/ov/iflabels/config/lan/a\nb", "1");
    EXPECT_EQ(commit_in_vain(), "/ov/iflabels/config/lan/a\nb: an interface label must not hold "
                                "control characters, as \"a\\nb\" does: choose another name "
                                "(interface-label)\n");
}

// Behind 255 characters the library's "/ov/iflabels/config/*/LABEL" would be of another label.
TEST_F(InterfaceLabelNames, AreAsLongAsTheLibraryCanLookThemUp)
{
    const std::string longest(233, 'l');
    set("/ov/iflabels/config/lan/" + longest, "1");
    set(rmap("m1/prio/10/match/0/matchstr"), "vlan:" + longest);
    EXPECT_EQ(commit(), "committed");
    set(rmap("m1/prio/10/match/0/matchstr"), "vlan:" + longest + "l");
    EXPECT_THAT(commit_in_vain(),
                testing::HasSubstr("the value must be a label or a VLAN's name: 1 to 233 bytes"));
    set("/ov/iflabels/config/lan/" + longest + "l", "1");
    EXPECT_EQ(commit_in_vain(), "/ov/iflabels/config/lan/" + longest +
                                    "l: an interface label is 1 to 233 bytes long, not 234 "
                                    "(interface-label)\n");
}

TEST_F(InterfaceLabelNames, StayWhileAnAclMatchesByThem)
{
    const std::string label = "/ov/iflabels/config/wan/a long label with blanks";
    set(label, "1");
    set(acl("a1/entry/10/matchstr"), "dst_port:80,vlan:a long label with blanks");
    ASSERT_EQ(commit(), "committed");
    erase(label);
    EXPECT_EQ(commit_in_vain(), label +
                                    ": Cannot delete an interface label when used by an ACL.\n"
                                    "  Please remove vlan:a long label with blanks from ACL a1, "
                                    "entry 10 first. (interface-label)\n");
    erase(label);
    erase(acl("a1/entry/10"));
    EXPECT_EQ(commit(), "committed");
}

class PreferredInterfaces : public MapTest
{
  protected:
    static std::string preferred(const std::string &address)
    {
        return "/ov/tunneld/net/routes/config/ipv4/prefix/10.0.0.0\\/8/nhop/" + address +
               "/preferred_if";
    }

    void set_mode(const std::string &mode)
    {
        set(rmap("m1/prio/10/match/0/matchstr"), "any");
        set(rmap("m1/prio/10/set/0/auto_mod"), mode);
    }
};

TEST_F(PreferredInterfaces, LeaveOneForTheRouteMapsThatGoByThem)
{
    set(preferred("192.0.2.1"), "wan0");
    set(preferred("192.0.2.2"), "wan1");
    set_mode("preferred-if");
    ASSERT_EQ(commit(), "committed");
    erase(preferred("192.0.2.1"));
    EXPECT_EQ(commit(), "committed") << "one is left";
    erase(preferred("192.0.2.2"));
    EXPECT_EQ(commit_in_vain(),
              preferred("192.0.2.2") +
                  ": Cannot delete the last preferred interface when used by a route-map.\n"
                  "  Please change auto_mod \"preferred-if\" of the route-map's entries first, in "
                  "a commit of its own. (preferred-interface)\n");
    set_mode("balanced");
    ASSERT_EQ(commit(), "committed");
    erase(preferred("192.0.2.2"));
    EXPECT_EQ(commit(), "committed");
}

} // namespace
