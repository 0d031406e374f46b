#include "host/tree/tree.h"

#include "host/tree/name.h"

#include <gmock/gmock.h>

#include <algorithm>
#include <map>
#include <random>
#include <stdexcept>

namespace ovhost
{
namespace
{

using testing::ElementsAre;
using testing::IsEmpty;
using testing::Pointee;

using Parts = std::vector<std::string>;

Parts parts(std::string_view name)
{
    return split_name(name).value();
}

Value text(std::string value)
{
    return {bt_string, std::move(value)};
}

NamePattern pattern(std::string_view name)
{
    return NamePattern::parse(name).value();
}

/// A tree of nodes whose value is their name.
Tree tree_of(std::initializer_list<const char *> names)
{
    Tree tree;
    for (const char *name : names) {
        tree.set(parts(name), text(name));
    }
    return tree;
}

std::vector<std::string> visited(const Tree &tree, std::string_view below = "/")
{
    std::vector<std::string> names;
    tree.visit([&names](Tree::Parts name, const Value &) { names.push_back(join_name(name)); },
               parts(below));
    return names;
}

TEST(Tree, IsEmptyAtFirst)
{
    const Tree tree;
    EXPECT_EQ(tree.size(), 0U);
    EXPECT_TRUE(tree.exists({}));
    EXPECT_EQ(tree.value({}), nullptr);
    EXPECT_FALSE(tree.exists(parts("/a")));
    EXPECT_EQ(tree.value(parts("/a")), nullptr);
    EXPECT_THAT(tree.children({}), IsEmpty());
    EXPECT_THAT(tree.children(parts("/a")), IsEmpty());
    EXPECT_THAT(tree.matching(pattern("/*")), IsEmpty());
    EXPECT_THAT(tree.matching(pattern("/")), ElementsAre("/"));
    EXPECT_THAT(visited(tree), IsEmpty());
}

TEST(Tree, HoldsTypedValues)
{
    Tree tree;
    tree.set(parts("/a/b"), {bt_uint32, "7"});
    EXPECT_THAT(tree.value(parts("/a/b")), Pointee(Value{bt_uint32, "7"}));
    tree.set(parts("/a/b"), {bt_int32, "7"});
    EXPECT_THAT(tree.value(parts("/a/b")), Pointee(Value{bt_int32, "7"}));
    tree.set(parts("/a/b"), {bt_int32, "8"});
    EXPECT_THAT(tree.value(parts("/a/b")), Pointee(Value{bt_int32, "8"}));
    EXPECT_EQ(tree.size(), 1U);
}

TEST(Tree, ParentsExistWithoutValue)
{
    const Tree tree = tree_of({"/a/b/c"});
    EXPECT_TRUE(tree.exists(parts("/a/b")));
    EXPECT_EQ(tree.value(parts("/a/b")), nullptr);
    EXPECT_EQ(tree.size(), 1U);
    EXPECT_FALSE(tree.exists(parts("/a/b/c/d")));
    EXPECT_FALSE(tree.exists(parts("/a/c")));
}

TEST(Tree, ParentMayGetItsValueLater)
{
    Tree tree = tree_of({"/a/b", "/a"});
    EXPECT_THAT(tree.value(parts("/a")), Pointee(text("/a")));
    EXPECT_THAT(tree.value(parts("/a/b")), Pointee(text("/a/b")));
    EXPECT_EQ(tree.size(), 2U);
}

TEST(Tree, RootMayHoldAValue)
{
    Tree tree = tree_of({"/", "/a"});
    EXPECT_THAT(tree.value({}), Pointee(text("/")));
    EXPECT_THAT(visited(tree), ElementsAre("/", "/a"));
    EXPECT_TRUE(tree.erase(parts("/a")));
    EXPECT_THAT(tree.value({}), Pointee(text("/")));
    EXPECT_EQ(tree.size(), 1U);
}

TEST(Tree, KeepsComponentsWithSlashesApart)
{
    const Tree tree = tree_of({R"(/route/10.0.0.0\/8/nhop)", "/route/10.0.0.0/8"});
    EXPECT_THAT(tree.children(parts("/route")), ElementsAre("10.0.0.0", "10.0.0.0/8"));
    EXPECT_TRUE(tree.exists(Parts{"route", "10.0.0.0/8", "nhop"}));
    EXPECT_THAT(tree.matching(pattern("/route/*")),
                ElementsAre("/route/10.0.0.0", R"(/route/10.0.0.0\/8)"));
    EXPECT_THAT(tree.matching(pattern(R"(/route/10.0.0.0\/8/*)")),
                ElementsAre(R"(/route/10.0.0.0\/8/nhop)"));
}

TEST(Tree, ListsChildrenInOrder)
{
    const Tree tree = tree_of({"/m/b", "/m/10", "/m/a", "/m/9", "/m/010", "/m/a10", "/m/a2", "/n"});
    EXPECT_THAT(tree.children(parts("/m")), ElementsAre("9", "10", "010", "a", "a10", "a2", "b"));
    EXPECT_THAT(tree.children({}), ElementsAre("m", "n"));
    EXPECT_THAT(tree.children(parts("/n")), IsEmpty());
}

TEST(Tree, ListsMatchingNodesWithOrWithoutValue)
{
    const Tree tree =
        tree_of({"/map/b/prio/10/name", "/map/b/prio/9/name", "/map/a/prio/1/name", "/map/c"});
    EXPECT_THAT(tree.matching(pattern("/map/*")), ElementsAre("/map/a", "/map/b", "/map/c"));
    EXPECT_THAT(tree.matching(pattern("/map/*/prio/*")),
                ElementsAre("/map/a/prio/1", "/map/b/prio/9", "/map/b/prio/10"));
    EXPECT_THAT(tree.matching(pattern("/map/b/prio/*/name")),
                ElementsAre("/map/b/prio/9/name", "/map/b/prio/10/name"));
    EXPECT_THAT(tree.matching(pattern("/map/b")), ElementsAre("/map/b"));
    EXPECT_THAT(tree.matching(pattern("/map/x/*")), IsEmpty());
    EXPECT_THAT(tree.matching(pattern("/*/*/*/*/*/*")), IsEmpty());
}

TEST(Tree, TellsALiteralStarFromTheWildcard)
{
    const Tree tree = tree_of({"/a/*", "/a/b"});
    EXPECT_THAT(tree.matching(pattern("/a/*")), ElementsAre(R"(/a/\*)", "/a/b"));
    EXPECT_THAT(tree.matching(pattern(R"(/a/\*)")), ElementsAre(R"(/a/\*)"));
}

TEST(Tree, VisitsParentsBeforeChildrenInOrder)
{
    const Tree tree = tree_of({"/b", "/a/10/x", "/a/9", "/a", "/a/9/y", "/c/d/e"});
    EXPECT_THAT(visited(tree), ElementsAre("/a", "/a/9", "/a/9/y", "/a/10/x", "/b", "/c/d/e"));
    EXPECT_THAT(visited(tree, "/a"), ElementsAre("/a", "/a/9", "/a/9/y", "/a/10/x"));
    EXPECT_THAT(visited(tree, "/c"), ElementsAre("/c/d/e"));
    EXPECT_THAT(visited(tree, "/x"), IsEmpty());
}

TEST(Tree, VisitorMayChangeTheTree)
{
    Tree tree = tree_of({"/a", "/b", "/c"});
    std::vector<std::string> names;
    tree.visit([&](Tree::Parts name, const Value &) {
        names.push_back(join_name(name));
        tree.erase(parts("/b"));
        tree.set(parts("/d"), text("new"));
    });
    EXPECT_THAT(names, ElementsAre("/a", "/b", "/c"));
    EXPECT_THAT(visited(tree), ElementsAre("/a", "/c", "/d"));
}

TEST(Tree, EraseTakesAllBelow)
{
    Tree tree = tree_of({"/a", "/a/b", "/a/b/c", "/d"});
    EXPECT_TRUE(tree.erase(parts("/a")));
    EXPECT_THAT(visited(tree), ElementsAre("/d"));
    EXPECT_EQ(tree.size(), 1U);
    EXPECT_FALSE(tree.exists(parts("/a")));
}

TEST(Tree, EraseTakesParentsThatAreLeftWithNothing)
{
    Tree tree = tree_of({"/a/b/c/d", "/a/x"});
    EXPECT_TRUE(tree.erase(parts("/a/b/c/d")));
    EXPECT_FALSE(tree.exists(parts("/a/b")));
    EXPECT_TRUE(tree.exists(parts("/a")));
    EXPECT_TRUE(tree.erase(parts("/a/x")));
    EXPECT_FALSE(tree.exists(parts("/a")));
    EXPECT_EQ(tree.size(), 0U);
}

TEST(Tree, EraseLeavesParentsWithAValueOrOtherChildren)
{
    Tree tree = tree_of({"/a/b", "/a/b/c/d", "/e/f", "/e/g"});
    EXPECT_TRUE(tree.erase(parts("/a/b/c/d")));
    EXPECT_TRUE(tree.exists(parts("/a/b")));
    EXPECT_FALSE(tree.exists(parts("/a/b/c")));
    EXPECT_TRUE(tree.erase(parts("/e/f")));
    EXPECT_THAT(visited(tree), ElementsAre("/a/b", "/e/g"));
}

TEST(Tree, EraseOfANodeWithoutValueTakesAllBelow)
{
    Tree tree = tree_of({"/a/b/c", "/a/b/d", "/e"});
    EXPECT_TRUE(tree.erase(parts("/a/b")));
    EXPECT_FALSE(tree.exists(parts("/a")));
    EXPECT_THAT(visited(tree), ElementsAre("/e"));
}

TEST(Tree, EraseOfWhatIsNotThereChangesNothing)
{
    Tree tree = tree_of({"/a/b"});
    EXPECT_FALSE(tree.erase(parts("/a/c")));
    EXPECT_FALSE(tree.erase(parts("/a/b/c")));
    EXPECT_FALSE(tree.erase(parts("/x/y/z")));
    EXPECT_THAT(visited(tree), ElementsAre("/a/b"));
    EXPECT_FALSE(Tree().erase(parts("/a")));
}

TEST(Tree, EraseOfTheRootEmptiesTheTree)
{
    Tree tree = tree_of({"/", "/a/b", "/c"});
    EXPECT_TRUE(tree.erase({}));
    EXPECT_EQ(tree.size(), 0U);
    EXPECT_THAT(tree.children({}), IsEmpty());
    EXPECT_FALSE(tree.erase({}));
}

TEST(Tree, RefusesWhatIsNoName)
{
    Tree tree;
    EXPECT_THROW(tree.set(Parts{"a", ""}, text("")), std::invalid_argument);
    EXPECT_THROW(tree.set(Parts{std::string("\0", 1)}, text("")), std::invalid_argument);
    EXPECT_THROW(tree.set(Parts(257, "x"), text("")), std::invalid_argument);
    EXPECT_EQ(tree.size(), 0U);
    tree.set(Parts(256, "x"), text("deep"));
    EXPECT_THAT(tree.value(Parts(256, "x")), Pointee(text("deep")));
}

TEST(Tree, CopiesAreSnapshots)
{
    Tree tree = tree_of({"/a/b", "/a/c", "/d"});
    const Tree snapshot = tree;
    tree.set(parts("/a/b"), text("changed"));
    tree.set(parts("/a/x/y"), text("new"));
    tree.erase(parts("/d"));
    EXPECT_THAT(visited(snapshot), ElementsAre("/a/b", "/a/c", "/d"));
    EXPECT_THAT(snapshot.value(parts("/a/b")), Pointee(text("/a/b")));
    EXPECT_EQ(snapshot.size(), 3U);
    EXPECT_THAT(visited(tree), ElementsAre("/a/b", "/a/c", "/a/x/y"));
    EXPECT_THAT(tree.value(parts("/a/b")), Pointee(text("changed")));
    EXPECT_EQ(tree.size(), 3U);
}

TEST(Tree, ValuesKeepTheirPlaceWhileOnlyOtherHandlesChange)
{
    const Tree tree = tree_of({"/a/b", "/a/c"});
    const Value *value = tree.value(parts("/a/b"));
    Tree other = tree;
    other.set(parts("/a/b"), text("changed"));
    other.erase(parts("/a"));
    EXPECT_EQ(tree.value(parts("/a/b")), value);
    EXPECT_EQ(*value, text("/a/b"));
}

TEST(Tree, HoldsManySiblingsAddedInAnyOrder)
{
    std::vector<int> numbers(5000);
    std::ranges::generate(numbers, [next = 0]() mutable { return next++; });
    std::vector<std::string> in_order;
    std::ranges::transform(numbers, std::back_inserter(in_order),
                           [](int number) { return std::to_string(number); });
    std::mt19937 random(3);
    for (int round = 0; round < 3; ++round) {
        Tree tree;
        for (const int number : numbers) {
            tree.set(Parts{"if", std::to_string(number)}, text("x"));
        }
        EXPECT_EQ(tree.children(Parts{"if"}), in_order);
        std::ranges::shuffle(numbers, random);
        for (const int number : numbers) {
            ASSERT_TRUE(tree.erase(Parts{"if", std::to_string(number)}));
        }
        EXPECT_EQ(tree.size(), 0U);
    }
}

// What follows checks the tree against a plain map over random runs. The map's order is the tree's,
// component by component.

struct TreeOrder {
    bool operator()(const Parts &left, const Parts &right) const
    {
        return std::ranges::lexicographical_compare(
            left, right, [](const std::string &one, const std::string &other) {
                return compare_components(one, other) < 0;
            });
    }
};

using Model = std::map<Parts, Value, TreeOrder>;

bool is_at_or_below(const Parts &name, const Parts &ancestor)
{
    return name.size() >= ancestor.size() &&
           std::equal(ancestor.begin(), ancestor.end(), name.begin());
}

/// Every node of the model, those included that only stand above others.
std::map<Parts, bool, TreeOrder> all_nodes(const Model &model)
{
    std::map<Parts, bool, TreeOrder> nodes = {{Parts{}, true}};
    for (const auto &[name, value] : model) {
        for (std::size_t length = 1; length <= name.size(); ++length) {
            nodes[Parts(name.begin(), name.begin() + static_cast<std::ptrdiff_t>(length))] = true;
        }
    }
    return nodes;
}

Parts random_name(std::mt19937 &random)
{
    static const std::vector<std::string> components = {"1", "2", "10", "02", "a", "b", "*", "x/y"};
    Parts name(random() % 5);
    for (std::string &part : name) {
        part = components[random() % components.size()];
    }
    return name;
}

void expect_same(const Tree &tree, const Model &model)
{
    std::vector<std::pair<Parts, Value>> found;
    tree.visit([&found](Tree::Parts name, const Value &value) {
        found.emplace_back(Parts(name.begin(), name.end()), value);
    });
    ASSERT_EQ(found, (std::vector<std::pair<Parts, Value>>(model.begin(), model.end())));
    ASSERT_EQ(tree.size(), model.size());
}

void expect_same_structure(const Tree &tree, const Model &model, const NamePattern &asked)
{
    std::map<Parts, std::vector<std::string>, TreeOrder> children;
    std::vector<std::string> matching;
    for (const auto &[name, exists] : all_nodes(model)) {
        ASSERT_TRUE(tree.exists(name)) << join_name(name);
        if (!name.empty()) {
            children[Parts(name.begin(), name.end() - 1)].push_back(name.back());
        }
        if (asked.matches(name)) {
            matching.push_back(join_name(name));
        }
    }
    for (const auto &[name, names] : children) {
        ASSERT_EQ(tree.children(name), names) << join_name(name);
    }
    ASSERT_EQ(tree.matching(asked), matching);
}

NamePattern random_pattern(std::mt19937 &random)
{
    std::string asked;
    for (const std::string &part : random_name(random)) {
        asked += '/';
        asked += random() % 2 == 0 ? "*" : escape_component(part);
    }
    return pattern(asked.empty() ? "/" : asked);
}

void change_both(Tree &tree, Model &model, std::mt19937 &random)
{
    const Parts name = random_name(random);
    if (random() % 4 != 0) {
        const Value value = {bt_uint32, std::to_string(random() % 3)};
        tree.set(name, value);
        model[name] = value;
        return;
    }
    const bool existed = name.empty() ? !model.empty() : all_nodes(model).contains(name);
    EXPECT_EQ(tree.erase(name), existed) << join_name(name);
    std::erase_if(model, [&name](const auto &node) { return is_at_or_below(node.first, name); });
}

TEST(TreeModel, AgreesWithAMapOverRandomRuns)
{
    for (unsigned seed = 0; seed < 20; ++seed) {
        std::mt19937 random(seed);
        Tree tree;
        Model model;
        std::vector<std::pair<Tree, Model>> snapshots;
        for (int step = 0; step < 200; ++step) {
            change_both(tree, model, random);
            const Parts asked = random_name(random);
            const auto held = model.find(asked);
            const Value *value = tree.value(asked);
            ASSERT_EQ(value != nullptr, held != model.end());
            ASSERT_TRUE(value == nullptr || *value == held->second);
            ASSERT_EQ(tree.exists(asked), all_nodes(model).contains(asked));
            if (step % 20 == 0) {
                snapshots.emplace_back(tree, model);
                expect_same_structure(tree, model, random_pattern(random));
            }
            if (step % 70 == 69) {
                std::tie(tree, model) = snapshots[random() % snapshots.size()];
            }
            expect_same(tree, model);
        }
        for (const auto &[snapshot, its_model] : snapshots) {
            expect_same(snapshot, its_model);
        }
    }
}

} // namespace
} // namespace ovhost
