// The conversion of maps of the older form; md_xmap_legacy_match_test.cpp has its lesser edits.
#include "orvale/md_xmap_common.h"

#include "tests/library/library_test.h"
#include "tests/library/map_changes.h"

#include <ostream>
#include <string>
#include <utility>

using namespace ovtest;
using testing::ElementsAre;
using testing::IsEmpty;

namespace
{

const std::string root = "/ov/tunneld/route_map/config/map";
const std::string entry_node = root + "/m/prio/10";
const std::string match_node = entry_node + "/match/0/";

constexpr char src_ipv4[] = "source/addr/ipv4/static/ipaddr";
constexpr char src_mask[] = "source/addr/ipv4/static/mask_len";
constexpr char dst_ipv4[] = "dest/addr/ipv4/static/ipaddr";
constexpr char dst_mask[] = "dest/addr/ipv4/static/mask_len";
constexpr char src_ipv6[] = "source/addr/ipv6/static/ipv6prefix";
constexpr char dst_ipv6[] = "dest/addr/ipv6/static/ipv6prefix";

// The fields that are removed, in the order in which the upgrade visits them.
constexpr const char *removed_fields[] = {
    "application", "ipver",    src_ipv6,    dst_ipv6, src_ipv4,   src_mask, dst_ipv4,
    dst_mask,      "src/port", "dest/port", "vlan",   "protocol", "dscp",
};

const std::string function_name = "md_xmap_upgrade_to_pattern_match";

std::string line_of(const std::string &function, const std::string &text)
{
    return error_line("md_xmap_common", function, text);
}

std::string converted(const std::string &match_string)
{
    return gated_line(6, "Converted match string " + match_string);
}

class LegacyUpgrade : public LibraryTest
{
  protected:
    LegacyUpgrade() { new_db_.writable = true; }

    // A node of the configuration as it is found, which the new one starts from.
    void set(const std::string &node, const std::string &value)
    {
        set_node(old_db_, node, value);
        set_node(new_db_, node, value);
    }
    // A field of the one entry that most tests are about.
    void set_field(const std::string &field, const std::string &value)
    {
        set(match_node + field, value);
    }

    int upgrade(int mtype = MAP_TYPE_R)
    {
        return in_library(md_xmap_upgrade_to_pattern_match, &new_db_, &old_db_, mtype);
    }

    // What the one entry has become: status and its match string.
    std::string match_string()
    {
        const int status = upgrade();
        const std::string prefix = match_node + "matchstr string ";
        const std::vector<std::string> left = nodes(new_db_, entry_node);
        const bool is_alone = left.size() == 1 && left.front().starts_with(prefix);
        return std::to_string(status) + ' ' +
               (is_alone ? left.front().substr(prefix.size()) : testing::PrintToString(left));
    }

    mdb_db old_db_;
    mdb_db new_db_;
};

TEST_F(LegacyUpgrade, PutsAllFieldsOfIpv4InTheirOrder)
{
    set_field("application", "web");
    set_field("ipver", "ipv4");
    set_field(src_ipv4, "10.0.0.0");
    set_field(src_mask, "8");
    set_field(dst_ipv4, "10.1.2.0");
    set_field(dst_mask, "255.255.255.0");
    set_field("src/port", "1024-2048");
    set_field("dest/port", "443");
    set_field("vlan", "vlan7");
    set_field("protocol", "tcp");
    set_field("dscp", "ef");
    const std::string expected = "application:web,src_ip:10.0.0.0/8,dst_ip:10.1.2.0/24,"
                                 "src_port:1024-2048,dst_port:443,vlan:vlan7,protocol:tcp,dscp:ef";
    EXPECT_EQ(match_string(), "0 " + expected);
    EXPECT_THAT(log_lines(), ElementsAre(converted(expected)));
}

TEST_F(LegacyUpgrade, PutsAllFieldsOfIpv6InTheirOrder)
{
    set_field("dscp", "46");
    set_field("protocol", "udp");
    set_field("vlan", "wan0");
    set_field("dest/port", "53");
    set_field("src/port", "1");
    set_field(dst_ipv6, "2001:db8:1::/48");
    set_field(src_ipv6, "2001:db8::/32");
    set_field("ipver", "ipv6");
    set_field("application", "dns");
    EXPECT_EQ(match_string(), "0 application:dns,src_ip:2001:db8::/32,dst_ip:2001:db8:1::/48,"
                              "src_port:1,dst_port:53,vlan:wan0,protocol:udp,dscp:46");
}

TEST_F(LegacyUpgrade, ReadsRemovesAndWritesAsTheHostExpectsIt)
{
    set_field("ipver", "ipv4");
    set_field(src_ipv4, "10.0.0.0");
    set_field(src_mask, "8");
    EXPECT_EQ(match_string(), "0 src_ip:10.0.0.0/8,dst_ip:0.0.0.0/0");
    const auto list_call = [](const std::string &node) {
        return "mdb_get_tstr_array(null, *, \"" + node + "\", 0, 0, 0, *)";
    };
    const auto read_call = [](const std::string &field) {
        return "mdb_get_node_value_tstr(null, *, \"" + match_node + field + "\", 0, null, *)";
    };
    EXPECT_THAT(calls_of(Operation::mdb_get_tstr_array),
                ElementsAre(list_call(root), list_call(root + "/m/prio")));
    EXPECT_THAT(calls_of(Operation::mdb_get_node_value_tstr),
                ElementsAre(read_call("acl"), read_call("application"), read_call("ipver"),
                            read_call(src_ipv4), read_call(src_mask), read_call(dst_ipv4),
                            read_call(dst_mask), read_call("src/port"), read_call("dest/port"),
                            read_call("vlan"), read_call("protocol"), read_call("dscp")));
    EXPECT_THAT(calls_of(Operation::lc_mask_or_masklen_to_masklen_str),
                ElementsAre("lc_mask_or_masklen_to_masklen_str(\"8\", *)"));
    EXPECT_THAT(calls_of(Operation::mdb_set_node_binding),
                ElementsAre("mdb_set_node_binding(null, *, 2, 0, *)",
                            "mdb_set_node_binding(null, *, 2, 0, *)",
                            "mdb_set_node_binding(null, *, 2, 0, *)",
                            "mdb_set_node_binding(null, *, 4, 0, *)"));
    EXPECT_THAT(calls_of(Operation::bn_binding_new_str),
                ElementsAre("bn_binding_new_str(*, \"" + match_node +
                            "matchstr\", 1, 101, 0, \"src_ip:10.0.0.0/8,dst_ip:0.0.0.0/0\")"));
}

TEST_F(LegacyUpgrade, ReadsNoIpv4FieldsOfIpv6)
{
    set_field("ipver", "ipv6");
    EXPECT_EQ(match_string(), "0 src_ip:::/0,dst_ip:::/0");
    const auto read_call = [](const std::string &field) {
        return "mdb_get_node_value_tstr(null, *, \"" + match_node + field + "\", 0, null, *)";
    };
    EXPECT_THAT(calls_of(Operation::mdb_get_node_value_tstr),
                ElementsAre(read_call("acl"), read_call("application"), read_call("ipver"),
                            read_call(src_ipv6), read_call(dst_ipv6), read_call("src/port"),
                            read_call("dest/port"), read_call("vlan"), read_call("protocol"),
                            read_call("dscp")));
}

TEST_F(LegacyUpgrade, AsksNothingAboutAbsentFields)
{
    set(entry_node + "/comment", "x");
    EXPECT_EQ(upgrade(), 0);
    for (const Operation operation :
         {Operation::ts_str_, Operation::ts_length_, Operation::ts_equal_str}) {
        EXPECT_EQ(num_calls(operation), 0U) << row_of(operation).name;
    }
    EXPECT_THAT(log_lines(), ElementsAre(converted("any")));
}

TEST_F(LegacyUpgrade, ComparesAVersionWithAnyFirst)
{
    const std::string with_any = "ts_equal_str(*, \"any\", 0)";
    const std::string with_ipv6 = "ts_equal_str(*, \"ipv6\", 0)";
    set_field("ipver", "");
    EXPECT_EQ(upgrade(), 0);
    EXPECT_THAT(calls_of(Operation::ts_equal_str), IsEmpty());
    set_field("ipver", "any");
    EXPECT_EQ(upgrade(), 0);
    EXPECT_THAT(calls_of(Operation::ts_equal_str), ElementsAre(with_any));
    for (const char *version : {"ipv6", "ipv4"}) {
        set_field("ipver", version);
        forget_calls();
        EXPECT_EQ(upgrade(), 0);
        EXPECT_THAT(calls_of(Operation::ts_equal_str), ElementsAre(with_any, with_ipv6));
    }
}

TEST_F(LegacyUpgrade, AsksAndWritesTheDatabaseThatIsMeant)
{
    set_field("dscp", "ef");
    name_object(&old_db_, "old");
    name_object(&new_db_, "new");
    EXPECT_EQ(match_string(), "0 dscp:ef");
    for (const std::string &call : calls_of(Operation::mdb_get_tstr_array)) {
        EXPECT_THAT(call, testing::StartsWith("mdb_get_tstr_array(null, old, "));
    }
    for (const std::string &call : calls_of(Operation::mdb_get_node_value_tstr)) {
        EXPECT_THAT(call, testing::StartsWith("mdb_get_node_value_tstr(null, old, "));
    }
    for (const std::string &call : calls_of(Operation::mdb_get_node_binding)) {
        EXPECT_THAT(call, testing::StartsWith("mdb_get_node_binding(null, new, "));
    }
    EXPECT_THAT(calls_of(Operation::mdb_set_node_binding),
                ElementsAre("mdb_set_node_binding(null, new, 2, 0, *)",
                            "mdb_set_node_binding(null, new, 4, 0, *)"));
}

TEST_F(LegacyUpgrade, LooksForEveryFieldToRemoveInItsOrder)
{
    for (const char *version : {"ipv4", "any"}) {
        set_field("ipver", version);
        forget_calls();
        EXPECT_EQ(upgrade(), 0);
        std::vector<std::string> expected;
        for (const std::string field : removed_fields) {
            expected.push_back("mdb_get_node_binding(null, *, \"" + match_node + field +
                               "\", 0, *)");
        }
        EXPECT_EQ(calls_of(Operation::mdb_get_node_binding), expected) << version;
    }
}

// One entry: its fields, and the match string that they make.
struct Conversion {
    const char *name;
    std::vector<std::pair<const char *, const char *>> fields;
    const char *match_string;
};

void PrintTo(const Conversion &conversion, std::ostream *out)
{
    *out << conversion.name;
}

class LegacyEntry : public LegacyUpgrade, public testing::WithParamInterface<Conversion>
{
};

TEST_P(LegacyEntry, BecomesItsMatchString)
{
    for (const auto &[field, value] : GetParam().fields) {
        set_field(field, value);
    }
    EXPECT_EQ(match_string(), std::string("0 ") + GetParam().match_string);
    EXPECT_THAT(log_lines(), ElementsAre(converted(GetParam().match_string)));
}

const Conversion conversions[] = {
    {"Ipv4WithoutAddressesIsOfAllAddresses",
     {{"ipver", "ipv4"}},
     "src_ip:0.0.0.0/0,dst_ip:0.0.0.0/0"},
    {"Ipv6WithoutAddressesIsOfAllAddresses", {{"ipver", "ipv6"}}, "src_ip:::/0,dst_ip:::/0"},
    {"Ipv6WithoutDestinationGoesAnywhere",
     {{"ipver", "ipv6"}, {src_ipv6, "2001:db8::/32"}},
     "src_ip:2001:db8::/32,dst_ip:::/0"},
    {"Ipv6WithEmptyPrefixesIsOfAllAddresses",
     {{"ipver", "ipv6"}, {src_ipv6, ""}, {dst_ipv6, ""}},
     "src_ip:::/0,dst_ip:::/0"},
    {"Ipv6PassesOverIpv4Addresses",
     {{"ipver", "ipv6"}, {src_ipv4, "10.0.0.0"}, {src_mask, "not a mask"}, {dst_ipv4, "10.0.0.1"}},
     "src_ip:::/0,dst_ip:::/0"},
    {"Ipv4PassesOverIpv6Prefixes",
     {{"ipver", "ipv4"}, {src_ipv6, "2001:db8::/32"}, {dst_ipv6, "2001:db8::/32"}},
     "src_ip:0.0.0.0/0,dst_ip:0.0.0.0/0"},
    {"AnyVersionHasNoAddresses",
     {{"ipver", "any"},
      {src_ipv4, "10.0.0.0"},
      {src_mask, "8"},
      {dst_ipv4, "10.0.0.0"},
      {dst_mask, "8"},
      {src_ipv6, "2001:db8::/32"}},
     "any"},
    {"NoVersionHasNoAddresses",
     {{src_ipv4, "10.0.0.0"}, {src_mask, "8"}, {"dscp", "ef"}},
     "dscp:ef"},
    {"EmptyVersionHasNoAddresses",
     {{"ipver", ""}, {src_ipv4, "10.0.0.0"}, {src_mask, "8"}, {src_ipv6, "::1/128"}},
     "any"},
    {"AnotherVersionIsTakenForIpv4",
     {{"ipver", "IPV6"}, {src_ipv4, "10.0.0.0"}, {src_mask, "8"}, {src_ipv6, "2001:db8::/32"}},
     "src_ip:10.0.0.0/8,dst_ip:0.0.0.0/0"},
    {"AVersionThatOnlyBeginsLikeAnyIsTakenForIpv4",
     {{"ipver", "any "}},
     "src_ip:0.0.0.0/0,dst_ip:0.0.0.0/0"},
    {"AMaskIsWrittenAsItsLength",
     {{"ipver", "ipv4"}, {src_ipv4, "10.0.0.0"}, {src_mask, "255.0.0.0"}},
     "src_ip:10.0.0.0/8,dst_ip:0.0.0.0/0"},
    {"AMaskLengthStays",
     {{"ipver", "ipv4"}, {src_ipv4, "10.0.0.0"}, {src_mask, "8"}},
     "src_ip:10.0.0.0/8,dst_ip:0.0.0.0/0"},
    {"AMaskOfZerosAndOneOfOnes",
     {{"ipver", "ipv4"},
      {src_ipv4, "0.0.0.0"},
      {src_mask, "0.0.0.0"},
      {dst_ipv4, "10.1.2.3"},
      {dst_mask, "255.255.255.255"}},
     "src_ip:0.0.0.0/0,dst_ip:10.1.2.3/32"},
    {"AMaskWithoutAddressIsPassedOver",
     {{"ipver", "ipv4"}, {src_mask, "not a mask"}, {dst_ipv4, ""}, {dst_mask, "not a mask"}},
     "src_ip:0.0.0.0/0,dst_ip:0.0.0.0/0"},
    {"WhatSaysNothingIsLeftOut",
     {{"application", "any"},
      {"src/port", "0"},
      {"dest/port", "0"},
      {"vlan", "any"},
      {"protocol", "ip"},
      {"dscp", "any"}},
     "any"},
    {"WhatIsEmptyIsLeftOut",
     {{"application", ""},
      {"src/port", ""},
      {"dest/port", ""},
      {"vlan", ""},
      {"protocol", ""},
      {"dscp", ""}},
     "any"},
    {"WordsAreComparedWholeAndWithCase",
     {{"application", "Any"},
      {"src/port", "00"},
      {"dest/port", "0 "},
      {"vlan", "anything"},
      {"protocol", "IP"},
      {"dscp", "ANY"}},
     "application:Any,src_port:00,dst_port:0 ,vlan:anything,protocol:IP,dscp:ANY"},
    {"WordsOfOtherFieldsAreValues",
     {{"application", "0"},
      {"src/port", "any"},
      {"dest/port", "any"},
      {"vlan", "0"},
      {"protocol", "any"},
      {"dscp", "0"}},
     "application:0,src_port:any,dst_port:any,vlan:0,protocol:any,dscp:0"},
    {"ValuesAreTakenAsTheyAre",
     {{"application", "%s,a:b"}, {"dscp", "af 11"}},
     "application:%s,a:b,dscp:af 11"},
};

INSTANTIATE_TEST_SUITE_P(All, LegacyEntry, testing::ValuesIn(conversions),
                         [](const auto &about) { return std::string(about.param.name); });

TEST_F(LegacyUpgrade, TakesAnEmptyAclForNone)
{
    set_field("acl", "");
    set_field("dscp", "ef");
    EXPECT_EQ(upgrade(), 0);
    EXPECT_THAT(nodes(new_db_, entry_node),
                ElementsAre(match_node + "acl string ", match_node + "matchstr string dscp:ef"));
}

TEST_F(LegacyUpgrade, LeavesAnEntryWithAnAclAllButItsApplication)
{
    set_field("acl", "office");
    set_field("application", "web");
    set_field("dscp", "ef");
    set_field("ipver", "ipv4");
    EXPECT_EQ(upgrade(), 0);
    EXPECT_THAT(nodes(new_db_, entry_node),
                ElementsAre(match_node + "acl string office", match_node + "dscp string ef",
                            match_node + "ipver string ipv4"));
    EXPECT_EQ(num_calls(Operation::mdb_get_node_value_tstr), 1U);
    EXPECT_EQ(num_calls(Operation::mdb_get_node_binding), 13U);
    EXPECT_THAT(log_lines(), IsEmpty());
}

TEST_F(LegacyUpgrade, ConvertsEveryEntryOfEveryMapInOrder)
{
    set(root + "/a/prio/20/match/0/dscp", "2");
    set(root + "/a/prio/3/match/0/dscp", "1");
    set(root + "/a/prio/65535/set/0/nexthop", "x");
    set(root + "/b/prio/1/match/0/dscp", "3");
    EXPECT_EQ(upgrade(), 0);
    EXPECT_THAT(nodes(new_db_, root),
                ElementsAre(root + "/a/prio/3/match/0/matchstr string dscp:1",
                            root + "/a/prio/20/match/0/matchstr string dscp:2",
                            root + "/a/prio/65535/match/0/matchstr string any",
                            root + "/a/prio/65535/set/0/nexthop string x",
                            root + "/b/prio/1/match/0/matchstr string dscp:3"));
    EXPECT_THAT(log_lines(), ElementsAre(converted("dscp:1"), converted("dscp:2"), converted("any"),
                                         converted("dscp:3")));
}

TEST_F(LegacyUpgrade, BeginsEachMatchStringAnew)
{
    set(root + "/m/prio/1/match/0/application", "web");
    set(root + "/m/prio/2/match/0/dscp", "ef");
    EXPECT_EQ(upgrade(), 0);
    EXPECT_THAT(log_lines(), ElementsAre(converted("application:web"), converted("dscp:ef")));
}

TEST_F(LegacyUpgrade, LeavesTheOldDatabaseAlone)
{
    set_field("application", "web");
    set_field("ipver", "ipv4");
    const std::vector<std::string> before = nodes(old_db_, "/");
    EXPECT_EQ(upgrade(), 0);
    EXPECT_EQ(nodes(old_db_, "/"), before);
}

TEST_F(LegacyUpgrade, ReadsTheOldDatabaseAndWritesTheNewOne)
{
    set_node(old_db_, match_node + "dscp", "old");
    set_node(new_db_, match_node + "dscp", "new");
    set_node(new_db_, match_node + "application", "new");
    set_node(new_db_, root + "/added/prio/1/match/0/dscp", "1");
    EXPECT_EQ(upgrade(), 0);
    EXPECT_THAT(nodes(new_db_, root), ElementsAre(root + "/added/prio/1/match/0/dscp string 1",
                                                  match_node + "matchstr string dscp:old"));
}

TEST_F(LegacyUpgrade, WritesOverAPresentMatchString)
{
    set_field("matchstr", "application:old");
    set_field("dscp", "ef");
    EXPECT_EQ(match_string(), "0 dscp:ef");
}

struct LegacyRoot {
    int mtype;
    const char *root;
};

void PrintTo(const LegacyRoot &kind, std::ostream *out)
{
    *out << kind.root;
}

constexpr LegacyRoot legacy_roots[] = {
    {0, "/ov/tunneld/route_map/config/map"}, {1, "/ov/tunneld/opt_map/config/map"},
    {2, "/ov/tunneld/qos_map/config/map"},   {3, "/ov/tunneld/stats_map/config/map"},
    {4, "/ov/tunneld/nat_map/config/map"},
};

class LegacyKind : public LegacyUpgrade, public testing::WithParamInterface<LegacyRoot>
{
};

TEST_P(LegacyKind, IsUpgradedAlone)
{
    for (const LegacyRoot &kind : legacy_roots) {
        set(std::string(kind.root) + "/m/prio/10/match/0/dscp", "ef");
    }
    EXPECT_EQ(upgrade(GetParam().mtype), 0);
    for (const LegacyRoot &kind : legacy_roots) {
        const std::string match = std::string(kind.root) + "/m/prio/10/match/0/";
        EXPECT_THAT(nodes(new_db_, kind.root),
                    ElementsAre(kind.mtype == GetParam().mtype ? match + "matchstr string dscp:ef"
                                                               : match + "dscp string ef"));
    }
}

INSTANTIATE_TEST_SUITE_P(All, LegacyKind, testing::ValuesIn(legacy_roots),
                         [](const auto &about) { return std::to_string(about.param.mtype); });

TEST_F(LegacyUpgrade, RefusesKindsWithoutAnOlderFormAndTouchesNothing)
{
    set_field("dscp", "ef");
    set("/ov/tunneld/sec_map/config/map/map1/m/prio/10/match/dscp", "ef");
    const std::vector<std::string> before = nodes(new_db_, "/");
    for (const int mtype : {5, 6, 7, 8, -1, 1000}) {
        forget_calls();
        EXPECT_EQ(upgrade(mtype), 14002) << mtype;
        EXPECT_THAT(log_lines(),
                    ElementsAre(line_of(function_name, "Required condition was not met")));
        EXPECT_EQ(num_calls(Operation::bail_debug), 1U);
        EXPECT_EQ(num_calls(Operation::mdb_get_tstr_array), 0U);
    }
    EXPECT_EQ(nodes(new_db_, "/"), before);
}

TEST_F(LegacyUpgrade, RefusesNoDatabase)
{
    EXPECT_EQ(in_library(md_xmap_upgrade_to_pattern_match, nullptr, &old_db_, 0), 14001);
    EXPECT_EQ(in_library(md_xmap_upgrade_to_pattern_match, &new_db_, nullptr, 0), 14001);
    EXPECT_THAT(log_lines(), ElementsAre(line_of(function_name, "Unexpected NULL"),
                                         line_of(function_name, "Unexpected NULL")));
}

TEST_F(LegacyUpgrade, OfNoMapsOrNoEntriesChangesNothing)
{
    EXPECT_EQ(upgrade(), 0);
    set(root + "/m/note", "no entries");
    EXPECT_EQ(upgrade(), 0);
    EXPECT_THAT(nodes(new_db_, "/"), ElementsAre(root + "/m/note string no entries"));
    EXPECT_THAT(log_lines(), IsEmpty());
}

TEST_F(LegacyUpgrade, TakesListsThatDoNotComeForEmpty)
{
    set_field("dscp", "ef");
    for (const unsigned call : {1U, 2U}) {
        arm({.operation = Operation::mdb_get_tstr_array,
             .call = call,
             .way = FaultWay::without_object});
        EXPECT_EQ(upgrade(), 0);
    }
    EXPECT_THAT(nodes(new_db_, "/"), ElementsAre(match_node + "dscp string ef"));
    EXPECT_THAT(log_lines(), IsEmpty());
}

TEST_F(LegacyUpgrade, EndsAtANameThatDoesNotCome)
{
    set_field("dscp", "ef");
    for (const unsigned call : {1U, 2U}) {
        forget_calls();
        planted().null_text_at_call = call;
        EXPECT_EQ(upgrade(), 14001);
        EXPECT_THAT(log_lines(), ElementsAre(line_of(function_name, "Unexpected NULL")));
    }
    EXPECT_THAT(nodes(new_db_, "/"), ElementsAre(match_node + "dscp string ef"));
}

TEST_F(LegacyUpgrade, EndsAtAMaskThatIsNone)
{
    set_field("ipver", "ipv4");
    set_field(src_ipv4, "10.0.0.0");
    set_field(src_mask, "255.0.255.0");
    set_field("dscp", "ef");
    set(root + "/n/prio/1/match/0/dscp", "ef");
    EXPECT_EQ(upgrade(), 14020);
    EXPECT_THAT(
        log_lines(),
        ElementsAre(line_of(function_name, "Error code 14020 (type conversion failed) returned")));
    EXPECT_EQ(num_calls(Operation::bail_debug), 1U);
    // What the entry had lost by then stays lost.
    EXPECT_THAT(nodes(new_db_, root), ElementsAre(match_node + "dscp string ef",
                                                  root + "/n/prio/1/match/0/dscp string ef"));
}

TEST_F(LegacyUpgrade, HandsNoMaskTextOnWhereThereIsNone)
{
    set_field("ipver", "ipv4");
    set_field(dst_ipv4, "10.0.0.0");
    EXPECT_EQ(upgrade(), 14001);
    EXPECT_THAT(calls_of(Operation::lc_mask_or_masklen_to_masklen_str),
                ElementsAre("lc_mask_or_masklen_to_masklen_str(null, *)"));
    EXPECT_THAT(log_lines(),
                ElementsAre(line_of(function_name, "Error code 14001 (unexpected NULL) returned")));
}

TEST_F(LegacyUpgrade, EndsAtAMaskThatBecomesNothing)
{
    set_field("ipver", "ipv4");
    set_field(src_ipv4, "10.0.0.0");
    set_field(src_mask, "8");
    arm({.operation = Operation::lc_mask_or_masklen_to_masklen_str,
         .way = FaultWay::without_object});
    EXPECT_EQ(upgrade(), 14001);
    EXPECT_THAT(log_lines(), ElementsAre(line_of(function_name, "Unexpected NULL")));
    EXPECT_EQ(num_calls(Operation::bail_debug), 1U);
}

TEST_F(LegacyUpgrade, KeepsWhatWasConvertedBeforeAFailure)
{
    set(root + "/m/prio/1/match/0/dscp", "1");
    set(root + "/m/prio/2/match/0/dscp", "2");
    arm({.operation = Operation::bn_binding_new_str, .call = 2, .code = 14014});
    EXPECT_EQ(upgrade(), 14014);
    EXPECT_THAT(nodes(new_db_, root),
                ElementsAre(root + "/m/prio/1/match/0/matchstr string dscp:1"));
    EXPECT_THAT(log_lines(), ElementsAre(converted("dscp:1"), converted("dscp:2"),
                                         line_of(function_name,
                                                 "Error code 14014 (generic IO error) returned")));
}

TEST_F(LegacyUpgrade, EndsSilentlyWhenCancelled)
{
    set_field("dscp", "ef");
    arm({.operation = Operation::mdb_get_node_value_tstr, .call = 3, .code = 14120});
    EXPECT_EQ(upgrade(), 14120);
    EXPECT_THAT(log_lines(), IsEmpty());
    EXPECT_EQ(num_calls(Operation::bail_quiet_debug), 1U);
    EXPECT_EQ(num_calls(Operation::bail_debug), 0U);
}

TEST_F(LegacyUpgrade, LogsARemovalThatFailsAndGoesOn)
{
    set_field("application", "web");
    set_field("dscp", "ef");
    // The first removal of a node is that of "application", the second that of "dscp".
    arm({.operation = Operation::mdb_set_node_binding, .call = 1, .code = 14014});
    EXPECT_EQ(upgrade(), 0);
    EXPECT_THAT(nodes(new_db_, root),
                ElementsAre(match_node + "application string web",
                            match_node + "matchstr string application:web,dscp:ef"));
    EXPECT_THAT(log_lines(),
                ElementsAre(line_of("md_xmap_delete_match_binding",
                                    "Error code 14014 (generic IO error) returned"),
                            line_of(function_name, "Error code 14014 (generic IO error) returned"),
                            converted("application:web,dscp:ef")));
    // The removal's own error exit; that the upgrade goes on is none.
    EXPECT_EQ(num_calls(Operation::bail_debug), 1U);
}

TEST_F(LegacyUpgrade, LogsEveryRemovalThatFailsAndGoesOn)
{
    set_field("ipver", "ipv4");
    arm({.operation = Operation::mdb_get_node_binding, .and_later = true, .code = 13999});
    EXPECT_EQ(upgrade(), 0);
    std::vector<std::string> expected;
    for (std::size_t i = 0; i < std::size(removed_fields); ++i) {
        expected.push_back(line_of("md_xmap_delete_match_binding", "Error code 13999 returned"));
        expected.push_back(line_of(function_name, "Error code 13999 returned"));
    }
    expected.push_back(converted("src_ip:0.0.0.0/0,dst_ip:0.0.0.0/0"));
    EXPECT_EQ(log_lines(), expected);
    EXPECT_THAT(nodes(new_db_, root),
                ElementsAre(match_node + "ipver string ipv4",
                            match_node + "matchstr string src_ip:0.0.0.0/0,dst_ip:0.0.0.0/0"));
}

TEST_F(LegacyUpgrade, GoesOnSilentlyAfterARemovalThatWasCancelled)
{
    set_field("dscp", "ef");
    arm({.operation = Operation::mdb_set_node_binding, .call = 1, .code = 14120});
    EXPECT_EQ(upgrade(), 0);
    EXPECT_THAT(nodes(new_db_, root),
                ElementsAre(match_node + "dscp string ef", match_node + "matchstr string dscp:ef"));
    EXPECT_THAT(log_lines(), ElementsAre(converted("dscp:ef")));
    EXPECT_EQ(num_calls(Operation::bail_debug), 0U);
    EXPECT_EQ(num_calls(Operation::bail_quiet_debug), 1U);
}

// An entry with an ACL, whose clean-up is made to fail.
class FailedCleanUp : public LegacyUpgrade
{
  protected:
    FailedCleanUp()
    {
        set_field("acl", "office");
        set_field("application", "web");
    }

    int upgrade_failing_with(int code)
    {
        arm({.operation = Operation::mdb_get_node_binding, .code = code});
        return upgrade();
    }
};

TEST_F(FailedCleanUp, OfTheLastEntryIsReturned)
{
    EXPECT_EQ(upgrade_failing_with(14014), 14014);
    EXPECT_THAT(
        log_lines(),
        ElementsAre(
            line_of("md_xmap_delete_match_binding", "Error code 14014 (generic IO error) returned"),
            line_of("md_xmap_delete_match_entries", "Error code 14014 (generic IO error) returned"),
            line_of(function_name, "Error code 14014 (generic IO error) returned")));
    EXPECT_THAT(nodes(new_db_, root), ElementsAre(match_node + "acl string office",
                                                  match_node + "application string web"));
}

// The steps below are cancelled without a line as ever; the upgrade tells what it goes on without.
TEST_F(FailedCleanUp, ByCancellationOfTheLastEntryIsToldAndReturned)
{
    EXPECT_EQ(upgrade_failing_with(14120), 14120);
    EXPECT_THAT(
        log_lines(),
        ElementsAre(line_of(function_name, "Error code 14120 (Operation cancelled) returned")));
}

TEST_F(FailedCleanUp, IsForgottenWithTheNextEntry)
{
    set(root + "/m/prio/20/match/0/dscp", "ef");
    for (const int code : {14014, 14120, 13999}) {
        EXPECT_EQ(upgrade_failing_with(code), 0);
    }
    EXPECT_THAT(nodes(new_db_, root + "/m/prio/20"),
                ElementsAre(root + "/m/prio/20/match/0/matchstr string dscp:ef"));
}

TEST_F(FailedCleanUp, IsForgottenWithAnEntryOfTheNextMap)
{
    set(root + "/n/prio/20/match/0/acl", "branch");
    EXPECT_EQ(upgrade_failing_with(14120), 0);
}

// Listing its entries is a read that succeeds.
TEST_F(FailedCleanUp, IsForgottenWithAnEmptyMap)
{
    set(root + "/n/note", "no entries");
    EXPECT_EQ(upgrade_failing_with(14014), 0);
    EXPECT_EQ(upgrade_failing_with(14120), 0);
}

TEST_F(FailedCleanUp, GivesWayToALaterFailure)
{
    set(root + "/m/prio/20/match/0/dscp", "ef");
    set_node(old_db_, root + "/m/prio/20/match/0/ipver", "ipv4");
    set_node(old_db_, root + "/m/prio/20/match/0/" + std::string(src_ipv4), "10.0.0.0");
    set_node(old_db_, root + "/m/prio/20/match/0/" + std::string(src_mask), "x");
    EXPECT_EQ(upgrade_failing_with(14014), 14020);
}

TEST_F(LegacyUpgrade, LeavesAPairOutForWhichThereIsNoRoom)
{
    // 1012 characters, which leave 11 and the end.
    const std::string long_pair = "application:" + std::string(1000, 'a');
    set_field("application", std::string(1000, 'a'));
    set_field("src/port", "80");
    set_field("dscp", "63");
    EXPECT_EQ(match_string(), "0 " + long_pair + ",dscp:63");
    EXPECT_THAT(log_lines(),
                ElementsAre(line_of("md_xmap_concat_key_value", "Required condition was not met"),
                            converted(long_pair + ",dscp:63")));
}

TEST_F(LegacyUpgrade, FillsAMatchStringUpTo1023Characters)
{
    const std::string value(1001, 'a');
    set_field("application", value);
    set_field("src/port", "1"); // ",src_port:1" are 11, and would be one too many
    set_field("vlan", "wan0");  // ",vlan:wan0" are 10
    set_field("dscp", "1");
    EXPECT_EQ(match_string(), "0 application:" + value + ",vlan:wan0");
    EXPECT_EQ(("application:" + value + ",vlan:wan0").size(), 1023U);
}

TEST_F(LegacyUpgrade, CutsAPairThatIsLongerThanAMatchString)
{
    set_field("application", std::string(1100, 'a'));
    set_field("dscp", "1");
    EXPECT_EQ(match_string(), "0 application:" + std::string(1011, 'a'));
}

TEST_F(LegacyUpgrade, CutsAnAddressAt1023Characters)
{
    set_field("ipver", "ipv4");
    set_field(src_ipv4, std::string(1100, '1'));
    set_field(src_mask, "8");
    EXPECT_EQ(match_string(), "0 src_ip:" + std::string(1016, '1'));
    EXPECT_EQ(num_calls(Operation::bail_debug), 1U); // no room for "dst_ip"
}

// "ROOT/MAP/prio" and 470 characters of a map's name leave 2 for a priority.
TEST_F(LegacyUpgrade, CutsTheNodeOfAnEntryAt511Characters)
{
    const std::string entry = root + '/' + std::string(470, 'm') + "/prio/10";
    ASSERT_EQ(entry.size(), 511U);
    set(entry + "/match/0/dscp", "1");
    set(entry + "/dscp", "2");
    EXPECT_EQ(upgrade(), 0);
    EXPECT_THAT(nodes(new_db_, root),
                ElementsAre(entry + "/match/0/dscp string 1", entry + "/matchstr string dscp:2"));
}

TEST_F(LegacyUpgrade, ReadsWholeFieldsOfTheLongestEntry)
{
    const std::string entry = root + '/' + std::string(462, 'm') + "/prio/10";
    ASSERT_EQ((entry + "/match/0").size(), 511U);
    set(entry + "/match/0/" + src_ipv6, "2001:db8::/32");
    set(entry + "/match/0/ipver", "ipv6");
    EXPECT_EQ(upgrade(), 0);
    EXPECT_THAT(nodes(new_db_, root),
                ElementsAre(entry + "/match/0/matchstr string src_ip:2001:db8::/32,dst_ip:::/0"));
}

// 600 characters of a map's name are cut to 478: its entries are not found.
TEST_F(LegacyUpgrade, ConvertsMapsOfLongNamesUpToWhereTheirPathIsCut)
{
    for (const std::size_t size : {255U, 256U, 600U}) {
        const std::string match = root + '/' + std::string(size, 'm') + "/prio/10/match/0/";
        set(match + "dscp", "ef");
        EXPECT_EQ(upgrade(), 0);
        EXPECT_THAT(
            nodes(new_db_, root + '/' + std::string(size, 'm')),
            ElementsAre(match + (size == 600 ? "dscp string ef" : "matchstr string dscp:ef")));
    }
}

// 600 characters of a priority are cut to 471: nothing is read there, and the match string is
// "any".
TEST_F(LegacyUpgrade, ConvertsEntriesOfLongNamesUpToWhereTheirNodeIsCut)
{
    for (const std::size_t size : {255U, 256U}) {
        const std::string entry = root + "/m/prio/" + std::string(size, 'p');
        set(entry + "/match/0/dscp", "ef");
        EXPECT_EQ(upgrade(), 0);
        EXPECT_THAT(nodes(new_db_, entry), ElementsAre(entry + "/match/0/matchstr string dscp:ef"));
    }
    const std::string too_long = root + "/n/prio/" + std::string(600, 'p');
    const std::string cut = root + "/n/prio/" + std::string(471, 'p');
    ASSERT_EQ(cut.size(), 511U);
    set(too_long + "/match/0/dscp", "ef");
    EXPECT_EQ(upgrade(), 0);
    EXPECT_THAT(nodes(new_db_, root + "/n"),
                ElementsAre(cut + "/matchstr string any", too_long + "/match/0/dscp string ef"));
}

TEST_F(LegacyUpgrade, TakesAnEntryWithASlashInItsNameForOneTwoLevelsDeep)
{
    const std::string field = root + "/m/prio/" + written("1/2") + "/match/0/dscp";
    set(field, "ef");
    EXPECT_EQ(upgrade(), 0);
    EXPECT_THAT(nodes(new_db_, root), ElementsAre(root + "/m/prio/1/2/match/0/matchstr string any",
                                                  field + " string ef"));
}

TEST_F(LegacyUpgrade, DoesNotFindEntriesOfAMapWithASlashInItsName)
{
    set(root + '/' + written("a/b") + "/prio/10/match/0/dscp", "ef");
    EXPECT_EQ(upgrade(), 0);
    EXPECT_THAT(nodes(new_db_, root), ElementsAre(root + "/a\\/b/prio/10/match/0/dscp string ef"));
}

} // namespace
