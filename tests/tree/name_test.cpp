#include "host/tree/name.h"

#include <gmock/gmock.h>

#include <random>

namespace ovhost
{
namespace
{

using testing::ElementsAre;
using testing::Optional;

using Parts = std::vector<std::string>;

TEST(SplitName, TakesComponentsApart)
{
    EXPECT_THAT(split_name("/a"), Optional(ElementsAre("a")));
    EXPECT_THAT(split_name("/ov/tunneld/mode"), Optional(ElementsAre("ov", "tunneld", "mode")));
    EXPECT_THAT(split_name("/a b/ /c,d"), Optional(ElementsAre("a b", " ", "c,d")));
}

TEST(SplitName, RootHasNoComponents)
{
    EXPECT_THAT(split_name("/"), Optional(Parts{}));
}

TEST(SplitName, TakesEscapedCharactersLiterally)
{
    EXPECT_THAT(split_name(R"(/a/b\/c)"), Optional(ElementsAre("a", "b/c")));
    EXPECT_THAT(split_name(R"(/route/10.0.0.0\/8/nhop)"),
                Optional(ElementsAre("route", "10.0.0.0/8", "nhop")));
    EXPECT_THAT(split_name(R"(/a\\/b)"), Optional(ElementsAre("a\\", "b")));
    EXPECT_THAT(split_name(R"(/a\\\/b)"), Optional(ElementsAre("a\\/b")));
    EXPECT_THAT(split_name(R"(/\/)"), Optional(ElementsAre("/")));
    EXPECT_THAT(split_name(R"(/\*/x\*y)"), Optional(ElementsAre("*", "x*y")));
}

TEST(SplitName, RefusesWhatIsNoName)
{
    for (const std::string name :
         {"", "a", "a/b", "//", "//a", "/a//b", "/a/", "/a\\", "/\\", "/a\\b", "/a/\\n", " /a"}) {
        EXPECT_EQ(split_name(name), std::nullopt) << name;
    }
    EXPECT_EQ(split_name(std::string_view("/a\0b", 4)), std::nullopt);
    EXPECT_EQ(split_name(std::string_view("/\0", 2)), std::nullopt);
    EXPECT_EQ(split_name(std::string_view("/a\\\0", 4)), std::nullopt);
}

TEST(SplitName, LimitsTheNumberOfComponents)
{
    std::string name;
    for (int count = 0; count < 256; ++count) {
        name += "/x";
    }
    EXPECT_THAT(split_name(name), Optional(Parts(256, "x")));
    EXPECT_EQ(split_name(name + "/x"), std::nullopt);
    EXPECT_EQ(NamePattern::parse(name + "/*"), std::nullopt);
}

TEST(ValidName, IsWhatSplitNameCouldYield)
{
    EXPECT_TRUE(is_valid_name({}));
    EXPECT_TRUE(is_valid_name(Parts{"a", "/", "\\", "*"}));
    EXPECT_TRUE(is_valid_name(Parts(256, "x")));
    EXPECT_FALSE(is_valid_name(Parts(257, "x")));
    EXPECT_FALSE(is_valid_name(Parts{"a", ""}));
    EXPECT_FALSE(is_valid_name(Parts{std::string("a\0b", 3)}));
}

TEST(EscapeComponent, EscapesWhatWouldEndOrChangeIt)
{
    EXPECT_EQ(escape_component("plain"), "plain");
    EXPECT_EQ(escape_component("10.0.0.0/8"), R"(10.0.0.0\/8)");
    EXPECT_EQ(escape_component(R"(a\b)"), R"(a\\b)");
    EXPECT_EQ(escape_component("*"), R"(\*)");
    EXPECT_EQ(escape_component("a*"), "a*");
}

TEST(JoinName, WritesTheName)
{
    EXPECT_EQ(join_name({}), "/");
    EXPECT_EQ(join_name(Parts{"a", "b/c", "d\\"}), R"(/a/b\/c/d\\)");
}

Parts random_parts(std::mt19937 &random)
{
    // Mostly the characters that matter, so that every run of them comes up.
    const std::string alphabet = "//\\\\**ab0.\x01\xff ";
    Parts parts(random() % 6);
    for (std::string &part : parts) {
        for (auto length = 1 + random() % 5; length > 0; --length) {
            part += alphabet[random() % alphabet.size()];
        }
    }
    return parts;
}

TEST(JoinName, IsUndoneBySplitName)
{
    std::mt19937 random(7);
    for (int round = 0; round < 20000; ++round) {
        const Parts parts = random_parts(random);
        ASSERT_THAT(split_name(join_name(parts)), Optional(parts)) << join_name(parts);
    }
}

TEST(JoinName, AsPatternMatchesItsOwnNameOnly)
{
    std::mt19937 random(8);
    for (int round = 0; round < 20000; ++round) {
        const Parts one = random_parts(random);
        const Parts other = random_parts(random);
        const auto pattern = NamePattern::parse(join_name(one));
        ASSERT_TRUE(pattern.has_value());
        EXPECT_TRUE(pattern->matches(one));
        EXPECT_EQ(pattern->matches(other), one == other);
    }
}

TEST(CompareComponents, PutsNumbersFirstByTheirNumber)
{
    const std::vector<std::string> in_order = {"0",
                                               "00",
                                               "1",
                                               "01",
                                               "001",
                                               "2",
                                               "9",
                                               "09",
                                               "10",
                                               "99999999999999999999",
                                               "100000000000000000000",
                                               "",
                                               "-1",
                                               "1.5",
                                               "10a",
                                               "A",
                                               "a",
                                               "a1",
                                               "a10",
                                               "a2",
                                               "b",
                                               "\xc3\xa4"};
    for (std::size_t left = 0; left < in_order.size(); ++left) {
        for (std::size_t right = 0; right < in_order.size(); ++right) {
            EXPECT_EQ(compare_components(in_order[left], in_order[right]), left <=> right)
                << in_order[left] << " and " << in_order[right];
        }
    }
}

bool matches(std::string_view pattern, std::string_view name)
{
    return NamePattern::parse(pattern).value().matches(split_name(name).value());
}

TEST(NamePattern, StarMatchesExactlyOneComponent)
{
    EXPECT_TRUE(matches("/a/*/c", "/a/b/c"));
    EXPECT_TRUE(matches("/a/*/c", R"(/a/10.0.0.0\/8/c)"));
    EXPECT_TRUE(matches("/*", "/a"));
    EXPECT_TRUE(matches("/*/*", "/a/b"));
    EXPECT_FALSE(matches("/a/*/c", "/a/c"));
    EXPECT_FALSE(matches("/a/*/c", "/a/b/b/c"));
    EXPECT_FALSE(matches("/a/*", "/a"));
    EXPECT_FALSE(matches("/a/*", "/a/b/c"));
    EXPECT_FALSE(matches("/*", "/"));
}

TEST(NamePattern, OtherComponentsMatchThemselves)
{
    EXPECT_TRUE(matches("/", "/"));
    EXPECT_TRUE(matches(R"(/a/b\/c)", R"(/a/b\/c)"));
    EXPECT_FALSE(matches("/a", "/b"));
    EXPECT_FALSE(matches("/a", "/"));
    EXPECT_FALSE(matches("/", "/a"));
    EXPECT_FALSE(matches("/a", "/A"));
}

TEST(NamePattern, StarIsLiteralWhenEscapedOrNotAlone)
{
    EXPECT_TRUE(matches(R"(/\*)", "/*"));
    EXPECT_FALSE(matches(R"(/\*)", "/a"));
    EXPECT_TRUE(matches("/a*", "/a*"));
    EXPECT_FALSE(matches("/a*", "/ab"));
    EXPECT_FALSE(matches("/**", "/ab"));
}

TEST(NamePattern, TellsItsParts)
{
    const auto pattern = NamePattern::parse(R"(/a/*/\*/b\/c)");
    ASSERT_TRUE(pattern.has_value());
    EXPECT_THAT(pattern->parts(),
                ElementsAre(Optional(std::string("a")), std::nullopt, Optional(std::string("*")),
                            Optional(std::string("b/c"))));
}

TEST(NamePattern, RefusesWhatIsNoName)
{
    for (const std::string pattern : {"", "*", "a/*", "/*/", "//*", "/*\\", "/\\a"}) {
        EXPECT_FALSE(NamePattern::parse(pattern).has_value()) << pattern;
    }
}

} // namespace
} // namespace ovhost
