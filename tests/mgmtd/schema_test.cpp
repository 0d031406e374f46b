#include "tests/mgmtd/fixture.h"

namespace
{

using namespace ovhost;
using namespace mgmtd_test;
using testing::ElementsAre;
using testing::IsEmpty;

/// What a check of the running daemon's candidate refuses.
class Schema : public DaemonTest
{
  protected:
    Schema() { configuration_.start(); }

    void set(const std::string &name, bn_type type, const std::string &text)
    {
        ASSERT_EQ(configuration_.candidate().set(name, type, text), std::nullopt);
    }

    std::vector<std::string> refusals() { return refusals_of(configuration_.check().refusals); }

    /// Those of the module itself.
    std::vector<std::string> refusals_by_type()
    {
        std::vector<std::string> texts = refusals();
        std::erase_if(texts, [](const std::string &text) { return !text.ends_with(" (schema)"); });
        return texts;
    }

    Configuration configuration_{state_.path()};
};

TEST_F(Schema, KnowsTheTypeOfEachOfItsNodes)
{
    struct Row {
        const char *node;
        const char *type;
    };
    const Row rows[] = {
        {"/net/interface/config/eth0", "string"},
        {"/net/interface/config/eth0/addr/ipv4/static/1/mask_len", "uint8"},
        {"/net/interface/config/eth0/enable", "bool"},
        {"/ov/iflabels/config/lan/inside", "string"},
        {"/ov/model/config/name", "string"},
        {"/ov/model/limits/max_interfaces", "uint32"},
        {"/ov/model/limits/max_tunnels", "uint32"},
        {"/ov/redd/net/interface/vrrp/config/vr1", "string"},
        {"/ov/tunneld/app/config/1/name", "string"},
        {"/ov/tunneld/net/interface/tunnel/ip/config/tun0", "string"},
        {"/ov/tunneld/net/interface/tunnel/vlan/config/vlan7", "string"},
        {"/ov/tunneld/net/routes/config/ipv4/prefix/p", "ipv4prefix"},
        {"/ov/tunneld/net/routes/config/ipv4/prefix/p/nhop/n/preferred_if", "string"},
        {"/ov/tunneld/system/config/10g", "bool"},
        {"/ov/tunneld/system/config/bonding", "bool"},
        {"/ov/tunneld/system/config/limits/another", "uint32"},
        {"/ov/tunneld/system/config/limits/mem_size", "uint32"},
        {"/ov/tunneld/system/config/mode", "string"},
        {"/ov/tunneld/system/config/mode/router/1/ifname", "string"},
        {"/ov/tunneld/system/config/routing_inline", "bool"},
        {"/ov/tunneld/system/config/submode", "string"},
        {"/ov/wccpd/wccp/srv_grp/config/10/interface", "string"},
    };
    std::vector<std::string> expected;
    for (const Row &row : rows) {
        set(row.node, bt_ipv4addr, "192.0.2.1");
        expected.push_back(std::string(row.node) + ": must be of type " + row.type + " (schema)");
    }
    EXPECT_EQ(refusals_by_type(), expected);
}

TEST_F(Schema, KnowsWhichNodesHoldAnAddress)
{
    for (const char *node : {"/net/interface/config/eth0/addr/ipv4/static/1/ip",
                             "/ov/tunneld/net/routes/config/ipv4/prefix/p/nhop/n"}) {
        set(node, bt_string, "192.0.2.1");
        EXPECT_THAT(refusals_by_type(),
                    testing::Contains(std::string(node) + ": must be of type ipv4addr (schema)"));
    }
}

TEST_F(Schema, KnowsTheNodesOfMapsAndAcls)
{
    struct Row {
        const char *node;
        const char *type;
    };
    // Every kind of map, with those nodes that its module looks at.
    const Row rows[] = {
        {"/ov/tunneld/acl/config/a1", "string"},
        {"/ov/tunneld/acl/config/a1/entry/10", "uint16"},
        {"/ov/tunneld/acl/config/a1/entry/10/application", "string"},
        {"/ov/tunneld/acl/config/a1/entry/10/matchstr", "string"},
        {"/ov/tunneld/acl/config/a1/entry/10/protocol", "string"},
        {"/ov/tunneld/acl/config/a1/rmap/m1/prio/10", "uint32"},
        {"/ov/tunneld/acl/config/a1/secmap/m1/prio/10", "uint32"},
        {"/ov/tunneld/nat_map/config/map/m1", "string"},
        {"/ov/tunneld/nat_map/config/map/m1/prio/10", "uint16"},
        {"/ov/tunneld/opt_map/config/map/m1/prio/10/match/0/acl", "string"},
        {"/ov/tunneld/qos_map/config/map/m1/prio/10/match/0/matchstr", "string"},
        {"/ov/tunneld/route_map/config/map/m1/prio/10/set/0/auto_mod", "string"},
        {"/ov/tunneld/route_map/config/map/m1/prio/10/set/0/auto_prefif", "string"},
        {"/ov/tunneld/sec_map/config/map/map1/z1", "string"},
        {"/ov/tunneld/sec_map/config/map/map1/z1/prio/10", "uint16"},
        {"/ov/tunneld/sec_map/config/map/map1/z1/prio/10/match/acl", "string"},
        {"/ov/tunneld/sec_map/config/map/map1/z1/prio/10/match/matchstr", "string"},
        {"/ov/tunneld/stats_map/config/map/m1/prio/10/match/0/application", "string"},
    };
    for (const Row &row : rows) {
        set(row.node, bt_ipv4addr, "192.0.2.1");
    }
    const std::vector<std::string> present = refusals();
    for (const Row &row : rows) {
        EXPECT_THAT(present, testing::Contains(std::string(row.node) + ": must be of type " +
                                               row.type + " (schema)"));
    }
}

TEST_F(Schema, LeavesOtherNodesAlone)
{
    set("/ov/tunneld/system/config/limits/a/b", bt_string, "x");
    set("/ov/tunneld/system/config/mode/router/1/other", bt_uint8, "1");
    set("/ov/model/config/other", bt_bool, "true");
    set("/somewhere/else", bt_string, "x");
    EXPECT_THAT(refusals(), IsEmpty());
}

TEST_F(Schema, TakesTheThreeModesAndNoOther)
{
    for (const char *mode : {"bridge", "router", "server"}) {
        set("/ov/tunneld/system/config/mode", bt_string, mode);
        EXPECT_THAT(refusals(), IsEmpty()) << mode;
    }
    for (const char *mode : {"", "Router", "routers", "rout", "rou%ter"}) {
        set("/ov/tunneld/system/config/mode", bt_string, mode);
        EXPECT_THAT(refusals(), ElementsAre("/ov/tunneld/system/config/mode: must be bridge, "
                                            "router or server, not \"" +
                                            std::string(mode) + "\" (schema)"));
    }
}

TEST_F(Schema, TakesEverySubmode)
{
    set("/ov/tunneld/system/config/submode", bt_string, "whatever, really");
    EXPECT_THAT(refusals(), IsEmpty());
}

TEST_F(Schema, LetsNodesGo)
{
    for (const char *node : {"/ov/tunneld/system/config/mode", "/ov/tunneld/system/config/limits"})
        ASSERT_EQ(configuration_.candidate().erase(node), std::nullopt);
    EXPECT_THAT(refusals(), IsEmpty());
}

TEST_F(Schema, RefusesACommitAndLeavesEverythingAsItWas)
{
    const auto before = nodes_of(configuration_.running());
    set("/ov/tunneld/system/config/mode", bt_string, "x");
    set("/ov/tunneld/system/config/limits/mem_size", bt_string, "y");
    set("/fine", bt_string, "z");
    const CommitReport report = configuration_.commit(daemon_note("no"));
    EXPECT_EQ(report.outcome, CommitOutcome::refused);
    EXPECT_THAT(refusals_of(report.refusals),
                ElementsAre("/ov/tunneld/system/config/limits/mem_size: must be of type uint32 "
                            "(schema)",
                            "/ov/tunneld/system/config/mode: must be bridge, router or server, not "
                            "\"x\" (schema)"));
    EXPECT_EQ(nodes_of(configuration_.running()), before);
    EXPECT_EQ(configuration_.commit_number(), 1U);
    EXPECT_EQ(configuration_.candidate().pending(configuration_.running()).size(), 3U);
}

} // namespace
