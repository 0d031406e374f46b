#include "host/commit/candidate.h"

#include "tests/commit/support.h"

#include <gmock/gmock.h>

#include <array>

using commit_test::Config;
using commit_test::config_of;
using commit_test::tree_of;
using ovhost::Candidate;
using ovhost::Edit;
using ovhost::Tree;
using testing::ElementsAre;
using testing::IsEmpty;

namespace
{

constexpr const char *bad_name =
    "\"/a//b\" is not the name of a node: a name is /PART/PART, with \"\\/\" for a slash inside a "
    "part";

TEST(CandidateTest, SetWritesTheCandidateAndNothingElse)
{
    const ovhost::Tree running = tree_of({{"/a", "1"}});
    Candidate candidate(running);
    EXPECT_EQ(candidate.set("/a", bt_string, "2"), std::nullopt);
    EXPECT_EQ(candidate.set("/b/c", bt_uint8, "255"), std::nullopt);
    EXPECT_EQ(config_of(candidate.tree()), (Config{{"/a", "2"}, {"/b/c", "255"}}));
    EXPECT_EQ(config_of(running), (Config{{"/a", "1"}}));
}

TEST(CandidateTest, ValueThatDoesNotFitIsNamedWithNodeTypeAndValue)
{
    Candidate candidate(tree_of({{"/a/b", "1"}}));
    EXPECT_EQ(candidate.set("/a/b", bt_uint8, "300"),
              "/a/b: \"300\" is not a uint8: must be a decimal number from 0 to 255");
    EXPECT_EQ(config_of(candidate.tree()), (Config{{"/a/b", "1"}}));
}

TEST(CandidateTest, NameThatIsNoneIsNamed)
{
    Candidate candidate;
    EXPECT_EQ(candidate.set("/a//b", bt_string, "1"), bad_name);
    EXPECT_EQ(candidate.erase("/a//b"), bad_name);
    EXPECT_THAT(candidate.load(
                    std::array{Edit{"/a//b", bt_string, "1", false}, Edit{"/a//b", 0, "", true}}),
                ElementsAre(bad_name, bad_name));
    EXPECT_EQ(candidate.tree().size(), 0U);
}

TEST(CandidateTest, RootIsNoNodeToEdit)
{
    constexpr const char *fault =
        "\"/\" is not the name of a node: a name is /PART/PART, with \"\\/\" for a slash inside a "
        "part";
    Candidate candidate(tree_of({{"/a", "1"}}));
    EXPECT_EQ(candidate.set("/", bt_string, "1"), fault);
    EXPECT_EQ(candidate.erase("/"), fault);
    EXPECT_EQ(config_of(candidate.tree()), (Config{{"/a", "1"}}));
}

TEST(CandidateTest, EraseTakesAllBelowAndTellsOfAbsentNodes)
{
    Candidate candidate(tree_of({{"/a", "1"}, {"/a/b", "2"}, {"/c", "3"}}));
    EXPECT_EQ(candidate.erase("/a"), std::nullopt);
    EXPECT_EQ(config_of(candidate.tree()), (Config{{"/c", "3"}}));
    EXPECT_EQ(candidate.erase("/a"), "there is no node /a to delete");
}

TEST(CandidateTest, LoadMakesEditsInTheirOrder)
{
    Candidate candidate(tree_of({{"/a/b", "1"}}));
    EXPECT_THAT(candidate.load(
                    std::array{Edit{"/a", 0, "", true}, Edit{"/a/c", bt_string, "2", false},
                               Edit{"/absent", 0, "", true}, Edit{"/a/c", bt_string, "3", false}}),
                IsEmpty());
    EXPECT_EQ(config_of(candidate.tree()), (Config{{"/a/c", "3"}}));
}

TEST(CandidateTest, LoadWithFaultsMakesNoEditAndTellsOfAll)
{
    Candidate candidate(tree_of({{"/a", "1"}}));
    EXPECT_THAT(candidate.load(std::array{Edit{"/a", bt_string, "2", false},
                                          Edit{"/b", bt_bool, "maybe", false},
                                          Edit{"/c", bt_uint8, "-1", false}}),
                ElementsAre("/b: \"maybe\" is not a bool: must be true or false",
                            "/c: \"-1\" is not a uint8: must be a decimal number from 0 to 255"));
    EXPECT_EQ(config_of(candidate.tree()), (Config{{"/a", "1"}}));
}

TEST(CandidateTest, PendingListsWhatDiffers)
{
    const ovhost::Tree running = tree_of({{"/a", "1"}, {"/b", "2"}});
    Candidate candidate(running);
    EXPECT_THAT(candidate.pending(running), IsEmpty());
    ASSERT_EQ(candidate.set("/a", bt_string, "9"), std::nullopt);
    ASSERT_EQ(candidate.erase("/b"), std::nullopt);
    ASSERT_EQ(candidate.set("/c", bt_uint8, "3"), std::nullopt);
    EXPECT_THAT(candidate.pending(running),
                ElementsAre(ovhost::Change{{"a"}, {{bt_string, "1"}}, {{bt_string, "9"}}},
                            ovhost::Change{{"b"}, {{bt_string, "2"}}, {}},
                            ovhost::Change{{"c"}, {}, {{bt_uint8, "3"}}}));
}

TEST(CandidateTest, DiscardDropsTheEdits)
{
    Candidate candidate(tree_of({{"/a", "1"}}));
    ASSERT_EQ(candidate.set("/a", bt_string, "2"), std::nullopt);
    candidate.discard(tree_of({{"/a", "3"}}));
    EXPECT_EQ(config_of(candidate.tree()), (Config{{"/a", "3"}}));
    EXPECT_THAT(candidate.pending(tree_of({{"/a", "3"}})), IsEmpty());
}

TEST(CandidateTest, AnotherCommitInBetweenIsKept)
{
    Candidate candidate(tree_of({{"/a", "1"}, {"/b", "1"}, {"/c", "1"}, {"/d", "1"}}));
    ASSERT_EQ(candidate.set("/a", bt_string, "mine"), std::nullopt);
    ASSERT_EQ(candidate.set("/c", bt_string, "mine"), std::nullopt);
    ASSERT_EQ(candidate.erase("/d"), std::nullopt);
    const ovhost::Tree running =
        tree_of({{"/a", "1"}, {"/b", "theirs"}, {"/c", "theirs"}, {"/d", "theirs"}, {"/e", "new"}});
    EXPECT_EQ(config_of(candidate.over(running)),
              (Config{{"/a", "mine"}, {"/b", "theirs"}, {"/c", "mine"}, {"/e", "new"}}));
}

TEST(CandidateTest, DeletionKeepsWhatAnotherCommitHasPutBelow)
{
    Candidate candidate(tree_of({{"/list", "1"}, {"/list/x", "1"}, {"/list/x/y", "1"}}));
    ASSERT_EQ(candidate.erase("/list"), std::nullopt);
    const ovhost::Tree running =
        tree_of({{"/list", "1"}, {"/list/x", "1"}, {"/list/x/y", "1"}, {"/list/x/new", "theirs"}});
    EXPECT_EQ(config_of(candidate.over(running)), (Config{{"/list/x/new", "theirs"}}));
}

TEST(CandidateTest, DeletionOfWhatAnotherCommitHasDeletedIsNoChange)
{
    Candidate candidate(tree_of({{"/a", "1"}, {"/b", "1"}}));
    ASSERT_EQ(candidate.erase("/a"), std::nullopt);
    EXPECT_THAT(candidate.pending(tree_of({{"/b", "1"}})), IsEmpty());
}

TEST(CandidateTest, ReplaceLeadsToAnotherConfiguration)
{
    const Tree running = tree_of({{"/a", "1"}, {"/b", "1"}});
    Candidate candidate(running);
    ASSERT_EQ(candidate.set("/c", bt_string, "dropped"), std::nullopt);
    candidate.replace(tree_of({{"/a", "2"}}));
    EXPECT_EQ(config_of(candidate.tree()), (Config{{"/a", "2"}}));
    EXPECT_EQ(config_of(candidate.over(running)), (Config{{"/a", "2"}}));
}

TEST(CandidateTest, RebaseKeepsTheEditsOverAnotherCommit)
{
    Candidate candidate(tree_of({{"/a", "1"}, {"/b", "1"}, {"/c", "1"}}));
    ASSERT_EQ(candidate.set("/a", bt_string, "mine"), std::nullopt);
    ASSERT_EQ(candidate.erase("/b"), std::nullopt);
    const Tree running = tree_of({{"/a", "2"}, {"/b", "2"}, {"/c", "2"}});
    candidate.rebase(running);
    EXPECT_EQ(config_of(candidate.tree()), (Config{{"/a", "mine"}, {"/c", "2"}}));
    EXPECT_EQ(candidate.pending(running).size(), 2U);
}

} // namespace
