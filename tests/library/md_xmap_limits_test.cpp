// The limits of maps and entries, which are part of what is checked for every change of a map.
#include "orvale/md_xmap_common.h"
#include "tests/library/library_test.h"
#include "tests/library/map_changes.h"
#include "tests/library/map_kinds.h"

#include <algorithm>
#include <climits>
#include <map>
#include <ostream>
#include <string>
#include <vector>

using namespace ovtest;
using testing::ElementsAre;
using testing::IsEmpty;

namespace
{

constexpr char check_function[] = "md_xmap_common_change_check";
constexpr char limit_function[] = "md_xmap_check_limit";
constexpr char count_function[] = "get_nbr_map_entries";
constexpr char maps_refused[] = "1 Cannot add map because maximum reached.";
constexpr char entries_refused[] = "1 Cannot add map entry because maximum reached.";
constexpr char not_found[] = "Error code 14004 (item not found) returned";

std::string line_of(const std::string &function, const std::string &text)
{
    return error_line("md_xmap_common", function, text);
}

std::string total(unsigned count)
{
    return gated_line(6, "Total map entries before add: " + std::to_string(count));
}

std::string maximum_reached(unsigned maximum)
{
    return gated_line(5,
                      "Can't add map entry because max (" + std::to_string(maximum) + ") reached");
}

class MapLimits : public LibraryTest
{
  protected:
    // Status, and whether the change is refused, which was the opposite of what the answer tells
    // most: "0 accepted".
    std::string check(int mtype, int change_type, const std::string &name)
    {
        MapChange change(change_type, name);
        tbool to_bail = true;
        const int status = in_library(md_xmap_common_change_check, change.record(), &commit_.dbinfo,
                                      mtype, &to_bail);
        return std::to_string(status) + (to_bail ? " refused" : " accepted");
    }

    std::string add(int mtype, const std::string &name) { return check(mtype, mdct_add, name); }

    std::string add_entry(const MapKind &kind, const std::string &map = "m1")
    {
        return add(kind.mtype, kind.entry(map, "7"));
    }

    // Entries 1001, 1002 and so on, and the default one.
    void give_entries(const MapKind &kind, const std::string &map, unsigned count)
    {
        for (unsigned i = 1; i <= count; ++i) {
            commit_.set_old(kind.entry(map, std::to_string(1000 + i)) + "/comment", "x");
        }
        commit_.set_old(kind.entry(map, "65535") + "/comment", "x");
    }

    void give_maps(const MapKind &kind, unsigned count)
    {
        for (unsigned i = 1; i <= count; ++i) {
            give_entries(kind, "map" + std::to_string(i), 0);
        }
    }

    MapCommit commit_;
};

// A kind of map and where its maximum comes from.
struct LimitedKind {
    MapKind kind;
    Operation getter;
};

void PrintTo(const LimitedKind &limited, std::ostream *out)
{
    PrintTo(limited.kind, out);
}

std::string name_of(const testing::TestParamInfo<LimitedKind> &about)
{
    return about.param.kind.name;
}

std::vector<LimitedKind> limited_kinds(const std::vector<int> &mtypes)
{
    const std::map<int, Operation> getters = {{MAP_TYPE_R, Operation::get_max_rmap_entries},
                                              {MAP_TYPE_O, Operation::get_max_omap_entries},
                                              {MAP_TYPE_Q, Operation::get_max_qmap_entries},
                                              {MAP_TYPE_S, Operation::get_max_smap_entries},
                                              {MAP_TYPE_N, Operation::get_max_nmap_entries},
                                              {MAP_TYPE_SEC, Operation::get_max_nmap_entries}};
    std::vector<LimitedKind> limited;
    for (const MapKind &kind : map_kinds()) {
        if (std::ranges::find(mtypes, kind.mtype) != mtypes.end()) {
            limited.push_back({kind, getters.at(kind.mtype)});
        }
    }
    return limited;
}

class LimitsOfEveryKind : public MapLimits, public testing::WithParamInterface<LimitedKind>
{
  protected:
    const MapKind &kind() const { return GetParam().kind; }
    void set_maximum(uint32 maximum) { planted().max_entries[GetParam().getter] = maximum; }
};

TEST_P(LimitsOfEveryKind, ChangesAndRemovalsAreNotLimited)
{
    set_maximum(0);
    give_maps(kind(), 20);
    give_entries(kind(), "map1", 20);
    for (const int change_type : std::vector<int>{mdct_modify, mdct_delete, 0, 4}) {
        for (const std::string &name :
             {std::string(kind().root) + "/m1", kind().entry("m1", "7")}) {
            EXPECT_EQ(check(kind().mtype, change_type, name), "0 accepted") << change_type;
        }
    }
    EXPECT_EQ(num_calls(Operation::mdb_get_tstr_array), 0U);
    EXPECT_THAT(commit_.commit.refusals, IsEmpty());
    EXPECT_THAT(log_lines(), IsEmpty());
}

TEST_P(LimitsOfEveryKind, OtherNodesAreNotLimited)
{
    set_maximum(0);
    give_maps(kind(), 20);
    for (const std::string &name : {std::string(kind().root), std::string(kind().root) + "/m1/prio",
                                    kind().entry("m1", "7") + "/match", kind().acl_node("m1", "7"),
                                    kind().matchstr_node("m1", "7"), std::string("/ov/other")}) {
        EXPECT_EQ(add(kind().mtype, name), "0 accepted") << name;
    }
    EXPECT_EQ(num_calls(Operation::mdb_get_tstr_array), 0U);
    EXPECT_THAT(commit_.commit.refusals, IsEmpty());
}

TEST_P(LimitsOfEveryKind, WithAMaximumOf0NoEntryIsAccepted)
{
    set_maximum(0);
    EXPECT_EQ(add_entry(kind()), "0 refused");
    EXPECT_THAT(commit_.commit.refusals, ElementsAre(entries_refused));
    EXPECT_EQ(last_log_line(), maximum_reached(0));
}

// Doubled in 32 bits it is 0.
TEST_P(LimitsOfEveryKind, WithAMaximumOf2147483648NoEntryIsAccepted)
{
    set_maximum(0x80000000);
    EXPECT_EQ(add_entry(kind()), "0 refused");
    EXPECT_THAT(commit_.commit.refusals, ElementsAre(entries_refused));
    EXPECT_EQ(last_log_line(), maximum_reached(0));
    set_maximum(0x80000001);
    EXPECT_EQ(add_entry(kind()), "0 accepted");
}

TEST_P(LimitsOfEveryKind, TheyAreCountedInTheDatabaseBefore)
{
    give_entries(kind(), "m1", 1);
    commit_.name_handles();
    EXPECT_EQ(add_entry(kind()), "0 accepted");
    EXPECT_EQ(add(kind().mtype, std::string(kind().root) + "/m2"), "0 accepted");
    for (const std::string &call : calls_of(Operation::mdb_get_tstr_array)) {
        EXPECT_THAT(call, testing::StartsWith("mdb_get_tstr_array(commit, olddb, "));
    }
}

TEST_P(LimitsOfEveryKind, EntriesOfOtherKindsAreNoneOfThisOnes)
{
    set_maximum(0);
    for (const MapKind &other : map_kinds()) {
        if (other.mtype != kind().mtype) {
            EXPECT_EQ(add(kind().mtype, other.entry("m1", "7")), "0 accepted") << other.name;
        }
    }
}

TEST_P(LimitsOfEveryKind, ARefusalThatCannotBeReportedIsNone)
{
    set_maximum(0);
    arm({.operation = Operation::md_commit_set_return_status_msg, .code = 14004});
    EXPECT_EQ(add_entry(kind()), "14004 accepted");
    const std::vector<std::string> lines = log_lines();
    ASSERT_GE(lines.size(), 3U);
    EXPECT_EQ(std::vector(lines.end() - 3, lines.end()),
              std::vector({maximum_reached(0), line_of(limit_function, not_found),
                           line_of(check_function, not_found)}));
    arm({.operation = Operation::md_commit_set_return_status_msg, .code = 14120});
    EXPECT_EQ(add_entry(kind()), "14120 accepted");
    EXPECT_EQ(last_log_line(), maximum_reached(0));
    EXPECT_EQ(num_calls(Operation::bail_quiet_debug), 2U);
}

INSTANTIATE_TEST_SUITE_P(All, LimitsOfEveryKind,
                         testing::ValuesIn(limited_kinds({MAP_TYPE_R, MAP_TYPE_O, MAP_TYPE_Q,
                                                          MAP_TYPE_S, MAP_TYPE_N, MAP_TYPE_SEC})),
                         name_of);

class LimitsOfMaps : public LimitsOfEveryKind
{
  protected:
    std::string add_map() { return add(kind().mtype, std::string(kind().root) + "/new"); }
};

TEST_P(LimitsOfMaps, TheTenthIsAccepted)
{
    give_maps(kind(), 9);
    EXPECT_EQ(add_map(), "0 accepted");
    EXPECT_THAT(commit_.commit.refusals, IsEmpty());
    EXPECT_THAT(log_lines(), IsEmpty());
    EXPECT_THAT(
        calls_of(Operation::mdb_get_tstr_array),
        ElementsAre("mdb_get_tstr_array(*, *, \"" + std::string(kind().root) + "\", 0, 0, 0, *)"));
}

TEST_P(LimitsOfMaps, TheEleventhIsRefused)
{
    give_maps(kind(), 10);
    EXPECT_EQ(add_map(), "0 refused");
    EXPECT_THAT(commit_.commit.refusals, ElementsAre(maps_refused));
    EXPECT_THAT(log_lines(), IsEmpty());
    EXPECT_EQ(num_calls(Operation::bail_debug), 0U);
}

TEST_P(LimitsOfMaps, TheyAreThoseOfTheDatabaseBefore)
{
    give_maps(kind(), 9);
    for (int i = 0; i < 20; ++i) {
        commit_.set_new(std::string(kind().root) + "/new" + std::to_string(i), "x");
    }
    EXPECT_EQ(add_map(), "0 accepted");
}

TEST_P(LimitsOfMaps, TheNumberOfEntriesIsNoMatterForANewMap)
{
    set_maximum(0);
    give_maps(kind(), 9);
    EXPECT_EQ(add_map(), "0 accepted");
    EXPECT_THAT(log_lines(), IsEmpty());
}

TEST_P(LimitsOfMaps, AnEntryIsAcceptedInTheEleventh)
{
    set_maximum(1);
    give_maps(kind(), 11);
    EXPECT_EQ(add_entry(kind()), "0 accepted");
}

TEST_P(LimitsOfMaps, AListThatCannotBeReadIsAnError)
{
    arm({.operation = Operation::mdb_get_tstr_array, .code = 14004});
    EXPECT_EQ(add_map(), "14004 accepted");
    EXPECT_THAT(log_lines(), ElementsAre(line_of(limit_function, not_found),
                                         line_of(check_function, not_found)));
    EXPECT_EQ(num_calls(Operation::bail_debug), 2U);
}

TEST_P(LimitsOfMaps, ACancelledListIsSilent)
{
    arm({.operation = Operation::mdb_get_tstr_array, .code = 14120});
    EXPECT_EQ(add_map(), "14120 accepted");
    EXPECT_THAT(log_lines(), IsEmpty());
    EXPECT_EQ(num_calls(Operation::bail_quiet_debug), 2U);
}

TEST_P(LimitsOfMaps, WithoutAListTheMapIsAccepted)
{
    give_maps(kind(), 10);
    arm({.operation = Operation::mdb_get_tstr_array, .way = FaultWay::without_object});
    EXPECT_EQ(add_map(), "0 accepted");
    EXPECT_THAT(log_lines(), IsEmpty());
}

TEST_P(LimitsOfMaps, ARefusalThatCannotBeReportedIsNone)
{
    give_maps(kind(), 10);
    arm({.operation = Operation::md_commit_set_return_status_msg, .code = 13999});
    EXPECT_EQ(add_map(), "13999 accepted");
    EXPECT_THAT(log_lines(), ElementsAre(line_of(limit_function, "Error code 13999 returned"),
                                         line_of(check_function, "Error code 13999 returned")));
    forget_calls();
    arm({.operation = Operation::md_commit_set_return_status_msg, .code = 14120});
    EXPECT_EQ(add_map(), "14120 accepted");
    EXPECT_THAT(log_lines(), IsEmpty());
}

INSTANTIATE_TEST_SUITE_P(All, LimitsOfMaps,
                         testing::ValuesIn(limited_kinds({MAP_TYPE_R, MAP_TYPE_O, MAP_TYPE_Q,
                                                          MAP_TYPE_S, MAP_TYPE_N})),
                         name_of);

class CountedEntries : public LimitsOfEveryKind
{
};

TEST_P(CountedEntries, TwiceTheModelsNumberIsAllowedInAllMapsTogether)
{
    set_maximum(5);
    give_entries(kind(), "m1", 4);
    give_entries(kind(), "m2", 5);
    EXPECT_EQ(add_entry(kind(), "m3"), "0 accepted");
    EXPECT_THAT(log_lines(), ElementsAre(total(9)));
    EXPECT_EQ(num_calls(GetParam().getter), 1U);
}

TEST_P(CountedEntries, TheOneBeyondIsRefused)
{
    set_maximum(5);
    give_entries(kind(), "m1", 5);
    give_entries(kind(), "m2", 5);
    EXPECT_EQ(add_entry(kind(), "m3"), "0 refused");
    EXPECT_THAT(commit_.commit.refusals, ElementsAre(entries_refused));
    EXPECT_THAT(log_lines(), ElementsAre(total(10), maximum_reached(10)));
    EXPECT_EQ(num_calls(Operation::bail_debug), 0U);
}

TEST_P(CountedEntries, TheDefaultEntryIsLimitedLikeAnyOther)
{
    set_maximum(1);
    give_entries(kind(), "m1", 2);
    EXPECT_EQ(add(kind().mtype, kind().entry("m2", "65535")), "0 refused");
}

TEST_P(CountedEntries, TheyAreThoseOfTheDatabaseBefore)
{
    set_maximum(1);
    give_entries(kind(), "m1", 1);
    for (int i = 0; i < 10; ++i) {
        commit_.set_new(kind().entry("m1", std::to_string(i)), "x");
    }
    EXPECT_EQ(add_entry(kind()), "0 accepted");
    EXPECT_THAT(log_lines(), ElementsAre(total(1)));
}

// One of each map's entries is taken for its default one, whether it is or not.
TEST_P(CountedEntries, OneOfEachMapIsNotCounted)
{
    set_maximum(50);
    commit_.set_old(kind().entry("m1", "10"), "x");
    commit_.set_old(kind().entry("m1", "20"), "x");
    commit_.set_old(kind().entry("m1", "30"), "x");
    commit_.set_old(kind().entry("m2", "10"), "x");
    commit_.set_old(std::string(kind().root) + "/m3", "without entries");
    EXPECT_EQ(add_entry(kind()), "0 accepted");
    EXPECT_THAT(log_lines(), ElementsAre(total(2)));
}

TEST_P(CountedEntries, NoMapsAreNoEntries)
{
    set_maximum(1);
    EXPECT_EQ(add_entry(kind()), "0 accepted");
    EXPECT_THAT(log_lines(), ElementsAre(total(0)));
}

TEST_P(CountedEntries, TheMaximumIsComparedAsAnUnsignedNumber)
{
    set_maximum(0x7fffffff);
    give_entries(kind(), "m1", 3);
    EXPECT_EQ(add_entry(kind()), "0 accepted");
}

TEST_P(CountedEntries, TheyAreReadMapByMap)
{
    set_maximum(50);
    give_entries(kind(), "b", 1);
    give_entries(kind(), "a", 1);
    EXPECT_EQ(add_entry(kind()), "0 accepted");
    const std::string root = kind().root;
    EXPECT_THAT(calls_of(Operation::mdb_get_tstr_array),
                ElementsAre("mdb_get_tstr_array(*, *, \"" + root + "\", 0, 0, 0, *)",
                            "mdb_get_tstr_array(*, *, \"" + root + "/a/prio\", 0, 0, 0, *)",
                            "mdb_get_tstr_array(*, *, \"" + root + "/b/prio\", 0, 0, 0, *)"));
}

TEST_P(CountedEntries, BelowALevelTheyAreNotLogged)
{
    set_maximum(1);
    give_entries(kind(), "m1", 2);
    host_.set_log_level(5);
    EXPECT_EQ(add_entry(kind()), "0 refused");
    EXPECT_THAT(log_lines(), ElementsAre(maximum_reached(2)));
    forget_calls();
    host_.set_log_level(4);
    EXPECT_EQ(add_entry(kind()), "0 refused");
    EXPECT_THAT(log_lines(), IsEmpty());
}

TEST_P(CountedEntries, MapsThatCannotBeReadAreNotCounted)
{
    set_maximum(1);
    give_entries(kind(), "m1", 2);
    arm({.operation = Operation::mdb_get_tstr_array, .code = 14004});
    EXPECT_EQ(add_entry(kind()), "0 accepted");
    EXPECT_THAT(log_lines(), ElementsAre(line_of(count_function, not_found)));
    EXPECT_EQ(num_calls(Operation::bail_debug), 1U);
    forget_calls();
    arm({.operation = Operation::mdb_get_tstr_array, .code = 14120});
    EXPECT_EQ(add_entry(kind()), "0 accepted");
    EXPECT_THAT(log_lines(), IsEmpty());
    EXPECT_EQ(num_calls(Operation::bail_quiet_debug), 1U);
}

TEST_P(CountedEntries, WithoutAListOfMapsNothingIsCounted)
{
    set_maximum(1);
    give_entries(kind(), "m1", 2);
    arm({.operation = Operation::mdb_get_tstr_array, .way = FaultWay::without_object});
    EXPECT_EQ(add_entry(kind()), "0 accepted");
    EXPECT_THAT(log_lines(), ElementsAre(line_of(count_function, "Unexpected NULL")));
}

TEST_P(CountedEntries, WhatWasCountedBeforeAFailureCounts)
{
    give_entries(kind(), "m1", 2);
    give_entries(kind(), "m2", 2);
    set_maximum(1);
    arm({.operation = Operation::mdb_get_tstr_array, .call = 3, .code = 14004});
    EXPECT_EQ(add_entry(kind()), "0 refused");
    EXPECT_THAT(log_lines(), ElementsAre(line_of(count_function, not_found), maximum_reached(2)));
    forget_calls();
    set_maximum(2);
    arm({.operation = Operation::mdb_get_tstr_array, .call = 3, .code = 14004});
    EXPECT_EQ(add_entry(kind()), "0 accepted");
    EXPECT_THAT(log_lines(), ElementsAre(line_of(count_function, not_found)));
}

TEST_P(CountedEntries, AnAbsentNameEndsTheCount)
{
    give_entries(kind(), "m1", 2);
    give_entries(kind(), "m2", 2);
    set_maximum(1);
    planted().null_text_at_call = 2;
    EXPECT_EQ(add_entry(kind()), "0 refused");
    EXPECT_THAT(log_lines(),
                ElementsAre(line_of(count_function, "Unexpected NULL"), maximum_reached(2)));
    EXPECT_EQ(num_calls(Operation::mdb_get_tstr_array), 2U);
}

TEST_P(CountedEntries, AMapWithoutAListOfEntriesHasNone)
{
    give_entries(kind(), "m1", 2);
    give_entries(kind(), "m2", 3);
    set_maximum(50);
    arm({.operation = Operation::mdb_get_tstr_array, .call = 2, .way = FaultWay::without_object});
    EXPECT_EQ(add_entry(kind()), "0 accepted");
    EXPECT_THAT(log_lines(), ElementsAre(total(3)));
}

// The path to a map's entries has 511 characters at most.
TEST_P(CountedEntries, TheEntriesOfAMapWithALongNameAreNotFound)
{
    const std::string root = kind().root;
    const std::string fits(511 - root.size() - std::string("//prio").size(), 'm');
    set_maximum(50);
    give_entries(kind(), fits, 2);
    EXPECT_EQ(add_entry(kind()), "0 accepted");
    EXPECT_THAT(log_lines(), ElementsAre(total(2)));
    forget_calls();
    give_entries(kind(), fits + 'x', 3);
    give_entries(kind(), std::string(600, 'y'), 4);
    EXPECT_EQ(add_entry(kind()), "0 accepted");
    EXPECT_THAT(log_lines(), ElementsAre(total(2)));
    EXPECT_THAT(
        calls_of(Operation::mdb_get_tstr_array),
        ElementsAre("mdb_get_tstr_array(*, *, \"" + root + "\", 0, 0, 0, *)",
                    "mdb_get_tstr_array(*, *, \"" + root + '/' + fits + "/prio\", 0, 0, 0, *)",
                    "mdb_get_tstr_array(*, *, \"" + root + '/' + fits + "x/pri\", 0, 0, 0, *)",
                    "mdb_get_tstr_array(*, *, \"" + root + '/' +
                        std::string(511 - root.size() - 1, 'y') + "\", 0, 0, 0, *)"));
}

TEST_P(CountedEntries, LongNamesAreAccepted)
{
    set_maximum(50);
    for (const std::size_t size : {255U, 256U, 600U}) {
        EXPECT_EQ(add_entry(kind(), std::string(size, 'm')), "0 accepted") << size;
    }
}

// A name in a list comes without escapes, and is put into a path as it is.
TEST_P(CountedEntries, TheEntriesOfAMapWithASlashInItsNameAreNotFound)
{
    set_maximum(50);
    give_entries(kind(), written("a/b"), 2);
    EXPECT_EQ(add_entry(kind()), "0 accepted");
    EXPECT_THAT(log_lines(), ElementsAre(total(0)));
    EXPECT_EQ(calls_of(Operation::mdb_get_tstr_array).back(), "mdb_get_tstr_array(*, *, \"" +
                                                                  std::string(kind().root) +
                                                                  "/a/b/prio\", 0, 0, 0, *)");
}

INSTANTIATE_TEST_SUITE_P(All, CountedEntries,
                         testing::ValuesIn(limited_kinds({MAP_TYPE_R, MAP_TYPE_O, MAP_TYPE_Q,
                                                          MAP_TYPE_S, MAP_TYPE_SEC})),
                         name_of);

TEST_F(MapLimits, AHundredRouteMapEntriesAreTheMostOfAModelWithFifty)
{
    planted().max_entries[Operation::get_max_rmap_entries] = 50;
    give_entries(route_map, "m1", 99);
    EXPECT_EQ(add_entry(route_map), "0 accepted");
    give_entries(route_map, "m2", 1);
    EXPECT_EQ(add_entry(route_map), "0 refused");
    EXPECT_THAT(log_lines(), ElementsAre(total(99), total(100), maximum_reached(100)));
}

TEST_F(MapLimits, NatMapEntriesAreNotCounted)
{
    const MapKind nat_map = limited_kinds({MAP_TYPE_N}).front().kind;
    planted().max_entries[Operation::get_max_nmap_entries] = 1;
    give_entries(nat_map, "m1", 100);
    EXPECT_EQ(add_entry(nat_map), "0 accepted");
    EXPECT_EQ(num_calls(Operation::mdb_get_tstr_array), 0U);
    EXPECT_THAT(log_lines(), IsEmpty());
    planted().max_entries[Operation::get_max_nmap_entries] = 0;
    EXPECT_EQ(add_entry(nat_map), "0 refused");
    EXPECT_EQ(num_calls(Operation::mdb_get_tstr_array), 0U);
    EXPECT_THAT(log_lines(), ElementsAre(maximum_reached(0)));
}

TEST_F(MapLimits, SecuritySubMapsAreNotLimited)
{
    give_maps(security_map, 20);
    EXPECT_EQ(add(MAP_TYPE_SEC, "/ov/tunneld/sec_map/config/map/map1/new"), "0 accepted");
    EXPECT_EQ(add(MAP_TYPE_SEC, "/ov/tunneld/sec_map/config/map/map2"), "0 accepted");
    EXPECT_EQ(num_calls(Operation::mdb_get_tstr_array), 0U);
    EXPECT_THAT(log_lines(), IsEmpty());
}

TEST_F(MapLimits, SecurityEntriesAreCountedBelowMap1Only)
{
    planted().max_entries[Operation::get_max_nmap_entries] = 1;
    for (const char *priority : {"10", "20", "30", "40", "65535"}) {
        commit_.set_old(std::string("/ov/tunneld/sec_map/config/map/map2/z1/prio/") + priority,
                        "x");
    }
    give_entries(security_map, "z1", 1);
    EXPECT_EQ(add_entry(security_map), "0 accepted");
    EXPECT_THAT(log_lines(), ElementsAre(total(1)));
}

TEST_F(MapLimits, SecurityEntriesBelowAnotherNameThanMap1AreLimitedByIt)
{
    planted().max_entries[Operation::get_max_nmap_entries] = 1;
    give_entries(security_map, "z1", 2);
    EXPECT_EQ(add(MAP_TYPE_SEC, "/ov/tunneld/sec_map/config/map/map2/z1/prio/10"), "0 refused");
    EXPECT_THAT(commit_.commit.refusals, ElementsAre(entries_refused));
}

constexpr char dns_maps[] = "/ov/dnsproxy/config/0/map";

// What the checks behind the limits say of DNS-proxy maps and of kinds that there are none of.
const std::string unknown_type = gated_line(3, "UNKNOWN type in md_xmap_common_change_check");
const std::string unknown_map_type = gated_line(3, "UNKNOWN map type");

TEST_F(MapLimits, ANewDnsProxyMapIsAlwaysRefused)
{
    EXPECT_EQ(add(MAP_TYPE_DNS_PROXY, "/ov/dnsproxy/config/0/map/m1"), "0 refused");
    EXPECT_THAT(commit_.commit.refusals, ElementsAre(maps_refused));
    EXPECT_THAT(log_lines(), ElementsAre(unknown_type));
    EXPECT_THAT(calls_of(Operation::smprintf),
                ElementsAre("smprintf(\"%s\", \"/ov/dnsproxy/config/0/map\")",
                            "smprintf(\"%s\", \"/ov/dnsproxy/config/0/map/*/prio\")"));
    EXPECT_THAT(
        calls_of(Operation::mdb_get_tstr_array),
        ElementsAre("mdb_get_tstr_array(*, *, \"" + std::string(dns_maps) + "\", 0, 0, 0, *)"));
    EXPECT_EQ(num_calls(Operation::get_max_dns_proxy_map_entries), 1U);
}

TEST_F(MapLimits, ANewDnsProxyMapIsAcceptedWithoutAList)
{
    arm({.operation = Operation::mdb_get_tstr_array, .way = FaultWay::without_object});
    EXPECT_EQ(add(MAP_TYPE_DNS_PROXY, "/ov/dnsproxy/config/0/map/m1"), "0 accepted");
    EXPECT_THAT(log_lines(), ElementsAre(unknown_type, unknown_map_type));
}

TEST_F(MapLimits, OnlyTheDnsProxyMapsOfTheFirstVrfAreLimited)
{
    planted().max_entries[Operation::get_max_dns_proxy_map_entries] = 0;
    EXPECT_EQ(add(MAP_TYPE_DNS_PROXY, "/ov/dnsproxy/config/1/map/m1"), "0 accepted");
    EXPECT_EQ(add(MAP_TYPE_DNS_PROXY, "/ov/dnsproxy/config/1/map/m1/prio/10"), "0 accepted");
    EXPECT_THAT(commit_.commit.refusals, IsEmpty());
}

TEST_F(MapLimits, DnsProxyEntriesAreNotCounted)
{
    planted().max_entries[Operation::get_max_dns_proxy_map_entries] = 1;
    for (int i = 0; i < 20; ++i) {
        commit_.set_old("/ov/dnsproxy/config/0/map/m1/prio/" + std::to_string(i), "x");
    }
    EXPECT_EQ(add(MAP_TYPE_DNS_PROXY, "/ov/dnsproxy/config/0/map/m1/prio/77"), "0 accepted");
    EXPECT_EQ(num_calls(Operation::mdb_get_tstr_array), 0U);
    EXPECT_THAT(log_lines(), ElementsAre(unknown_type, unknown_map_type));
}

TEST_F(MapLimits, WithAMaximumOf0NoDnsProxyEntryIsAccepted)
{
    planted().max_entries[Operation::get_max_dns_proxy_map_entries] = 0;
    EXPECT_EQ(add(MAP_TYPE_DNS_PROXY, "/ov/dnsproxy/config/0/map/m1/prio/10"), "0 refused");
    EXPECT_THAT(commit_.commit.refusals, ElementsAre(entries_refused));
    EXPECT_THAT(log_lines(), ElementsAre(unknown_type, maximum_reached(0)));
}

TEST_F(MapLimits, ChangesAndRemovalsOfDnsProxyMapsAreNotLimited)
{
    planted().max_entries[Operation::get_max_dns_proxy_map_entries] = 0;
    for (const int change_type : {mdct_modify, mdct_delete}) {
        EXPECT_EQ(check(MAP_TYPE_DNS_PROXY, change_type, "/ov/dnsproxy/config/0/map/m1"),
                  "0 accepted");
        EXPECT_EQ(check(MAP_TYPE_DNS_PROXY, change_type, "/ov/dnsproxy/config/0/map/m1/prio/10"),
                  "0 accepted");
    }
    EXPECT_EQ(num_calls(Operation::smprintf), 0U);
}

TEST_F(MapLimits, WithoutMemoryForADnsProxyPathTheCheckFails)
{
    for (const unsigned call : {1U, 2U}) {
        forget_calls();
        arm({.operation = Operation::smprintf, .call = call});
        EXPECT_EQ(add(MAP_TYPE_DNS_PROXY, "/ov/dnsproxy/config/0/map/m1"), "14001 accepted");
        EXPECT_THAT(
            log_lines(),
            ElementsAre(unknown_type, line_of(limit_function, "Unexpected NULL"),
                        line_of(check_function, "Error code 14001 (unexpected NULL) returned")));
        EXPECT_EQ(num_calls(Operation::mdb_get_tstr_array), 0U);
    }
}

TEST_F(MapLimits, UnknownKindsHaveNone)
{
    for (const int mtype : {-1, static_cast<int>(MAP_TYPE_RTMAP), 8, 1000, INT_MIN, INT_MAX}) {
        for (const MapKind &kind : map_kinds()) {
            forget_calls();
            give_maps(kind, 20);
            EXPECT_EQ(add(mtype, std::string(kind.root) + "/new"), "0 accepted") << mtype;
            EXPECT_EQ(add(mtype, kind.entry("m1", "7")), "0 accepted") << mtype;
            EXPECT_THAT(log_lines(), ElementsAre(unknown_type, unknown_map_type, unknown_type,
                                                 unknown_map_type));
            EXPECT_EQ(num_calls(Operation::mdb_get_tstr_array), 0U);
        }
    }
    EXPECT_THAT(commit_.commit.refusals, IsEmpty());
}

TEST_F(MapLimits, WithoutADatabaseBeforeTheHostsCodeIsPassedUp)
{
    commit_.dbinfo.olddb = nullptr;
    EXPECT_EQ(add(MAP_TYPE_R, "/ov/tunneld/route_map/config/map/m1"), "14001 accepted");
    EXPECT_THAT(commit_.commit.refusals, IsEmpty());
}

} // namespace
