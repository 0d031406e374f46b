#include "framework/mdb_db.h"

#include "host/framework/objects.h"
#include "host/tree/name.h"
#include "tests/framework/allocation_failure.h"
#include "tests/framework/log_capture.h"
#include "tests/framework/owned.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <cwchar>
#include <string>

namespace ovhost::test
{
namespace
{

using testing::ElementsAre;
using testing::HasSubstr;
using testing::IsEmpty;

class MdbDb : public testing::Test
{
  protected:
    MdbDb()
    {
        put("/ov/route/1", {bt_string, "one"});
        put("/ov/route/10", {bt_uint32, "10"});
        put("/ov/route/9/gw", {bt_ipv4addr, "192.0.2.9"});
        put("/ov/route/10.0.0.0\\/8", {bt_string, "prefix"});
        put("/ov/name", {bt_none, ""});
        db.writable = true;
    }

    void put(const char *name, Value value)
    {
        db.tree.set(split_name(name).value(), std::move(value));
    }

    [[nodiscard]] const Value *value_of(const char *name) const
    {
        return db.tree.value(split_name(name).value());
    }

    int set(int op, bn_type type, const char *value, const char *name)
    {
        return mdb_set_node_str(nullptr, &db, op, 0, type, value, "%s", name);
    }

    mdb_db db;
};

TEST_F(MdbDb, ValueOfANode)
{
    OwnedString value;
    ASSERT_EQ(mdb_get_node_value_tstr(nullptr, &db, "/ov/route/10", 0, nullptr, value.out()), 0);
    EXPECT_STREQ(ts_str(value.get()), "10");
    ASSERT_EQ(mdb_get_node_value_tstr(nullptr, &db, "/ov/name", 0, nullptr, value.out()), 0);
    EXPECT_STREQ(ts_str(value.get()), "");
}

TEST_F(MdbDb, ValueOfAnAbsentNodeIsNull)
{
    OwnedString value;
    // The second is only the parent of others.
    for (const char *name : {"/ov/none", "/ov/route", "/"}) {
        EXPECT_EQ(mdb_get_node_value_tstr(nullptr, &db, name, 0, nullptr, value.out()), 0);
        EXPECT_EQ(value.get(), nullptr) << name;
    }
}

TEST_F(MdbDb, BindingOfANode)
{
    OwnedBinding binding;
    ASSERT_EQ(mdb_get_node_binding(nullptr, &db, "/ov/route/10.0.0.0\\/8", 0, binding.out()), 0);
    OwnedText text;
    ASSERT_EQ(bn_binding_get_str(binding.get(), ba_value, bt_string, 0, text.out()), 0);
    EXPECT_STREQ(text.get(), "prefix");
    EXPECT_EQ(binding.get()->name, "/ov/route/10.0.0.0\\/8");
    ASSERT_EQ(mdb_get_node_binding(nullptr, &db, "/ov/route/10", 0, binding.out()), 0);
    uint32 number = 0;
    ASSERT_EQ(bn_binding_get_uint32(binding.get(), ba_value, 0, &number), 0);
    EXPECT_EQ(number, 10U);
}

TEST_F(MdbDb, BindingOfAnAbsentNodeIsNull)
{
    OwnedBinding binding;
    for (const char *name : {"/ov/none", "/ov/route"}) {
        EXPECT_EQ(mdb_get_node_binding(nullptr, &db, name, 0, binding.out()), 0);
        EXPECT_EQ(binding.get(), nullptr) << name;
    }
}

TEST_F(MdbDb, ChildrenComeUnescapedWithNumbersFirst)
{
    OwnedStrings names;
    ASSERT_EQ(mdb_get_tstr_array(nullptr, &db, "/ov/route", 0, 0, 0, names.out()), 0);
    EXPECT_THAT(texts_of(names), ElementsAre("1", "9", "10", "10.0.0.0/8"));
    ASSERT_EQ(mdb_get_tstr_array(nullptr, &db, "/", 0, 0, 0, names.out()), 0);
    EXPECT_THAT(texts_of(names), ElementsAre("ov"));
}

TEST_F(MdbDb, ChildrenOfANodeWithoutAny)
{
    OwnedStrings names;
    for (const char *parent : {"/ov/name", "/ov/none"}) {
        ASSERT_EQ(mdb_get_tstr_array(nullptr, &db, parent, 0, 0, 0, names.out()), 0);
        EXPECT_THAT(texts_of(names), IsEmpty());
    }
}

TEST_F(MdbDb, MatchingGivesFullNamesOfAllNodesThatExist)
{
    OwnedStrings names;
    for (const uint32 options : {512U, 4096U + 512U}) {
        ASSERT_EQ(mdb_get_matching_tstr_array(nullptr, &db, "/ov/route/*", options, names.out()),
                  0);
        EXPECT_THAT(texts_of(names), ElementsAre("/ov/route/1", "/ov/route/9", "/ov/route/10",
                                                 "/ov/route/10.0.0.0\\/8"));
    }
    ASSERT_EQ(mdb_get_matching_tstr_array(nullptr, &db, "/*/*/*/gw", 512, names.out()), 0);
    EXPECT_THAT(texts_of(names), ElementsAre("/ov/route/9/gw"));
    ASSERT_EQ(mdb_get_matching_tstr_array(nullptr, &db, "/ov/*/7", 512, names.out()), 0);
    EXPECT_THAT(texts_of(names), IsEmpty());
}

TEST_F(MdbDb, QueriesRefuseNull)
{
    OwnedString value;
    OwnedBinding binding;
    OwnedStrings names;
    EXPECT_EQ(mdb_get_node_value_tstr(nullptr, nullptr, "/a", 0, nullptr, value.out()), 14001);
    EXPECT_EQ(mdb_get_node_value_tstr(nullptr, &db, nullptr, 0, nullptr, value.out()), 14001);
    EXPECT_EQ(mdb_get_node_value_tstr(nullptr, &db, "/a", 0, nullptr, nullptr), 14001);
    EXPECT_EQ(mdb_get_node_binding(nullptr, nullptr, "/a", 0, binding.out()), 14001);
    EXPECT_EQ(mdb_get_node_binding(nullptr, &db, nullptr, 0, binding.out()), 14001);
    EXPECT_EQ(mdb_get_node_binding(nullptr, &db, "/a", 0, nullptr), 14001);
    EXPECT_EQ(mdb_get_tstr_array(nullptr, nullptr, "/a", 0, 0, 0, names.out()), 14001);
    EXPECT_EQ(mdb_get_tstr_array(nullptr, &db, nullptr, 0, 0, 0, names.out()), 14001);
    EXPECT_EQ(mdb_get_tstr_array(nullptr, &db, "/a", 0, 0, 0, nullptr), 14001);
    EXPECT_EQ(mdb_get_matching_tstr_array(nullptr, nullptr, "/a", 512, names.out()), 14001);
    EXPECT_EQ(mdb_get_matching_tstr_array(nullptr, &db, nullptr, 512, names.out()), 14001);
    EXPECT_EQ(mdb_get_matching_tstr_array(nullptr, &db, "/a", 512, nullptr), 14001);
}

TEST_F(MdbDb, QueriesRefuseWhatIsNoNodeName)
{
    OwnedString value;
    OwnedBinding binding;
    OwnedStrings names;
    EXPECT_EQ(mdb_get_node_value_tstr(nullptr, &db, "ov", 0, nullptr, value.out()), 14009);
    EXPECT_EQ(mdb_get_node_binding(nullptr, &db, "/ov/", 0, binding.out()), 14009);
    EXPECT_EQ(mdb_get_tstr_array(nullptr, &db, "", 0, 0, 0, names.out()), 14009);
    EXPECT_EQ(mdb_get_matching_tstr_array(nullptr, &db, "/ov//*", 512, names.out()), 14009);
}

TEST_F(MdbDb, SetWritesANodeWithTheParentsItLacks)
{
    ASSERT_EQ(mdb_set_node_str(nullptr, &db, bsso_create, 0, bt_uint16, "80", "/a/%s/%d", "b", 7),
              0);
    ASSERT_NE(value_of("/a/b/7"), nullptr);
    EXPECT_EQ(*value_of("/a/b/7"), (Value{bt_uint16, "80"}));
    EXPECT_EQ(value_of("/a/b"), nullptr);
}

TEST_F(MdbDb, SetReplacesAValue)
{
    for (const int op : {bsso_create, bsso_modify}) {
        put("/ov/x", {bt_string, "old"});
        ASSERT_EQ(set(op, bt_bool, "true", "/ov/x"), 0);
        EXPECT_EQ(*value_of("/ov/x"), (Value{bt_bool, "true"}));
    }
}

TEST_F(MdbDb, SetWithLongNamesAndEscapes)
{
    const std::string name = "/ov/" + std::string(2000, 'n') + "/a\\/b";
    ASSERT_EQ(set(bsso_modify, bt_string, "x", name.c_str()), 0);
    EXPECT_EQ(*value_of(name.c_str()), (Value{bt_string, "x"}));
}

TEST_F(MdbDb, DeleteRemovesEverythingBelowAndTakesNoValue)
{
    ASSERT_EQ(set(bsso_delete, bt_string, nullptr, "/ov/route"), 0);
    EXPECT_EQ(value_of("/ov/route/1"), nullptr);
    EXPECT_EQ(value_of("/ov/route/9/gw"), nullptr);
    EXPECT_NE(value_of("/ov/name"), nullptr);
}

TEST_F(MdbDb, DeleteOfAnAbsentNodeIsNoError)
{
    EXPECT_EQ(set(bsso_delete, bt_string, nullptr, "/ov/none"), 0);
    EXPECT_EQ(db.tree.size(), 5U);
}

TEST_F(MdbDb, SetRefusesWhatIsWrongAndWritesNothing)
{
    EXPECT_EQ(mdb_set_node_str(nullptr, nullptr, bsso_create, 0, bt_string, "x", "/a"), 14001);
    EXPECT_EQ(set(bsso_create, bt_string, nullptr, "/a"), 14001);
    EXPECT_EQ(set(bsso_modify, bt_string, nullptr, "/a"), 14001);
    const char *no_format = nullptr;
    EXPECT_EQ(mdb_set_node_str(nullptr, &db, bsso_create, 0, bt_string, "x", no_format, 1), 14001);
    for (const int op : {0, 3, 5, -1}) {
        EXPECT_EQ(set(op, bt_string, "x", "/a"), 14002);
    }
    for (const char *name : {"", "a", "/a/", "/a//b", "/"}) {
        EXPECT_EQ(set(bsso_create, bt_string, "x", name), 14009) << name;
        EXPECT_EQ(set(bsso_delete, bt_string, "x", name), 14009) << name;
    }
    EXPECT_EQ(set(bsso_create, bt_uint8, "256", "/a"), 14020);
    constexpr wint_t no_character = 0x7FFFFFFF;
    EXPECT_EQ(mdb_set_node_str(nullptr, &db, bsso_create, 0, bt_string, "x", "/%lc", no_character),
              14000);
    EXPECT_EQ(db.tree.size(), 5U);
    EXPECT_EQ(db.refused_writes, 0U);
}

TEST_F(MdbDb, WritesOutsideTheCheckingPhaseAreRefusedCountedAndLogged)
{
    LogCapture log;
    OwnedBinding binding;
    ASSERT_EQ(bn_binding_new_named(binding.out(), "/ov/b"), 0);
    db.writable = false;
    EXPECT_EQ(set(bsso_delete, bt_string, nullptr, "/ov/route"), 14002);
    EXPECT_EQ(mdb_set_node_binding(nullptr, &db, bsso_create, 0, binding.get()), 14002);
    EXPECT_EQ(db.refused_writes, 2U);
    EXPECT_EQ(db.tree.size(), 5U);
    ASSERT_EQ(log.lines.size(), 2U);
    EXPECT_EQ(log.lines[0].level, 3);
    EXPECT_THAT(log.lines[0].text, HasSubstr("/ov/route"));
    EXPECT_THAT(log.lines[1].text, HasSubstr("/ov/b"));
}

TEST_F(MdbDb, SetFromABinding)
{
    OwnedBinding binding;
    ASSERT_EQ(bn_binding_new_str(binding.out(), "/ov/new", ba_value, bt_ipaddr, 0, "::1"), 0);
    ASSERT_EQ(mdb_set_node_binding(nullptr, &db, bsso_modify, 0, binding.get()), 0);
    EXPECT_EQ(*value_of("/ov/new"), (Value{bt_ipaddr, "::1"}));
    ASSERT_EQ(mdb_set_node_binding(nullptr, &db, bsso_delete, 0, binding.get()), 0);
    EXPECT_EQ(value_of("/ov/new"), nullptr);
}

TEST_F(MdbDb, SetFromABindingWithoutAValueMakesANodeOfTypeNone)
{
    OwnedBinding binding;
    ASSERT_EQ(bn_binding_new_named(binding.out(), "/ov/new"), 0);
    ASSERT_EQ(mdb_set_node_binding(nullptr, &db, bsso_create, 0, binding.get()), 0);
    EXPECT_EQ(*value_of("/ov/new"), (Value{bt_none, ""}));
}

TEST_F(MdbDb, SetFromABindingRefusesWhatIsWrong)
{
    OwnedBinding binding;
    ASSERT_EQ(bn_binding_new_named(binding.out(), "/"), 0);
    EXPECT_EQ(mdb_set_node_binding(nullptr, &db, bsso_create, 0, nullptr), 14001);
    EXPECT_EQ(mdb_set_node_binding(nullptr, nullptr, bsso_create, 0, binding.get()), 14001);
    EXPECT_EQ(mdb_set_node_binding(nullptr, &db, bsso_create, 0, binding.get()), 14009);
    const bn_binding unfit = {"/a", {{{ba_value, {bt_bool, "maybe"}}}}};
    EXPECT_EQ(mdb_set_node_binding(nullptr, &db, bsso_create, 0, &unfit), 14020);
    EXPECT_EQ(mdb_set_node_binding(nullptr, &db, 3, 0, &unfit), 14002);
    EXPECT_EQ(db.tree.size(), 5U);
}

TEST_F(MdbDb, AWriteLeavesOtherHandlesAsTheyWere)
{
    const mdb_db before = db;
    ASSERT_EQ(set(bsso_modify, bt_string, "changed", "/ov/route/1"), 0);
    OwnedString value;
    ASSERT_EQ(mdb_get_node_value_tstr(nullptr, &before, "/ov/route/1", 0, nullptr, value.out()), 0);
    EXPECT_STREQ(ts_str(value.get()), "one");
}

TEST_F(MdbDb, ReportsLackOfMemory)
{
    const std::string name = "/ov/" + std::string(100, 'n');
    const std::string text(100, 'v');
    put(name.c_str(), {bt_string, text});
    OwnedString value;
    OwnedBinding binding;
    OwnedStrings names;
    expect_allocation_failures_reported([&] {
        return mdb_get_node_value_tstr(nullptr, &db, name.c_str(), 0, nullptr, value.out());
    });
    expect_allocation_failures_reported(
        [&] { return mdb_get_node_binding(nullptr, &db, name.c_str(), 0, binding.out()); });
    expect_allocation_failures_reported(
        [&] { return mdb_get_tstr_array(nullptr, &db, "/ov", 0, 0, 0, names.out()); });
    expect_allocation_failures_reported(
        [&] { return mdb_get_matching_tstr_array(nullptr, &db, "/ov/*", 512, names.out()); });
}

TEST_F(MdbDb, AWriteThatRunsOutOfMemoryWritesNothing)
{
    const std::string name = "/ov/" + std::string(100, 'n') + "/leaf";
    for (int nth = 0;; ++nth) {
        AllocationFailure failure(nth);
        const int status =
            set(bsso_create, bt_string, "some text of thirty-one bytes.", name.c_str());
        if (!failure.end()) {
            ASSERT_EQ(status, 0);
            EXPECT_NE(value_of(name.c_str()), nullptr);
            EXPECT_EQ(db.tree.size(), 6U);
            return;
        }
        ASSERT_EQ(status, 14000);
        EXPECT_EQ(value_of(name.c_str()), nullptr);
        EXPECT_EQ(db.tree.size(), 5U);
    }
}

TEST(MdbDbChangeArray, CountsAndHandsOutWithNullEntries)
{
    const auto free_change = [](mdb_db_change *change) { delete change; };
    mdb_db_change_array changes;
    EXPECT_EQ(mdb_db_change_array_length_quick(&changes), 0);
    changes.changes.emplace_back(new mdb_db_change{}, free_change);
    changes.changes.emplace_back(nullptr, free_change);
    EXPECT_EQ(mdb_db_change_array_length_quick(&changes), 2);
    EXPECT_EQ(mdb_db_change_array_get_quick(&changes, 0), changes.changes[0].get());
    EXPECT_EQ(mdb_db_change_array_get_quick(&changes, 1), nullptr);
}

} // namespace
} // namespace ovhost::test
