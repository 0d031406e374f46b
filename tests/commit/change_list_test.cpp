#include "host/commit/change_list.h"

#include "tests/commit/support.h"

#include <gmock/gmock.h>

using commit_test::described;
using commit_test::tree_of;
using ovhost::ChangeList;
using ovhost::ChangeListUpdate;
using ovhost::diff;
using testing::ElementsAre;
using testing::IsEmpty;

namespace
{

using Names = std::vector<std::vector<std::string>>;

std::optional<std::string> value_in(const bn_attrib_array *attribs)
{
    tstring *text = nullptr;
    EXPECT_EQ(bn_attrib_array_get_attrib_tstr(attribs, ba_value, &text), 0);
    if (text == nullptr) {
        return std::nullopt;
    }
    std::string copy = ts_str(text);
    ts_free(&text);
    return copy;
}

TEST(ChangeListTest, RecordsHaveNamePartsKindAndBothValues)
{
    ChangeList list;
    (void)list.replace(diff(tree_of({{"/m/1\\/2", "old"}, {"/x", "gone"}}),
                            tree_of({{"/m/1\\/2", "new"}, {"/n/k", "added"}})));
    ASSERT_EQ(mdb_db_change_array_length_quick(list.array()), 3);
    EXPECT_THAT(described(list.array()), ElementsAre("modify /m/1\\/2", "add /n/k", "delete /x"));

    const mdb_db_change *modified = mdb_db_change_array_get_quick(list.array(), 0);
    ASSERT_EQ(tstr_array_length_quick(modified->mdc_name_parts), 2);
    EXPECT_STREQ(tstr_array_get_str_quick(modified->mdc_name_parts, 0), "m");
    EXPECT_STREQ(tstr_array_get_str_quick(modified->mdc_name_parts, 1), "1/2");
    EXPECT_EQ(value_in(modified->mdc_old_attribs), "old");
    EXPECT_EQ(value_in(modified->mdc_new_attribs), "new");
    EXPECT_FALSE(modified->mdc_no_notify);

    const mdb_db_change *added = mdb_db_change_array_get_quick(list.array(), 1);
    EXPECT_EQ(added->mdc_old_attribs, nullptr);
    EXPECT_EQ(value_in(added->mdc_new_attribs), "added");

    const mdb_db_change *deleted = mdb_db_change_array_get_quick(list.array(), 2);
    EXPECT_EQ(value_in(deleted->mdc_old_attribs), "gone");
    EXPECT_EQ(deleted->mdc_new_attribs, nullptr);
}

TEST(ChangeListTest, ParentsComeBeforeChildrenAlsoWhenDeleted)
{
    ChangeList list;
    (void)list.replace(diff(tree_of({{"/a", "1"}, {"/a/b", "2"}, {"/a/b/c", "3"}}), {}));
    EXPECT_THAT(described(list.array()), ElementsAre("delete /a", "delete /a/b", "delete /a/b/c"));
}

TEST(ChangeListTest, FirstListIsAllFresh)
{
    ChangeList list;
    const ChangeListUpdate update = list.replace(diff({}, tree_of({{"/a", "1"}, {"/b", "2"}})));
    EXPECT_THAT(update.fresh, ElementsAre(0U, 1U));
    EXPECT_THAT(update.withdrawn, IsEmpty());
    EXPECT_FALSE(update.empty());
}

TEST(ChangeListTest, UpdateTellsNewChangedAndWithdrawn)
{
    const ovhost::Tree running = tree_of({{"/a", "0"}, {"/d", "0"}});
    ChangeList list;
    (void)list.replace(diff(running, tree_of({{"/a", "1"}, {"/b", "1"}, {"/c", "1"}})));
    // /a leads elsewhere, /b stays, /c and the deletion of /d are withdrawn, /e is new.
    const ChangeListUpdate update =
        list.replace(diff(running, tree_of({{"/a", "2"}, {"/b", "1"}, {"/d", "0"}, {"/e", "1"}})));
    EXPECT_THAT(described(list.array()), ElementsAre("modify /a", "add /b", "add /e"));
    EXPECT_THAT(update.fresh, ElementsAre(0U, 2U));
    EXPECT_THAT(update.withdrawn,
                testing::UnorderedElementsAre(Names::value_type{"c"}, Names::value_type{"d"}));
    EXPECT_EQ(list.name(2), "/e");
}

TEST(ChangeListTest, SameChangesAreNoUpdateAndKeepTheirRecords)
{
    const ovhost::Tree proposed = tree_of({{"/a", "1"}});
    ChangeList list;
    (void)list.replace(diff({}, proposed));
    mdb_db_change *record = list.record(0);
    record->mdc_no_notify = true;
    EXPECT_TRUE(list.replace(diff({}, proposed)).empty());
    EXPECT_EQ(list.record(0), record);
    EXPECT_TRUE(list.record(0)->mdc_no_notify);
}

} // namespace
