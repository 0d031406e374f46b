// What is checked for every change of a map: that an entry matches before it sets, and the order of
// the checks. md_xmap_limits_test.cpp has the limits.
#include "orvale/md_xmap_common.h"
#include "tests/library/library_test.h"
#include "tests/library/map_changes.h"
#include "tests/library/map_kinds.h"

#include <climits>
#include <optional>
#include <string>
#include <vector>

using namespace ovtest;
using testing::ElementsAre;
using testing::IsEmpty;

namespace
{

constexpr char set_function[] = "md_xmap_check_match_exists_for_set";
constexpr char common_function[] = "md_xmap_common_change_check";
constexpr char refusal[] =
    "1 The match parameters have to be configured before configuring the set parameters.";
constexpr char not_found[] = "Error code 14004 (item not found) returned";

const std::string unknown_map_type = gated_line(3, "UNKNOWN map type");
const std::string unknown_type = gated_line(3, "UNKNOWN type in md_xmap_common_change_check");

std::string line_of(const std::string &function, const std::string &text)
{
    return error_line("md_xmap_common", function, text);
}

std::string path_line(const std::string &path)
{
    return debug_line("md_xmap_common", set_function, "smprintf=" + path);
}

class ChangeChecks : public LibraryTest
{
  protected:
    int check_set(int mtype, int change_type, const std::string &name)
    {
        MapChange change(change_type, name, "x");
        return in_library(md_xmap_check_match_exists_for_set, change.record(), &commit_.dbinfo,
                          mtype);
    }

    // Status, and whether the change is refused, which was so before: "0 goes on".
    std::string check(int mtype, int change_type, const std::string &name,
                      const std::optional<std::string> &value = "x")
    {
        MapChange change(change_type, name, value);
        tbool to_bail = true;
        const int status = in_library(md_xmap_common_change_check, change.record(), &commit_.dbinfo,
                                      mtype, &to_bail);
        return std::to_string(status) + (to_bail ? " refused" : " goes on");
    }

    const std::vector<std::string> &refused() { return commit_.commit.refusals; }

    MapCommit commit_;
};

class ChangeChecksOfEveryKind : public ChangeChecks, public testing::WithParamInterface<MapKind>
{
  protected:
    int add_set() { return check_set(GetParam().mtype, mdct_add, set_node()); }
    std::string set_node() const { return GetParam().set_node("m1", "10"); }
    std::string match_node() const { return GetParam().match_node("m1", "10"); }
};

TEST_P(ChangeChecksOfEveryKind, AnEntryThatMatchesNothingSetsNothing)
{
    EXPECT_EQ(add_set(), 80000);
    EXPECT_THAT(refused(), ElementsAre(refusal));
    EXPECT_THAT(log_lines(), ElementsAre(path_line(match_node())));
    EXPECT_THAT(calls_of(Operation::mdb_get_tstr_array),
                ElementsAre("mdb_get_tstr_array(*, *, \"" + match_node() + "\", 0, 0, 0, *)"));
    EXPECT_EQ(num_calls(Operation::bail_debug), 0U);
}

TEST_P(ChangeChecksOfEveryKind, AnEntryThatMatchesMaySet)
{
    for (const char *child : {"/0/acl", "/0/matchstr", "/anything"}) {
        MapCommit commit;
        commit.set_new(match_node() + child, "");
        MapChange change(mdct_add, set_node(), "x");
        EXPECT_EQ(in_library(md_xmap_check_match_exists_for_set, change.record(), &commit.dbinfo,
                             GetParam().mtype),
                  0);
        EXPECT_THAT(commit.commit.refusals, IsEmpty());
    }
    EXPECT_THAT(log_lines(), ElementsAre(path_line(match_node()), path_line(match_node()),
                                         path_line(match_node())));
}

TEST_P(ChangeChecksOfEveryKind, WhatItMatchesIsAskedOfTheProposedDatabase)
{
    commit_.name_handles();
    EXPECT_EQ(add_set(), 80000);
    EXPECT_THAT(
        calls_of(Operation::mdb_get_tstr_array),
        ElementsAre("mdb_get_tstr_array(commit, newdb, \"" + match_node() + "\", 0, 0, 0, *)"));
}

// Which names match is the host's to say.
TEST_P(ChangeChecksOfEveryKind, ANodeWithATooShortNameIsAnError)
{
    const std::string root = GetParam().root;
    planted().every_name_matches = true;
    for (const std::string &name : {root, root + "/m1", root + "/m1/prio"}) {
        forget_calls();
        EXPECT_EQ(check_set(GetParam().mtype, mdct_add, name), 14001);
        EXPECT_THAT(log_lines(), ElementsAre(line_of(set_function, "Unexpected NULL")));
        EXPECT_EQ(num_calls(Operation::bail_debug), 1U);
        EXPECT_EQ(num_calls(Operation::mdb_get_tstr_array), 0U);
    }
    EXPECT_THAT(refused(), IsEmpty());
}

TEST_P(ChangeChecksOfEveryKind, WhatItMatchedBeforeDoesNotCount)
{
    commit_.set_old(match_node() + "/0/acl", "a1");
    EXPECT_EQ(add_set(), 80000);
}

TEST_P(ChangeChecksOfEveryKind, WhatAnotherEntryMatchesDoesNotCount)
{
    commit_.set_new(GetParam().match_node("m1", "20") + "/0/acl", "a1");
    commit_.set_new(GetParam().match_node("m2", "10") + "/0/acl", "a1");
    EXPECT_EQ(add_set(), 80000);
}

TEST_P(ChangeChecksOfEveryKind, AValueOfTheMatchNodeIsNoMatch)
{
    commit_.set_new(match_node(), "x");
    EXPECT_EQ(add_set(), 80000);
}

TEST_P(ChangeChecksOfEveryKind, OnlyNewSetParametersAreChecked)
{
    for (const int change_type : std::vector<int>{mdct_modify, mdct_delete, 0, 4}) {
        EXPECT_EQ(check_set(GetParam().mtype, change_type, set_node()), 0);
    }
    for (const std::string &name :
         {GetParam().entry("m1", "10"), match_node(), GetParam().acl_node("m1", "10"),
          set_node() + "/x", set_node() + 'x' + "/y/z", std::string("/ov")}) {
        EXPECT_EQ(check_set(GetParam().mtype, mdct_add, name), 0) << name;
    }
    EXPECT_THAT(refused(), IsEmpty());
    EXPECT_THAT(log_lines(), IsEmpty());
    EXPECT_EQ(num_calls(Operation::mdb_get_tstr_array), 0U);
}

TEST_P(ChangeChecksOfEveryKind, SetParametersOfOtherKindsAreNoneOfThisOnes)
{
    for (const MapKind &other : map_kinds()) {
        if (other.mtype != GetParam().mtype) {
            EXPECT_EQ(check_set(GetParam().mtype, mdct_add, other.set_node("m1", "10")), 0);
        }
    }
    EXPECT_THAT(log_lines(), IsEmpty());
}

TEST_P(ChangeChecksOfEveryKind, TheDefaultEntryIsCheckedLikeAnyOther)
{
    EXPECT_EQ(check_set(GetParam().mtype, mdct_add, GetParam().set_node("m1", "65535")), 80000);
}

TEST_P(ChangeChecksOfEveryKind, AListThatIsNotThereIsEmpty)
{
    commit_.set_new(match_node() + "/0/acl", "a1");
    arm({.operation = Operation::mdb_get_tstr_array, .way = FaultWay::without_object});
    EXPECT_EQ(add_set(), 80000);
    EXPECT_THAT(refused(), ElementsAre(refusal));
}

TEST_P(ChangeChecksOfEveryKind, ARefusalThatCannotBeReportedIsAnError)
{
    arm({.operation = Operation::md_commit_set_return_status_msg, .code = 14004});
    EXPECT_EQ(add_set(), 14004);
    EXPECT_EQ(last_log_line(), line_of(set_function, not_found));
    forget_calls();
    arm({.operation = Operation::md_commit_set_return_status_msg, .code = 14120});
    EXPECT_EQ(add_set(), 14120);
    EXPECT_THAT(log_lines(), ElementsAre(path_line(match_node())));
}

TEST_P(ChangeChecksOfEveryKind, WithoutMemoryForThePathTheCheckFails)
{
    arm({.operation = Operation::smprintf});
    EXPECT_EQ(add_set(), 14001);
    EXPECT_THAT(log_lines(), ElementsAre(line_of(set_function, "Unexpected NULL")));
    EXPECT_EQ(num_calls(Operation::mdb_get_tstr_array), 0U);
}

TEST_P(ChangeChecksOfEveryKind, LongNamesAreKeptWhole)
{
    for (const std::size_t size : {255U, 256U, 600U}) {
        const std::string map(size, 'm');
        EXPECT_EQ(check_set(GetParam().mtype, mdct_add, GetParam().set_node(map, "10")), 80000);
        EXPECT_EQ(last_log_line(), path_line(GetParam().match_node(map, "10")));
        commit_.set_new(GetParam().match_node(map, "10") + "/0/acl", "a1");
        EXPECT_EQ(check_set(GetParam().mtype, mdct_add, GetParam().set_node(map, "10")), 0);
    }
}

// Names go into paths as they are: a slash makes two levels of one name.
TEST_P(ChangeChecksOfEveryKind, AMapWithASlashInItsNameMatchesNothing)
{
    const std::string map = written("m/n");
    commit_.set_new(GetParam().match_node(map, "10") + "/0/acl", "a1");
    EXPECT_EQ(check_set(GetParam().mtype, mdct_add, GetParam().set_node(map, "10")), 80000);
    EXPECT_EQ(last_log_line(), path_line(GetParam().match_node("m/n", "10")));
    EXPECT_EQ(check_set(GetParam().mtype, mdct_add, GetParam().set_node(written("m\\n"), "10")),
              14009);
}

TEST_P(ChangeChecksOfEveryKind, TheCommonCheckRefusesASetWithoutAMatch)
{
    EXPECT_EQ(check(GetParam().mtype, mdct_add, set_node()), "0 refused");
    EXPECT_THAT(refused(), ElementsAre(refusal));
    EXPECT_THAT(log_lines(), ElementsAre(path_line(match_node())));
    EXPECT_EQ(num_calls(Operation::bail_debug), 0U);
}

TEST_P(ChangeChecksOfEveryKind, AMatchAndASetOfOneCommitPassTheCommonCheck)
{
    commit_.set_new(GetParam().acl_node("m1", "10"), "a1");
    commit_.set_new(set_node(), "x");
    EXPECT_EQ(check(GetParam().mtype, mdct_add, GetParam().acl_node("m1", "10"), "a1"),
              "0 goes on");
    EXPECT_EQ(check(GetParam().mtype, mdct_add, set_node()), "0 goes on");
    EXPECT_THAT(refused(), IsEmpty());
}

TEST_P(ChangeChecksOfEveryKind, TheCommonCheckTakesAnyMatchString)
{
    const std::string name = GetParam().matchstr_node("m1", "10");
    for (const std::string &value :
         {std::string("any"), std::string(), std::string("no match string at all"),
          std::string("src_ip:1,src_ip:1"), std::string(1024, ','), std::string("%s%n")}) {
        EXPECT_EQ(check(GetParam().mtype, mdct_add, name, value), "0 goes on");
        EXPECT_EQ(check(GetParam().mtype, mdct_modify, name, value), "0 goes on");
    }
    EXPECT_EQ(check(GetParam().mtype, mdct_modify, name, std::nullopt), "0 goes on");
    EXPECT_THAT(refused(), IsEmpty());
    EXPECT_THAT(log_lines(), IsEmpty());
}

TEST_P(ChangeChecksOfEveryKind, TheCommonCheckReadsANewMatchString)
{
    const std::string name = GetParam().matchstr_node("m1", "10");
    EXPECT_EQ(check(GetParam().mtype, mdct_modify, name), "0 goes on");
    EXPECT_THAT(calls_of(Operation::bn_attrib_array_get_attrib_tstr),
                ElementsAre("bn_attrib_array_get_attrib_tstr(*, 1, *)"));
    EXPECT_EQ(num_calls(Operation::ov_acl_validate_matchstr), 0U);
    forget_calls();
    EXPECT_EQ(check(GetParam().mtype, mdct_delete, name), "0 goes on");
    EXPECT_EQ(check(GetParam().mtype, mdct_add, GetParam().acl_node("m1", "10")), "0 goes on");
    EXPECT_EQ(num_calls(Operation::bn_attrib_array_get_attrib_tstr), 0U);
}

TEST_P(ChangeChecksOfEveryKind, TheCommonCheckReadsNothingWhereNothingIsNew)
{
    const std::string name = GetParam().matchstr_node("m1", "10");
    for (const int change_type : std::vector<int>{mdct_add, mdct_modify}) {
        EXPECT_EQ(check(GetParam().mtype, change_type, name, std::nullopt), "0 goes on");
    }
    EXPECT_EQ(num_calls(Operation::bn_attrib_array_get_attrib_tstr), 0U);
}

TEST_P(ChangeChecksOfEveryKind, AMatchStringThatCannotBeReadIsAnError)
{
    const std::string name = GetParam().matchstr_node("m1", "10");
    arm({.operation = Operation::bn_attrib_array_get_attrib_tstr, .code = 14004});
    EXPECT_EQ(check(GetParam().mtype, mdct_add, name), "14004 goes on");
    EXPECT_THAT(log_lines(), ElementsAre(line_of(common_function, not_found)));
    forget_calls();
    arm({.operation = Operation::bn_attrib_array_get_attrib_tstr, .code = 14120});
    EXPECT_EQ(check(GetParam().mtype, mdct_add, name), "14120 goes on");
    EXPECT_THAT(log_lines(), IsEmpty());
    EXPECT_EQ(num_calls(Operation::bail_quiet_debug), 1U);
}

TEST_P(ChangeChecksOfEveryKind, WhatTheCommonCheckPassesUpIsLoggedAgain)
{
    arm({.operation = Operation::mdb_get_tstr_array, .code = 14004});
    EXPECT_EQ(check(GetParam().mtype, mdct_add, set_node()), "14004 goes on");
    EXPECT_THAT(log_lines(), ElementsAre(path_line(match_node()), line_of(set_function, not_found),
                                         line_of(common_function, not_found)));
    EXPECT_EQ(num_calls(Operation::bail_debug), 2U);
    forget_calls();
    arm({.operation = Operation::mdb_get_tstr_array, .code = 14120});
    EXPECT_EQ(check(GetParam().mtype, mdct_add, set_node()), "14120 goes on");
    EXPECT_THAT(log_lines(), ElementsAre(path_line(match_node())));
    EXPECT_EQ(num_calls(Operation::bail_quiet_debug), 2U);
}

TEST_P(ChangeChecksOfEveryKind, NothingIsWritten)
{
    commit_.set_new(set_node(), "x");
    const std::vector<std::string> before = nodes(commit_.newdb, "/");
    EXPECT_EQ(check(GetParam().mtype, mdct_add, set_node()), "0 refused");
    EXPECT_EQ(nodes(commit_.newdb, "/"), before);
    EXPECT_EQ(num_calls(Operation::mdb_set_node_binding), 0U);
}

INSTANTIATE_TEST_SUITE_P(All, ChangeChecksOfEveryKind, testing::ValuesIn(map_kinds()),
                         [](const auto &about) { return std::string(about.param.name); });

TEST_F(ChangeChecks, OfRegularMapsTheSetNodeItselfIsNoSetParameter)
{
    EXPECT_EQ(check_set(MAP_TYPE_R, mdct_add, "/ov/tunneld/route_map/config/map/m1/prio/10/set"),
              0);
    EXPECT_EQ(check_set(MAP_TYPE_R, mdct_add, "/ov/tunneld/route_map/config/map/m1/prio/10/set/x"),
              80000);
}

TEST_F(ChangeChecks, OfTheSecurityMapTheSetNodeItselfIsTheSetParameter)
{
    const std::string entry = "/ov/tunneld/sec_map/config/map/map1/z1/prio/5";
    EXPECT_EQ(check_set(MAP_TYPE_SEC, mdct_add, entry + "/set/x"), 0);
    EXPECT_EQ(check_set(MAP_TYPE_SEC, mdct_add, entry + "/set"), 80000);
}

TEST_F(ChangeChecks, WhatASecurityEntryMatchesIsLookedUpBelowMap1WhateverStandsThere)
{
    const std::string set_node = "/ov/tunneld/sec_map/config/map/map2/z1/prio/5/set";
    commit_.set_new("/ov/tunneld/sec_map/config/map/map2/z1/prio/5/match/acl", "a1");
    EXPECT_EQ(check_set(MAP_TYPE_SEC, mdct_add, set_node), 80000);
    EXPECT_EQ(last_log_line(), path_line("/ov/tunneld/sec_map/config/map/map1/z1/prio/5/match"));
    commit_.set_new("/ov/tunneld/sec_map/config/map/map1/z1/prio/5/match/acl", "a1");
    EXPECT_EQ(check_set(MAP_TYPE_SEC, mdct_add, set_node), 0);
}

TEST_F(ChangeChecks, OfTheSecurityMapAMatchStringHasNoIndex)
{
    const std::string match = "/ov/tunneld/sec_map/config/map/map1/z1/prio/5/match";
    EXPECT_EQ(check(MAP_TYPE_SEC, mdct_add, match + "/0/matchstr"), "0 goes on");
    EXPECT_EQ(num_calls(Operation::bn_attrib_array_get_attrib_tstr), 0U);
    EXPECT_EQ(check(MAP_TYPE_SEC, mdct_add, match + "/matchstr"), "0 goes on");
    EXPECT_EQ(num_calls(Operation::bn_attrib_array_get_attrib_tstr), 1U);
}

TEST_F(ChangeChecks, OfRegularMapsAMatchStringMayHaveAnyIndex)
{
    const std::string match = "/ov/tunneld/qos_map/config/map/m1/prio/5/match";
    EXPECT_EQ(check(MAP_TYPE_Q, mdct_add, match + "/7/matchstr"), "0 goes on");
    EXPECT_EQ(num_calls(Operation::bn_attrib_array_get_attrib_tstr), 1U);
    EXPECT_EQ(check(MAP_TYPE_Q, mdct_add, match + "/matchstr"), "0 goes on");
    EXPECT_EQ(num_calls(Operation::bn_attrib_array_get_attrib_tstr), 1U);
}

TEST_F(ChangeChecks, LimitsComeFirst)
{
    for (int i = 0; i < 10; ++i) {
        commit_.set_old("/ov/tunneld/opt_map/config/map/m" + std::to_string(i), "x");
    }
    EXPECT_EQ(check(MAP_TYPE_O, mdct_add, "/ov/tunneld/opt_map/config/map/new"), "0 refused");
    EXPECT_THAT(refused(), ElementsAre("1 Cannot add map because maximum reached."));
}

TEST_F(ChangeChecks, UnknownKindsAreToldAndPass)
{
    for (const int mtype : {-1, static_cast<int>(MAP_TYPE_RTMAP), 8, 1000, INT_MIN, INT_MAX}) {
        for (const MapKind &kind : map_kinds()) {
            forget_calls();
            EXPECT_EQ(check_set(mtype, mdct_add, kind.set_node("m1", "10")), 0) << mtype;
            EXPECT_THAT(log_lines(), ElementsAre(unknown_map_type));
            forget_calls();
            EXPECT_EQ(check(mtype, mdct_add, kind.set_node("m1", "10")), "0 goes on") << mtype;
            EXPECT_EQ(check(mtype, mdct_delete, kind.matchstr_node("m1", "10")), "0 goes on");
            EXPECT_EQ(check(mtype, mdct_add, kind.matchstr_node("m1", "10")), "0 goes on");
            EXPECT_THAT(log_lines(), ElementsAre(unknown_type, unknown_map_type, unknown_type,
                                                 unknown_map_type, unknown_type, unknown_map_type));
            EXPECT_EQ(num_calls(Operation::mdb_get_tstr_array), 0U);
            EXPECT_EQ(num_calls(Operation::bn_attrib_array_get_attrib_tstr), 0U);
        }
    }
    EXPECT_THAT(refused(), IsEmpty());
}

TEST_F(ChangeChecks, UnknownKindsAreToldFromTheErrorLevelOn)
{
    host_.set_log_level(3);
    EXPECT_EQ(check(8, mdct_add, "/ov/a"), "0 goes on");
    EXPECT_EQ(log_lines().size(), 2U);
    forget_calls();
    host_.set_log_level(2);
    EXPECT_EQ(check(8, mdct_add, "/ov/a"), "0 goes on");
    EXPECT_THAT(log_lines(), IsEmpty());
}

TEST_F(ChangeChecks, ADnsProxyMapIsUnknownAndLimited)
{
    EXPECT_EQ(check(MAP_TYPE_DNS_PROXY, mdct_add, "/ov/dnsproxy/config/0/map/m1"), "0 refused");
    EXPECT_THAT(refused(), ElementsAre("1 Cannot add map because maximum reached."));
    EXPECT_THAT(log_lines(), ElementsAre(unknown_type));
    EXPECT_EQ(check_set(MAP_TYPE_DNS_PROXY, mdct_add, "/ov/dnsproxy/config/0/map/m1/prio/1/set/x"),
              0);
    EXPECT_EQ(last_log_line(), unknown_map_type);
}

TEST_F(ChangeChecks, NullArgumentsAreRefused)
{
    MapChange change(mdct_add, route_map.set_node("m1", "10"));
    tbool to_bail = false;
    EXPECT_EQ(in_library(md_xmap_check_match_exists_for_set, nullptr, &commit_.dbinfo, 0), 14001);
    EXPECT_EQ(in_library(md_xmap_check_match_exists_for_set, change.record(), nullptr, 0), 14001);
    EXPECT_EQ(in_library(md_xmap_common_change_check, nullptr, &commit_.dbinfo, 0, &to_bail),
              14001);
    EXPECT_EQ(in_library(md_xmap_common_change_check, change.record(), nullptr, 0, &to_bail),
              14001);
    EXPECT_EQ(in_library(md_xmap_common_change_check, change.record(), &commit_.dbinfo, 0, nullptr),
              14001);
    const std::string set_line = line_of(set_function, "Unexpected NULL");
    const std::string common_line = line_of(common_function, "Unexpected NULL");
    EXPECT_THAT(log_lines(),
                ElementsAre(set_line, set_line, common_line, common_line, common_line));
    EXPECT_EQ(num_calls(Operation::bail_debug), 5U);
    EXPECT_FALSE(to_bail);
    EXPECT_THAT(refused(), IsEmpty());
}

TEST_F(ChangeChecks, WithoutADatabaseTheHostsCodeIsPassedUp)
{
    commit_.dbinfo.newdb = nullptr;
    EXPECT_EQ(check_set(MAP_TYPE_R, mdct_add, route_map.set_node("m1", "10")), 14001);
    EXPECT_THAT(refused(), IsEmpty());
}

} // namespace
