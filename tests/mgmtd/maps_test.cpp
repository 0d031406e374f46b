// Maps in a commit: host/modules/maps.h and map_checks.h, and dns_proxy_maps.h.

#include "host/modules/maps.h"

#include "framework/appliance.h"
#include "tests/mgmtd/map_fixture.h"

namespace
{

using namespace ovhost;
using namespace mgmtd_test;
using testing::ElementsAre;
using testing::IsEmpty;

class Maps : public EveryMapKind
{
};

INSTANTIATE_TEST_SUITE_P(Kinds, Maps, testing::ValuesIn(map_kinds), key_of);

/// What only the kinds have that are no security maps.
class RegularMaps : public EveryMapKind
{
};

INSTANTIATE_TEST_SUITE_P(Kinds, RegularMaps,
                         testing::ValuesIn(map_kinds.begin(), map_kinds.begin() + 5), key_of);

TEST_P(Maps, AreCompletedByTheCommitThatAddsThem)
{
    set(match("m1", "10", "matchstr"), "any");
    ASSERT_EQ(commit(), "committed");
    EXPECT_EQ(value(map_node(kind(), "m1")), "string m1");
    EXPECT_EQ(value(entry("m1", "10")), "uint16 10");
    EXPECT_EQ(value(match("m1", "10", "matchstr")), "string any");
    EXPECT_THAT(configuration_->candidate().pending(configuration_->running()), IsEmpty());
}

TEST_P(Maps, RecordTheAclsThatTheyName)
{
    add_acl("a1");
    set(match("m1", "10", "acl"), "a1");
    set(match("m1", "20", "acl"), "a1");
    set(match("m2", "10", "acl"), "a1");
    ASSERT_EQ(commit(), "committed");
    const std::string key = kind().key;
    EXPECT_THAT(records(), ElementsAre("a1/" + key + "/m1/10", "a1/" + key + "/m1/20",
                                       "a1/" + key + "/m2/10"));
}

TEST_P(Maps, MoveARecordWithTheAcl)
{
    add_acl("a1");
    add_acl("a2");
    set(match("m1", "10", "acl"), "a1");
    set(match("m1", "20", "acl"), "a1");
    ASSERT_EQ(commit(), "committed");
    set(match("m1", "10", "acl"), "a2");
    ASSERT_EQ(commit(), "committed");
    const std::string key = kind().key;
    EXPECT_THAT(records(), ElementsAre("a1/" + key + "/m1/20", "a2/" + key + "/m1/10"));
    set(match("m1", "20", "acl"), "");
    ASSERT_EQ(commit(), "committed");
    EXPECT_THAT(records(), ElementsAre("a2/" + key + "/m1/10"));
}

TEST_P(Maps, TakeTheirRecordsAlong)
{
    add_acl("a1");
    set(match("m1", "10", "acl"), "a1");
    set(match("m1", "20", "acl"), "a1");
    set(match("m2", "10", "acl"), "a1");
    ASSERT_EQ(commit(), "committed");
    erase(entry("m1", "10"));
    erase(map_node(kind(), "m2"));
    ASSERT_EQ(commit(), "committed");
    EXPECT_THAT(records(), ElementsAre("a1/" + std::string(kind().key) + "/m1/20"));
    EXPECT_EQ(value(map_node(kind(), "m1")), "string m1");
    EXPECT_EQ(value(map_node(kind(), "m2")), "none");
}

TEST_P(Maps, LoseTheRecordWithTheAclsNode)
{
    add_acl("a1");
    for (const char *priority : {"10", "20", "30"}) {
        set(match("m1", priority, "acl"), "a1");
    }
    ASSERT_EQ(commit(), "committed");
    erase(match("m1", "10", "acl"));
    ASSERT_EQ(commit(), "committed");
    const std::string key = kind().key;
    EXPECT_THAT(records(), ElementsAre("a1/" + key + "/m1/20", "a1/" + key + "/m1/30"));
    erase(entry("m1", "20") + "/match");
    ASSERT_EQ(commit(), "committed");
    EXPECT_THAT(records(), ElementsAre("a1/" + key + "/m1/30"));
    erase(match("m1", "30", "acl"));
    ASSERT_EQ(commit(), "committed");
    EXPECT_THAT(records(), IsEmpty());
    EXPECT_EQ(value(entry("m1", "30")), "uint16 30");
}

TEST_P(Maps, LoseTheRecordOfAnEntryThatIsReplacedWithoutAcl)
{
    add_acl("a1");
    for (const char *priority : {"10", "20", "30"}) {
        set(match("m1", priority, "acl"), "a1");
    }
    set(match("m2", "10", "acl"), "a1");
    ASSERT_EQ(commit(), "committed");
    erase(entry("m1", "10"));
    set(match("m1", "10", "matchstr"), "any");
    erase(entry("m1", "20"));
    erase(map_node(kind(), "m2"));
    set(match("m2", "10", "matchstr"), "any");
    ASSERT_EQ(commit(), "committed");
    EXPECT_THAT(records(), ElementsAre("a1/" + std::string(kind().key) + "/m1/30"));
    EXPECT_EQ(value(entry("m2", "10")), "uint16 10");
}

TEST_P(Maps, KeepTheRecordOfAnEntryThatIsReplaced)
{
    add_acl("a1");
    set(match("m1", "10", "acl"), "a1");
    ASSERT_EQ(commit(), "committed");
    erase(map_node(kind(), "m1"));
    set(match("m1", "10", "acl"), "a1");
    set(entry("m1", "10") + "/note", "the same ACL");
    ASSERT_EQ(commit(), "committed");
    EXPECT_THAT(records(), ElementsAre("a1/" + std::string(kind().key) + "/m1/10"));
    EXPECT_EQ(value(map_node(kind(), "m1")), "string m1");
    EXPECT_EQ(value(entry("m1", "10")), "uint16 10");
}

TEST_P(Maps, HaveNoRecordOfTheDefaultEntry)
{
    add_acl("a1");
    set(match("m1", "65535", "acl"), "a1");
    ASSERT_EQ(commit(), "committed");
    EXPECT_THAT(records(), IsEmpty());
}

TEST_P(Maps, NameAclsThatAreThere)
{
    set(match("m1", "10", "acl"), "a1");
    const std::string module = std::string(" (") + kind().name + ")\n";
    EXPECT_EQ(commit_in_vain(), match("m1", "10", "acl") +
                                    ": there is no ACL \"a1\": set /ov/tunneld/acl/config/NAME to "
                                    "its name first" +
                                    module);
    // With a part of its own, an ACL is there.
    set(match("m1", "10", "acl"), "a1");
    set(acl("a1/entry/10/protocol"), "tcp");
    EXPECT_EQ(commit(), "committed");
    EXPECT_THAT(records(), ElementsAre("a1/" + std::string(kind().key) + "/m1/10"));
}

TEST_P(Maps, TakeNoAclThatGoesInTheSameCommit)
{
    add_acl("a1");
    ASSERT_EQ(commit(), "committed");
    erase(acl("a1"));
    set(match("m1", "10", "acl"), "a1");
    EXPECT_EQ(commit_in_vain(), match("m1", "10", "acl") +
                                    ": there is no ACL \"a1\": set /ov/tunneld/acl/config/NAME to "
                                    "its name first (" +
                                    kind().name + ")\n");
}

TEST_P(Maps, RefuseBadMatchStrings)
{
    set(match("m1", "10", "matchstr"), "dst_port:80,nonsense");
    EXPECT_EQ(commit_in_vain(),
              match("m1", "10", "matchstr") +
                  ": Invalid match string dst_port:80,nonsense - pair \"nonsense\": it has no "
                  "colon; write key:value\n (" +
                  kind().name + ")\n");
    set(match("m1", "10", "matchstr"), "vlan:a\\/b");
    EXPECT_EQ(
        commit_in_vain(),
        match("m1", "10", "matchstr") +
            ": Invalid match string vlan:a\\/b - pair \"vlan:a\\/b\": the value must be a label "
            "or a VLAN's name: 1 to 233 bytes without slash and backslash, and not * alone\n "
            "(" +
            kind().name + ")\n");
    const std::string longest = "application:" + std::string(1023 - 12, 'a');
    for (const std::size_t length : {1024U, 1000000U}) {
        set(match("m1", "10", "matchstr"), longest + std::string(length - 1023, 'a'));
        EXPECT_EQ(commit_in_vain(),
                  match("m1", "10", "matchstr") + ": Invalid match string application:" +
                      std::string(60 - 12, 'a') + "... (" + std::to_string(length) +
                      " bytes) - it is longer than 1023 characters\n (" + kind().name + ")\n");
    }
    set(match("m1", "10", "matchstr"), longest);
    EXPECT_EQ(commit(), "committed");
}

TEST_P(Maps, TakeALabelOrAVlanInAMatchString)
{
    set(match("m1", "10", "matchstr"), "vlan:vlan4094");
    EXPECT_EQ(commit(), "committed");
    set(match("m1", "10", "matchstr"), "vlan:a label with blanks");
    EXPECT_EQ(commit(), match("m1", "10", "matchstr") +
                            ": the VLAN of \"vlan:a label with blanks\" is neither an interface "
                            "label nor a name that a VLAN can have (" +
                            kind().name + ")\n");
    set("/ov/iflabels/config/lan/a label with blanks", "1");
    EXPECT_EQ(commit(), "committed");
}

TEST_P(Maps, MatchBeforeTheySet)
{
    const std::string parameter = kind().type == MAP_TYPE_SEC ? "/set" : "/set/0";
    set(entry("m1", "10") + parameter + "/auto_mod", "balanced");
    // The parameter's own node is the one that the library looks at.
    EXPECT_EQ(commit_in_vain(),
              entry("m1", "10") + parameter +
                  ": The match parameters have to be configured before configuring the set "
                  "parameters. (" +
                  kind().name + ")\n");
    set(entry("m1", "10") + parameter + "/auto_mod", "balanced");
    set(match("m1", "10", "matchstr"), "any");
    EXPECT_EQ(commit(), "committed");
    EXPECT_EQ(value(entry("m1", "10") + parameter),
              kind().type == MAP_TYPE_SEC ? "string set" : "string 0");
    // What is set already may be changed, whatever is matched.
    erase(entry("m1", "10") + "/match");
    set(entry("m1", "10") + parameter + "/auto_mod", "preferred-if");
    EXPECT_EQ(commit(), "committed");
}

TEST_P(Maps, HaveEntriesFrom1To65535)
{
    set(entry("m1", "1"), bt_uint16, "1");
    set(entry("m1", "65535"), bt_uint16, "65535");
    EXPECT_EQ(commit(), "committed");
    for (const char *priority : {"0", "65536", "010", "-1", "1a", "ten", "+1", " 1"}) {
        set(entry("m1", priority) + "/note", "x");
        EXPECT_EQ(commit_in_vain(),
                  entry("m1", priority) +
                      "/note: an entry's priority is a decimal number from 1 to 65535, not \"" +
                      priority + "\" (" + kind().name + ")\n");
    }
}

TEST_P(Maps, HoldTheirNames)
{
    set(map_node(kind(), "m1"), "m2");
    set(entry("m1", "10"), bt_uint16, "11");
    const std::string module = std::string(" (") + kind().name + ")\n";
    EXPECT_EQ(commit_in_vain(), map_node(kind(), "m1") + ": must hold the map's name, \"m1\"" +
                                    module + entry("m1", "10") +
                                    ": must hold the entry's priority, \"10\"" + module);
}

TEST_P(Maps, HavePlainNames)
{
    const std::string longest(255, 'm');
    set(map_node(kind(), longest), longest);
    EXPECT_EQ(commit(), "committed");
    const std::string too_long = longest + "m";
    set(map_node(kind(), too_long), too_long);
    EXPECT_EQ(commit_in_vain(), map_node(kind(), too_long) +
                                    ": a map's name is 1 to 255 bytes long, not 256 (" +
                                    kind().name + ")\n");
    struct Row {
        const char *name;
        const char *character;
    };
    set(map_node(kind(), "a\nb"), "a\nb");
    EXPECT_EQ(commit_in_vain(), map_node(kind(), "a\nb") +
                                    ": a map's name must not hold control characters, as "
                                    "\"a\\nb\" does: choose another name (" +
                                    kind().name + ")\n");
    for (const auto &[name, character] :
         {Row{"a/b", "/"}, Row{"a\\b", "\\"}, Row{"*", "*"}, Row{"a*", "*"}}) {
        set(map_node(kind(), name), name);
        EXPECT_EQ(commit_in_vain(), map_node(kind(), name) + ": a map's name must not hold \"" +
                                        character + "\": choose another name (" + kind().name +
                                        ")\n");
    }
}

TEST_P(Maps, AreCheckedAtAnyDepth)
{
    const std::string below = "/prio/10/match/0/c/d/e/f/g/h/i/j/k/l/m/n/o/p";
    set(map_node(kind(), "m1") + below, "x");
    EXPECT_EQ(commit(), "committed");
    EXPECT_EQ(value(map_node(kind(), "m1")), "string m1");
    EXPECT_EQ(value(map_node(kind(), "m1") + "/prio/10"), "uint16 10");
    const std::string nasty = map_node(kind(), "a/b") + below;
    set(nasty, "x");
    EXPECT_EQ(commit_in_vain(), nasty +
                                    ": a map's name must not hold \"/\": choose another name (" +
                                    kind().name + ")\n");
}

TEST_P(Maps, LeaveNothingOfARefusedCommit)
{
    add_acl("a1");
    ASSERT_EQ(commit(), "committed");
    const auto before = nodes_of(configuration_->running());
    set(match("m1", "10", "acl"), "a1");
    set(match("m1", "20", "matchstr"), "nonsense");
    EXPECT_THAT(commit(), testing::StartsWith(match("m1", "20", "matchstr") +
                                              ": Invalid match string nonsense - "));
    EXPECT_EQ(nodes_of(configuration_->running()), before);
}

TEST_P(RegularMaps, AreTenAtMost)
{
    for (unsigned i = 1; i <= 10; ++i) {
        set(match("m" + std::to_string(i), "10", "matchstr"), "any");
    }
    ASSERT_EQ(commit(), "committed");
    set(match("m11", "10", "matchstr"), "any");
    EXPECT_EQ(commit_in_vain(), map_node(kind(), "m11") +
                                    ": Cannot add map because maximum reached. (" + kind().name +
                                    ")\n");
    set(match("m10", "20", "matchstr"), "any");
    EXPECT_EQ(commit(), "committed") << "a new entry is no new map";
}

TEST_P(RegularMaps, MatchByIndex0)
{
    add_acl("a1");
    set(entry("m1", "10") + "/match/1/acl", "a1");
    EXPECT_EQ(commit_in_vain(), entry("m1", "10") +
                                    "/match/1/acl: an entry matches by match/0 alone, not by "
                                    "match/1 (" +
                                    kind().name + ")\n");
}

struct EntryLimit {
    const char *node;
    const char *key;
};

class LimitedMaps : public MapTest, public testing::WithParamInterface<EntryLimit>
{
};

INSTANTIATE_TEST_SUITE_P(Kinds, LimitedMaps,
                         testing::Values(EntryLimit{"max_rmap_entries", "rmap"},
                                         EntryLimit{"max_omap_entries", "omap"},
                                         EntryLimit{"max_qmap_entries", "qmap"},
                                         EntryLimit{"max_smap_entries", "smap"},
                                         EntryLimit{"max_nmap_entries", "secmap"}),
                         [](const auto &limit) { return std::string(limit.param.key); });

TEST_P(LimitedMaps, HaveTwiceTheModelsNumberOfEntries)
{
    const MapKind &kind = *find_map_kind(GetParam().key);
    set(std::string("/ov/model/limits/") + GetParam().node, bt_uint32, "2");
    // Of each map one entry is taken for the default one.
    for (const char *priority : {"1", "2", "3", "65535"}) {
        set(matched(kind, "m1", priority, "matchstr"), "any");
    }
    set(matched(kind, "m2", "65535", "matchstr"), "any");
    ASSERT_EQ(commit(), "committed");
    set(matched(kind, "m2", "1", "matchstr"), "any");
    ASSERT_EQ(commit(), "committed") << "the fourth";
    set(matched(kind, "m1", "4", "matchstr"), "any");
    EXPECT_EQ(commit_in_vain(), entry_node(kind, "m1", "4") +
                                    ": Cannot add map entry because maximum reached. (" +
                                    kind.name + ")\n");
    set(matched(kind, "m1", "3", "matchstr"), "dst_port:80");
    EXPECT_EQ(commit(), "committed") << "an entry that is there may change";
}

class NatMaps : public MapTest
{
};

TEST_F(NatMaps, HaveTheirEntriesCountedForNothing)
{
    set("/ov/model/limits/max_nmap_entries", bt_uint32, "1");
    ASSERT_EQ(commit(), "committed");
    for (unsigned priority = 1; priority <= 5; ++priority) {
        set(matched(*find_map_kind("nmap"), "m1", std::to_string(priority), "matchstr"), "any");
        EXPECT_EQ(commit(), "committed");
    }
    set("/ov/model/limits/max_nmap_entries", bt_uint32, "0");
    ASSERT_EQ(commit(), "committed");
    set(matched(*find_map_kind("nmap"), "m1", "6", "matchstr"), "any");
    EXPECT_EQ(commit_in_vain(), "/ov/tunneld/nat_map/config/map/m1/prio/6: Cannot add map entry "
                                "because maximum reached. (nat-map)\n");
}

class SecurityMaps : public MapTest
{
};

TEST_F(SecurityMaps, AreOneMap)
{
    for (const char *leaf : {"matchstr", "a/b/c/d/e/f/g/h/i/j"}) {
        const std::string node =
            std::string("/ov/tunneld/sec_map/config/map/map2/z1/prio/10/match/") + leaf;
        set(node, "any");
        EXPECT_EQ(commit_in_vain(), node + ": the one security map is called map1: set nodes below "
                                           "/ov/tunneld/sec_map/config/map/map1 (sec-map)\n");
    }
}

TEST_F(SecurityMaps, HaveMoreThanTenParts)
{
    for (unsigned i = 1; i <= 12; ++i) {
        set(matched(*find_map_kind("secmap"), "z" + std::to_string(i), "10", "matchstr"), "any");
    }
    EXPECT_EQ(commit(), "committed");
    set(matched(*find_map_kind("secmap"), "z13", "10", "matchstr"), "any");
    EXPECT_EQ(commit(), "committed");
}

class DnsProxyMaps : public MapTest
{
};

TEST_F(DnsProxyMaps, HaveNoRoomForAMap)
{
    G_daemon_log_level = 2; // to the library's other checks this kind is unknown, which it logs
    set("/ov/dnsproxy/config/0/map/d1", "d1");
    EXPECT_EQ(commit_in_vain(), "/ov/dnsproxy/config/0/map/d1: Cannot add map because maximum "
                                "reached. (dns-proxy-map)\n");
}

TEST_F(DnsProxyMaps, DoNotComeWithTheirEntries)
{
    G_daemon_log_level = 2;
    for (const char *below : {"d1/prio/10", "d1/prio/10/x", "d1/x"}) {
        set(std::string("/ov/dnsproxy/config/0/map/") + below,
            std::string(below).ends_with("10") ? bt_uint16 : bt_string, "10");
        EXPECT_EQ(commit_in_vain(), "/ov/dnsproxy/config/0/map/d1: Cannot add map because maximum "
                                    "reached. (dns-proxy-map)\n");
    }
}

TEST_F(DnsProxyMaps, HaveEntriesAsTheModelAllowsAny)
{
    G_daemon_log_level = 2;
    put_in_store("/ov/dnsproxy/config/0/map/d1", bt_string, "d1");
    set("/ov/dnsproxy/config/0/map/d1/prio/10/x", "x");
    EXPECT_EQ(commit(), "committed");
    EXPECT_EQ(value("/ov/dnsproxy/config/0/map/d1/prio/10"), "uint16 10");
    set("/ov/model/limits/max_dns_proxy_map_entries", bt_uint32, "0");
    ASSERT_EQ(commit(), "committed");
    set("/ov/dnsproxy/config/0/map/d1/prio/20", bt_uint16, "20");
    EXPECT_EQ(commit_in_vain(), "/ov/dnsproxy/config/0/map/d1/prio/20: Cannot add map entry "
                                "because maximum reached. (dns-proxy-map)\n");
}

TEST_F(DnsProxyMaps, HaveNamesAndNumbersAsOtherMapsHave)
{
    G_daemon_log_level = 2;
    struct Row {
        const char *node;
        const char *message;
    };
    const Row rows[] = {
        {"0/map/a\\/b/prio/10", "a map's name must not hold \"/\": choose another name"},
        {"0/map/d1", "must hold the map's name, \"d1\""},
        {"0/map/d1/prio/abc",
         "an entry's priority is a decimal number from 1 to 65535, not \"abc\""},
        {"0/map/d1/prio/0/x", "an entry's priority is a decimal number from 1 to 65535, not \"0\""},
        {"0/map/d1/prio/10", "must hold the entry's priority, \"10\""},
        {"1/map/d1", "DNS-proxy maps are those of VRF 0, not \"1\""},
        {"1/map/d1/prio/10/x", "DNS-proxy maps are those of VRF 0, not \"1\""},
        {"1/map/d1/a/b/c/d/e/f/g/h/i/j/k/l", "DNS-proxy maps are those of VRF 0, not \"1\""},
    };
    for (const auto &[node, message] : rows) {
        const std::string name = std::string("/ov/dnsproxy/config/") + node;
        set(name, "x");
        EXPECT_THAT(commit_in_vain(), testing::StartsWith(name + ": " + message + " ("));
    }
}

} // namespace
