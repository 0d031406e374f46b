// Lines out of a byte stream: host/control/framing.h.

#include "host/control/framing.h"

#include <gtest/gtest.h>

#include <string>
#include <vector>

namespace ovhost
{
namespace
{

std::vector<std::string> lines_of(LineSplitter &splitter)
{
    std::vector<std::string> lines;
    while (const auto line = splitter.next())
        lines.emplace_back(*line);
    return lines;
}

using Lines = std::vector<std::string>;

TEST(LineSplitterTest, GivesWholeLinesInOrder)
{
    LineSplitter splitter(100);
    splitter.feed("one\ntwo\n\nthree");
    EXPECT_EQ(lines_of(splitter), (Lines{"one", "two", ""}));
    EXPECT_EQ(splitter.rest(), "three");
    splitter.feed(" more\n");
    EXPECT_EQ(lines_of(splitter), Lines{"three more"});
    EXPECT_EQ(splitter.rest(), "");
}

TEST(LineSplitterTest, DoesNotMindHowTheStreamIsCut)
{
    const std::string stream = "alpha\nbeta\n\ngamma delta\n";
    for (std::size_t piece = 1; piece <= stream.size(); ++piece) {
        LineSplitter splitter(100);
        Lines lines;
        for (std::size_t at = 0; at < stream.size(); at += piece) {
            splitter.feed(std::string_view(stream).substr(at, piece));
            for (const std::string &line : lines_of(splitter))
                lines.push_back(line);
        }
        EXPECT_EQ(lines, (Lines{"alpha", "beta", "", "gamma delta"})) << "pieces of " << piece;
    }
}

TEST(LineSplitterTest, KeepsZeroBytes)
{
    LineSplitter splitter(100);
    splitter.feed(std::string_view("a\0b\n", 4));
    EXPECT_EQ(lines_of(splitter), Lines{std::string("a\0b", 3)});
}

TEST(LineSplitterTest, TakesALineOfExactlyTheLimit)
{
    LineSplitter splitter(5);
    splitter.feed("12345");
    EXPECT_FALSE(splitter.next());
    EXPECT_FALSE(splitter.too_long());
    splitter.feed("\n");
    EXPECT_EQ(lines_of(splitter), Lines{"12345"});
    EXPECT_FALSE(splitter.too_long());
}

TEST(LineSplitterTest, RefusesAWholeLinePastTheLimit)
{
    LineSplitter splitter(5);
    splitter.feed("ok\n123456\nnever\n");
    EXPECT_EQ(lines_of(splitter), Lines{"ok"});
    EXPECT_TRUE(splitter.too_long());
    splitter.feed("nor this\n");
    EXPECT_EQ(lines_of(splitter), Lines{});
    EXPECT_EQ(splitter.rest(), "");
}

TEST(LineSplitterTest, RefusesALinePastTheLimitBeforeItsEndIsThere)
{
    LineSplitter splitter(5);
    splitter.feed("123456");
    EXPECT_FALSE(splitter.next());
    EXPECT_TRUE(splitter.too_long());
}

} // namespace
} // namespace ovhost
