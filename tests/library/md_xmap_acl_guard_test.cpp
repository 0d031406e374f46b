// The guard that keeps an ACL while an entry of a map names it.
#include "orvale/md_xmap_common.h"
#include "tests/library/library_test.h"
#include "tests/library/map_changes.h"
#include "tests/library/map_kinds.h"

#include <map>
#include <string>
#include <vector>

using namespace ovtest;
using testing::ElementsAre;
using testing::IsEmpty;

namespace
{

constexpr char function[] = "md_acl_not_used_in_map";
constexpr char removed_acl[] = "/ov/tunneld/acl/config/a1";

std::string line_of(const std::string &text)
{
    return error_line("md_xmap_common", function, text);
}

std::string path_line(const std::string &path)
{
    return debug_line("md_xmap_common", function, "smprintf=" + path);
}

// What a user is told, by the kind of map.
const std::map<int, std::string> refusals = {
    {MAP_TYPE_R, "1 Cannot delete an ACL when used by a route-map.\n"
                 "  Please remove ACL from associated route-map first."},
    {MAP_TYPE_O, "1 Cannot delete an ACL when used by a opt-map.\n"
                 "  Please remove ACL from associated opt-map first."},
    {MAP_TYPE_Q, "1 Cannot delete an ACL when used by a QoS-map.\n"
                 "  Please remove ACL from associated QoS-map first."},
    {MAP_TYPE_S, "1 Cannot delete an ACL when used by a Stat-map.\n"
                 "  Please remove ACL from associated Stat-map first."},
    {MAP_TYPE_N, "1 Cannot delete an ACL when used by a nat-map.\n"
                 "  Please remove ACL from associated nat-map first."},
    {MAP_TYPE_SEC, "1 Cannot delete an ACL when used by a sec-map.\n"
                   "  Please remove ACL from associated sec-map first."}};

class AclGuard : public LibraryTest
{
  protected:
    int check(int mtype, int change_type, const std::string &name)
    {
        MapChange change(change_type, name);
        return in_library(md_acl_not_used_in_map, change.record(), &commit_.dbinfo, mtype);
    }

    int remove_acl(const MapKind &kind, const std::string &acl = "a1")
    {
        return check(kind.mtype, mdct_delete, "/ov/tunneld/acl/config/" + acl);
    }

    void give_reference(const MapKind &kind, const std::string &map, const std::string &priority,
                        const std::string &acl = "a1")
    {
        set_node(commit_.olddb, kind.reference(acl, map, priority), priority, bt_uint32);
    }

    // The entry names the ACL before the commit and after it.
    void give_entry(const MapKind &kind, const std::string &map, const std::string &priority,
                    const std::string &acl = "a1")
    {
        give_reference(kind, map, priority, acl);
        commit_.set_both(kind.acl_node(map, priority), acl);
    }

    const std::vector<std::string> &refused() { return commit_.commit.refusals; }

    MapCommit commit_;
};

std::string use_line(const MapKind &kind, unsigned count, const std::string &acl = "a1")
{
    return gated_line(5, "ACL " + acl + " used by " + std::to_string(count) + ' ' + kind.user_name);
}

class AclGuardOfEveryKind : public AclGuard, public testing::WithParamInterface<MapKind>
{
  protected:
    // The trace of the search for references.
    std::string search_line(const std::string &acl = "a1") const
    {
        return path_line("/ov/tunneld/acl/config/" + acl + '/' + GetParam().key + "/*/prio/*");
    }
};

TEST_P(AclGuardOfEveryKind, AnAclThatAnEntryNamesIsKept)
{
    const MapKind &kind = GetParam();
    give_entry(kind, "m1", "10");
    EXPECT_EQ(remove_acl(kind), 0);
    EXPECT_THAT(refused(), ElementsAre(refusals.at(kind.mtype)));
    EXPECT_THAT(log_lines(),
                ElementsAre(search_line(), use_line(kind, 1), path_line(kind.acl_node("m1", "10")),
                            gated_line(6, "Ref <m1/10>, <a1/a1>")));
}

TEST_P(AclGuardOfEveryKind, TheHostIsAskedAsItExpects)
{
    const MapKind &kind = GetParam();
    give_entry(kind, "m1", "10");
    EXPECT_EQ(remove_acl(kind), 0);
    EXPECT_THAT(calls_of(Operation::mdb_get_matching_tstr_array),
                ElementsAre("mdb_get_matching_tstr_array(*, *, \"/ov/tunneld/acl/config/a1/" +
                            std::string(kind.key) + "/*/prio/*\", 4608, *)"));
    EXPECT_THAT(calls_of(Operation::bn_binding_name_to_parts),
                ElementsAre("bn_binding_name_to_parts(\"" + kind.reference("a1", "m1", "10") +
                            "\", *, 0)"));
    EXPECT_THAT(calls_of(Operation::mdb_get_node_value_tstr),
                ElementsAre("mdb_get_node_value_tstr(*, *, \"" + kind.acl_node("m1", "10") +
                            "\", 0, null, *)"));
    EXPECT_THAT(calls_of(Operation::ts_cmp_str), ElementsAre("ts_cmp_str(*, \"a1\", 0)"));
}

TEST_P(AclGuardOfEveryKind, EachDatabaseIsAskedForItsOwn)
{
    const MapKind &kind = GetParam();
    give_entry(kind, "m1", "10");
    commit_.name_handles();
    EXPECT_EQ(remove_acl(kind), 0);
    EXPECT_THAT(
        calls_of(Operation::mdb_get_matching_tstr_array),
        ElementsAre("mdb_get_matching_tstr_array(commit, olddb, \"/ov/tunneld/acl/config/a1/" +
                    std::string(kind.key) + "/*/prio/*\", 4608, *)"));
    EXPECT_THAT(calls_of(Operation::mdb_get_node_value_tstr),
                ElementsAre("mdb_get_node_value_tstr(commit, newdb, \"" +
                            kind.acl_node("m1", "10") + "\", 0, null, *)"));
}

// A reference has its map as the seventh component of its name and its priority as the ninth.
TEST_P(AclGuardOfEveryKind, AReferenceWithATooShortNameIsAnError)
{
    const MapKind &kind = GetParam();
    const std::string key_level = std::string(removed_acl) + '/' + kind.key;
    for (const std::string &name : {key_level, key_level + "/m1", key_level + "/m1/prio"}) {
        forget_calls();
        planted().matching_names = {name};
        EXPECT_EQ(remove_acl(kind), 14001);
        EXPECT_THAT(log_lines(),
                    ElementsAre(search_line(), use_line(kind, 1), line_of("Unexpected NULL")));
        EXPECT_EQ(num_calls(Operation::bail_debug), 1U);
        EXPECT_EQ(num_calls(Operation::mdb_get_node_value_tstr), 0U);
    }
    EXPECT_THAT(refused(), IsEmpty());
}

TEST_P(AclGuardOfEveryKind, AReferenceWithoutPartsIsAnError)
{
    const MapKind &kind = GetParam();
    give_entry(kind, "m1", "10");
    arm({.operation = Operation::bn_binding_name_to_parts, .way = FaultWay::without_object});
    EXPECT_EQ(remove_acl(kind), 14001);
    EXPECT_THAT(log_lines(),
                ElementsAre(search_line(), use_line(kind, 1), line_of("Unexpected NULL")));
    EXPECT_EQ(num_calls(Operation::bail_debug), 1U);
}

// The first text that is asked for is the ACL's name.
TEST_P(AclGuardOfEveryKind, AReferenceWithoutNameIsAnError)
{
    const MapKind &kind = GetParam();
    give_entry(kind, "m1", "10");
    planted().null_text_at_call = 2;
    EXPECT_EQ(remove_acl(kind), 14001);
    EXPECT_THAT(log_lines(),
                ElementsAre(search_line(), use_line(kind, 1), line_of("Unexpected NULL")));
    EXPECT_EQ(num_calls(Operation::bail_debug), 1U);
    EXPECT_EQ(num_calls(Operation::bn_binding_name_to_parts), 0U);
    EXPECT_THAT(refused(), IsEmpty());
}

TEST_P(AclGuardOfEveryKind, AnAclWithoutReferencesGoes)
{
    const MapKind &kind = GetParam();
    commit_.set_both(kind.acl_node("m1", "10"), "a1");
    EXPECT_EQ(remove_acl(kind), 0);
    EXPECT_THAT(refused(), IsEmpty());
    EXPECT_THAT(log_lines(), ElementsAre(search_line(), use_line(kind, 0)));
}

TEST_P(AclGuardOfEveryKind, AnAclGoesWithTheEntry)
{
    const MapKind &kind = GetParam();
    give_reference(kind, "m1", "10");
    commit_.set_old(kind.acl_node("m1", "10"), "a1");
    EXPECT_EQ(remove_acl(kind), 0);
    EXPECT_THAT(refused(), IsEmpty());
    EXPECT_THAT(log_lines(), ElementsAre(search_line(), use_line(kind, 1),
                                         path_line(kind.acl_node("m1", "10"))));
}

TEST_P(AclGuardOfEveryKind, AnAclGoesWhenTheEntryHasGotAnother)
{
    const MapKind &kind = GetParam();
    give_reference(kind, "m1", "10");
    commit_.set_old(kind.acl_node("m1", "10"), "a1");
    commit_.set_new(kind.acl_node("m1", "10"), "a2");
    EXPECT_EQ(remove_acl(kind), 0);
    EXPECT_THAT(refused(), IsEmpty());
    EXPECT_THAT(log_lines(),
                ElementsAre(search_line(), use_line(kind, 1), path_line(kind.acl_node("m1", "10")),
                            gated_line(6, "Ref <m1/10>, <a2/a1>")));
}

TEST_P(AclGuardOfEveryKind, AnotherSpellingIsAnotherAcl)
{
    const MapKind &kind = GetParam();
    give_reference(kind, "m1", "10");
    for (const char *value : {"A1", "a", "a11", "a1 ", ""}) {
        commit_.set_new(kind.acl_node("m1", "10"), value);
        EXPECT_EQ(remove_acl(kind), 0);
        EXPECT_EQ(last_log_line(), gated_line(6, "Ref <m1/10>, <" + std::string(value) + "/a1>"));
    }
    EXPECT_THAT(refused(), IsEmpty());
}

TEST_P(AclGuardOfEveryKind, ReferencesAreThoseOfTheDatabaseBefore)
{
    const MapKind &kind = GetParam();
    set_node(commit_.newdb, kind.reference("a1", "m1", "10"), "10", bt_uint32);
    commit_.set_new(kind.acl_node("m1", "10"), "a1");
    EXPECT_EQ(remove_acl(kind), 0);
    EXPECT_THAT(refused(), IsEmpty());
    EXPECT_EQ(last_log_line(), use_line(kind, 0));
}

TEST_P(AclGuardOfEveryKind, EntriesAreThoseOfTheProposedDatabase)
{
    const MapKind &kind = GetParam();
    give_reference(kind, "m1", "10");
    commit_.set_old(kind.acl_node("m1", "10"), "a2");
    commit_.set_new(kind.acl_node("m1", "10"), "a1");
    EXPECT_EQ(remove_acl(kind), 0);
    EXPECT_EQ(refused().size(), 1U);
}

TEST_P(AclGuardOfEveryKind, TheFirstEntryThatNamesItEndsTheSearch)
{
    const MapKind &kind = GetParam();
    give_reference(kind, "m1", "10");
    commit_.set_new(kind.acl_node("m1", "10"), "a2");
    give_entry(kind, "m1", "20");
    give_entry(kind, "m1", "100");
    give_entry(kind, "m2", "5");
    EXPECT_EQ(remove_acl(kind), 0);
    EXPECT_EQ(refused().size(), 1U);
    EXPECT_THAT(log_lines(),
                ElementsAre(search_line(), use_line(kind, 4), path_line(kind.acl_node("m1", "10")),
                            gated_line(6, "Ref <m1/10>, <a2/a1>"),
                            path_line(kind.acl_node("m1", "20")),
                            gated_line(6, "Ref <m1/20>, <a1/a1>")));
}

TEST_P(AclGuardOfEveryKind, EachKindOfMapIsAskedForItself)
{
    for (const MapKind &other : map_kinds()) {
        if (other.mtype != GetParam().mtype) {
            give_entry(other, "m1", "10");
        }
    }
    give_entry(GetParam(), "m1", "10", "a2");
    EXPECT_EQ(remove_acl(GetParam()), 0);
    EXPECT_THAT(refused(), IsEmpty());
    EXPECT_EQ(last_log_line(), use_line(GetParam(), 0));
}

TEST_P(AclGuardOfEveryKind, OtherChangesAreNoneOfItsBusiness)
{
    const MapKind &kind = GetParam();
    give_entry(kind, "m1", "10");
    for (const int change_type : std::vector<int>{mdct_add, mdct_modify, 0, 4}) {
        EXPECT_EQ(check(kind.mtype, change_type, removed_acl), 0);
    }
    for (const char *name : {"/ov/tunneld/acl/config", "/ov/tunneld/acl/config/a1/rmap",
                             "/ov/tunneld/acl/config/a1/prio/10", "/ov/tunneld/acl/other/a1"}) {
        EXPECT_EQ(check(kind.mtype, mdct_delete, name), 0) << name;
    }
    EXPECT_THAT(refused(), IsEmpty());
    EXPECT_THAT(log_lines(), IsEmpty());
    EXPECT_EQ(num_calls(Operation::mdb_get_matching_tstr_array), 0U);
}

// Of the name, 255 characters count.
TEST_P(AclGuardOfEveryKind, ALongNameIsCut)
{
    const MapKind &kind = GetParam();
    const std::string fits(255, 'a');
    const std::string longer = fits + 'x';
    give_entry(kind, "m1", "10", longer);
    EXPECT_EQ(remove_acl(kind, longer), 0);
    EXPECT_THAT(refused(), IsEmpty());
    EXPECT_THAT(log_lines(), ElementsAre(search_line(fits), use_line(kind, 0, fits)));
    forget_calls();
    give_entry(kind, "m1", "10", fits);
    EXPECT_EQ(remove_acl(kind, fits), 0);
    EXPECT_EQ(refused().size(), 1U);
    EXPECT_EQ(remove_acl(kind, longer), 0);
    EXPECT_EQ(refused().size(), 2U);
    EXPECT_EQ(remove_acl(kind, std::string(600, 'a')), 0);
    EXPECT_EQ(refused().size(), 3U);
    EXPECT_EQ(last_log_line(), gated_line(6, "Ref <m1/10>, <" + fits + '/' + fits + '>'));
}

TEST_P(AclGuardOfEveryKind, LongNamesOfMapsAndEntriesAreKeptWhole)
{
    const MapKind &kind = GetParam();
    for (const std::size_t size : {255U, 256U, 600U}) {
        const std::string map(size, 'm');
        const std::string priority = std::string(size - 2, '0') + "10";
        const std::string acl = "a" + std::to_string(size);
        set_node(commit_.olddb, kind.reference(acl, map, priority), "10", bt_uint32);
        commit_.set_new(kind.acl_node(map, priority), acl);
        forget_calls();
        EXPECT_EQ(remove_acl(kind, acl), 0);
        EXPECT_THAT(refused(), ElementsAre(refusals.at(kind.mtype)));
        EXPECT_EQ(log_line(2), path_line(kind.acl_node(map, priority)));
        commit_.commit.refusals.clear();
    }
}

// Names go into paths as they are: a slash makes two levels of one name, and the parts of a
// reference stand one further on.
TEST_P(AclGuardOfEveryKind, AnAclWithASlashInItsNameIsNotFoundInEntries)
{
    const MapKind &kind = GetParam();
    give_entry(kind, "m1", "10", "a/b");
    EXPECT_EQ(remove_acl(kind, written("a/b")), 0);
    EXPECT_THAT(refused(), IsEmpty());
    EXPECT_THAT(log_lines(), ElementsAre(search_line("a/b"), use_line(kind, 1, "a/b"),
                                         path_line(kind.acl_node(kind.key, "prio"))));
}

TEST_P(AclGuardOfEveryKind, ANameThatMakesNoPathIsTheHostsCode)
{
    const MapKind &kind = GetParam();
    EXPECT_EQ(remove_acl(kind, written("a\\b")), 14009);
    EXPECT_THAT(log_lines(), ElementsAre(search_line("a\\b"),
                                         line_of("Error code 14009 (invalid path name) returned")));
}

TEST_P(AclGuardOfEveryKind, AMapWithASlashInItsNameIsLookedUpTwoLevelsDeep)
{
    const MapKind &kind = GetParam();
    give_reference(kind, written("m/n"), "10");
    commit_.set_new(kind.acl_node(written("m/n"), "10"), "a1");
    EXPECT_EQ(remove_acl(kind), 0);
    EXPECT_THAT(refused(), IsEmpty());
    EXPECT_EQ(last_log_line(), path_line(kind.acl_node("m/n", "10")));
}

TEST_P(AclGuardOfEveryKind, AnEntryWithASlashInItsNameIsLookedUpTwoLevelsDeep)
{
    const MapKind &kind = GetParam();
    set_node(commit_.olddb, kind.reference("a1", "m1", written("1/2")), "10", bt_uint32);
    commit_.set_new(kind.acl_node("m1", written("1/2")), "a1");
    EXPECT_EQ(remove_acl(kind), 0);
    EXPECT_THAT(refused(), IsEmpty());
    EXPECT_EQ(last_log_line(), path_line(kind.acl_node("m1", "1/2")));
}

TEST_P(AclGuardOfEveryKind, WithoutAListThereAreNoReferences)
{
    const MapKind &kind = GetParam();
    give_entry(kind, "m1", "10");
    arm({.operation = Operation::mdb_get_matching_tstr_array, .way = FaultWay::without_object});
    EXPECT_EQ(remove_acl(kind), 0);
    EXPECT_THAT(refused(), IsEmpty());
    EXPECT_THAT(log_lines(), ElementsAre(search_line(), use_line(kind, 0)));
}

TEST_P(AclGuardOfEveryKind, ARefusalThatCannotBeReportedIsAnError)
{
    const MapKind &kind = GetParam();
    give_entry(kind, "m1", "10");
    arm({.operation = Operation::md_commit_set_return_status_msg, .code = 14002});
    EXPECT_EQ(remove_acl(kind), 14002);
    EXPECT_EQ(last_log_line(), line_of("Error code 14002 (assertion failed) returned"));
    forget_calls();
    arm({.operation = Operation::md_commit_set_return_status_msg, .code = 14120});
    EXPECT_EQ(remove_acl(kind), 14120);
    EXPECT_EQ(last_log_line(), gated_line(6, "Ref <m1/10>, <a1/a1>"));
}

TEST_P(AclGuardOfEveryKind, LinesAreWrittenFromTheirLevelsOn)
{
    const MapKind &kind = GetParam();
    give_entry(kind, "m1", "10");
    host_.set_log_level(6);
    EXPECT_EQ(remove_acl(kind), 0);
    EXPECT_THAT(log_lines(), ElementsAre(use_line(kind, 1), gated_line(6, "Ref <m1/10>, <a1/a1>")));
    forget_calls();
    host_.set_log_level(5);
    EXPECT_EQ(remove_acl(kind), 0);
    EXPECT_THAT(log_lines(), ElementsAre(use_line(kind, 1)));
    forget_calls();
    host_.set_log_level(4);
    EXPECT_EQ(remove_acl(kind), 0);
    EXPECT_THAT(log_lines(), IsEmpty());
    EXPECT_EQ(refused().size(), 3U);
}

TEST_P(AclGuardOfEveryKind, NothingIsWritten)
{
    const MapKind &kind = GetParam();
    give_entry(kind, "m1", "10");
    const std::vector<std::string> before = nodes(commit_.newdb, "/");
    EXPECT_EQ(remove_acl(kind), 0);
    EXPECT_EQ(nodes(commit_.newdb, "/"), before);
}

INSTANTIATE_TEST_SUITE_P(All, AclGuardOfEveryKind, testing::ValuesIn(map_kinds()),
                         [](const auto &about) { return std::string(about.param.name); });

TEST_F(AclGuard, ARouteMapEntryKeepsItsAcl)
{
    set_node(commit_.olddb, "/ov/tunneld/acl/config/a1/rmap/m1/prio/10", "10", bt_uint32);
    commit_.set_new("/ov/tunneld/route_map/config/map/m1/prio/10/match/0/acl", "a1");
    EXPECT_EQ(check(MAP_TYPE_R, mdct_delete, "/ov/tunneld/acl/config/a1"), 0);
    EXPECT_THAT(refused(), ElementsAre(refusals.at(MAP_TYPE_R)));
}

TEST_F(AclGuard, ASecurityMapEntryIsReadBelowMap1)
{
    set_node(commit_.olddb, "/ov/tunneld/acl/config/a1/secmap/z1/prio/5", "5", bt_uint32);
    commit_.set_new("/ov/tunneld/sec_map/config/map/map2/z1/prio/5/match/acl", "a1");
    EXPECT_EQ(check(MAP_TYPE_SEC, mdct_delete, "/ov/tunneld/acl/config/a1"), 0);
    EXPECT_THAT(refused(), IsEmpty());
    commit_.set_new("/ov/tunneld/sec_map/config/map/map1/z1/prio/5/match/acl", "a1");
    EXPECT_EQ(check(MAP_TYPE_SEC, mdct_delete, "/ov/tunneld/acl/config/a1"), 0);
    EXPECT_THAT(refused(), ElementsAre(refusals.at(MAP_TYPE_SEC)));
}

TEST_F(AclGuard, UnknownKindsKeepNone)
{
    for (const int mtype : unknown_types()) {
        forget_calls();
        give_entry(route_map, "m1", "10");
        EXPECT_EQ(check(mtype, mdct_delete, removed_acl), 0) << mtype;
        EXPECT_THAT(log_lines(), ElementsAre(gated_line(3, "UNKNOWN map type")));
        EXPECT_EQ(num_calls(Operation::mdb_get_matching_tstr_array), 0U);
    }
    EXPECT_THAT(refused(), IsEmpty());
    host_.set_log_level(2);
    forget_calls();
    EXPECT_EQ(check(1000, mdct_delete, removed_acl), 0);
    EXPECT_THAT(log_lines(), IsEmpty());
}

TEST_F(AclGuard, UnknownKindsAreToldOnlyWhereAnAclGoes)
{
    EXPECT_EQ(check(1000, mdct_modify, removed_acl), 0);
    EXPECT_EQ(check(1000, mdct_delete, "/ov/tunneld/acl/config/a1/rmap"), 0);
    EXPECT_THAT(log_lines(), IsEmpty());
}

TEST_F(AclGuard, NullArgumentsAreRefused)
{
    MapChange change(mdct_delete, removed_acl);
    EXPECT_EQ(in_library(md_acl_not_used_in_map, nullptr, &commit_.dbinfo, 0), 14001);
    EXPECT_EQ(in_library(md_acl_not_used_in_map, change.record(), nullptr, 0), 14001);
    EXPECT_THAT(log_lines(), ElementsAre(line_of("Unexpected NULL"), line_of("Unexpected NULL")));
    EXPECT_EQ(num_calls(Operation::bail_debug), 2U);
}

// Which names match is the host's to say.
TEST_F(AclGuard, AnAclWithATooShortNameIsAnError)
{
    planted().every_name_matches = true;
    EXPECT_EQ(check(MAP_TYPE_R, mdct_delete, "/ov/tunneld/acl/config"), 14001);
    EXPECT_THAT(log_lines(), ElementsAre(line_of("Unexpected NULL")));
    EXPECT_EQ(num_calls(Operation::bail_debug), 1U);
    EXPECT_EQ(num_calls(Operation::mdb_get_matching_tstr_array), 0U);
}

TEST_F(AclGuard, WithoutADatabaseTheHostsCodeIsPassedUp)
{
    give_entry(route_map, "m1", "10");
    commit_.dbinfo.newdb = nullptr;
    EXPECT_EQ(remove_acl(route_map), 14001);
    commit_.dbinfo.olddb = nullptr;
    EXPECT_EQ(remove_acl(route_map), 14001);
    EXPECT_EQ(last_log_line(), line_of("Error code 14001 (unexpected NULL) returned"));
    EXPECT_THAT(refused(), IsEmpty());
}

} // namespace
