// Edits of maps of the older form; md_xmap_legacy_upgrade_test.cpp has their conversion.
#include "orvale/md_xmap_common.h"

#include "tests/library/library_test.h"
#include "tests/library/map_changes.h"

#include <string>

using namespace ovtest;
using testing::ElementsAre;
using testing::IsEmpty;

namespace
{

const std::string root = "/ov/tunneld/route_map/config/map";

std::string line_of(const std::string &function, const std::string &text)
{
    return error_line("md_xmap_common", function, text);
}

class LegacyMatch : public LibraryTest
{
  protected:
    LegacyMatch() { db_.writable = true; }

    void set(const std::string &node) { set_node(db_, node, "x"); }
    int add_ipver(const std::string &below = root)
    {
        return in_library(md_xmap_add_ipver, &db_, below.c_str());
    }
    int delete_binding(const std::string &node)
    {
        return in_library(md_xmap_delete_match_binding, &db_, node.c_str());
    }
    int delete_entries(const std::string &match_node)
    {
        return in_library(md_xmap_delete_match_entries, &db_, MAP_TYPE_R, match_node.c_str());
    }
    std::vector<std::string> all() const { return nodes(db_, "/"); }

    mdb_db db_;
};

using IpVersion = LegacyMatch;

TEST_F(IpVersion, IsGivenToEveryEntryOfEveryMap)
{
    set(root + "/alpha/prio/10/match/0/dscp");
    set(root + "/alpha/prio/65535/match/0/dscp");
    set(root + "/beta/prio/20/set/0/nexthop");
    EXPECT_EQ(add_ipver(), 0);
    EXPECT_THAT(all(), ElementsAre(root + "/alpha/prio/10/match/0/dscp string x",
                                   root + "/alpha/prio/10/match/0/ipver string ipv4",
                                   root + "/alpha/prio/65535/match/0/dscp string x",
                                   root + "/alpha/prio/65535/match/0/ipver string any",
                                   root + "/beta/prio/20/match/0/ipver string ipv4",
                                   root + "/beta/prio/20/set/0/nexthop string x"));
}

TEST_F(IpVersion, IsWrittenWithALineForEachStep)
{
    set(root + "/alpha/prio/10/seq");
    set(root + "/alpha/prio/65535/seq");
    EXPECT_EQ(add_ipver(), 0);
    const auto path_line = [](const std::string &path) {
        return debug_line("md_xmap_common", "md_xmap_add_ipver", "smprintf=" + root + path);
    };
    EXPECT_THAT(log_lines(), ElementsAre(gated_line(6, "md_xmap_add_ipver: num maps: 1"),
                                         path_line("/alpha/prio"),
                                         gated_line(6, "md_xmap_add_ipver: num prios for alpha: 2"),
                                         path_line("/alpha/prio/10/match/0/ipver"),
                                         path_line("/alpha/prio/65535/match/0/ipver")));
}

TEST_F(IpVersion, IsWrittenAsTheHostExpectsIt)
{
    set(root + "/alpha/prio/10/seq");
    EXPECT_EQ(add_ipver(), 0);
    EXPECT_THAT(
        calls_of(Operation::mdb_get_tstr_array),
        ElementsAre("mdb_get_tstr_array(null, *, \"" + root + "\", 0, 0, 0, *)",
                    "mdb_get_tstr_array(null, *, \"" + root + "/alpha/prio\", 0, 0, 0, *)"));
    EXPECT_THAT(calls_of(Operation::bn_binding_new_str),
                ElementsAre("bn_binding_new_str(*, \"" + root +
                            "/alpha/prio/10/match/0/ipver\", 1, 101, 0, \"ipv4\")"));
    EXPECT_THAT(calls_of(Operation::mdb_set_node_binding),
                ElementsAre("mdb_set_node_binding(null, *, 1, 0, *)"));
}

TEST_F(IpVersion, IsAnyForTheDefaultEntryAlone)
{
    for (const char *priority : {"065535", "6553", "65536", "655350", "65535"}) {
        set(root + "/alpha/prio/" + priority + "/seq");
    }
    EXPECT_EQ(add_ipver(), 0);
    const auto version = [this](const std::string &priority) {
        return nodes(db_, root + "/alpha/prio/" + priority + "/match/0/ipver")
            .at(0)
            .substr(root.size());
    };
    EXPECT_EQ(version("065535"), "/alpha/prio/065535/match/0/ipver string ipv4");
    EXPECT_EQ(version("6553"), "/alpha/prio/6553/match/0/ipver string ipv4");
    EXPECT_EQ(version("65536"), "/alpha/prio/65536/match/0/ipver string ipv4");
    EXPECT_EQ(version("655350"), "/alpha/prio/655350/match/0/ipver string ipv4");
    EXPECT_EQ(version("65535"), "/alpha/prio/65535/match/0/ipver string any");
}

TEST_F(IpVersion, TakesThePlaceOfThePresentOne)
{
    set_node(db_, root + "/alpha/prio/10/match/0/ipver", "ipv6");
    EXPECT_EQ(add_ipver(), 0);
    EXPECT_THAT(all(), ElementsAre(root + "/alpha/prio/10/match/0/ipver string ipv4"));
}

TEST_F(IpVersion, IsGivenBelowWhateverRoot)
{
    set("/ov/other/maps/m/prio/5/seq");
    set(root + "/alpha/prio/10/seq");
    EXPECT_EQ(add_ipver("/ov/other/maps"), 0);
    EXPECT_THAT(all(), ElementsAre("/ov/other/maps/m/prio/5/match/0/ipver string ipv4",
                                   "/ov/other/maps/m/prio/5/seq string x",
                                   root + "/alpha/prio/10/seq string x"));
}

TEST_F(IpVersion, IsGivenToNoneWhereThereIsNone)
{
    EXPECT_EQ(add_ipver(), 0);
    EXPECT_THAT(log_lines(), ElementsAre(gated_line(6, "md_xmap_add_ipver: num maps: 0")));
    set(root + "/alpha/note");
    forget_calls();
    EXPECT_EQ(add_ipver(), 0);
    EXPECT_EQ(log_lines().back(), gated_line(6, "md_xmap_add_ipver: num prios for alpha: 0"));
    EXPECT_THAT(all(), ElementsAre(root + "/alpha/note string x"));
}

TEST_F(IpVersion, IsGivenToEntriesOfLongNames)
{
    for (const std::size_t size : {255U, 256U, 600U}) {
        const std::string entry =
            root + '/' + std::string(size, 'm') + "/prio/" + std::string(size, 'p');
        mdb_db db;
        db.writable = true;
        set_node(db, entry + "/seq", "x");
        EXPECT_EQ(in_library(md_xmap_add_ipver, &db, root.c_str()), 0);
        EXPECT_THAT(nodes(db, "/"),
                    ElementsAre(entry + "/match/0/ipver string ipv4", entry + "/seq string x"));
    }
}

// Names go into paths as they are: a slash makes two levels of one name.
TEST_F(IpVersion, IsGivenToNoEntryOfAMapWithASlashInItsName)
{
    const std::string entry = root + '/' + written("m/n") + "/prio/10/seq";
    set(entry);
    EXPECT_EQ(add_ipver(), 0);
    EXPECT_EQ(log_lines().back(), gated_line(6, "md_xmap_add_ipver: num prios for m/n: 0"));
    EXPECT_THAT(all(), ElementsAre(entry + " string x"));
}

TEST_F(IpVersion, IsGivenTwoLevelsDeepWhereAnEntryHasASlash)
{
    const std::string entry = root + "/m/prio/" + written("1/2") + "/seq";
    set(entry);
    EXPECT_EQ(add_ipver(), 0);
    EXPECT_THAT(all(),
                ElementsAre(root + "/m/prio/1/2/match/0/ipver string ipv4", entry + " string x"));
}

TEST_F(IpVersion, WithoutInterestInTracesIsAddedWithoutThem)
{
    host_.set_log_level(6);
    set(root + "/alpha/prio/10/seq");
    EXPECT_EQ(add_ipver(), 0);
    EXPECT_THAT(log_lines(),
                ElementsAre(gated_line(6, "md_xmap_add_ipver: num maps: 1"),
                            gated_line(6, "md_xmap_add_ipver: num prios for alpha: 1")));
    host_.set_log_level(5);
    forget_calls();
    EXPECT_EQ(add_ipver(), 0);
    EXPECT_THAT(log_lines(), IsEmpty());
    EXPECT_EQ(num_calls(Operation::ov_log_internal), 0U);
}

TEST_F(IpVersion, StaysWithTheEntriesBeforeAFailure)
{
    for (const char *entry : {"/alpha/prio/10/seq", "/alpha/prio/20/seq", "/beta/prio/10/seq"}) {
        set(root + entry);
    }
    arm({.operation = Operation::mdb_set_node_binding, .call = 2, .code = 14014});
    EXPECT_EQ(add_ipver(), 14014);
    EXPECT_EQ(log_lines().back(),
              line_of("md_xmap_add_ipver", "Error code 14014 (generic IO error) returned"));
    EXPECT_EQ(num_calls(Operation::mdb_set_node_binding), 2U);
    EXPECT_EQ(nodes(db_, root + "/alpha/prio/10").size(), 2U);
    EXPECT_EQ(nodes(db_, root + "/alpha/prio/20").size(), 1U);
}

TEST_F(IpVersion, OfAMapWithoutNameIsAnError)
{
    set(root + "/alpha/prio/10/seq");
    planted().null_text_at_call = 1;
    EXPECT_EQ(add_ipver(), 14001);
    EXPECT_EQ(log_lines().back(), line_of("md_xmap_add_ipver", "Unexpected NULL"));
}

TEST_F(IpVersion, OfNothingIsAnError)
{
    EXPECT_EQ(in_library(md_xmap_add_ipver, nullptr, root.c_str()), 14001);
    EXPECT_EQ(in_library(md_xmap_add_ipver, &db_, nullptr), 14001);
    EXPECT_THAT(log_lines(), ElementsAre(line_of("md_xmap_add_ipver", "Unexpected NULL"),
                                         line_of("md_xmap_add_ipver", "Unexpected NULL")));
    EXPECT_EQ(num_calls(Operation::mdb_get_tstr_array), 0U);
}

using MatchBinding = LegacyMatch;

TEST_F(MatchBinding, IsRemovedWithWhatStandsBelow)
{
    set("/ov/a/b");
    set("/ov/a/b/c");
    set("/ov/a/d");
    EXPECT_EQ(delete_binding("/ov/a/b"), 0);
    EXPECT_THAT(all(), ElementsAre("/ov/a/d string x"));
    EXPECT_THAT(calls_of(Operation::mdb_get_node_binding),
                ElementsAre("mdb_get_node_binding(null, *, \"/ov/a/b\", 0, *)"));
    EXPECT_THAT(calls_of(Operation::mdb_set_node_binding),
                ElementsAre("mdb_set_node_binding(null, *, 2, 0, *)"));
    EXPECT_THAT(log_lines(), IsEmpty());
}

TEST_F(MatchBinding, ThatIsAbsentIsNoError)
{
    set("/ov/a/b");
    EXPECT_EQ(delete_binding("/ov/a/c"), 0);
    EXPECT_EQ(num_calls(Operation::mdb_set_node_binding), 0U);
    EXPECT_THAT(all(), ElementsAre("/ov/a/b string x"));
}

TEST_F(MatchBinding, ThatOnlyHasChildrenIsAbsent)
{
    set("/ov/a/b");
    EXPECT_EQ(delete_binding("/ov/a"), 0);
    EXPECT_THAT(all(), ElementsAre("/ov/a/b string x"));
}

TEST_F(MatchBinding, OfWhateverNameIsRemoved)
{
    for (const std::string &name : {std::string(255, 'b'), std::string(256, 'b'),
                                    std::string(600, 'b'), written("b/c"), written("b\\c")}) {
        set("/ov/a/" + name);
        EXPECT_EQ(delete_binding("/ov/a/" + name), 0);
        EXPECT_THAT(all(), IsEmpty()) << name;
    }
}

TEST_F(MatchBinding, ThatMayNotBeWrittenPassesUpTheCode)
{
    set("/ov/a/b");
    db_.writable = false;
    EXPECT_EQ(delete_binding("/ov/a/b"), 14002);
    EXPECT_THAT(log_lines(), ElementsAre(line_of("md_xmap_delete_match_binding",
                                                 "Error code 14002 (assertion failed) returned")));
    EXPECT_EQ(num_calls(Operation::bail_debug), 1U);
}

TEST_F(MatchBinding, OfNothingIsAnError)
{
    EXPECT_EQ(in_library(md_xmap_delete_match_binding, nullptr, "/ov/a"), 14001);
    EXPECT_EQ(in_library(md_xmap_delete_match_binding, &db_, nullptr), 14001);
    EXPECT_THAT(log_lines(),
                ElementsAre(line_of("md_xmap_delete_match_binding", "Unexpected NULL"),
                            line_of("md_xmap_delete_match_binding", "Unexpected NULL")));
    EXPECT_EQ(num_calls(Operation::mdb_get_node_binding), 0U);
}

using MatchEntries = LegacyMatch;

TEST_F(MatchEntries, AreTheApplicationAlone)
{
    for (const char *field : {"application", "ipver", "src/port", "vlan", "protocol", "dscp"}) {
        set("/ov/m/match/0/" + std::string(field));
    }
    EXPECT_EQ(delete_entries("/ov/m/match/0"), 0);
    EXPECT_THAT(all(),
                ElementsAre("/ov/m/match/0/dscp string x", "/ov/m/match/0/ipver string x",
                            "/ov/m/match/0/protocol string x", "/ov/m/match/0/src/port string x",
                            "/ov/m/match/0/vlan string x"));
    EXPECT_THAT(log_lines(), IsEmpty());
}

TEST_F(MatchEntries, AreAskedForThirteenTimes)
{
    set("/ov/m/match/0/application");
    EXPECT_EQ(delete_entries("/ov/m/match/0"), 0);
    EXPECT_EQ(calls_of(Operation::mdb_get_node_binding),
              std::vector<std::string>(13, "mdb_get_node_binding(null, *, "
                                           "\"/ov/m/match/0/application\", 0, *)"));
    EXPECT_EQ(num_calls(Operation::mdb_set_node_binding), 1U);
}

TEST_F(MatchEntries, OfWhateverKindOfMapAreTheSame)
{
    for (const int mtype : {-1, 0, 5, 6, 7, 8, 1000}) {
        set("/ov/m/application");
        EXPECT_EQ(in_library(md_xmap_delete_match_entries, &db_, mtype, "/ov/m"), 0);
        EXPECT_THAT(all(), IsEmpty()) << mtype;
    }
}

TEST_F(MatchEntries, ThatAreAbsentAreNoError)
{
    set("/ov/m/match/0/dscp");
    EXPECT_EQ(delete_entries("/ov/m/match/0"), 0);
    EXPECT_THAT(all(), ElementsAre("/ov/m/match/0/dscp string x"));
    EXPECT_EQ(num_calls(Operation::mdb_get_node_binding), 13U);
    EXPECT_EQ(num_calls(Operation::mdb_set_node_binding), 0U);
}

TEST_F(MatchEntries, AreAskedForUpToTheFirstFailure)
{
    arm({.operation = Operation::mdb_get_node_binding, .call = 5, .code = 14014});
    EXPECT_EQ(delete_entries("/ov/m/match/0"), 14014);
    EXPECT_EQ(num_calls(Operation::mdb_get_node_binding), 5U);
    EXPECT_THAT(log_lines(), ElementsAre(line_of("md_xmap_delete_match_binding",
                                                 "Error code 14014 (generic IO error) returned"),
                                         line_of("md_xmap_delete_match_entries",
                                                 "Error code 14014 (generic IO error) returned")));
}

// "/application" leaves 243 characters of the path's 255.
TEST_F(MatchEntries, HaveAPathThatIsCutAt255Characters)
{
    const std::string longest = "/ov/" + std::string(239, 'm');
    ASSERT_EQ(longest.size(), 243U);
    set(longest + "/application");
    EXPECT_EQ(delete_entries(longest), 0);
    EXPECT_THAT(all(), IsEmpty());

    const std::string too_long = longest + "mmm";
    set(too_long + "/application");
    set(too_long + "/applicat");
    EXPECT_EQ(delete_entries(too_long), 0);
    EXPECT_THAT(all(), ElementsAre(too_long + "/application string x"));
}

// Nothing of "/application" is left: what has the first 255 characters for its name is removed.
TEST_F(MatchEntries, OfALongNodeAreTheNodeThatItsNameIsCutTo)
{
    for (const std::size_t size : {255U, 256U, 600U}) {
        mdb_db db;
        db.writable = true;
        const std::string node = "/ov/" + std::string(size - 4, 'm');
        const std::string application = node + "/application";
        set_node(db, application, "x");
        EXPECT_EQ(in_library(md_xmap_delete_match_entries, &db, MAP_TYPE_R, node.c_str()), 0);
        EXPECT_THAT(nodes(db, "/"), ElementsAre(application + " string x")) << size;

        set_node(db, node.substr(0, 255), "y");
        EXPECT_EQ(in_library(md_xmap_delete_match_entries, &db, MAP_TYPE_R, node.c_str()), 0);
        if (size == 255) {
            EXPECT_THAT(nodes(db, "/"), IsEmpty());
        } else {
            EXPECT_THAT(nodes(db, "/"), ElementsAre(application + " string x")) << size;
        }
    }
}

TEST_F(MatchEntries, OfANodeWithASlashInItsNameAreItsOwn)
{
    const std::string node = "/ov/" + written("m/n");
    set(node + "/application");
    set("/ov/m/n/application");
    EXPECT_EQ(delete_entries(node), 0);
    EXPECT_THAT(all(), ElementsAre("/ov/m/n/application string x"));
}

TEST_F(MatchEntries, OfNothingAreNone)
{
    set("/ov/m/application");
    EXPECT_EQ(in_library(md_xmap_delete_match_entries, nullptr, 0, "/ov/m"), 0);
    EXPECT_EQ(in_library(md_xmap_delete_match_entries, &db_, 0, nullptr), 0);
    EXPECT_THAT(all(), ElementsAre("/ov/m/application string x"));
    EXPECT_THAT(log_lines(), IsEmpty());
    EXPECT_EQ(num_calls(Operation::mdb_get_node_binding), 0U);
}

} // namespace
