// A legacy configuration becomes match strings: the conversion laid over a candidate, and the
// request that commits it.

#include "host/modules/legacy_upgrade.h"

#include "host/control/request_error.h"
#include "host/control/server.h"
#include "host/mgmtd/requests.h"
#include "host/tree/name.h"
#include "tests/mgmtd/fixture.h"

#include <nlohmann/json.hpp>

namespace
{

using namespace ovhost;
using namespace mgmtd_test;
using nlohmann::json;
using testing::ElementsAre;
using testing::HasSubstr;
using testing::IsEmpty;
using testing::StartsWith;

const std::string route_maps = "/ov/tunneld/route_map/config/map";

/// Lines of one entry: fields are "NODE,TYPE,VALUE" below its match node.
std::string entry_text(const std::string &entry, const std::vector<std::string> &fields)
{
    std::string text;
    for (const std::string &field : fields) {
        text += entry;
        text += "/match/0/" + field + "\n";
    }
    return text;
}

class LegacyUpgradeTest : public DaemonTest
{
  protected:
    LegacyUpgradeTest() { log_.lines.clear(); }

    /// "CONVERTED/BY-ACL" when all is well, else "LINE NODE|MESSAGE" for each fault.
    std::vector<std::string> upgrade(const std::string &text)
    {
        const LegacyUpgrade result = upgrade_legacy(candidate_, text);
        if (result.is_done()) {
            return {std::to_string(result.converted) + "/" + std::to_string(result.by_acl)};
        }
        std::vector<std::string> faults;
        for (const auto *list : {&result.line_faults, &result.entry_faults}) {
            for (const LineFault &fault : *list) {
                faults.push_back(std::to_string(fault.line) + " " + fault.node + "|" +
                                 fault.message);
            }
        }
        return faults;
    }

    void in_force(const std::string &text)
    {
        ASSERT_THAT(load_text(candidate_, text).faults, IsEmpty());
        candidate_ = Candidate(candidate_.tree());
    }

    std::vector<std::string> nodes() const { return nodes_of(candidate_.tree()); }

    Candidate candidate_;
};

TEST_F(LegacyUpgradeTest, TakesNothingForNothing)
{
    EXPECT_THAT(upgrade("# nothing\n"), ElementsAre("0/0"));
    EXPECT_THAT(nodes(), IsEmpty());
}

struct FieldCase {
    const char *what;
    std::vector<std::string> fields;
    const char *match_string;
};

const FieldCase field_cases[] = {
    {"no fields that say anything",
     {"application,string,any", "src/port,string,0", "dest/port,string,0", "vlan,string,any",
      "protocol,string,ip", "dscp,string,any"},
     "any"},
    {"IPv4 alone", {"ipver,string,ipv4"}, "src_ip:0.0.0.0/0,dst_ip:0.0.0.0/0"},
    {"IPv6 with a source",
     {"ipver,string,ipv6", "source/addr/ipv6/static/ipv6prefix,ipv6prefix,2001:db8::/32"},
     "src_ip:2001:db8::/32,dst_ip:::/0"},
    {"a mask",
     {"ipver,string,ipv4", "source/addr/ipv4/static/ipaddr,ipv4addr,10.0.0.0",
      "source/addr/ipv4/static/mask_len,string,255.0.0.0"},
     "src_ip:10.0.0.0/8,dst_ip:0.0.0.0/0"},
    {"a mask length",
     {"ipver,string,ipv4", "dest/addr/ipv4/static/ipaddr,ipv4addr,10.0.0.0",
      "dest/addr/ipv4/static/mask_len,uint8,8"},
     "src_ip:0.0.0.0/0,dst_ip:10.0.0.0/8"},
    {"any version, which has no addresses",
     {"ipver,string,any", "source/addr/ipv4/static/ipaddr,ipv4addr,10.0.0.0",
      "source/addr/ipv4/static/mask_len,string,8"},
     "any"},
    {"every key in its order",
     {"dscp,string,ef", "protocol,string,tcp", "vlan,string,wan0", "dest/port,string,443",
      "src/port,string,1024-65535", "ipver,string,ipv4",
      "source/addr/ipv4/static/ipaddr,ipv4addr,10.1.0.0",
      "source/addr/ipv4/static/mask_len,string,16",
      "dest/addr/ipv4/static/ipaddr,ipv4addr,10.2.0.0", "dest/addr/ipv4/static/mask_len,string,24",
      "application,string,web"},
     "application:web,src_ip:10.1.0.0/16,dst_ip:10.2.0.0/24,src_port:1024-65535,dst_port:443,"
     "vlan:wan0,protocol:tcp,dscp:ef"},
};

TEST_F(LegacyUpgradeTest, TurnsFieldsIntoAMatchString)
{
    const std::string entry = route_maps + "/m/prio/10";
    for (const FieldCase &row : field_cases) {
        candidate_ = Candidate();
        EXPECT_THAT(upgrade(entry + ",uint16,10\n" + entry_text(entry, row.fields)),
                    ElementsAre("1/0"))
            << row.what;
        EXPECT_THAT(nodes(), ElementsAre(entry + " uint16 10",
                                         entry + "/match/0/matchstr string " + row.match_string))
            << row.what;
    }
}

TEST_F(LegacyUpgradeTest, ConvertsTheFiveKindsThatHaveAnOlderForm)
{
    std::string text;
    for (const char *maps :
         {"route_map", "opt_map", "qos_map", "stats_map", "nat_map", "sec_map"}) {
        text += entry_text("/ov/tunneld/" + std::string(maps) + "/config/map/m/prio/10",
                           {"dscp,string,ef"});
    }
    EXPECT_THAT(upgrade(text), ElementsAre("5/0"));
    EXPECT_THAT(
        nodes(),
        ElementsAre("/ov/tunneld/nat_map/config/map/m/prio/10/match/0/matchstr string dscp:ef",
                    "/ov/tunneld/opt_map/config/map/m/prio/10/match/0/matchstr string dscp:ef",
                    "/ov/tunneld/qos_map/config/map/m/prio/10/match/0/matchstr string dscp:ef",
                    "/ov/tunneld/route_map/config/map/m/prio/10/match/0/matchstr string dscp:ef",
                    "/ov/tunneld/sec_map/config/map/m/prio/10/match/0/dscp string ef",
                    "/ov/tunneld/stats_map/config/map/m/prio/10/match/0/matchstr string dscp:ef"));
}

TEST_F(LegacyUpgradeTest, LeavesAnEntryWithAnAclAllButItsApplication)
{
    const std::string entry = route_maps + "/m/prio/10";
    EXPECT_THAT(upgrade(entry_text(entry, {"acl,string,a1", "application,string,web",
                                           "ipver,string,ipv4", "dscp,string,ef"})),
                ElementsAre("0/1"));
    EXPECT_THAT(nodes(),
                ElementsAre(entry + "/match/0/acl string a1", entry + "/match/0/dscp string ef",
                            entry + "/match/0/ipver string ipv4"));
}

TEST_F(LegacyUpgradeTest, SetsEverythingElseOfTheFileAndKeepsWhatItDoesNotName)
{
    in_force("/a,string,old\n/b,string,kept\n/c/d,string,gone\n" +
             entry_text(route_maps + "/today/prio/10", {"matchstr,string,dscp:1"}));
    EXPECT_THAT(upgrade("/a,string,new\n-/c\n" +
                        entry_text(route_maps + "/m/prio/65535", {"ipver,string,any"})),
                ElementsAre("1/0"));
    EXPECT_THAT(nodes(), ElementsAre("/a string new", "/b string kept",
                                     route_maps + "/m/prio/65535/match/0/matchstr string any",
                                     route_maps + "/today/prio/10/match/0/matchstr string dscp:1"));
}

TEST_F(LegacyUpgradeTest, PutsTheFilesMatchInThePlaceOfTheOneInForce)
{
    const std::string entry = route_maps + "/m/prio/10";
    in_force(entry + ",uint16,10\n" + entry + "/set/0,string,kept\n" +
             entry_text(entry, {"matchstr,string,dscp:1", "ipver,string,ipv6"}));
    EXPECT_THAT(upgrade(entry_text(entry, {"acl,string,a1"})), ElementsAre("0/1"));
    EXPECT_THAT(nodes(), ElementsAre(entry + " uint16 10", entry + "/match/0/acl string a1",
                                     entry + "/set/0 string kept"));
}

TEST_F(LegacyUpgradeTest, DoneTwiceChangesNothing)
{
    const std::string text =
        entry_text(route_maps + "/m/prio/10", {"vlan,string,wan0"}) +
        entry_text(route_maps + "/m/prio/20", {"acl,string,a1", "application,string,web"});
    ASSERT_THAT(upgrade(text), ElementsAre("1/1"));
    const std::vector<std::string> first = nodes();
    candidate_ = Candidate(candidate_.tree());
    EXPECT_THAT(upgrade(text), ElementsAre("1/1"));
    EXPECT_EQ(nodes(), first);
}

TEST_F(LegacyUpgradeTest, TakesTheAclFromAnEntryInForce)
{
    const std::string entry = route_maps + "/m/prio/10";
    in_force(entry_text(entry, {"acl,string,a1"}));
    EXPECT_THAT(upgrade(entry_text(entry, {"dscp,string,ef"})), ElementsAre("1/0"));
    EXPECT_THAT(nodes(), ElementsAre(entry + "/match/0/matchstr string dscp:ef"));
}

// Else a file that sets something else of an entry would have it match everything.
TEST_F(LegacyUpgradeTest, KeepsTheMatchInForceOfAnEntryThatSaysNothingOfIt)
{
    const std::string entry = route_maps + "/m/prio/";
    in_force(entry_text(entry + "10", {"matchstr,string,dst_port:80"}) +
             entry_text(entry + "20", {"acl,string,a1"}) + entry + "30,uint16,30\n");
    EXPECT_THAT(upgrade(entry + "10/set/0/x,string,1\n" + entry + "20,uint16,20\n" + entry +
                        "20/match/0,string,0\n" + entry + "30/note,string,n\n" + entry +
                        "40,uint16,40\n"),
                ElementsAre("1/0"));
    EXPECT_THAT(nodes(),
                ElementsAre(entry + "10/match/0/matchstr string dst_port:80",
                            entry + "10/set/0/x string 1", entry + "20 uint16 20",
                            entry + "20/match/0 string 0", entry + "20/match/0/acl string a1",
                            entry + "30 uint16 30", entry + "30/note string n",
                            entry + "40 uint16 40", entry + "40/match/0/matchstr string any"));
}

// Passed over, a field that narrows an entry down would be lost.
TEST_F(LegacyUpgradeTest, RefusesFieldsThatItDoesNotKnow)
{
    const std::string entry = route_maps + "/m/prio/";
    const std::string advice =
        "\", and without it the entry would match more; mend its name, or remove it";
    EXPECT_THAT(
        upgrade(entry_text(entry + "10", {"dscp,string,ef", "dest/prot,string,80"}) +
                entry_text(entry + "20", {"a\\/b,string,x"}) +
                entry_text(entry + "30", {"source/addr/ipv4/static,string,x"}) +
                entry_text(entry + "40", {"acl,string,a1", "protocols,string,tcp"})),
        ElementsAre("0 " + entry + "10/match/0|an upgrade knows no field \"dest/prot" + advice,
                    "0 " + entry + "20/match/0|an upgrade knows no field \"a\\/b" + advice,
                    "0 " + entry +
                        "30/match/0|an upgrade knows no field \"source/addr/ipv4/static" + advice,
                    "0 " + entry + "40/match/0|an upgrade knows no field \"protocols" + advice));
    EXPECT_THAT(nodes(), IsEmpty());
}

TEST_F(LegacyUpgradeTest, RefusesValuesWithCommas)
{
    EXPECT_THAT(upgrade(entry_text(route_maps + "/m/prio/10", {"application,string,a,dscp:ef"})),
                ElementsAre("1 " + route_maps +
                            "/m/prio/10/match/0/application|a value in a file cannot hold a "
                            "comma; use ovctl set"));
    EXPECT_THAT(nodes(), IsEmpty());
}

TEST_F(LegacyUpgradeTest, RefusesEveryBadLine)
{
    in_force("/a,string,before\n");
    EXPECT_THAT(
        upgrade("/a,string,after\n/b\n" +
                entry_text(route_maps + "/m/prio/10", {"dscp,nosuchtype,ef"})),
        ElementsAre("2 /b|a value line needs a name and a type: NAME,TYPE,VALUE",
                    "3 " + route_maps + "/m/prio/10/match/0/dscp|unknown type \"nosuchtype\""));
    EXPECT_THAT(nodes(), ElementsAre("/a string before"));
}

const std::vector<std::string> bad_mask = {"ipver,string,ipv4",
                                           "source/addr/ipv4/static/ipaddr,ipv4addr,10.0.0.0",
                                           "source/addr/ipv4/static/mask_len,string,255.0.255.0"};
const std::vector<std::string> no_mask = {"ipver,string,ipv4",
                                          "dest/addr/ipv4/static/ipaddr,ipv4addr,10.0.0.0"};

TEST_F(LegacyUpgradeTest, NamesTheEntryOfEachKindThatCannotBeConverted)
{
    const std::string opt_maps = "/ov/tunneld/opt_map/config/map";
    in_force("/a,string,before\n");
    EXPECT_THAT(
        upgrade("/a,string,after\n" + entry_text(route_maps + "/m/prio/10", {"dscp,string,ef"}) +
                entry_text(route_maps + "/m/prio/20", bad_mask) +
                entry_text(route_maps + "/m/prio/30", {"dscp,string,ef"}) +
                entry_text(opt_maps + "/m/prio/5", no_mask)),
        ElementsAre("0 " + route_maps +
                        "/m/prio/20/match/0|an IPv4 address needs a mask such as 255.255.0.0 or a "
                        "length such as 16, and source/addr/ipv4/static/mask_len is "
                        "\"255.0.255.0\" (error code 14020, type conversion failed)",
                    "0 " + opt_maps +
                        "/m/prio/5/match/0|an IPv4 address needs a mask such as 255.255.0.0 or a "
                        "length such as 16, and dest/addr/ipv4/static/mask_len is missing (error "
                        "code 14001, unexpected NULL)"));
    EXPECT_THAT(nodes(), ElementsAre("/a string before"));
}

TEST_F(LegacyUpgradeTest, DoesNotOverwriteAMatchString)
{
    const std::string entry = route_maps + "/m/prio/10";
    EXPECT_THAT(upgrade(entry_text(entry, {"matchstr,string,dscp:1"})),
                ElementsAre("0 " + entry +
                            "/match/0|it has a match string already; give a file whose entries are "
                            "all of the older form"));
    EXPECT_THAT(nodes(), IsEmpty());
}

struct RoomCase {
    std::vector<std::string> fields; ///< behind an application of `size` characters
    std::size_t size;                ///< the longest application that leaves them room
    const char *rest;                ///< of the match string
    std::vector<const char *> lost;  ///< with one, two, ... characters more
};

// A match string has 1023 characters, of which "application:" takes 12 and ",dscp:ef" 8.
const RoomCase room_cases[] = {
    {{}, 1011, "", {"application", "application"}},
    {{"dscp,string,ef"}, 1003, ",dscp:ef", {"dscp", "dscp"}},
    // 18 and 8: the shorter pair still has room when the longer one has lost its own.
    {{"vlan,string,lan0wan0net0", "dscp,string,ef"},
     985,
     ",vlan:lan0wan0net0,dscp:ef",
     {"dscp", "dscp", "dscp", "dscp", "dscp", "dscp", "dscp", "dscp", "vlan"}},
    {{"ipver,string,ipv6"}, 987, ",src_ip:::/0,dst_ip:::/0", {"dst_ip"}},
    {{"ipver,string,ipv4", "src/port,string,80", "vlan,string,v1", "protocol,string,udp",
      "dscp,string,ef"},
     936,
     ",src_ip:0.0.0.0/0,dst_ip:0.0.0.0/0,src_port:80,vlan:v1,protocol:udp,dscp:ef",
     {"dscp"}},
    {{"ipver,string,ipv4", "src/port,string,1024-65535", "dest/port,string,8080-8090",
      "protocol,string,tcp", "dscp,string,af41"},
     915,
     ",src_ip:0.0.0.0/0,dst_ip:0.0.0.0/0,src_port:1024-65535,dst_port:8080-8090,protocol:tcp,"
     "dscp:af41",
     {"dscp"}},
};

TEST_F(LegacyUpgradeTest, RefusesEntriesThatWouldLoseAPair)
{
    const std::string entry = route_maps + "/m/prio/10";
    for (const RoomCase &row : room_cases) {
        const auto text = [&](std::size_t size) {
            return entry_text(entry, {"application,string," + std::string(size, 'a')}) +
                   entry_text(entry, row.fields);
        };
        candidate_ = Candidate();
        const std::string longest = "application:" + std::string(row.size, 'a') + row.rest;
        ASSERT_EQ(longest.size(), 1023U) << row.rest;
        EXPECT_THAT(upgrade(text(row.size)), ElementsAre("1/0")) << row.rest;
        EXPECT_THAT(nodes(), ElementsAre(entry + "/match/0/matchstr string " + longest));
        candidate_ = Candidate();
        std::size_t more = 0;
        for (const char *lost : row.lost) {
            ++more;
            EXPECT_THAT(upgrade(text(row.size + more)),
                        ElementsAre("0 " + entry + "/match/0|its match string would lack " + lost +
                                    ", and the entry would match more: it needs " +
                                    std::to_string(1023 + more) +
                                    " characters, and there is room for 1023"))
                << row.rest;
            EXPECT_THAT(nodes(), IsEmpty());
        }
    }
}

// The pairs of both addresses are lost, and the one behind them still has room.
TEST_F(LegacyUpgradeTest, NamesEveryPairThatWouldBeLost)
{
    const std::string entry = route_maps + "/m/prio/";
    EXPECT_THAT(
        upgrade(entry_text(entry + "10", {"application,string," + std::string(1000, 'a'),
                                          "ipver,string,ipv4", "dscp,string,ef"}) +
                entry_text(entry + "20", {"dscp,string,ef"}) +
                entry_text(entry + "30", {"vlan,string," + std::string(1100, 'v')})),
        ElementsAre("0 " + entry +
                        "10/match/0|its match string would lack src_ip, dst_ip, and the "
                        "entry would match more: it needs 1054 characters, and there is "
                        "room for 1023",
                    "0 " + entry +
                        "30/match/0|its match string would lack vlan, and the entry would "
                        "match more: it needs 1105 characters, and there is room for 1023"));
    EXPECT_THAT(nodes(), IsEmpty());
}

// Behind 255 characters the library would take the name of another node.
TEST_F(LegacyUpgradeTest, RefusesNamesThatTheLibraryCuts)
{
    // "/ov/tunneld/route_map/config/map/" and "/prio/10/match/0" are 33 and 16 characters.
    const std::string longest = route_maps + "/" + std::string(243 - 33 - 16, 'm') + "/prio/10";
    EXPECT_THAT(upgrade(entry_text(longest, {"acl,string,a1", "application,string,web"})),
                ElementsAre("0/1"));
    EXPECT_THAT(nodes(), ElementsAre(longest + "/match/0/acl string a1"));
    for (const std::size_t length : {195UL, 256UL, 600UL}) {
        candidate_ = Candidate();
        const std::string entry = route_maps + "/" + std::string(length, 'm') + "/prio/10";
        EXPECT_THAT(upgrade(entry_text(entry, {"acl,string,a1", "application,string,web"})),
                    ElementsAre("0 " + entry +
                                "/match/0|its names are too long: an upgrade takes 243 "
                                "characters up to here"));
        EXPECT_THAT(nodes(), IsEmpty());
    }
}

TEST_F(LegacyUpgradeTest, NamesEveryEntryThatIsPassedOver)
{
    const std::string entry = route_maps + "/a\\/b/prio/";
    EXPECT_THAT(upgrade(entry_text(entry + "10", {"dscp,string,ef"}) +
                        entry_text(entry + "20", {"dscp,string,ef"}) +
                        entry_text(route_maps + "/m/prio/10", {"dscp,string,ef"})),
                ElementsAre("0 " + entry +
                                "10/match/0|it was not converted: an upgrade takes no map whose "
                                "name holds a slash or a backslash",
                            "0 " + entry +
                                "20/match/0|it was not converted: an upgrade takes no map whose "
                                "name holds a slash or a backslash"));
    EXPECT_THAT(nodes(), IsEmpty());
}

class UpgradeRequest : public DaemonTest
{
  protected:
    UpgradeRequest()
    {
        configuration_.start();
        before_ = nodes_of(configuration_.running());
    }

    json ask(const json &request) { return requests_.handle(request, {}); }

    json upgrade(const std::string &text)
    {
        return ask({{"command", "upgrade"}, {"text", text}, {"source", "legacy.db"}});
    }

    /// "CODE: MESSAGE", with " [LINE NODE|MESSAGE|MODULE]" for each detail.
    std::string refusal(const std::string &text)
    {
        try {
            return upgrade(text).dump();
        } catch (const RequestError &error) {
            std::string words = error.code() + ": " + error.what();
            for (const ErrorDetail &detail : error.details()) {
                words += " [" + std::to_string(detail.line) + " " + detail.node + "|" +
                         detail.message + "|" + detail.module + "]";
            }
            return words;
        }
    }

    /// Nothing is stored, nothing is in force, and no edit is left behind.
    void expect_nothing_happened()
    {
        EXPECT_EQ(nodes_of(configuration_.running()), before_);
        EXPECT_EQ(nodes_of(configuration_.candidate().tree()), before_);
        EXPECT_EQ(configuration_.commit_number(), 1U);
    }

    Configuration configuration_{state_.path()};
    Requests requests_{configuration_,
                       {[] { return std::vector<PeerStatus>(); }, [this] { ++announced_; }}};
    std::vector<std::string> before_;
    int announced_ = 0;
};

const std::string acl_a1 = "/ov/tunneld/acl/config/a1,string,a1\n";

TEST_F(UpgradeRequest, StoresTheConvertedEntriesAndAnswersWithTheChanges)
{
    const std::string entry = route_maps + "/m/prio/10";
    const json result = upgrade(entry_text(entry, {"vlan,string,wan0", "ipver,string,ipv4"}));
    EXPECT_EQ(result.at("converted"), 1);
    EXPECT_EQ(result.at("by_acl"), 0);
    EXPECT_EQ(result.at("number"), 2);
    EXPECT_EQ(result.at("warnings"), json::array());
    const json change = {
        {"change", "add"},
        {"name", entry + "/match/0/matchstr"},
        {"old", nullptr},
        {"new", {{"type", "string"}, {"value", "src_ip:0.0.0.0/0,dst_ip:0.0.0.0/0,vlan:wan0"}}}};
    EXPECT_THAT(result.at("changes"), testing::Contains(change));
    for (const json &other : result.at("changes")) {
        EXPECT_THAT(other.at("name").get<std::string>(), testing::Not(HasSubstr("ipver")));
    }
    EXPECT_EQ(value_in(configuration_.running(), entry + "/match/0/matchstr"),
              "string src_ip:0.0.0.0/0,dst_ip:0.0.0.0/0,vlan:wan0");
    EXPECT_TRUE(configuration_.candidate().pending(configuration_.running()).empty());
    EXPECT_EQ(announced_, 1);
}

TEST_F(UpgradeRequest, RecordsTheReferencesOfItsAcls)
{
    const std::string reference = "/ov/tunneld/acl/config/a1/rmap/m/prio/";
    (void)upgrade(acl_a1 + entry_text(route_maps + "/m/prio/10", {"acl,string,a1"}) +
                  entry_text(route_maps + "/m/prio/20", {"dscp,string,ef"}) +
                  entry_text(route_maps + "/m/prio/65535", {"acl,string,a1"}));
    EXPECT_EQ(value_in(configuration_.running(), reference + "10"), "uint32 10");
    EXPECT_EQ(value_in(configuration_.running(), reference + "20"), "none");
    EXPECT_EQ(value_in(configuration_.running(), reference + "65535"), "none");
    // The entry's end of matching by the ACL ends the reference.
    (void)upgrade(entry_text(route_maps + "/m/prio/10", {"dscp,string,ef"}));
    EXPECT_EQ(value_in(configuration_.running(), reference + "10"), "none");
    (void)upgrade(entry_text(route_maps + "/m/prio/10", {"acl,string,a1"}));
    EXPECT_EQ(value_in(configuration_.running(), reference + "10"), "uint32 10");
    // As does a line that removes its node.
    (void)upgrade("-" + route_maps + "/m/prio/10/match/0/acl\n" +
                  entry_text(route_maps + "/m/prio/30", {"dscp,string,ef"}));
    EXPECT_EQ(value_in(configuration_.running(), reference + "10"), "none");
    (void)upgrade(entry_text(route_maps + "/m/prio/10", {"acl,string,a1"}));
    // Another ACL for the entry takes its reference along.
    (void)upgrade("/ov/tunneld/acl/config/a2,string,a2\n" +
                  entry_text(route_maps + "/m/prio/10", {"acl,string,a2"}));
    EXPECT_EQ(value_in(configuration_.running(), reference + "10"), "none");
    EXPECT_EQ(value_in(configuration_.running(), "/ov/tunneld/acl/config/a2/rmap/m/prio/10"),
              "uint32 10");
}

TEST_F(UpgradeRequest, DoneTwiceStoresNothingMore)
{
    const std::string text = acl_a1 + entry_text(route_maps + "/m/prio/10", {"acl,string,a1"}) +
                             entry_text(route_maps + "/m/prio/20", {"dscp,string,ef"});
    (void)upgrade(text);
    const std::vector<std::string> first = nodes_of(configuration_.running());
    const json again = upgrade(text);
    EXPECT_EQ(again.at("changes"), json::array());
    EXPECT_EQ(again.at("number"), 2);
    EXPECT_EQ(nodes_of(configuration_.running()), first);
}

TEST_F(UpgradeRequest, StoresNothingWhenALineIsBad)
{
    EXPECT_EQ(refusal("/a,string,x\n/b,nosuchtype,x\n"),
              "bad-lines: legacy.db: 1 bad line; nothing was loaded [2 /b|unknown type "
              "\"nosuchtype\"|]");
    expect_nothing_happened();
}

TEST_F(UpgradeRequest, StoresNothingWhenAnEntryCannotBeConverted)
{
    EXPECT_THAT(refusal(entry_text(route_maps + "/m/prio/10", {"dscp,string,ef"}) +
                        entry_text(route_maps + "/m/prio/20", bad_mask)),
                StartsWith("refused: entries cannot be upgraded; nothing was stored [0 " +
                           route_maps +
                           "/m/prio/20/match/0|an IPv4 address needs a mask such as 255.255.0.0 "
                           "or a length such as 16, and "));
    expect_nothing_happened();
}

TEST_F(UpgradeRequest, StoresNothingWhenAModuleRefuses)
{
    EXPECT_THAT(refusal(entry_text(route_maps + "/m/prio/10", {"dscp,string,ef"}) +
                        entry_text(route_maps + "/m/prio/20", {"dscp,string,64"})),
                StartsWith("refused: the upgraded configuration is refused [0 " + route_maps +
                           "/m/prio/20/match/0/matchstr|Invalid match string dscp:64 - pair "
                           "\"dscp:64\": the value must be "));
    expect_nothing_happened();
    EXPECT_THAT(refusal("/ov/tunneld/system/config/mode,string,brigde\n" +
                        entry_text(route_maps + "/m/prio/10", {"dscp,string,ef"})),
                StartsWith("refused: the upgraded configuration is refused "
                           "[0 /ov/tunneld/system/config/mode|"));
    expect_nothing_happened();
}

TEST_F(UpgradeRequest, RefusesALengthOfAnotherFamily)
{
    EXPECT_THAT(
        refusal(entry_text(route_maps + "/m/prio/10",
                           {"ipver,string,ipv4", "source/addr/ipv4/static/ipaddr,ipv4addr,10.0.0.0",
                            "source/addr/ipv4/static/mask_len,string,33"})),
        HasSubstr("matchstr|Invalid match string src_ip:10.0.0.0/33,dst_ip:0.0.0.0/0 - "
                  "pair \"src_ip:10.0.0.0/33\": "));
    expect_nothing_happened();
}

TEST_F(UpgradeRequest, WaitsForTheEditsOfTheCandidate)
{
    (void)ask({{"command", "set"}, {"name", "/a"}, {"type", "string"}, {"value", "x"}});
    EXPECT_EQ(refusal(entry_text(route_maps + "/m/prio/10", {"dscp,string,ef"})),
              "refused: the candidate has edits: commit or discard them first");
    EXPECT_EQ(value_in(configuration_.candidate().tree(), "/a"), "string x");
    EXPECT_EQ(configuration_.commit_number(), 1U);
}

TEST_F(UpgradeRequest, NeedsAText)
{
    EXPECT_THROW((void)ask({{"command", "upgrade"}}), RequestError);
}

TEST_F(UpgradeRequest, NeedsEntries)
{
    for (const std::string text : {"", "# nothing\n", "/a,string,x\n", "-/ov/x\n"}) {
        EXPECT_EQ(refusal(text), "refused: there are no map entries to convert; nothing was "
                                 "stored (use load for a file of other nodes)");
    }
    expect_nothing_happened();
}

} // namespace
