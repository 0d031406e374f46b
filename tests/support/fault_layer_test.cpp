// The layer notices what tests of the library rely on it to notice. Functions of this file stand in
// for the library's.
#include "tests/support/fault_layer.h"

#include "tests/support/allocation_layer.h"
#include "tests/support/host_fixture.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <cstdlib>
#include <fstream>
#include <iterator>
#include <set>

using namespace ovtest;
using testing::ElementsAre;
using testing::IsEmpty;

namespace
{

class FaultLayer : public testing::Test
{
  protected:
    HostFixture host_;
};

tstring *new_string(const char *text)
{
    tstring *string = nullptr;
    return ts_new_str(&string, text) == 0 ? string : nullptr;
}

void free_string(tstring *string)
{
    ts_free(&string);
}

int take_over(tstr_array *array, tstring **string)
{
    return tstr_array_append_takeover(array, string);
}

TEST_F(FaultLayer, PassesCallsOnToTheHost)
{
    tstring *const string = in_library(new_string, "text");
    EXPECT_STREQ(ts_str_(string), "text");
    EXPECT_THAT(calls_of(Operation::ts_new_str), ElementsAre("ts_new_str(*, \"text\")"));
    in_library(free_string, string);
}

TEST_F(FaultLayer, KeepsAccountOfObjects)
{
    tstring *const string = in_library(new_string, "text");
    EXPECT_THAT(live_objects(), ElementsAre("tstring"));
    in_library(free_string, string);
    EXPECT_THAT(live_objects(), IsEmpty());
    EXPECT_THAT(misuses(), IsEmpty());
}

TEST_F(FaultLayer, AnObjectMayBeFreedByTheTest)
{
    tstring *string = in_library(new_string, "text");
    ts_free(&string);
    EXPECT_THAT(live_objects(), IsEmpty());
    EXPECT_THAT(misuses(), IsEmpty());
}

TEST_F(FaultLayer, AnObjectThatIsTakenOverIsNoLongerItsMakers)
{
    tstr_array *array = nullptr;
    ASSERT_EQ(tstr_array_new(&array, nullptr), 0);
    tstring *string = in_library(new_string, "text");
    EXPECT_EQ(in_library(take_over, array, &string), 0);
    EXPECT_EQ(string, nullptr);
    EXPECT_THAT(live_objects(), IsEmpty());
    tstr_array_free(&array);
}

TEST_F(FaultLayer, NoticesThatAForeignObjectIsFreed)
{
    in_library(free_string, new_string("the test's"));
    EXPECT_THAT(misuses(), ElementsAre("the library freed a foreign tstring"));
}

TEST_F(FaultLayer, NoticesThatANullStringIsAskedAbout)
{
    EXPECT_EQ(in_library(ts_str_, nullptr), nullptr);
    (void)in_library(ts_length_, nullptr);
    (void)in_library(ts_equal_str, nullptr, "text", true);
    (void)in_library(ts_cmp_str, nullptr, "text", false);
    EXPECT_THAT(misuses(), ElementsAre("the library asked ts_str_ about null",
                                       "the library asked ts_length_ about null",
                                       "the library asked ts_equal_str about null",
                                       "the library asked ts_cmp_str about null"));
}

TEST_F(FaultLayer, TheTestMayAskAboutANullString)
{
    EXPECT_EQ(ts_str_(nullptr), nullptr);
    tstring *const string = in_library(new_string, "text");
    EXPECT_FALSE(in_library(ts_equal_str, string, nullptr, true));
    in_library(free_string, string);
    EXPECT_THAT(misuses(), IsEmpty());
}

TEST_F(FaultLayer, CallsObjectsByTheirNames)
{
    tstr_array *array = nullptr;
    name_object(host_.db(), "db");
    (void)in_library(mdb_get_tstr_array, nullptr, host_.db(), "/ov", 0U, 0U, 0U, &array);
    EXPECT_THAT(calls_of(Operation::mdb_get_tstr_array),
                ElementsAre("mdb_get_tstr_array(null, db, \"/ov\", 0, 0, 0, *)"));
    tstr_array_free(&array);
}

TEST_F(FaultLayer, KeepsOperationsInTheirOrder)
{
    in_library(free_string, in_library(new_string, "1"));
    in_library(free_string, in_library(new_string, "2"));
    EXPECT_THAT(operations_called(), ElementsAre("ts_new_str", "ts_free", "ts_new_str", "ts_free"));
    forget_calls();
    EXPECT_THAT(operations_called(), IsEmpty());
}

TEST_F(FaultLayer, MakesTheNthCallFail)
{
    arm({.operation = Operation::ts_new_str, .call = 2});
    tstring *const first = in_library(new_string, "1");
    EXPECT_FALSE(fault_struck());
    EXPECT_EQ(in_library(new_string, "2"), nullptr);
    EXPECT_TRUE(fault_struck());
    tstring *const third = in_library(new_string, "3");
    EXPECT_NE(first, nullptr);
    EXPECT_NE(third, nullptr);
    in_library(free_string, first);
    in_library(free_string, third);
}

TEST_F(FaultLayer, MakesLaterCallsFailToo)
{
    arm({.operation = Operation::ts_new_str, .call = 2, .and_later = true});
    tstring *const first = in_library(new_string, "1");
    EXPECT_EQ(in_library(new_string, "2"), nullptr);
    EXPECT_EQ(in_library(new_string, "3"), nullptr);
    disarm();
    tstring *const fourth = in_library(new_string, "4");
    EXPECT_NE(fourth, nullptr);
    in_library(free_string, first);
    in_library(free_string, fourth);
}

TEST_F(FaultLayer, LeavesTheTestsOwnCallsAlone)
{
    arm({.operation = Operation::ts_new_str, .and_later = true});
    tstring *string = new_string("the test's");
    EXPECT_NE(string, nullptr);
    EXPECT_EQ(num_calls(Operation::ts_new_str), 0U);
    EXPECT_THAT(live_objects(), IsEmpty());
    ts_free(&string);
}

// The host may build one operation on another.
TEST_F(FaultLayer, LeavesTheHostsOwnCallsAlone)
{
    arm({.operation = Operation::ts_cmp_str, .and_later = true});
    tstring *string = new_string("text");
    EXPECT_TRUE(in_library(ts_equal_str, string, "text", true));
    EXPECT_EQ(num_calls(Operation::ts_equal_str), 1U);
    EXPECT_EQ(num_calls(Operation::ts_cmp_str), 0U);
    ts_free(&string);
}

int ask_for_name(const char **ret)
{
    *ret = get_config_name();
    return conf_file_okay("/opt/orvale/good") ? 1 : 0;
}

TEST_F(FaultLayer, FailsByTheKindOfTheOperation)
{
    write_file("/opt/orvale/good", "");
    const char *name = "";
    arm({.operation = Operation::conf_file_okay});
    EXPECT_EQ(in_library(ask_for_name, &name), 0);
    disarm();
    EXPECT_EQ(in_library(ask_for_name, &name), 1);
    arm({.operation = Operation::get_config_name});
    name = "";
    (void)in_library(ask_for_name, &name);
    EXPECT_EQ(name, nullptr);
}

TEST_F(FaultLayer, HandsOutNothing)
{
    host_.set("/a", bt_string, "x");
    bn_binding *binding = reinterpret_cast<bn_binding *>(&host_);
    arm({.operation = Operation::mdb_get_node_binding, .way = FaultWay::without_object});
    EXPECT_EQ(in_library(mdb_get_node_binding, nullptr, host_.db(), "/a", 0U, &binding), 0);
    EXPECT_EQ(binding, nullptr);
}

int format_everything(md_commit *commit, mdb_db *db, char **ret)
{
    *ret = smprintf("%s-%d", "text", 1);
    (void)md_commit_set_return_status_msg_fmt(commit, 1, "refused: %s", "why");
    return mdb_set_node_str(commit, db, bsso_modify, 0, bt_uint32, "7", "/a/%d", 5);
}

TEST_F(FaultLayer, FormatsBeforeItPassesOn)
{
    host_.db()->writable = true;
    char *text = nullptr;
    EXPECT_EQ(in_library(format_everything, &host_.commit(), host_.db(), &text), 0);
    EXPECT_EQ(taken(text), "text-1");
    EXPECT_THAT(host_.commit().refusals, ElementsAre("1 refused: why"));
    EXPECT_THAT(calls_of(Operation::mdb_set_node_str),
                ElementsAre("mdb_set_node_str(*, *, 4, 0, 5, \"7\", \"%s\", \"/a/5\")"));
}

uint32 ask_for_bound()
{
    return get_max_tunnel_number();
}

TEST_F(FaultLayer, PlantsAnswers)
{
    planted().tunnel_bounds = {5, 7};
    EXPECT_EQ(in_library(ask_for_bound), 5U);
    EXPECT_EQ(in_library(ask_for_bound), 7U);
    EXPECT_EQ(get_max_tunnel_number(), 7U);
    EXPECT_EQ(num_calls(Operation::get_max_tunnel_number), 2U);
    planted().ms_since_boot = 11;
    EXPECT_EQ(sys_time_since_boot_ms(), 11U);
    planted().without_time_info = true;
    ctime_init();
    EXPECT_EQ(time_info_ptr, nullptr);
    reset_fault_layer();
    ctime_init();
    EXPECT_NE(time_info_ptr, nullptr);
}

TEST_F(FaultLayer, PlantsTheModelsNumbersOfEntries)
{
    planted().max_entries = {{Operation::get_max_rmap_entries, 3},
                             {Operation::get_max_dns_proxy_map_entries, 0}};
    EXPECT_EQ(in_library(get_max_rmap_entries), 3U);
    EXPECT_EQ(in_library(get_max_dns_proxy_map_entries), 0U);
    EXPECT_GT(in_library(get_max_omap_entries), 3U);
}

TEST_F(FaultLayer, PlantsTheKernelsInterfacesAndASubnetOfAll)
{
    EXPECT_GT(in_library(ovif_get_ifcount), 0);
    planted().kernel_interfaces = -5;
    EXPECT_EQ(in_library(ovif_get_ifcount), -5);
    const auto same_subnet = [] {
        return in_library(mgmt_is_same_subnet_using_masklen, "any", "other", uint8{24}, uint8{24});
    };
    EXPECT_FALSE(same_subnet());
    planted().one_subnet = true;
    EXPECT_TRUE(same_subnet());
}

TEST_F(FaultLayer, PlantsTheModelsName)
{
    planted().config_name = "";
    EXPECT_STREQ(in_library(get_config_name), "");
}

TEST_F(FaultLayer, PlantsNamesThatMatch)
{
    tstr_array *found = nullptr;
    planted().matching_names = {"/a", "/b/c"};
    EXPECT_EQ(in_library(mdb_get_matching_tstr_array, nullptr, host_.db(), "/none", 0U, &found), 0);
    EXPECT_EQ(taken(found), "[/a, /b/c]");
    tstr_array *parts = nullptr;
    ASSERT_EQ(bn_binding_name_to_parts("/a/b", &parts, false), 0);
    EXPECT_FALSE(in_library(bn_binding_name_parts_pattern_match, parts, true, "/other"));
    planted().every_name_matches = true;
    EXPECT_TRUE(in_library(bn_binding_name_parts_pattern_match, parts, true, "/other"));
    tstr_array_free(&parts);
}

TEST_F(FaultLayer, PlantsTheRefusalOfAMatchString)
{
    tstr_array *keys = nullptr;
    tstr_array *values = nullptr;
    char *reason = nullptr;
    planted().match_string_reason = "why not";
    EXPECT_EQ(in_library(ov_acl_validate_matchstr, "dscp:ef", &keys, &values, &reason), 14012);
    EXPECT_EQ(taken(keys), "[dscp]");
    EXPECT_EQ(taken(values), "[ef]");
    EXPECT_EQ(taken(reason), "why not");
}

TEST_F(FaultLayer, PlantsANullTextInAList)
{
    tstr_array *array = nullptr;
    ASSERT_EQ(tstr_array_new(&array, nullptr), 0);
    ASSERT_EQ(tstr_array_append_str(array, "text"), 0);
    planted().null_text_at_call = 2;
    EXPECT_STREQ(in_library(tstr_array_get_str_quick, array, 0U), "text");
    EXPECT_STREQ(tstr_array_get_str_quick(array, 0), "text");
    EXPECT_EQ(in_library(tstr_array_get_str_quick, array, 0U), nullptr);
    EXPECT_STREQ(in_library(tstr_array_get_str_quick, array, 0U), "text");
    tstr_array_free(&array);
}

TEST_F(FaultLayer, ForgetsCallsButNoObjects)
{
    tstring *string = in_library(new_string, "text");
    forget_calls();
    EXPECT_THAT(calls_of(Operation::ts_new_str), IsEmpty());
    EXPECT_THAT(live_objects(), ElementsAre("tstring"));
    ts_free(&string);
}

int log_two_lines(const char *text)
{
    (void)lc_log_internal("f", "unit", 12, 2048, 0, 3, "said %s", text);
    ov_log_internal(5, nullptr, 0, "also %s", text);
    return 0;
}

int log_a_trace()
{
    return lc_log_internal("f", "unit", 12, 2048, 0, 7, "smprintf=%s", "/ov");
}

TEST_F(FaultLayer, RecordsTraces)
{
    (void)in_library(log_a_trace);
    EXPECT_THAT(log_lines(),
                ElementsAre("lc_log_internal(\"f\", \"unit\", LINE, 2048, 0, 7): smprintf=/ov"));
    EXPECT_THAT(log_lines(), ElementsAre(debug_line("unit", "f", "smprintf=/ov")));
}

TEST_F(FaultLayer, RecordsLogLines)
{
    (void)in_library(log_two_lines, "so");
    EXPECT_THAT(log_lines(),
                ElementsAre("lc_log_internal(\"f\", \"unit\", LINE, 2048, 0, 3): said so",
                            "ov_log_internal(5, null, 0): also so"));
    EXPECT_THAT(log_lines(),
                ElementsAre(error_line("unit", "f", "said so"), gated_line(5, "also so")));
}

#if OVTEST_ALLOCATION_LAYER
// Volatile: a compiler that sees malloc and free of an unused block leaves both out.
void *(*volatile allocate)(std::size_t) = std::malloc;
void (*volatile release)(void *) = std::free;

TEST_F(FaultLayer, KeepsAccountOfMemory)
{
    void *const block = in_library(allocate, 10U);
    EXPECT_EQ(live_allocations(), 1U);
    in_library(release, block);
    EXPECT_EQ(live_allocations(), 0U);
}

TEST_F(FaultLayer, ATextOfTheHostIsMemoryToo)
{
    char *text = nullptr;
    host_.db()->writable = true;
    (void)in_library(format_everything, &host_.commit(), host_.db(), &text);
    EXPECT_EQ(live_allocations(), 1U);
    EXPECT_EQ(taken(text), "text-1");
    EXPECT_EQ(live_allocations(), 0U);
}

TEST_F(FaultLayer, MemoryRunsOut)
{
    arm({.operation = Operation::allocation, .call = 1});
    EXPECT_EQ(in_library(allocate, 10U), nullptr);
    EXPECT_TRUE(fault_struck());
    void *const block = in_library(allocate, 10U);
    EXPECT_NE(block, nullptr);
    in_library(release, block);
}

TEST_F(FaultLayer, TheHostsMemoryDoesNotRunOut)
{
    arm({.operation = Operation::allocation, .and_later = true});
    tstring *const string = in_library(new_string, "a text that is too long for its object");
    EXPECT_NE(string, nullptr);
    in_library(free_string, string);
    EXPECT_EQ(num_calls(Operation::allocation), 0U);
}
#endif

TEST(HostOperations, AreThoseOfTheHostsInterface)
{
    std::ifstream file(OVTEST_HOST_OPERATIONS_FILE);
    std::set<std::string> listed{std::istream_iterator<std::string>(file), {}};
    ASSERT_FALSE(listed.empty()) << OVTEST_HOST_OPERATIONS_FILE;
    for (const char *variable : {"G_daemon_log_level", "G_log_level", "g_ovif_skfd",
                                 "ov_log_module_levels", "ov_system_info", "time_info_ptr"}) {
        EXPECT_EQ(listed.erase(variable), 1U) << variable;
    }
    std::set<std::string> in_table;
    for (const OperationRow &row : operation_rows) {
        in_table.insert(row.name);
    }
    in_table.erase("allocation");
    EXPECT_EQ(in_table, listed);
}

} // namespace
