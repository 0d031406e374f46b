#include "orvale/md_xmap_common.h"

#include "tests/library/library_test.h"
#include "tests/library/map_changes.h"

#include <initializer_list>
#include <string>

using namespace ovtest;
using testing::ElementsAre;
using testing::IsEmpty;

namespace
{

const std::string root = "/ov/tunneld/route_map/config/map/";

constexpr char set_nodes_call[] = "mdb_get_matching_tstr_array(*, *, "
                                  "\"/ov/tunneld/route_map/config/map/*/prio/*/set/0\", 4608, *)";

std::string line_of(const std::string &function, const std::string &text)
{
    return error_line("md_xmap_common", function, text);
}

std::string value_call(const std::string &node)
{
    return "mdb_get_node_value_tstr(*, *, \"" + root + node + "\", 0, null, *)";
}

class PreferredInterface : public LibraryTest
{
  protected:
    void set_mode(const std::string &entry, const std::string &mode)
    {
        map_commit_.set_both(root + entry + "/set/0/auto_mod", mode);
    }

    // Status and answer; the change is not looked at.
    std::string is_used()
    {
        tbool found = true;
        const int status =
            in_library(md_preferred_if_is_used_in_rmap, nullptr, &map_commit_.dbinfo, &found);
        return std::to_string(status) + (found ? " yes" : " no");
    }
    static std::string path_line(const std::string &entry)
    {
        return debug_line("md_xmap_common", "md_preferred_if_is_used_in_rmap",
                          "smprintf=" + root + entry + "/set/0/auto_mod");
    }

    MapCommit map_commit_;
};

TEST_F(PreferredInterface, IsNotUsedWithoutRouteMaps)
{
    EXPECT_EQ(is_used(), "0 no");
    EXPECT_THAT(calls_of(Operation::mdb_get_matching_tstr_array), ElementsAre(set_nodes_call));
    EXPECT_THAT(log_lines(), IsEmpty());
}

TEST_F(PreferredInterface, IsUsedByTheFirstEntryThatSaysSo)
{
    set_mode("a/prio/10", "other");
    set_mode("a/prio/20", "preferred-if");
    set_mode("b/prio/10", "preferred-if");
    EXPECT_EQ(is_used(), "0 yes");
    EXPECT_THAT(calls_of(Operation::mdb_get_node_value_tstr),
                ElementsAre(value_call("a/prio/10/set/0/auto_mod"),
                            value_call("a/prio/20/set/0/auto_mod")));
    EXPECT_THAT(log_lines(), ElementsAre(path_line("a/prio/10"), path_line("a/prio/20"),
                                         gated_line(5, "Found preferred_if in a:20.")));
    EXPECT_THAT(map_commit_.commit.refusals, IsEmpty());
}

TEST_F(PreferredInterface, IsComparedWholeAndWithCase)
{
    for (const char *mode : {"Preferred-if", "preferred-if ", "preferred", ""}) {
        set_mode("a/prio/10", mode);
        EXPECT_EQ(is_used(), "0 no") << mode;
    }
}

TEST_F(PreferredInterface, IsNotUsedByAnEntryWithoutMode)
{
    map_commit_.set_both(root + "a/prio/10/set/0/nexthop", "10.0.0.1");
    EXPECT_EQ(is_used(), "0 no");
    EXPECT_THAT(log_lines(), ElementsAre(path_line("a/prio/10")));
}

TEST_F(PreferredInterface, IsReadAsItWasInTheEntriesThatAreToBe)
{
    map_commit_.set_new(root + "added/prio/10/set/0/auto_mod", "preferred-if");
    map_commit_.set_old(root + "gone/prio/10/set/0/auto_mod", "preferred-if");
    EXPECT_EQ(is_used(), "0 no");
    map_commit_.set_new(root + "gone/prio/10/set/0/auto_mod", "other");
    EXPECT_EQ(is_used(), "0 yes");
}

TEST_F(PreferredInterface, IsLookedForBelowTheFirstSetOnly)
{
    map_commit_.set_both(root + "a/prio/10/set/1/auto_mod", "preferred-if");
    EXPECT_EQ(is_used(), "0 no");
    EXPECT_EQ(num_calls(Operation::mdb_get_node_value_tstr), 0U);
}

TEST_F(PreferredInterface, IsNotLookedForWhenNobodyAsks)
{
    EXPECT_EQ(in_library(md_preferred_if_is_used_in_rmap, nullptr, &map_commit_.dbinfo, nullptr),
              0);
    EXPECT_EQ(in_library(md_preferred_if_is_used_in_rmap, nullptr, nullptr, nullptr), 0);
    EXPECT_THAT(log_lines(), IsEmpty());
    EXPECT_EQ(num_calls(Operation::mdb_get_matching_tstr_array), 0U);
}

TEST_F(PreferredInterface, OfNoCommitIsAnError)
{
    tbool found = true;
    EXPECT_EQ(in_library(md_preferred_if_is_used_in_rmap, nullptr, nullptr, &found), 14001);
    EXPECT_FALSE(found);
    EXPECT_THAT(log_lines(),
                ElementsAre(line_of("md_preferred_if_is_used_in_rmap", "Unexpected NULL")));
}

TEST_F(PreferredInterface, EndsAtTheFirstFailedRead)
{
    set_mode("a/prio/10", "other");
    set_mode("a/prio/20", "preferred-if");
    arm({.operation = Operation::mdb_get_node_value_tstr, .code = 14014});
    EXPECT_EQ(is_used(), "14014 no");
    EXPECT_EQ(log_lines().back(), line_of("md_preferred_if_is_used_in_rmap",
                                          "Error code 14014 (generic IO error) returned"));
    EXPECT_EQ(num_calls(Operation::mdb_get_node_value_tstr), 1U);
}

TEST_F(PreferredInterface, IsLookedForInBothDatabases)
{
    set_mode("a/prio/10", "preferred-if");
    map_commit_.name_handles();
    EXPECT_EQ(is_used(), "0 yes");
    EXPECT_THAT(calls_of(Operation::mdb_get_matching_tstr_array),
                ElementsAre("mdb_get_matching_tstr_array(commit, newdb, "
                            "\"/ov/tunneld/route_map/config/map/*/prio/*/set/0\", 4608, *)"));
    EXPECT_THAT(calls_of(Operation::mdb_get_node_value_tstr),
                ElementsAre("mdb_get_node_value_tstr(commit, olddb, \"" + root +
                            "a/prio/10/set/0/auto_mod\", 0, null, *)"));
}

// A set node has its map as the sixth component of its name and its priority as the eighth.
TEST_F(PreferredInterface, BehindANodeWithATooShortNameIsAnError)
{
    for (const char *name :
         {"/ov/tunneld/route_map/config/map", "/ov/tunneld/route_map/config/map/a",
          "/ov/tunneld/route_map/config/map/a/prio"}) {
        forget_calls();
        planted().matching_names = {name};
        EXPECT_EQ(is_used(), "14001 no");
        EXPECT_THAT(log_lines(),
                    ElementsAre(line_of("md_preferred_if_is_used_in_rmap", "Unexpected NULL")));
        EXPECT_EQ(num_calls(Operation::bail_debug), 1U);
    }
}

TEST_F(PreferredInterface, BehindANodeWithoutPartsIsAnError)
{
    set_mode("a/prio/10", "preferred-if");
    arm({.operation = Operation::bn_binding_name_to_parts, .way = FaultWay::without_object});
    EXPECT_EQ(is_used(), "14001 no");
    EXPECT_THAT(log_lines(),
                ElementsAre(line_of("md_preferred_if_is_used_in_rmap", "Unexpected NULL")));
    EXPECT_EQ(num_calls(Operation::bail_debug), 1U);
}

TEST_F(PreferredInterface, BehindANodeWithoutNameIsAnError)
{
    set_mode("a/prio/10", "preferred-if");
    planted().null_text_at_call = 1;
    EXPECT_EQ(is_used(), "14001 no");
    EXPECT_THAT(log_lines(),
                ElementsAre(line_of("md_preferred_if_is_used_in_rmap", "Unexpected NULL")));
    EXPECT_EQ(num_calls(Operation::bn_binding_name_to_parts), 0U);
}

TEST_F(PreferredInterface, IsFoundInMapsAndEntriesOfLongNames)
{
    for (const std::size_t size : {255U, 256U, 600U}) {
        const std::string map(size, 'm');
        const std::string priority(size, 'p');
        MapCommit commit;
        commit.set_both(root + map + "/prio/" + priority + "/set/0/auto_mod", "preferred-if");
        tbool found = false;
        EXPECT_EQ(in_library(md_preferred_if_is_used_in_rmap, nullptr, &commit.dbinfo, &found), 0);
        EXPECT_TRUE(found) << size;
        EXPECT_EQ(log_lines().back(),
                  gated_line(5, "Found preferred_if in " + map + ':' + priority + '.'));
    }
}

// Names go into paths as they are: a slash makes two levels of one name.
TEST_F(PreferredInterface, IsReadTwoLevelsDeepWhereAMapHasASlash)
{
    set_mode(written("m/n") + "/prio/10", "preferred-if");
    EXPECT_EQ(is_used(), "0 no");
    EXPECT_THAT(calls_of(Operation::mdb_get_node_value_tstr),
                ElementsAre(value_call("m/n/prio/10/set/0/auto_mod")));
    map_commit_.set_old(root + "m/n/prio/10/set/0/auto_mod", "preferred-if");
    EXPECT_EQ(is_used(), "0 yes");
    EXPECT_EQ(log_lines().back(), gated_line(5, "Found preferred_if in m/n:10."));
}

TEST_F(PreferredInterface, IsReadTwoLevelsDeepWhereAnEntryHasASlash)
{
    set_mode("m/prio/" + written("1/2"), "preferred-if");
    EXPECT_EQ(is_used(), "0 no");
    EXPECT_THAT(calls_of(Operation::mdb_get_node_value_tstr),
                ElementsAre(value_call("m/prio/1/2/set/0/auto_mod")));
}

TEST_F(PreferredInterface, IsSilentBelowTheThreshold)
{
    set_mode("a/prio/10", "preferred-if");
    host_.set_log_level(4);
    EXPECT_EQ(is_used(), "0 yes");
    EXPECT_THAT(log_lines(), IsEmpty());
}

class UsedVlan : public LibraryTest
{
  protected:
    static constexpr char function[] = "md_vlan_is_used_in_rmap";

    void set_interface(const std::string &entry, const std::string &interface)
    {
        map_commit_.set_both(root + entry + "/set/0/auto_prefif", interface);
    }
    int change(int change_type, const std::string &name)
    {
        MapChange change(change_type, name);
        return in_library(md_vlan_is_used_in_rmap, change.record(), &map_commit_.dbinfo);
    }
    int remove(const std::string &vlan)
    {
        return change(mdct_delete, "/ov/net/interface/config/bridge/br0/vlan/" + vlan);
    }
    static std::string path_line(const std::string &entry)
    {
        return debug_line("md_xmap_common", function,
                          "smprintf=" + root + entry + "/set/0/auto_prefif");
    }
    static std::string refusal(const std::string &vlan)
    {
        return "1 Cannot delete a vlan when used by a route-map preferred interface.\n"
               "  Please remove vlan " +
               vlan + " from associated route-map first.";
    }

    MapCommit map_commit_;
};

TEST_F(UsedVlan, IsNotRemoved)
{
    set_interface("a/prio/10", "vlan8");
    set_interface("a/prio/20", "vlan7");
    set_interface("b/prio/10", "vlan7");
    EXPECT_EQ(remove("vlan7"), 0);
    EXPECT_THAT(map_commit_.commit.refusals, ElementsAre(refusal("vlan7")));
    EXPECT_THAT(log_lines(), ElementsAre(gated_line(5, "Checking 3 rmaps entries for VLAN vlan7."),
                                         path_line("a/prio/10"), path_line("a/prio/20"),
                                         gated_line(5, "Found VLAN vlan7 in a:20.")));
    EXPECT_THAT(calls_of(Operation::mdb_get_matching_tstr_array), ElementsAre(set_nodes_call));
    EXPECT_THAT(calls_of(Operation::mdb_get_node_value_tstr),
                ElementsAre(value_call("a/prio/10/set/0/auto_prefif"),
                            value_call("a/prio/20/set/0/auto_prefif")));
    EXPECT_EQ(num_calls(Operation::md_commit_set_return_status_msg), 1U);
}

TEST_F(UsedVlan, IsToldFromOthersByItsWholeNameWithCase)
{
    set_interface("a/prio/10", "vlan7");
    for (const char *vlan : {"vlan70", "vlan", "VLAN7", "vlan7 "}) {
        EXPECT_EQ(remove(vlan), 0);
        EXPECT_THAT(map_commit_.commit.refusals, IsEmpty()) << vlan;
    }
}

TEST_F(UsedVlan, IsRemovedWithoutRouteMaps)
{
    EXPECT_EQ(remove("vlan7"), 0);
    EXPECT_THAT(map_commit_.commit.refusals, IsEmpty());
    EXPECT_THAT(log_lines(),
                ElementsAre(gated_line(5, "Checking 0 rmaps entries for VLAN vlan7.")));
}

TEST_F(UsedVlan, IsRemovedWhenTheListDoesNotCome)
{
    set_interface("a/prio/10", "vlan7");
    arm({.operation = Operation::mdb_get_matching_tstr_array, .way = FaultWay::without_object});
    EXPECT_EQ(remove("vlan7"), 0);
    EXPECT_THAT(map_commit_.commit.refusals, IsEmpty());
}

TEST_F(UsedVlan, MayBeAddedAndChangedWithoutAnythingBeingRead)
{
    set_interface("a/prio/10", "vlan7");
    for (const int change_type : std::initializer_list<int>{mdct_add, mdct_modify, 0, 4}) {
        EXPECT_EQ(change(change_type, "/a/b/c/d/e/f/g/vlan7"), 0);
        EXPECT_EQ(change(change_type, "/too/short"), 0);
    }
    EXPECT_THAT(map_commit_.commit.refusals, IsEmpty());
    EXPECT_THAT(log_lines(), IsEmpty());
    EXPECT_EQ(num_calls(Operation::mdb_get_matching_tstr_array), 0U);
    EXPECT_EQ(num_calls(Operation::tstr_array_get_str_quick), 0U);
}

TEST_F(UsedVlan, IsReadAsItWasInTheEntriesThatAreToBe)
{
    map_commit_.set_new(root + "added/prio/10/set/0/auto_prefif", "vlan7");
    map_commit_.set_old(root + "gone/prio/10/set/0/auto_prefif", "vlan7");
    EXPECT_EQ(remove("vlan7"), 0);
    EXPECT_THAT(map_commit_.commit.refusals, IsEmpty());

    map_commit_.set_new(root + "gone/prio/10/set/0/auto_prefif", "vlan8");
    EXPECT_EQ(remove("vlan7"), 0);
    EXPECT_THAT(map_commit_.commit.refusals, ElementsAre(refusal("vlan7")));
}

TEST_F(UsedVlan, IsTheEighthComponentWhateverStandsBehindIt)
{
    set_interface("a/prio/10", "vlan7");
    EXPECT_EQ(change(mdct_delete, "/a/b/c/d/e/f/g/vlan7/below"), 0);
    EXPECT_THAT(map_commit_.commit.refusals, ElementsAre(refusal("vlan7")));
}

TEST_F(UsedVlan, OfATooShortNameIsAnError)
{
    EXPECT_EQ(change(mdct_delete, "/a/b/c/d/e/f/vlan7"), 14001);
    EXPECT_THAT(log_lines(), ElementsAre(line_of(function, "Unexpected NULL")));
    EXPECT_EQ(num_calls(Operation::bail_debug), 1U);
    EXPECT_EQ(num_calls(Operation::mdb_get_matching_tstr_array), 0U);
}

TEST_F(UsedVlan, BehindANodeWithATooShortNameIsAnError)
{
    planted().matching_names = {"/ov/tunneld/route_map/config/map/a/prio"};
    EXPECT_EQ(remove("vlan7"), 14001);
    EXPECT_THAT(log_lines(), ElementsAre(gated_line(5, "Checking 1 rmaps entries for VLAN vlan7."),
                                         line_of(function, "Unexpected NULL")));
    EXPECT_EQ(num_calls(Operation::bail_debug), 1U);
    EXPECT_THAT(map_commit_.commit.refusals, IsEmpty());
}

// The first text that is asked for is the VLAN's name.
TEST_F(UsedVlan, BehindANodeWithoutNameIsAnError)
{
    set_interface("a/prio/10", "vlan7");
    planted().null_text_at_call = 2;
    EXPECT_EQ(remove("vlan7"), 14001);
    EXPECT_THAT(log_lines(), ElementsAre(gated_line(5, "Checking 1 rmaps entries for VLAN vlan7."),
                                         line_of(function, "Unexpected NULL")));
    EXPECT_EQ(num_calls(Operation::bn_binding_name_to_parts), 0U);
    EXPECT_THAT(map_commit_.commit.refusals, IsEmpty());
}

TEST_F(UsedVlan, OfALongNameIsCutAt255Characters)
{
    const std::string longest(255, 'v');
    set_interface("a/prio/10", longest);
    EXPECT_EQ(remove(std::string(600, 'v')), 0);
    EXPECT_THAT(map_commit_.commit.refusals, ElementsAre(refusal(longest)));
    EXPECT_EQ(log_lines().front(),
              gated_line(5, "Checking 1 rmaps entries for VLAN " + longest + "."));

    map_commit_.commit.refusals.clear();
    set_interface("a/prio/10", longest + 'v');
    EXPECT_EQ(remove(longest + 'v'), 0);
    EXPECT_THAT(map_commit_.commit.refusals, IsEmpty());
}

TEST_F(UsedVlan, WithASlashInItsNameIsLikeAnyOther)
{
    set_interface("a/prio/10", "v/7");
    EXPECT_EQ(remove(written("v/7")), 0);
    EXPECT_THAT(map_commit_.commit.refusals, ElementsAre(refusal("v/7")));
}

TEST_F(UsedVlan, IsReadTwoLevelsDeepWhereAMapHasASlash)
{
    set_interface(written("m/n") + "/prio/10", "vlan7");
    EXPECT_EQ(remove("vlan7"), 0);
    EXPECT_THAT(map_commit_.commit.refusals, IsEmpty());
    EXPECT_THAT(calls_of(Operation::mdb_get_node_value_tstr),
                ElementsAre(value_call("m/n/prio/10/set/0/auto_prefif")));
    map_commit_.set_old(root + "m/n/prio/10/set/0/auto_prefif", "vlan7");
    EXPECT_EQ(remove("vlan7"), 0);
    EXPECT_THAT(map_commit_.commit.refusals, ElementsAre(refusal("vlan7")));
    EXPECT_EQ(log_lines().back(), gated_line(5, "Found VLAN vlan7 in m/n:10."));
}

TEST_F(UsedVlan, IsFoundInMapsAndEntriesOfLongNames)
{
    for (const std::size_t size : {255U, 256U, 600U}) {
        MapCommit commit;
        commit.set_both(root + std::string(size, 'm') + "/prio/" + std::string(size, 'p') +
                            "/set/0/auto_prefif",
                        "vlan7");
        MapChange removal(mdct_delete, "/a/b/c/d/e/f/g/vlan7");
        EXPECT_EQ(in_library(md_vlan_is_used_in_rmap, removal.record(), &commit.dbinfo), 0);
        EXPECT_THAT(commit.commit.refusals, ElementsAre(refusal("vlan7"))) << size;
    }
}

TEST_F(UsedVlan, WithPercentSignsStandsInTheMessageAsItIs)
{
    set_interface("a/prio/10", "%s%n");
    EXPECT_EQ(remove("%s%n"), 0);
    EXPECT_THAT(map_commit_.commit.refusals, ElementsAre(refusal("%s%n")));
}

TEST_F(UsedVlan, ThatCannotBeRefusedPassesUpTheCode)
{
    set_interface("a/prio/10", "vlan7");
    arm({.operation = Operation::md_commit_set_return_status_msg, .code = 14002});
    EXPECT_EQ(remove("vlan7"), 14002);
    EXPECT_EQ(log_lines().back(),
              line_of(function, "Error code 14002 (assertion failed) returned"));
}

TEST_F(UsedVlan, EndsAtTheFirstFailedRead)
{
    set_interface("a/prio/10", "vlan8");
    set_interface("a/prio/20", "vlan7");
    arm({.operation = Operation::mdb_get_node_value_tstr, .code = 14120});
    EXPECT_EQ(remove("vlan7"), 14120);
    EXPECT_THAT(map_commit_.commit.refusals, IsEmpty());
    EXPECT_EQ(num_calls(Operation::mdb_get_node_value_tstr), 1U);
    EXPECT_EQ(num_calls(Operation::bail_quiet_debug), 1U);
}

TEST_F(UsedVlan, OfNothingIsAnError)
{
    MapChange removal(mdct_delete, "/a/b/c/d/e/f/g/vlan7");
    EXPECT_EQ(in_library(md_vlan_is_used_in_rmap, nullptr, &map_commit_.dbinfo), 14001);
    EXPECT_EQ(in_library(md_vlan_is_used_in_rmap, removal.record(), nullptr), 14001);
    EXPECT_THAT(log_lines(), ElementsAre(line_of(function, "Unexpected NULL"),
                                         line_of(function, "Unexpected NULL")));
}

} // namespace
