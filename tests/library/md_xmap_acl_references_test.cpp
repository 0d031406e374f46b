// The references from ACLs to the map entries that name them.
#include "orvale/md_xmap_common.h"
#include "tests/library/library_test.h"
#include "tests/library/map_changes.h"
#include "tests/library/map_kinds.h"

#include <optional>
#include <string>
#include <vector>

using namespace ovtest;
using testing::ElementsAre;
using testing::IsEmpty;

namespace
{

constexpr char function[] = "md_acl_ref_processing";
constexpr char acl_root[] = "/ov/tunneld/acl/config";

std::string line_of(const std::string &text)
{
    return error_line("md_xmap_common", function, text);
}

std::string path_line(const std::string &path)
{
    return debug_line("md_xmap_common", function, "smprintf=" + path);
}

std::string info(const std::string &text)
{
    return gated_line(6, text);
}

const std::string modify_line = info("In map Apply ACL modify");

class References : public LibraryTest
{
  protected:
    int process(int mtype, int change_type, const std::string &name,
                const std::optional<std::string> &value = {})
    {
        MapChange change(change_type, name, value);
        return in_library(md_acl_ref_processing, change.record(), &commit_.dbinfo, mtype);
    }

    int set_acl(const MapKind &kind, const std::string &map, const std::string &priority,
                const std::string &acl)
    {
        return process(kind.mtype, mdct_modify, kind.acl_node(map, priority), acl);
    }

    int remove_entry(const MapKind &kind, const std::string &map, const std::string &priority)
    {
        return process(kind.mtype, mdct_delete, kind.entry(map, priority));
    }

    // The entry names the ACL before the commit, and has its reference.
    void give_acl(const MapKind &kind, const std::string &map, const std::string &priority,
                  const std::string &acl)
    {
        commit_.set_old(kind.acl_node(map, priority), acl);
        give_reference(kind, map, priority, acl);
    }
    void give_reference(const MapKind &kind, const std::string &map, const std::string &priority,
                        const std::string &acl)
    {
        set_node(commit_.olddb, kind.reference(acl, map, priority), priority, bt_uint32);
        set_node(commit_.newdb, kind.reference(acl, map, priority), priority, bt_uint32);
    }

    std::vector<std::string> references() { return nodes(commit_.newdb, acl_root); }

    MapCommit commit_;
};

std::string reference_node(const MapKind &kind, const std::string &map, const std::string &priority,
                           const std::string &acl)
{
    return kind.reference(acl, map, priority) + " uint32 " + priority;
}

class ReferencesOfEveryKind : public References, public testing::WithParamInterface<MapKind>
{
  protected:
    // Two levels above the reference of an ACL to map m1: "ROOT/ACL/KEY/m1".
    std::string map_level(const std::string &acl) const
    {
        return std::string(acl_root) + '/' + acl + '/' + GetParam().key + "/m1";
    }
};

TEST_P(ReferencesOfEveryKind, AnEntryThatGetsAnAclIsReferredTo)
{
    const MapKind &kind = GetParam();
    EXPECT_EQ(process(kind.mtype, mdct_add, kind.acl_node("m1", "10"), "a1"), 0);
    EXPECT_THAT(references(), ElementsAre(reference_node(kind, "m1", "10", "a1")));
    EXPECT_THAT(log_lines(),
                ElementsAre(modify_line, path_line(kind.acl_node("m1", "10")),
                            info("refcheck: acl=a1, m1-10, old=(null)"),
                            path_line(kind.reference("a1", "m1", "10")),
                            info("Creating ACL map entry " + kind.reference("a1", "m1", "10"))));
}

TEST_P(ReferencesOfEveryKind, TheHostIsAskedAsItExpects)
{
    const MapKind &kind = GetParam();
    give_acl(kind, "m1", "10", "a1");
    EXPECT_EQ(set_acl(kind, "m1", "10", "a2"), 0);
    EXPECT_THAT(calls_of(Operation::bn_attrib_array_get_attrib_tstr),
                ElementsAre("bn_attrib_array_get_attrib_tstr(*, 1, *)"));
    EXPECT_THAT(
        calls_of(Operation::mdb_get_node_binding),
        ElementsAre("mdb_get_node_binding(*, *, \"" + kind.acl_node("m1", "10") + "\", 0, *)"));
    EXPECT_THAT(calls_of(Operation::bn_binding_get_str),
                ElementsAre("bn_binding_get_str(*, 1, 101, 0, *)"));
    EXPECT_THAT(calls_of(Operation::bn_binding_new_str),
                ElementsAre("bn_binding_new_str(*, \"" + kind.reference("a2", "m1", "10") +
                            "\", 1, 5, 0, \"10\")"));
    EXPECT_THAT(
        calls_of(Operation::mdb_get_tstr_array),
        ElementsAre("mdb_get_tstr_array(*, *, \"" + map_level("a1") + "/prio\", 0, 0, 0, *)"));
    EXPECT_THAT(calls_of(Operation::bn_binding_new_named),
                ElementsAre("bn_binding_new_named(*, \"" + map_level("a1") + "\")"));
    EXPECT_THAT(
        calls_of(Operation::mdb_set_node_binding),
        ElementsAre("mdb_set_node_binding(*, *, 4, 0, *)", "mdb_set_node_binding(*, *, 2, 0, *)"));
}

TEST_P(ReferencesOfEveryKind, EachDatabaseIsAskedForItsOwn)
{
    const MapKind &kind = GetParam();
    give_acl(kind, "m1", "10", "a1");
    commit_.name_handles();
    EXPECT_EQ(set_acl(kind, "m1", "10", "a2"), 0);
    EXPECT_THAT(calls_of(Operation::mdb_get_node_binding),
                ElementsAre("mdb_get_node_binding(commit, olddb, \"" + kind.acl_node("m1", "10") +
                            "\", 0, *)"));
    EXPECT_THAT(calls_of(Operation::mdb_get_tstr_array),
                ElementsAre("mdb_get_tstr_array(commit, newdb, \"" + map_level("a1") +
                            "/prio\", 0, 0, 0, *)"));
    EXPECT_THAT(calls_of(Operation::mdb_set_node_binding),
                ElementsAre("mdb_set_node_binding(commit, newdb, 4, 0, *)",
                            "mdb_set_node_binding(commit, newdb, 2, 0, *)"));
}

// Which names match is the host's to say. Map and priority are asked for behind the new ACL.
TEST_P(ReferencesOfEveryKind, ANodeWithATooShortNameIsAnError)
{
    const MapKind &kind = GetParam();
    const std::string root = kind.root;
    planted().every_name_matches = true;
    for (const std::string &name : {root, root + "/m1", root + "/m1/prio"}) {
        forget_calls();
        EXPECT_EQ(process(kind.mtype, mdct_modify, name, "a1"), 14001);
        EXPECT_THAT(log_lines(), ElementsAre(modify_line, line_of("Unexpected NULL")));
        EXPECT_EQ(num_calls(Operation::bn_attrib_array_get_attrib_tstr), 1U);
        forget_calls();
        EXPECT_EQ(process(kind.mtype, mdct_delete, name), 14001);
        EXPECT_THAT(log_lines(), ElementsAre(line_of("Unexpected NULL")));
        EXPECT_EQ(num_calls(Operation::bail_debug), 1U);
        EXPECT_EQ(num_calls(Operation::mdb_get_node_binding), 0U);
    }
    EXPECT_THAT(references(), IsEmpty());
}

TEST_P(ReferencesOfEveryKind, AnotherAclTakesTheReference)
{
    const MapKind &kind = GetParam();
    give_acl(kind, "m1", "10", "a1");
    EXPECT_EQ(set_acl(kind, "m1", "10", "a2"), 0);
    EXPECT_THAT(references(), ElementsAre(reference_node(kind, "m1", "10", "a2")));
    EXPECT_THAT(log_lines(),
                ElementsAre(modify_line, path_line(kind.acl_node("m1", "10")),
                            info("refcheck: acl=a2, m1-10, old=a1"),
                            path_line(kind.reference("a2", "m1", "10")),
                            info("Creating ACL map entry " + kind.reference("a2", "m1", "10")),
                            path_line(map_level("a1") + "/prio"), path_line(map_level("a1")),
                            info("Removing " + map_level("a1"))));
}

TEST_P(ReferencesOfEveryKind, OtherEntriesOfTheMapKeepTheirs)
{
    const MapKind &kind = GetParam();
    give_acl(kind, "m1", "10", "a1");
    give_acl(kind, "m1", "20", "a1");
    EXPECT_EQ(set_acl(kind, "m1", "10", "a2"), 0);
    EXPECT_THAT(references(), ElementsAre(reference_node(kind, "m1", "20", "a1"),
                                          reference_node(kind, "m1", "10", "a2")));
    const std::string old_reference = kind.reference("a1", "m1", "10");
    EXPECT_EQ(log_line(6), path_line(old_reference));
    EXPECT_EQ(log_line(7), info("Removing " + old_reference));
}

// The whole level of the map goes, with all that stands below it.
TEST_P(ReferencesOfEveryKind, TheLastOneOfAMapTakesTheMapsLevelWithIt)
{
    const MapKind &kind = GetParam();
    give_acl(kind, "m1", "10", "a1");
    commit_.set_new(map_level("a1") + "/comment", "x");
    commit_.set_new(map_level("a1") + "/prio", "x");
    EXPECT_EQ(set_acl(kind, "m1", "10", ""), 0);
    EXPECT_THAT(references(), IsEmpty());
}

// However few, the one that is left may be that of another entry.
TEST_P(ReferencesOfEveryKind, TheMapsLevelGoesEvenWhenTheLastOneIsNotTheEntrys)
{
    const MapKind &kind = GetParam();
    commit_.set_old(kind.acl_node("m1", "10"), "a1");
    give_reference(kind, "m1", "20", "a1");
    EXPECT_EQ(remove_entry(kind, "m1", "10"), 0);
    EXPECT_THAT(references(), IsEmpty());
}

TEST_P(ReferencesOfEveryKind, OtherMapsAndKindsAndTheAclItselfKeepTheirs)
{
    const MapKind &kind = GetParam();
    commit_.set_new(std::string(acl_root) + "/a1", "x");
    for (const MapKind &each : map_kinds()) {
        give_reference(each, "m1", "10", "a2");
        give_reference(each, "m2", "10", "a1");
        if (each.mtype != kind.mtype) {
            give_reference(each, "m1", "10", "a1");
        }
    }
    const std::vector<std::string> others = references();
    EXPECT_EQ(others.size(), 18U);
    give_acl(kind, "m1", "10", "a1");
    EXPECT_EQ(remove_entry(kind, "m1", "10"), 0);
    EXPECT_EQ(references(), others);
    EXPECT_EQ(last_log_line(), info("Removing " + map_level("a1")));
}

TEST_P(ReferencesOfEveryKind, TheyAreCountedInTheProposedDatabase)
{
    const MapKind &kind = GetParam();
    give_acl(kind, "m1", "10", "a1");
    set_node(commit_.olddb, kind.reference("a1", "m1", "20"), "20", bt_uint32);
    EXPECT_EQ(remove_entry(kind, "m1", "10"), 0);
    EXPECT_EQ(last_log_line(), info("Removing " + map_level("a1")));
    forget_calls();
    set_node(commit_.newdb, kind.reference("a1", "m1", "20"), "20", bt_uint32);
    set_node(commit_.newdb, kind.reference("a1", "m1", "30"), "30", bt_uint32);
    EXPECT_EQ(remove_entry(kind, "m1", "10"), 0);
    EXPECT_EQ(last_log_line(), info("Removing " + kind.reference("a1", "m1", "10")));
}

TEST_P(ReferencesOfEveryKind, AnEntryThatLosesItsAclLosesItsReference)
{
    const MapKind &kind = GetParam();
    give_acl(kind, "m1", "10", "a1");
    EXPECT_EQ(set_acl(kind, "m1", "10", ""), 0);
    EXPECT_THAT(references(), IsEmpty());
    EXPECT_THAT(log_lines(),
                ElementsAre(modify_line, path_line(kind.acl_node("m1", "10")),
                            info("refcheck: acl=, m1-10, old=a1"),
                            path_line(map_level("a1") + "/prio"), path_line(map_level("a1")),
                            info("Removing " + map_level("a1"))));
}

TEST_P(ReferencesOfEveryKind, AChangeWithoutNewAttributesIsWithoutAnAcl)
{
    const MapKind &kind = GetParam();
    give_acl(kind, "m1", "10", "a1");
    EXPECT_EQ(process(kind.mtype, mdct_modify, kind.acl_node("m1", "10")), 0);
    EXPECT_THAT(references(), IsEmpty());
    EXPECT_EQ(log_line(2), info("refcheck: acl=(null), m1-10, old=a1"));
}

TEST_P(ReferencesOfEveryKind, NoAclBeforeAndNoneAfterIsNothingToDo)
{
    const MapKind &kind = GetParam();
    EXPECT_EQ(process(kind.mtype, mdct_add, kind.acl_node("m1", "10"), ""), 0);
    EXPECT_EQ(process(kind.mtype, mdct_modify, kind.acl_node("m1", "10")), 0);
    commit_.set_old(kind.acl_node("m1", "10"), "");
    EXPECT_EQ(set_acl(kind, "m1", "10", ""), 0);
    EXPECT_THAT(log_lines(), ElementsAre(modify_line, path_line(kind.acl_node("m1", "10")),
                                         info("refcheck: acl=, m1-10, old=(null)"), modify_line,
                                         path_line(kind.acl_node("m1", "10")),
                                         info("refcheck: acl=(null), m1-10, old=(null)"),
                                         modify_line, path_line(kind.acl_node("m1", "10")),
                                         info("refcheck: acl=, m1-10, old=")));
    EXPECT_EQ(num_calls(Operation::mdb_get_tstr_array), 0U);
    EXPECT_EQ(num_calls(Operation::mdb_set_node_binding), 0U);
}

TEST_P(ReferencesOfEveryKind, AnEmptyAclBeforeHadNoReference)
{
    const MapKind &kind = GetParam();
    commit_.set_old(kind.acl_node("m1", "10"), "");
    EXPECT_EQ(set_acl(kind, "m1", "10", "a1"), 0);
    EXPECT_THAT(references(), ElementsAre(reference_node(kind, "m1", "10", "a1")));
    EXPECT_EQ(last_log_line(), info("Creating ACL map entry " + kind.reference("a1", "m1", "10")));
}

// The new reference is written before the old one is removed, and they are the same.
TEST_P(ReferencesOfEveryKind, AnAclThatIsSetToWhatItWasLosesItsReference)
{
    const MapKind &kind = GetParam();
    give_acl(kind, "m1", "10", "a1");
    EXPECT_EQ(set_acl(kind, "m1", "10", "a1"), 0);
    EXPECT_THAT(references(), IsEmpty());
    EXPECT_THAT(
        calls_of(Operation::mdb_set_node_binding),
        ElementsAre("mdb_set_node_binding(*, *, 4, 0, *)", "mdb_set_node_binding(*, *, 2, 0, *)"));
}

TEST_P(ReferencesOfEveryKind, TheOneJustWrittenIsCounted)
{
    const MapKind &kind = GetParam();
    commit_.set_old(kind.acl_node("m1", "10"), "a1");
    give_reference(kind, "m1", "20", "a1");
    EXPECT_EQ(set_acl(kind, "m1", "10", "a1"), 0);
    EXPECT_THAT(references(), ElementsAre(reference_node(kind, "m1", "20", "a1")));
    EXPECT_EQ(last_log_line(), info("Removing " + kind.reference("a1", "m1", "10")));
}

TEST_P(ReferencesOfEveryKind, ARemovedEntryLosesItsReference)
{
    const MapKind &kind = GetParam();
    give_acl(kind, "m1", "10", "a1");
    give_acl(kind, "m1", "20", "a1");
    EXPECT_EQ(remove_entry(kind, "m1", "10"), 0);
    EXPECT_THAT(references(), ElementsAre(reference_node(kind, "m1", "20", "a1")));
    EXPECT_THAT(log_lines(), ElementsAre(path_line(kind.acl_node("m1", "10")),
                                         path_line(map_level("a1") + "/prio"),
                                         path_line(kind.reference("a1", "m1", "10")),
                                         info("Removing " + kind.reference("a1", "m1", "10"))));
    EXPECT_EQ(num_calls(Operation::bn_attrib_array_get_attrib_tstr), 0U);
}

TEST_P(ReferencesOfEveryKind, ARemovedEntryWithoutAnAclHadNone)
{
    const MapKind &kind = GetParam();
    EXPECT_EQ(remove_entry(kind, "m1", "10"), 0);
    commit_.set_old(kind.acl_node("m1", "10"), "");
    EXPECT_EQ(remove_entry(kind, "m1", "10"), 0);
    EXPECT_THAT(log_lines(), ElementsAre(path_line(kind.acl_node("m1", "10")),
                                         path_line(kind.acl_node("m1", "10"))));
    EXPECT_EQ(num_calls(Operation::mdb_set_node_binding), 0U);
}

TEST_P(ReferencesOfEveryKind, AReferenceThatIsNotThereCanBeRemoved)
{
    const MapKind &kind = GetParam();
    commit_.set_old(kind.acl_node("m1", "10"), "a1");
    EXPECT_EQ(remove_entry(kind, "m1", "10"), 0);
    EXPECT_THAT(references(), IsEmpty());
    EXPECT_EQ(last_log_line(), info("Removing " + map_level("a1")));
}

TEST_P(ReferencesOfEveryKind, OtherRemovalsLeaveItAlone)
{
    const MapKind &kind = GetParam();
    give_acl(kind, "m1", "10", "a1");
    for (const std::string &name :
         {kind.acl_node("m1", "10"), kind.match_node("m1", "10"), kind.matchstr_node("m1", "10"),
          std::string(kind.root) + "/m1", std::string(kind.root) + "/m1/prio",
          std::string("/ov/tunneld")}) {
        EXPECT_EQ(process(kind.mtype, mdct_delete, name), 0) << name;
    }
    EXPECT_THAT(references(), ElementsAre(reference_node(kind, "m1", "10", "a1")));
    EXPECT_THAT(log_lines(), IsEmpty());
}

TEST_P(ReferencesOfEveryKind, OtherChangesLeaveItAlone)
{
    const MapKind &kind = GetParam();
    give_acl(kind, "m1", "10", "a1");
    for (const int change_type : {mdct_add, mdct_modify}) {
        for (const std::string &name :
             {kind.entry("m1", "10"), kind.matchstr_node("m1", "10"), kind.set_node("m1", "10"),
              kind.acl_node("m1", "10") + "/x", std::string("/ov")}) {
            EXPECT_EQ(process(kind.mtype, change_type, name, "a2"), 0) << name;
        }
    }
    for (const int change_type : {0, 4, -1}) {
        EXPECT_EQ(process(kind.mtype, change_type, kind.acl_node("m1", "10"), "a2"), 0);
        EXPECT_EQ(process(kind.mtype, change_type, kind.entry("m1", "10")), 0);
    }
    EXPECT_THAT(references(), ElementsAre(reference_node(kind, "m1", "10", "a1")));
    EXPECT_THAT(log_lines(), IsEmpty());
}

TEST_P(ReferencesOfEveryKind, EntriesOfOtherKindsAreNoneOfThisOnes)
{
    for (const MapKind &other : map_kinds()) {
        if (other.mtype != GetParam().mtype) {
            EXPECT_EQ(process(GetParam().mtype, mdct_add, other.acl_node("m1", "10"), "a1"), 0);
            EXPECT_EQ(process(GetParam().mtype, mdct_delete, other.entry("m1", "10")), 0);
        }
    }
    EXPECT_THAT(references(), IsEmpty());
    EXPECT_THAT(log_lines(), IsEmpty());
}

TEST_P(ReferencesOfEveryKind, TheDefaultEntryIsNeverReferredTo)
{
    const MapKind &kind = GetParam();
    give_acl(kind, "m1", "65535", "a1");
    EXPECT_EQ(set_acl(kind, "m1", "65535", "a2"), 0);
    EXPECT_EQ(set_acl(kind, "m1", "65535", ""), 0);
    EXPECT_THAT(log_lines(), ElementsAre(modify_line, modify_line));
    EXPECT_EQ(remove_entry(kind, "m1", "65535"), 0);
    EXPECT_EQ(log_lines().size(), 2U);
    EXPECT_THAT(references(), ElementsAre(reference_node(kind, "m1", "65535", "a1")));
    EXPECT_EQ(num_calls(Operation::smprintf), 0U);
}

// Only the text counts, not the number.
TEST_P(ReferencesOfEveryKind, AnEntryThatIsWrittenLikeTheDefaultOneIsAnother)
{
    const MapKind &kind = GetParam();
    EXPECT_EQ(set_acl(kind, "m1", "065535", "a1"), 0);
    EXPECT_EQ(set_acl(kind, "m1", "6553", "a1"), 0);
    EXPECT_EQ(references().size(), 2U);
}

TEST_P(ReferencesOfEveryKind, TheNewAclIsReadBeforeThePriorityIsLookedAt)
{
    const MapKind &kind = GetParam();
    arm({.operation = Operation::bn_attrib_array_get_attrib_tstr, .code = 14004});
    EXPECT_EQ(set_acl(kind, "m1", "65535", "a2"), 14004);
    EXPECT_THAT(log_lines(),
                ElementsAre(modify_line, line_of("Error code 14004 (item not found) returned")));
}

TEST_P(ReferencesOfEveryKind, AListOfReferencesThatIsNotThereIsEmpty)
{
    const MapKind &kind = GetParam();
    give_acl(kind, "m1", "10", "a1");
    give_acl(kind, "m1", "20", "a1");
    arm({.operation = Operation::mdb_get_tstr_array, .way = FaultWay::without_object});
    EXPECT_EQ(remove_entry(kind, "m1", "10"), 0);
    EXPECT_THAT(references(), IsEmpty());
    EXPECT_EQ(last_log_line(), info("Removing " + map_level("a1")));
}

TEST_P(ReferencesOfEveryKind, WhatWasWrittenBeforeAFailureStays)
{
    const MapKind &kind = GetParam();
    give_acl(kind, "m1", "10", "a1");
    arm({.operation = Operation::mdb_set_node_binding, .call = 2, .code = 14004});
    EXPECT_EQ(set_acl(kind, "m1", "10", "a2"), 14004);
    EXPECT_THAT(references(), ElementsAre(reference_node(kind, "m1", "10", "a1"),
                                          reference_node(kind, "m1", "10", "a2")));
    EXPECT_EQ(last_log_line(), line_of("Error code 14004 (item not found) returned"));
}

TEST_P(ReferencesOfEveryKind, AnAclOfAnotherTypeIsTheHostsCode)
{
    const MapKind &kind = GetParam();
    set_node(commit_.olddb, kind.acl_node("m1", "10"), "7", bt_uint32);
    EXPECT_EQ(set_acl(kind, "m1", "10", "a2"), 14020);
    EXPECT_THAT(references(), IsEmpty());
    EXPECT_EQ(last_log_line(), line_of("Error code 14020 (type conversion failed) returned"));
}

TEST_P(ReferencesOfEveryKind, APriorityThatIsNoNumberIsTheHostsCode)
{
    const MapKind &kind = GetParam();
    EXPECT_EQ(set_acl(kind, "m1", "ten", "a1"), 14020);
    EXPECT_THAT(references(), IsEmpty());
    EXPECT_EQ(last_log_line(), line_of("Error code 14020 (type conversion failed) returned"));
}

TEST_P(ReferencesOfEveryKind, ADatabaseThatCannotBeWrittenIsTheHostsCode)
{
    const MapKind &kind = GetParam();
    commit_.newdb.writable = false;
    EXPECT_EQ(set_acl(kind, "m1", "10", "a1"), 14002);
    EXPECT_EQ(last_log_line(), line_of("Error code 14002 (assertion failed) returned"));
}

TEST_P(ReferencesOfEveryKind, LongNamesAreKeptWhole)
{
    const MapKind &kind = GetParam();
    for (const std::size_t size : {255U, 256U, 600U}) {
        const std::string acl(size, 'a');
        const std::string map(size, 'm');
        EXPECT_EQ(set_acl(kind, map, "10", acl), 0);
        EXPECT_THAT(references(), ElementsAre(reference_node(kind, map, "10", acl)));
        commit_.set_old(kind.acl_node(map, "10"), acl);
        EXPECT_EQ(remove_entry(kind, map, "10"), 0);
        EXPECT_THAT(references(), IsEmpty());
    }
}

// Names go into paths as they are: a slash makes two levels of one name.
TEST_P(ReferencesOfEveryKind, ASlashInANameIsALevelMore)
{
    const MapKind &kind = GetParam();
    EXPECT_EQ(set_acl(kind, "m1", "10", "a/b"), 0);
    EXPECT_EQ(set_acl(kind, written("m/n"), "10", "a1"), 0);
    EXPECT_THAT(references(), ElementsAre(reference_node(kind, "m1", "10", "a/b"),
                                          reference_node(kind, "m/n", "10", "a1")));
}

TEST_P(ReferencesOfEveryKind, ANameThatMakesNoPathIsTheHostsCode)
{
    const MapKind &kind = GetParam();
    for (const char *acl : {"a\\b", "/a", "a/"}) {
        EXPECT_EQ(set_acl(kind, "m1", "10", acl), 14009) << acl;
        EXPECT_EQ(last_log_line(), line_of("Error code 14009 (invalid path name) returned"));
    }
    EXPECT_EQ(remove_entry(kind, written("m\\n"), "10"), 14009);
    EXPECT_THAT(references(), IsEmpty());
}

TEST_P(ReferencesOfEveryKind, TracesAndLinesAreWrittenFromTheirLevelsOn)
{
    const MapKind &kind = GetParam();
    host_.set_log_level(6);
    EXPECT_EQ(set_acl(kind, "m1", "10", "a1"), 0);
    EXPECT_THAT(log_lines(),
                ElementsAre(modify_line, info("refcheck: acl=a1, m1-10, old=(null)"),
                            info("Creating ACL map entry " + kind.reference("a1", "m1", "10"))));
    forget_calls();
    host_.set_log_level(5);
    EXPECT_EQ(set_acl(kind, "m1", "10", "a1"), 0);
    EXPECT_THAT(log_lines(), IsEmpty());
}

TEST_P(ReferencesOfEveryKind, NullArgumentsAreRefused)
{
    const MapKind &kind = GetParam();
    MapChange change(mdct_add, kind.acl_node("m1", "10"), "a1");
    MapChange removal(mdct_delete, kind.entry("m1", "10"));
    md_dbinfo without_newdb = commit_.dbinfo;
    without_newdb.newdb = nullptr;
    EXPECT_EQ(in_library(md_acl_ref_processing, nullptr, &commit_.dbinfo, kind.mtype), 14001);
    EXPECT_EQ(in_library(md_acl_ref_processing, change.record(), nullptr, kind.mtype), 14001);
    EXPECT_EQ(in_library(md_acl_ref_processing, change.record(), &without_newdb, kind.mtype),
              14001);
    EXPECT_EQ(in_library(md_acl_ref_processing, removal.record(), &without_newdb, kind.mtype),
              14001);
    const std::string line = line_of("Unexpected NULL");
    EXPECT_THAT(log_lines(), ElementsAre(line, line, line, line));
    EXPECT_EQ(num_calls(Operation::bail_debug), 4U);
}

TEST_P(ReferencesOfEveryKind, TheDatabaseBeforeIsNotWritten)
{
    const MapKind &kind = GetParam();
    give_acl(kind, "m1", "10", "a1");
    const std::vector<std::string> before = nodes(commit_.olddb, "/");
    EXPECT_EQ(set_acl(kind, "m1", "10", "a2"), 0);
    EXPECT_EQ(nodes(commit_.olddb, "/"), before);
}

std::string name_of(const testing::TestParamInfo<MapKind> &about)
{
    return about.param.name;
}

INSTANTIATE_TEST_SUITE_P(All, ReferencesOfEveryKind, testing::ValuesIn(map_kinds()), name_of);

class ReferencesByIndex : public ReferencesOfEveryKind
{
};

TEST_P(ReferencesByIndex, TheAclBeforeIsReadAtIndex0WhateverIndexIsChanged)
{
    const MapKind &kind = GetParam();
    give_acl(kind, "m1", "10", "a1");
    commit_.set_old(kind.entry("m1", "10") + "/match/1/acl", "a9");
    give_reference(kind, "m1", "10", "a9");
    EXPECT_EQ(process(kind.mtype, mdct_modify, kind.entry("m1", "10") + "/match/1/acl", "a2"), 0);
    EXPECT_EQ(log_line(1), path_line(kind.entry("m1", "10") + "/match/0/acl"));
    EXPECT_EQ(log_line(2), info("refcheck: acl=a2, m1-10, old=a1"));
    EXPECT_THAT(references(), ElementsAre(reference_node(kind, "m1", "10", "a2"),
                                          reference_node(kind, "m1", "10", "a9")));
}

TEST_P(ReferencesByIndex, AnAclWithoutAnIndexIsNone)
{
    const MapKind &kind = GetParam();
    EXPECT_EQ(process(kind.mtype, mdct_add, kind.entry("m1", "10") + "/match/acl", "a1"), 0);
    EXPECT_THAT(log_lines(), IsEmpty());
}

INSTANTIATE_TEST_SUITE_P(All, ReferencesByIndex, testing::ValuesIn([] {
                             std::vector<MapKind> kinds = map_kinds();
                             kinds.pop_back();
                             return kinds;
                         }()),
                         name_of);

TEST_F(References, OfSecurityEntriesAreThoseOfTheSubMap)
{
    EXPECT_EQ(process(MAP_TYPE_SEC, mdct_add,
                      "/ov/tunneld/sec_map/config/map/map1/z1/prio/5/match/acl", "a1"),
              0);
    EXPECT_THAT(references(), ElementsAre("/ov/tunneld/acl/config/a1/secmap/z1/prio/5 uint32 5"));
}

TEST_F(References, OfSecurityEntriesAreReadBelowMap1WhateverStandsThere)
{
    commit_.set_old("/ov/tunneld/sec_map/config/map/map2/z1/prio/5/match/acl", "a9");
    give_acl(security_map, "z1", "5", "a1");
    EXPECT_EQ(process(MAP_TYPE_SEC, mdct_modify,
                      "/ov/tunneld/sec_map/config/map/map2/z1/prio/5/match/acl", "a2"),
              0);
    EXPECT_EQ(log_line(1), path_line("/ov/tunneld/sec_map/config/map/map1/z1/prio/5/match/acl"));
    EXPECT_THAT(references(), ElementsAre("/ov/tunneld/acl/config/a2/secmap/z1/prio/5 uint32 5"));
    EXPECT_EQ(process(MAP_TYPE_SEC, mdct_delete, "/ov/tunneld/sec_map/config/map/map3/z1/prio/5"),
              0);
    EXPECT_EQ(last_log_line(), info("Removing /ov/tunneld/acl/config/a1/secmap/z1"));
}

TEST_F(References, OfSecurityEntriesHaveNoMatchIndex)
{
    EXPECT_EQ(process(MAP_TYPE_SEC, mdct_add,
                      "/ov/tunneld/sec_map/config/map/map1/z1/prio/5/match/0/acl", "a1"),
              0);
    EXPECT_THAT(log_lines(), IsEmpty());
}

TEST_F(References, OfUnknownKindsAreNone)
{
    for (const int mtype : unknown_types()) {
        for (const MapKind &kind : map_kinds()) {
            forget_calls();
            commit_.set_old(kind.acl_node("m1", "10"), "a1");
            EXPECT_EQ(process(mtype, mdct_add, kind.acl_node("m1", "10"), "a1"), 0) << mtype;
            EXPECT_EQ(process(mtype, mdct_delete, kind.entry("m1", "10")), 0) << mtype;
            EXPECT_THAT(log_lines(), ElementsAre(gated_line(3, "UNKNOWN map type"),
                                                 gated_line(3, "UNKNOWN map type")));
        }
    }
    EXPECT_THAT(references(), IsEmpty());
    host_.set_log_level(2);
    forget_calls();
    EXPECT_EQ(process(6, mdct_add, route_map.acl_node("m1", "10"), "a1"), 0);
    EXPECT_THAT(log_lines(), IsEmpty());
}

TEST_F(References, AnUnknownKindWithoutADatabaseIsRefusedAllTheSame)
{
    commit_.dbinfo.newdb = nullptr;
    EXPECT_EQ(process(6, mdct_add, route_map.acl_node("m1", "10"), "a1"), 14001);
    EXPECT_THAT(log_lines(), ElementsAre(line_of("Unexpected NULL")));
}

} // namespace
