#include "host/tree/diff.h"

#include "host/tree/name.h"

#include <gmock/gmock.h>

#include <algorithm>
#include <random>
#include <set>

namespace ovhost
{
namespace
{

using testing::ElementsAre;
using testing::IsEmpty;

using Parts = std::vector<std::string>;

Parts parts(std::string_view name)
{
    return split_name(name).value();
}

Value text(std::string value)
{
    return {bt_string, std::move(value)};
}

Change change(std::string_view name, std::optional<Value> before, std::optional<Value> after)
{
    return {parts(name), std::move(before), std::move(after)};
}

TEST(Diff, OfTheSameTreeIsEmpty)
{
    Tree tree;
    EXPECT_THAT(diff(tree, tree), IsEmpty());
    tree.set(parts("/a/b"), text("1"));
    const Tree copy = tree;
    EXPECT_THAT(diff(tree, copy), IsEmpty());
}

TEST(Diff, OfEqualTreesThatShareNothingIsEmpty)
{
    Tree one;
    Tree other;
    for (const char *name : {"/a/b", "/a/c", "/d"}) {
        one.set(parts(name), text("1"));
    }
    for (const char *name : {"/d", "/a/c", "/a/b"}) {
        other.set(parts(name), text("1"));
    }
    EXPECT_THAT(diff(one, other), IsEmpty());
}

TEST(Diff, TellsAddedModifiedAndRemovedNodesInOrder)
{
    Tree before;
    before.set(parts("/m/10"), text("ten"));
    before.set(parts("/m/9"), text("nine"));
    before.set(parts("/m/a"), text("same"));
    before.set(parts("/z"), text("gone"));
    Tree after = before;
    after.set(parts("/m/10"), text("TEN"));
    after.set(parts("/m/9/x"), text("new"));
    after.set(parts("/m"), text("parent"));
    after.erase(parts("/z"));
    EXPECT_THAT(diff(before, after), ElementsAre(change("/m", std::nullopt, text("parent")),
                                                 change("/m/9/x", std::nullopt, text("new")),
                                                 change("/m/10", text("ten"), text("TEN")),
                                                 change("/z", text("gone"), std::nullopt)));
    EXPECT_THAT(diff(after, before), ElementsAre(change("/m", text("parent"), std::nullopt),
                                                 change("/m/9/x", text("new"), std::nullopt),
                                                 change("/m/10", text("TEN"), text("ten")),
                                                 change("/z", std::nullopt, text("gone"))));
}

TEST(Diff, SeesAChangeOfTypeAlone)
{
    Tree before;
    before.set(parts("/a"), {bt_uint32, "1"});
    Tree after = before;
    after.set(parts("/a"), {bt_int32, "1"});
    EXPECT_THAT(diff(before, after),
                ElementsAre(change("/a", Value{bt_uint32, "1"}, Value{bt_int32, "1"})));
}

TEST(Diff, ToldFromOrToAnEmptyTreeIsTheWholeTree)
{
    Tree tree;
    tree.set({}, text("root"));
    tree.set(parts("/a/b"), text("1"));
    EXPECT_THAT(diff(Tree(), tree), ElementsAre(change("/", std::nullopt, text("root")),
                                                change("/a/b", std::nullopt, text("1"))));
    EXPECT_THAT(diff(tree, Tree()), ElementsAre(change("/", text("root"), std::nullopt),
                                                change("/a/b", text("1"), std::nullopt)));
}

TEST(Diff, LeavesOutWhatWasSetBack)
{
    Tree before;
    before.set(parts("/a"), text("1"));
    Tree after = before;
    after.set(parts("/a"), text("2"));
    after.set(parts("/b/c"), text("3"));
    after.set(parts("/a"), text("1"));
    after.erase(parts("/b/c"));
    EXPECT_THAT(diff(before, after), IsEmpty());
}

/// What diff() must tell, from two flat lists of nodes in the tree's order.
std::vector<Change> compare_lists(const Tree &before, const Tree &after)
{
    const auto less = [](const Parts &left, const Parts &right) {
        return std::ranges::lexicographical_compare(
            left, right, [](const std::string &one, const std::string &other) {
                return compare_components(one, other) < 0;
            });
    };
    std::set<Parts, decltype(less)> names(less);
    const auto collect = [&names](Tree::Parts name, const Value &) {
        names.emplace(name.begin(), name.end());
    };
    before.visit(collect);
    after.visit(collect);
    std::vector<Change> changes;
    for (const Parts &name : names) {
        const Value *old_value = before.value(name);
        const Value *new_value = after.value(name);
        if (old_value == nullptr || new_value == nullptr || *old_value != *new_value) {
            changes.push_back({name, old_value ? std::optional(*old_value) : std::nullopt,
                               new_value ? std::optional(*new_value) : std::nullopt});
        }
    }
    return changes;
}

Parts random_name(std::mt19937 &random, unsigned width)
{
    Parts name(random() % 4);
    for (std::string &part : name) {
        part = std::to_string(random() % width);
    }
    return name;
}

void change_at_random(Tree &tree, std::mt19937 &random, unsigned width)
{
    const Parts name = random_name(random, width);
    if (random() % 3 == 0 && !name.empty()) {
        tree.erase(name);
    } else {
        tree.set(name, text(std::to_string(random() % 2)));
    }
}

TEST(DiffModel, AgreesWithComparingEveryNode)
{
    for (unsigned seed = 0; seed < 30; ++seed) {
        std::mt19937 random(seed);
        const unsigned width = seed % 2 == 0 ? 4 : 60;
        std::vector<Tree> versions(1);
        for (int step = 0; step < 300; ++step) {
            Tree next = versions[random() % versions.size()];
            for (auto changes = random() % 8; changes > 0; --changes) {
                change_at_random(next, random, width);
            }
            const Tree &other = versions[random() % versions.size()];
            ASSERT_EQ(diff(other, next), compare_lists(other, next)) << "seed " << seed;
            versions.push_back(std::move(next));
        }
    }
}

} // namespace
} // namespace ovhost
