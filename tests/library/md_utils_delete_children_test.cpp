// The removal of all children of a node: the other part of md_utils.
#include "orvale/md_utils.h"

#include "tests/library/library_test.h"
#include "tests/library/map_changes.h"

#include <string>

using namespace ovtest;
using testing::ElementsAre;
using testing::IsEmpty;

namespace
{

constexpr char function[] = "md_delete_children";
constexpr char list_node[] = "/ov/list";

std::string line_of(const std::string &text)
{
    return error_line("md_utils", function, text);
}

std::string removed_line(const std::string &child)
{
    return gated_line(6, "Child " + child + " removed");
}

class Children : public LibraryTest
{
  protected:
    void SetUp() override { host_.db()->writable = true; }

    void set(const std::string &node) { set_node(*host_.db(), node, "x"); }

    // Status and number.
    std::string remove(const char *parent = list_node)
    {
        int num = -7;
        const int status =
            in_library(md_delete_children, &host_.commit(), host_.db(), parent, &num);
        return std::to_string(status) + ' ' + std::to_string(num);
    }
    std::vector<std::string> left() { return nodes(*host_.db(), "/"); }
};

TEST_F(Children, GoWithAllThatIsBelowThem)
{
    set("/ov/list");
    set("/ov/list/10");
    set("/ov/list/10/below/it");
    set("/ov/list/9/no/value");
    set("/ov/list/name");
    set("/ov/lists/1");
    EXPECT_EQ(remove(), "0 3");
    EXPECT_THAT(left(), ElementsAre("/ov/list string x", "/ov/lists/1 string x"));
    EXPECT_THAT(log_lines(),
                ElementsAre(removed_line("9"), removed_line("10"), removed_line("name")));
}

TEST_F(Children, AreListedAndRemovedAsTheHostExpectsIt)
{
    set("/ov/list/1");
    set("/ov/list/2");
    EXPECT_EQ(remove(), "0 2");
    EXPECT_THAT(calls_of(Operation::mdb_get_tstr_array),
                ElementsAre("mdb_get_tstr_array(*, *, \"/ov/list\", 0, 0, 0, *)"));
    EXPECT_THAT(calls_of(Operation::mdb_set_node_str),
                ElementsAre("mdb_set_node_str(*, *, 2, 0, 101, \"\", \"%s\", \"/ov/list/1\")",
                            "mdb_set_node_str(*, *, 2, 0, 101, \"\", \"%s\", \"/ov/list/2\")"));
}

TEST_F(Children, MayBeNone)
{
    set("/ov/list");
    EXPECT_EQ(remove(), "0 0");
    EXPECT_EQ(remove("/ov/nothing"), "0 0");
    EXPECT_THAT(left(), ElementsAre("/ov/list string x"));
    EXPECT_THAT(log_lines(), IsEmpty());
}

TEST_F(Children, NeedNotBeCountedOrBelongToACommit)
{
    set("/ov/list/1");
    EXPECT_EQ(in_library(md_delete_children, nullptr, host_.db(), list_node, nullptr), 0);
    EXPECT_THAT(left(), IsEmpty());
    EXPECT_THAT(calls_of(Operation::mdb_get_tstr_array),
                ElementsAre("mdb_get_tstr_array(null, *, \"/ov/list\", 0, 0, 0, *)"));
    EXPECT_THAT(calls_of(Operation::mdb_set_node_str),
                ElementsAre("mdb_set_node_str(null, *, 2, 0, 101, \"\", \"%s\", \"/ov/list/1\")"));
}

TEST_F(Children, AreThoseOfTheCallersCommitAndDatabase)
{
    set("/ov/list/1");
    name_object(static_cast<md_commit *>(&host_.commit()), "commit");
    name_object(host_.db(), "db");
    EXPECT_EQ(remove(), "0 1");
    EXPECT_THAT(calls_of(Operation::mdb_get_tstr_array),
                ElementsAre("mdb_get_tstr_array(commit, db, \"/ov/list\", 0, 0, 0, *)"));
    EXPECT_THAT(
        calls_of(Operation::mdb_set_node_str),
        ElementsAre("mdb_set_node_str(commit, db, 2, 0, 101, \"\", \"%s\", \"/ov/list/1\")"));
}

TEST_F(Children, AreToldByTheDaemonsThresholdBeforeTheGeneralOne)
{
    set("/ov/list/1");
    G_log_level = 7;
    G_daemon_log_level = 5;
    EXPECT_EQ(remove(), "0 1");
    EXPECT_THAT(log_lines(), IsEmpty());
    set("/ov/list/2");
    G_log_level = 0;
    G_daemon_log_level = 6;
    EXPECT_EQ(remove(), "0 1");
    EXPECT_THAT(log_lines(), ElementsAre(removed_line("2")));
}

TEST_F(Children, GoInSilenceBelowTheThreshold)
{
    set("/ov/list/1");
    host_.set_log_level(5);
    EXPECT_EQ(remove(), "0 1");
    EXPECT_THAT(left(), IsEmpty());
    EXPECT_THAT(log_lines(), IsEmpty());
}

TEST_F(Children, ThatStayAfterAFailureAreNotCounted)
{
    for (const char *node : {"/ov/list/1", "/ov/list/2", "/ov/list/3"}) {
        set(node);
    }
    arm({.operation = Operation::mdb_set_node_str, .call = 3, .code = 14004});
    EXPECT_EQ(remove(), "14004 2");
    EXPECT_THAT(left(), ElementsAre("/ov/list/3 string x"));
    EXPECT_THAT(log_lines(), ElementsAre(removed_line("1"), removed_line("2"),
                                         line_of("Error code 14004 (item not found) returned")));
    EXPECT_EQ(num_calls(Operation::bail_debug), 1U);
}

TEST_F(Children, StayQuietlyWhenTheOperationIsCancelled)
{
    set("/ov/list/1");
    set("/ov/list/2");
    arm({.operation = Operation::mdb_set_node_str, .call = 2, .code = 14120});
    EXPECT_EQ(remove(), "14120 1");
    EXPECT_THAT(log_lines(), ElementsAre(removed_line("1")));
    EXPECT_EQ(num_calls(Operation::bail_debug), 0U);
    EXPECT_EQ(num_calls(Operation::bail_quiet_debug), 1U);
}

TEST_F(Children, StayWhereNothingMayBeWritten)
{
    set("/ov/list/1");
    host_.db()->writable = false;
    EXPECT_EQ(remove(), "14002 0");
    EXPECT_THAT(left(), ElementsAre("/ov/list/1 string x"));
    EXPECT_THAT(log_lines(), ElementsAre(line_of("Error code 14002 (assertion failed) returned")));
}

TEST_F(Children, WithoutNameEndTheWalk)
{
    set("/ov/list/1");
    set("/ov/list/2");
    planted().null_text_at_call = 2;
    EXPECT_EQ(remove(), "14001 1");
    EXPECT_THAT(left(), ElementsAre("/ov/list/2 string x"));
    EXPECT_THAT(log_lines(), ElementsAre(removed_line("1"), line_of("Unexpected NULL")));
}

TEST_F(Children, AreNamedAsTheyAreListed)
{
    set("/ov/list/10.0.0.0\\/8");
    set("/ov/list/10.0.0.0/8");
    set("/ov/list/10.0.0.0/9");
    EXPECT_EQ(remove(), "0 2");
    // The slash is not escaped: it is the node "8" below "10.0.0.0" that the name stands for.
    EXPECT_THAT(left(), ElementsAre("/ov/list/10.0.0.0\\/8 string x"));
    EXPECT_THAT(log_lines(), ElementsAre(removed_line("10.0.0.0"), removed_line("10.0.0.0/8")));
}

TEST_F(Children, OfLongNamesGoToo)
{
    const std::string name(600, 'n');
    set("/ov/list/" + name);
    EXPECT_EQ(remove(), "0 1");
    EXPECT_THAT(left(), IsEmpty());
    EXPECT_THAT(log_lines(), ElementsAre(removed_line(name)));
}

TEST_F(Children, OfNoNameAreAnError)
{
    EXPECT_EQ(remove("no/name"), "14009 0");
    EXPECT_THAT(log_lines(), ElementsAre(line_of("Error code 14009 (invalid path name) returned")));
}

TEST_F(Children, OfNothingAreAnError)
{
    int num = -7;
    EXPECT_EQ(in_library(md_delete_children, &host_.commit(), nullptr, list_node, &num), 14001);
    EXPECT_EQ(num, 0);
    EXPECT_EQ(remove(nullptr), "14001 0");
    EXPECT_EQ(in_library(md_delete_children, &host_.commit(), nullptr, list_node, nullptr), 14001);
    const std::string line = line_of("Unexpected NULL");
    EXPECT_THAT(log_lines(), ElementsAre(line, line, line));
    EXPECT_EQ(num_calls(Operation::bail_debug), 3U);
    EXPECT_EQ(num_calls(Operation::mdb_get_tstr_array), 0U);
}

} // namespace
