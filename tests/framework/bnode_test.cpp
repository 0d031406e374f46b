#include "framework/bnode.h"

#include "host/framework/objects.h"
#include "tests/framework/allocation_failure.h"
#include "tests/framework/owned.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <string>

namespace ovhost::test
{
namespace
{

using testing::ElementsAre;
using testing::IsEmpty;

TEST(BindingNew, HoldsNameTypeAndText)
{
    OwnedBinding binding;
    ASSERT_EQ(bn_binding_new_str(binding.out(), "/ov/a", ba_value, bt_string, 0, "text"), 0);
    EXPECT_EQ(binding.get()->name, "/ov/a");
    OwnedText text;
    ASSERT_EQ(bn_binding_get_str(binding.get(), ba_value, bt_string, 0, text.out()), 0);
    EXPECT_STREQ(text.get(), "text");
}

TEST(BindingNew, RefusesNull)
{
    OwnedBinding binding;
    EXPECT_EQ(bn_binding_new_str(nullptr, "/a", ba_value, bt_string, 0, "x"), 14001);
    EXPECT_EQ(bn_binding_new_str(binding.out(), nullptr, ba_value, bt_string, 0, "x"), 14001);
    EXPECT_EQ(bn_binding_new_str(binding.out(), "/a", ba_value, bt_string, 0, nullptr), 14001);
    EXPECT_EQ(bn_binding_new_named(nullptr, "/a"), 14001);
    EXPECT_EQ(bn_binding_new_named(binding.out(), nullptr), 14001);
    EXPECT_EQ(binding.get(), nullptr);
}

TEST(BindingNew, RefusesWhatIsNoNodeName)
{
    OwnedBinding binding;
    for (const char *name : {"", "a", "/a/", "/a//b", "/a\\b", "/a\\"}) {
        EXPECT_EQ(bn_binding_new_str(binding.out(), name, ba_value, bt_string, 0, "x"), 14009);
        EXPECT_EQ(bn_binding_new_named(binding.out(), name), 14009);
        EXPECT_EQ(binding.get(), nullptr);
    }
}

TEST(BindingNew, RefusesATextThatDoesNotFitTheType)
{
    OwnedBinding binding;
    EXPECT_EQ(bn_binding_new_str(binding.out(), "/a", ba_value, bt_uint32, 0, "-1"), 14020);
    EXPECT_EQ(bn_binding_new_str(binding.out(), "/a", ba_value, bt_bool, 0, "yes"), 14020);
    EXPECT_EQ(bn_binding_new_str(binding.out(), "/a", ba_value, 9999, 0, "x"), 14020);
    EXPECT_EQ(binding.get(), nullptr);
}

TEST(BindingNew, NamedHasNoAttribute)
{
    OwnedBinding binding;
    OwnedText text;
    uint32 number = 0;
    tbool flag = false;
    ASSERT_EQ(bn_binding_new_named(binding.out(), "/ov/a"), 0);
    EXPECT_EQ(bn_binding_get_str(binding.get(), ba_value, bt_string, 0, text.out()), 0);
    EXPECT_EQ(text.get(), nullptr);
    EXPECT_EQ(bn_binding_get_uint32(binding.get(), ba_value, 0, &number), 14004);
    EXPECT_EQ(bn_binding_get_tbool(binding.get(), ba_value, 0, &flag), 14004);
}

TEST(BindingFree, NullsAndIsSafeOnNull)
{
    bn_binding *binding = nullptr;
    ASSERT_EQ(bn_binding_new_named(&binding, "/a"), 0);
    bn_binding_free(&binding);
    EXPECT_EQ(binding, nullptr);
    bn_binding_free(&binding);
    bn_binding_free(nullptr);
}

TEST(BindingGetStr, IsStrictAboutTheType)
{
    OwnedBinding binding;
    OwnedText text;
    ASSERT_EQ(bn_binding_new_str(binding.out(), "/a", ba_value, bt_hostname, 0, "gate"), 0);
    EXPECT_EQ(bn_binding_get_str(binding.get(), ba_value, bt_string, 0, text.out()), 14020);
    EXPECT_EQ(text.get(), nullptr);
    EXPECT_EQ(bn_binding_get_str(binding.get(), ba_value, bt_hostname, 0, text.out()), 0);
    EXPECT_STREQ(text.get(), "gate");
    EXPECT_EQ(bn_binding_get_str(binding.get(), ba_value, bt_any, 0, text.out()), 0);
    EXPECT_STREQ(text.get(), "gate");
}

TEST(BindingGetStr, AttributesAreKeptApart)
{
    OwnedBinding binding;
    OwnedText text;
    ASSERT_EQ(bn_binding_new_str(binding.out(), "/a", 7, bt_string, 0, "seven"), 0);
    EXPECT_EQ(bn_binding_get_str(binding.get(), ba_value, bt_string, 0, text.out()), 0);
    EXPECT_EQ(text.get(), nullptr);
    EXPECT_EQ(bn_binding_get_str(binding.get(), 7, bt_string, 0, text.out()), 0);
    EXPECT_STREQ(text.get(), "seven");
}

TEST(BindingGetStr, RefusesNull)
{
    OwnedBinding binding;
    OwnedText text;
    ASSERT_EQ(bn_binding_new_named(binding.out(), "/a"), 0);
    EXPECT_EQ(bn_binding_get_str(nullptr, ba_value, bt_string, 0, text.out()), 14001);
    EXPECT_EQ(bn_binding_get_str(binding.get(), ba_value, bt_string, 0, nullptr), 14001);
}

TEST(BindingGetUint32, ReadsTheWholeRange)
{
    OwnedBinding binding;
    for (const auto &[text, expected] :
         {std::pair{"0", 0U}, {"007", 7U}, {"4294967295", 4294967295U}}) {
        uint32 number = 1;
        ASSERT_EQ(bn_binding_new_str(binding.out(), "/a", ba_value, bt_uint32, 0, text), 0);
        EXPECT_EQ(bn_binding_get_uint32(binding.get(), ba_value, 0, &number), 0);
        EXPECT_EQ(number, expected);
    }
}

TEST(BindingGetUint32, RefusesOtherTypesAndLeavesTheResultAlone)
{
    OwnedBinding binding;
    uint32 number = 4711;
    ASSERT_EQ(bn_binding_new_str(binding.out(), "/a", ba_value, bt_uint16, 0, "5"), 0);
    EXPECT_EQ(bn_binding_get_uint32(binding.get(), ba_value, 0, &number), 14020);
    EXPECT_EQ(bn_binding_get_uint32(binding.get(), 2, 0, &number), 14004);
    EXPECT_EQ(bn_binding_get_uint32(nullptr, ba_value, 0, &number), 14001);
    EXPECT_EQ(bn_binding_get_uint32(binding.get(), ba_value, 0, nullptr), 14001);
    EXPECT_EQ(number, 4711U);
}

TEST(BindingGetUint32, RefusesANumberThatTheTypeDoesNotHold)
{
    // The host itself can build such a binding; the library cannot.
    const bn_binding binding = {"/a", {{{ba_value, {bt_uint32, "4294967296"}}}}};
    uint32 number = 4711;
    EXPECT_EQ(bn_binding_get_uint32(&binding, ba_value, 0, &number), 14020);
    EXPECT_EQ(number, 4711U);
}

TEST(BindingGetTbool, ReadsBothValues)
{
    OwnedBinding binding;
    for (const auto &[text, expected] : {std::pair{"true", true}, {"false", false}}) {
        tbool flag = !expected;
        ASSERT_EQ(bn_binding_new_str(binding.out(), "/a", ba_value, bt_bool, 0, text), 0);
        EXPECT_EQ(bn_binding_get_tbool(binding.get(), ba_value, 0, &flag), 0);
        EXPECT_EQ(flag, expected);
    }
}

TEST(BindingGetTbool, RefusesOtherTypesAndLeavesTheResultAlone)
{
    OwnedBinding binding;
    tbool flag = true;
    ASSERT_EQ(bn_binding_new_str(binding.out(), "/a", ba_value, bt_string, 0, "false"), 0);
    EXPECT_EQ(bn_binding_get_tbool(binding.get(), ba_value, 0, &flag), 14020);
    EXPECT_EQ(bn_binding_get_tbool(binding.get(), 2, 0, &flag), 14004);
    EXPECT_EQ(bn_binding_get_tbool(nullptr, ba_value, 0, &flag), 14001);
    EXPECT_EQ(bn_binding_get_tbool(binding.get(), ba_value, 0, nullptr), 14001);
    EXPECT_TRUE(flag);
}

TEST(BindingNameToParts, ResolvesEscapes)
{
    OwnedStrings parts;
    ASSERT_EQ(bn_binding_name_to_parts("/route/10.0.0.0\\/8/back\\\\slash", parts.out(), false), 0);
    EXPECT_THAT(texts_of(parts), ElementsAre("route", "10.0.0.0/8", "back\\slash"));
}

TEST(BindingNameToParts, OfTheRootAreNone)
{
    OwnedStrings parts;
    ASSERT_EQ(bn_binding_name_to_parts("/", parts.out(), false), 0);
    EXPECT_THAT(texts_of(parts), IsEmpty());
}

TEST(BindingNameToParts, RefusesNullAndWhatIsNoName)
{
    OwnedStrings parts;
    EXPECT_EQ(bn_binding_name_to_parts(nullptr, parts.out(), false), 14001);
    EXPECT_EQ(bn_binding_name_to_parts("/a", nullptr, false), 14001);
    EXPECT_EQ(bn_binding_name_to_parts("a/b", parts.out(), false), 14009);
    EXPECT_EQ(parts.get(), nullptr);
}

struct PatternCase {
    const char *name;
    const char *pattern;
    bool matches;
};

constexpr PatternCase pattern_cases[] = {
    {"/ov/map/m1/prio/10", "/ov/map/*/prio/*", true},
    {"/ov/map/m1/prio", "/ov/map/*/prio/*", false},
    {"/ov/map/m1/prio/10/match", "/ov/map/*/prio/*", false},
    {"/ov/map/a\\/b/prio/10", "/ov/map/*/prio/*", true},
    {"/ov/map/a/b/prio/10", "/ov/map/*/prio/*", false},
    {"/ov/map", "/ov/map", true},
    {"/ov/Map", "/ov/map", false},
    {"/ov/m\\/p", "/ov/m\\/p", true},
    {"/ov/m1", "/ov/m*", false},
    {"/ov/m*", "/ov/m*", true},
    {"/a", "/*", true},
    {"a", "*", false},
    {"/a/", "/*", false},
    {"/a", "/*/", false},
};

TEST(BindingNamePatternMatch, MatchesComponentByComponent)
{
    for (const PatternCase &row : pattern_cases) {
        EXPECT_EQ(bn_binding_name_pattern_match(row.name, row.pattern), row.matches)
            << row.name << " and " << row.pattern;
    }
}

TEST(BindingNamePatternMatch, OfPartsIsTheSame)
{
    for (const PatternCase &row : pattern_cases) {
        OwnedStrings parts;
        if (bn_binding_name_to_parts(row.name, parts.out(), false) == 0) {
            EXPECT_EQ(bn_binding_name_parts_pattern_match(parts.get(), true, row.pattern),
                      row.matches)
                << row.name << " and " << row.pattern;
        }
    }
}

TEST(BindingNamePatternMatch, IsFalseForNull)
{
    OwnedStrings parts;
    ASSERT_EQ(bn_binding_name_to_parts("/a", parts.out(), false), 0);
    EXPECT_FALSE(bn_binding_name_pattern_match(nullptr, "/a"));
    EXPECT_FALSE(bn_binding_name_pattern_match("/a", nullptr));
    EXPECT_FALSE(bn_binding_name_parts_pattern_match(nullptr, true, "/a"));
    EXPECT_FALSE(bn_binding_name_parts_pattern_match(parts.get(), true, nullptr));
}

TEST(AttribArray, GivesTheTextOfAnAttribute)
{
    const bn_attrib_array attribs = {{{ba_value, {bt_uint32, "42"}}}};
    OwnedString text;
    ASSERT_EQ(bn_attrib_array_get_attrib_tstr(&attribs, ba_value, text.out()), 0);
    EXPECT_STREQ(ts_str(text.get()), "42");
}

TEST(AttribArray, GivesNullForAnAbsentAttributeAndOfNoArray)
{
    const bn_attrib_array attribs = {{{ba_value, {bt_uint32, "42"}}}};
    OwnedString text;
    EXPECT_EQ(bn_attrib_array_get_attrib_tstr(&attribs, 2, text.out()), 0);
    EXPECT_EQ(text.get(), nullptr);
    EXPECT_EQ(bn_attrib_array_get_attrib_tstr(nullptr, ba_value, text.out()), 0);
    EXPECT_EQ(text.get(), nullptr);
    EXPECT_EQ(bn_attrib_array_get_attrib_tstr(&attribs, ba_value, nullptr), 14001);
}

TEST(Binding, ReportsLackOfMemory)
{
    const std::string name = "/ov/" + std::string(100, 'n');
    const std::string value(100, 'v');
    OwnedBinding binding;
    OwnedStrings parts;
    OwnedString text;
    expect_allocation_failures_reported([&] {
        return bn_binding_new_str(binding.out(), name.c_str(), ba_value, bt_string, 0,
                                  value.c_str());
    });
    expect_allocation_failures_reported(
        [&] { return bn_binding_new_named(binding.out(), name.c_str()); });
    expect_allocation_failures_reported(
        [&] { return bn_binding_name_to_parts(name.c_str(), parts.out(), false); });
    const bn_attrib_array attribs = {{{ba_value, {bt_string, value}}}};
    expect_allocation_failures_reported(
        [&] { return bn_attrib_array_get_attrib_tstr(&attribs, ba_value, text.out()); });
}

TEST(Binding, MatchIsFalseWithoutMemory)
{
    const std::string name = "/ov/" + std::string(100, 'n');
    AllocationFailure failure(0);
    EXPECT_FALSE(bn_binding_name_pattern_match(name.c_str(), "/ov/*"));
}

} // namespace
} // namespace ovhost::test
