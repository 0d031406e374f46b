// Which nodes a module's patterns stand for: host/commit/node_scope.h.

#include "host/commit/node_scope.h"

#include <gtest/gtest.h>

namespace
{

using ovhost::NodeScope;

bool holds(const char *scope, const char *name)
{
    return NodeScope::parse(scope).value().holds(ovhost::split_name(name).value());
}

TEST(NodeScope, OfAPatternIsItsNames)
{
    EXPECT_TRUE(holds("/a/*", "/a/x"));
    EXPECT_FALSE(holds("/a/*", "/a"));
    EXPECT_FALSE(holds("/a/*", "/a/x/y"));
    EXPECT_FALSE(holds("/a/*", "/b/x"));
}

TEST(NodeScope, WithTwoStarsIsAllThatIsBelow)
{
    EXPECT_TRUE(holds("/a/*/c/**", "/a/x/c/1"));
    EXPECT_TRUE(holds("/a/*/c/**", "/a/x/c/1/2/3/4/5/6/7/8/9"));
    EXPECT_FALSE(holds("/a/*/c/**", "/a/x/c")) << "not the node itself";
    EXPECT_FALSE(holds("/a/*/c/**", "/a/x/d/1"));
    EXPECT_FALSE(holds("/a/*/c/**", "/a"));
}

TEST(NodeScope, TakesTwoStarsElsewhereForAName)
{
    EXPECT_TRUE(holds("/a/**/c", "/a/**/c"));
    EXPECT_FALSE(holds("/a/**/c", "/a/b/c"));
}

TEST(NodeScope, NeedsAPattern)
{
    for (const char *text : {"", "a", "a/**", "/a/", "/a//**"}) {
        EXPECT_FALSE(NodeScope::parse(text)) << text;
    }
}

} // namespace
