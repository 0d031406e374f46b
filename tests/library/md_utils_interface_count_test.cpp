// The interface budget: the part of md_utils that counts.
#include "orvale/md_utils.h"

#include "framework/appliance.h"
#include "tests/library/change_list.h"
#include "tests/library/library_test.h"

#include <algorithm>
#include <climits>
#include <limits>
#include <string>

#include <unistd.h>

using namespace ovtest;
using testing::ElementsAre;
using testing::IsEmpty;

namespace
{

constexpr char admission[] = "md_ifmgr_can_interface_be_added";
constexpr char vlan_root[] = "/ov/tunneld/net/interface/tunnel/vlan/config/";
constexpr char vlan_pattern[] = "/ov/tunneld/net/interface/tunnel/vlan/config/*";

void forget_count()
{
    md_ifmgr_ifcount_dec(md_ifmgr_get_ifcount());
}

// With the kernel's 10 interfaces, a model that allows 8, and none of them counted yet.
class InterfaceCount : public LibraryTest
{
  protected:
    void SetUp() override
    {
        forget_count();
        planted().kernel_interfaces = 10;
        ov_system_info = {.initialized = 1, .system_max_interfaces = 8};
        g_ovif_skfd = looks_open;
    }
    void TearDown() override
    {
        forget_count();
        g_ovif_skfd = -1;
        LibraryTest::TearDown();
    }

    static void start_from(int count)
    {
        forget_count();
        md_ifmgr_ifcount_inc(count);
    }
    static int count() { return in_library(md_ifmgr_get_ifcount); }

    static bool fits(ChangeList &changes, int multiplier = 1)
    {
        return in_library(md_ifmgr_can_interface_be_added, changes.get(), vlan_pattern, multiplier);
    }
    // So many VLANs more.
    static bool fits(int additions, int multiplier = 1)
    {
        ChangeList changes;
        for (int i = 1; i <= additions; ++i) {
            changes.add(mdct_add, vlan_root + std::to_string(i));
        }
        return fits(changes, multiplier);
    }

    // The lines at the default module level, 6.
    static std::string added_line(const std::string &node, int so_many)
    {
        return module_line(6, admission,
                           "Interfaces " + node + " being added. count=" + std::to_string(so_many));
    }
    static std::string summary_line(const std::string &numbers)
    {
        return module_line(5, admission, std::string(admission) + ": Interface " + numbers);
    }
    static std::string l3_refusal(int additions, int current)
    {
        return module_line(3, admission,
                           std::string(admission) + ": Adding " + std::to_string(additions) +
                               " interfaces to current l3 ifs:" + std::to_string(current) +
                               " exceeds max");
    }
    static std::string index_refusal(int additions, int current)
    {
        return module_line(3, admission,
                           std::string(admission) + ": Adding " + std::to_string(additions) +
                               " interfaces to current ifindicies:" + std::to_string(current) +
                               " exceeds max");
    }

    static constexpr int looks_open = 70'000; // beyond every descriptor of this process
};

TEST_F(InterfaceCount, FollowsWhatTheHostReports)
{
    EXPECT_EQ(count(), 0);
    in_library(md_ifmgr_ifcount_inc, 2);
    EXPECT_EQ(count(), 2);
    in_library(md_ifmgr_ifcount_inc, 3);
    EXPECT_EQ(count(), 5);
    in_library(md_ifmgr_ifcount_dec, 1);
    EXPECT_EQ(count(), 4);
    EXPECT_THAT(
        log_lines(),
        ElementsAre(module_line(6, "md_ifmgr_ifcount_inc",
                                "md_ifmgr_ifcount_inc: Incrementing interface count from 0 to 2"),
                    module_line(6, "md_ifmgr_ifcount_inc",
                                "md_ifmgr_ifcount_inc: Incrementing interface count from 2 to 5"),
                    module_line(6, "md_ifmgr_ifcount_dec",
                                "md_ifmgr_ifcount_dec: Decrementing interface count from 5 to 4")));
}

TEST_F(InterfaceCount, PassesBelowZero)
{
    start_from(2);
    in_library(md_ifmgr_ifcount_dec, 5);
    EXPECT_EQ(count(), -3);
    EXPECT_THAT(log_lines(),
                ElementsAre(module_line(
                    6, "md_ifmgr_ifcount_dec",
                    "md_ifmgr_ifcount_dec: Decrementing interface count from 2 to -3")));
    in_library(md_ifmgr_ifcount_inc, 4);
    EXPECT_EQ(count(), 1);
}

TEST_F(InterfaceCount, TakesNegativeAmounts)
{
    in_library(md_ifmgr_ifcount_inc, -4);
    EXPECT_EQ(count(), -4);
    in_library(md_ifmgr_ifcount_dec, -7);
    EXPECT_EQ(count(), 3);
    in_library(md_ifmgr_ifcount_inc, 0);
    EXPECT_EQ(count(), 3);
}

TEST_F(InterfaceCount, WrapsAtTheEndsOfItsType)
{
    start_from(INT_MAX);
    in_library(md_ifmgr_ifcount_inc, 1);
    EXPECT_EQ(count(), INT_MIN);
    EXPECT_EQ(last_log_line(),
              module_line(6, "md_ifmgr_ifcount_inc",
                          "md_ifmgr_ifcount_inc: Incrementing interface count from 2147483647 to "
                          "-2147483648"));
    in_library(md_ifmgr_ifcount_dec, 1);
    EXPECT_EQ(count(), INT_MAX);
    EXPECT_EQ(last_log_line(),
              module_line(6, "md_ifmgr_ifcount_dec",
                          "md_ifmgr_ifcount_dec: Decrementing interface count from -2147483648 to "
                          "2147483647"));
    start_from(0);
    in_library(md_ifmgr_ifcount_dec, INT_MIN);
    EXPECT_EQ(count(), INT_MIN);
    in_library(md_ifmgr_ifcount_inc, INT_MIN);
    EXPECT_EQ(count(), 0);
}

TEST_F(InterfaceCount, IsWhatItIsWhenNothingIsLogged)
{
    host_.set_log_level(-1);
    in_library(md_ifmgr_ifcount_inc, 9);
    in_library(md_ifmgr_ifcount_dec, 2);
    EXPECT_EQ(count(), 7);
    EXPECT_THAT(log_lines(), IsEmpty());
}

// Each line has the module's level, but at most that of its place, and is written when the
// threshold lets it pass.
class ModuleLevel : public InterfaceCount
{
  protected:
    static constexpr int thresholds[] = {-1, 0, 1, 2, 3, 4, 5, 6, 7, 255};

    static void expect_levels(const std::vector<int> &expected, const std::string &about)
    {
        std::vector<int> levels;
        for (const std::string &line : log_lines()) {
            const std::string begin = "ov_log_internal(";
            ASSERT_EQ(line.substr(0, begin.size()), begin);
            levels.push_back(std::stoi(line.substr(begin.size())));
        }
        EXPECT_EQ(levels, expected) << about;
    }

    // Runs the step under all module levels and thresholds; `caps` has those of its lines.
    template <typename Step>
    void expect_caps(const std::vector<int> &caps, Step step)
    {
        for (int module_level = 0; module_level <= 255; ++module_level) {
            for (const int threshold : thresholds) {
                ov_log_module_levels[ov_log_module_ovmd] = static_cast<unsigned char>(module_level);
                host_.set_log_level(threshold);
                std::vector<int> expected;
                for (const int cap : caps) {
                    const int level = module_level > cap ? cap : module_level;
                    if (level <= threshold) {
                        expected.push_back(level);
                    }
                }
                forget_calls();
                step();
                expect_levels(expected, "module level " + std::to_string(module_level) +
                                            ", threshold " + std::to_string(threshold));
            }
        }
    }
};

TEST_F(ModuleLevel, OfCountingIsAtMost6)
{
    expect_caps({6}, [] { in_library(md_ifmgr_ifcount_inc, 1); });
    expect_caps({6}, [] { in_library(md_ifmgr_ifcount_dec, 1); });
}

TEST_F(ModuleLevel, OfChangesIsAtMost7AndOfTheSummary5)
{
    expect_caps({7, 7, 5}, [] { EXPECT_TRUE(fits(2)); });
}

TEST_F(ModuleLevel, OfARefusalIsAtMost3)
{
    start_from(8);
    expect_caps({7, 5, 3}, [] { EXPECT_FALSE(fits(1)); });
    start_from(0);
    planted().kernel_interfaces = 127;
    expect_caps({7, 5, 3}, [] { EXPECT_FALSE(fits(1)); });
}

TEST_F(ModuleLevel, IsThatOfThisModuleAlone)
{
    for (unsigned module = 0; module < ov_log_module_ovmd; ++module) {
        ov_log_module_levels[module] = 0;
    }
    ov_log_module_levels[ov_log_module_ovmd] = 6;
    host_.set_log_level(5);
    in_library(md_ifmgr_ifcount_inc, 1);
    EXPECT_THAT(log_lines(), IsEmpty());
}

TEST_F(ModuleLevel, IsMeasuredAgainstTheDaemonsThreshold)
{
    ov_log_module_levels[ov_log_module_ovmd] = 3;
    G_log_level = 7;
    G_daemon_log_level = 2;
    in_library(md_ifmgr_ifcount_inc, 1);
    expect_levels({}, "daemon 2");
    G_daemon_log_level = 3;
    in_library(md_ifmgr_ifcount_inc, 1);
    expect_levels({3}, "daemon 3");
    forget_calls();
    G_log_level = 0;
    in_library(md_ifmgr_ifcount_inc, 1);
    expect_levels({3}, "daemon 3, host 0");
    forget_calls();
    G_daemon_log_level = -2;
    G_log_level = 7;
    in_library(md_ifmgr_ifcount_inc, 1);
    expect_levels({}, "daemon -2");
    G_daemon_log_level = -1;
    in_library(md_ifmgr_ifcount_inc, 1);
    expect_levels({3}, "host 7");
}

using Admission = InterfaceCount;

TEST_F(Admission, OfNothingIsGrantedWithoutAsking)
{
    g_ovif_skfd = -1;
    ov_system_info = {};
    EXPECT_TRUE(fits(0));
    EXPECT_EQ(num_calls(Operation::mdb_db_change_array_get_quick), 0U);
    EXPECT_EQ(num_calls(Operation::ovif_get_ifcount), 0U);
    EXPECT_THAT(log_lines(), IsEmpty());
}

TEST_F(Admission, CountsAddedNodesThatThePatternMatches)
{
    ChangeList changes;
    changes.add(mdct_modify, std::string(vlan_root) + "a");
    changes.add(mdct_add, std::string(vlan_root) + "b");
    changes.add_null();
    changes.add(mdct_add, std::string(vlan_root) + "b/tag");
    changes.add(mdct_delete, std::string(vlan_root) + "c");
    changes.add(mdct_add, "/ov/tunneld/net/interface/tunnel/vlan/config");
    changes.add(mdct_add, "/ov/tunneld/net/interface/tunnel/gre/config/d");
    changes.add(0, std::string(vlan_root) + "e");
    changes.add(4, std::string(vlan_root) + "f");
    changes.add(mdct_add, std::string(vlan_root) + "g\\/h");
    EXPECT_TRUE(fits(changes, 3));
    EXPECT_THAT(log_lines(),
                ElementsAre(added_line(std::string(vlan_root) + "b", 1),
                            added_line(std::string(vlan_root) + "g\\/h", 2),
                            summary_line("2 changes; cur l3:0 ifidx:10 mult:3 max:8")));
    EXPECT_EQ(num_calls(Operation::mdb_db_change_array_get_quick), 10U);
    EXPECT_EQ(num_calls(Operation::ovif_get_ifcount), 1U);
}

TEST_F(Admission, IsGrantedWithoutAskingWhenNothingIsAdded)
{
    g_ovif_skfd = -1;
    ov_system_info = {};
    start_from(1000);
    planted().kernel_interfaces = 1000;
    ChangeList changes;
    changes.add(mdct_modify, std::string(vlan_root) + "a");
    changes.add(mdct_delete, std::string(vlan_root) + "b");
    changes.add_null();
    EXPECT_TRUE(fits(changes));
    for (const Operation operation :
         {Operation::ovif_network_init_sockets, Operation::ovif_get_ifcount,
          Operation::init_model_info, Operation::ov_log_internal}) {
        EXPECT_EQ(num_calls(operation), 0U) << row_of(operation).name;
    }
    EXPECT_EQ(g_ovif_skfd, -1);
}

TEST_F(Admission, PassesOverChangesWithoutAName)
{
    ChangeList changes;
    changes.add_nameless(mdct_add);
    changes.add(mdct_add, std::string(vlan_root) + "b");
    EXPECT_TRUE(fits(changes));
    EXPECT_EQ(num_calls(Operation::bn_binding_name_pattern_match), 1U);
    EXPECT_THAT(log_lines(),
                ElementsAre(added_line(std::string(vlan_root) + "b", 1),
                            summary_line("1 changes; cur l3:0 ifidx:10 mult:1 max:8")));
    EXPECT_THAT(misuses(), IsEmpty());
}

TEST_F(Admission, OfNullEntriesAloneIsGranted)
{
    ChangeList changes;
    changes.add_null();
    changes.add_null();
    EXPECT_TRUE(fits(changes));
    EXPECT_EQ(num_calls(Operation::ovif_get_ifcount), 0U);
    EXPECT_EQ(num_calls(Operation::bn_binding_name_pattern_match), 0U);
}

TEST_F(Admission, LeavesTheCountAlone)
{
    start_from(3);
    EXPECT_TRUE(fits(5));
    EXPECT_FALSE(fits(6));
    EXPECT_EQ(count(), 3);
}

TEST_F(Admission, EndsWhereTheModelEnds)
{
    EXPECT_TRUE(fits(8));
    forget_calls();
    EXPECT_FALSE(fits(9));
    EXPECT_EQ(last_log_line(), l3_refusal(9, 0));
    EXPECT_EQ(log_line(9), summary_line("9 changes; cur l3:0 ifidx:10 mult:1 max:8"));

    start_from(5);
    EXPECT_TRUE(fits(3));
    EXPECT_FALSE(fits(4));
    EXPECT_EQ(last_log_line(), l3_refusal(4, 5));

    start_from(8);
    EXPECT_FALSE(fits(1));
    start_from(9);
    EXPECT_FALSE(fits(1));
    EXPECT_EQ(last_log_line(), l3_refusal(1, 9));
}

TEST_F(Admission, ComparesWithTheModelUnsigned)
{
    // 2^32 - 3 and one more.
    start_from(-3);
    EXPECT_FALSE(fits(1));
    EXPECT_EQ(last_log_line(), l3_refusal(1, -3));
    EXPECT_FALSE(fits(2));
    // 2^32 is 0 again.
    EXPECT_TRUE(fits(3));
    EXPECT_TRUE(fits(11));
    EXPECT_FALSE(fits(12));

    start_from(INT_MAX);
    ov_system_info.system_max_interfaces = 0x7FFFFFFF;
    EXPECT_FALSE(fits(1));
    ov_system_info.system_max_interfaces = 0x80000000;
    EXPECT_TRUE(fits(1));
    EXPECT_EQ(last_log_line(),
              summary_line("1 changes; cur l3:2147483647 ifidx:10 mult:1 max:-2147483648"));

    start_from(-2);
    ov_system_info.system_max_interfaces = 0xFFFFFFFF;
    EXPECT_TRUE(fits(1));
}

TEST_F(Admission, EndsWhereTheKernelsIndicesEnd)
{
    ov_system_info.system_max_interfaces = 1000;
    planted().kernel_interfaces = 100;
    EXPECT_TRUE(fits(9, 3));
    forget_calls();
    EXPECT_FALSE(fits(10, 3));
    EXPECT_EQ(last_log_line(), index_refusal(10, 100));
    EXPECT_EQ(log_line(10), summary_line("10 changes; cur l3:0 ifidx:100 mult:3 max:1000"));

    EXPECT_TRUE(fits(27, 1));
    EXPECT_FALSE(fits(28, 1));

    planted().kernel_interfaces = 126;
    EXPECT_TRUE(fits(1));
    planted().kernel_interfaces = 127;
    EXPECT_FALSE(fits(1));
    EXPECT_EQ(last_log_line(), index_refusal(1, 127));
}

TEST_F(Admission, MayTakeNoIndices)
{
    planted().kernel_interfaces = 127;
    EXPECT_TRUE(fits(8, 0));
    planted().kernel_interfaces = 128;
    EXPECT_FALSE(fits(1, 0));
}

TEST_F(Admission, ComparesIndicesUnsignedIn32Bits)
{
    planted().kernel_interfaces = 0;
    EXPECT_FALSE(fits(1, -1)); // 2^32 - 1
    EXPECT_EQ(last_log_line(), index_refusal(1, 0));
    planted().kernel_interfaces = 1;
    EXPECT_TRUE(fits(1, -1));
    planted().kernel_interfaces = -1;
    EXPECT_TRUE(fits(1, 1));
    planted().kernel_interfaces = -5;
    EXPECT_FALSE(fits(1, 1));
    EXPECT_EQ(last_log_line(), index_refusal(1, -5));
    EXPECT_TRUE(fits(1, 5));

    planted().kernel_interfaces = 10;
    EXPECT_FALSE(fits(1, INT_MIN)); // 2^31 and 10
    EXPECT_TRUE(fits(2, INT_MIN));  // 2^32 and 10
    EXPECT_FALSE(fits(3, INT_MIN));
    EXPECT_FALSE(fits(1, INT_MAX));
    EXPECT_TRUE(fits(2, INT_MAX));         // 2^32 - 2 and 10
    EXPECT_TRUE(fits(4, 0x40000000));      // 2^32 and 10
    EXPECT_TRUE(fits(8, 0x20000000 + 14)); // 2^32, 112 and 10
    EXPECT_FALSE(fits(8, 0x20000000 + 15));
}

TEST_F(Admission, MeasuresAgainstTheModelFirst)
{
    planted().kernel_interfaces = 127;
    EXPECT_FALSE(fits(9));
    EXPECT_EQ(last_log_line(), l3_refusal(9, 0));
    EXPECT_EQ(log_lines().size(), 11U);
}

TEST_F(Admission, DoesNotDependOnWhatIsLogged)
{
    for (const int threshold : {-1, 0, 3, 4, 5, 7}) {
        host_.set_log_level(threshold);
        planted().kernel_interfaces = 10;
        EXPECT_TRUE(fits(8));
        EXPECT_FALSE(fits(9));
        planted().kernel_interfaces = 127;
        EXPECT_FALSE(fits(1));
    }
}

TEST_F(Admission, AsksTheKernelItself)
{
    planted().kernel_interfaces.reset();
    EXPECT_TRUE(fits(1));
    // The test program's network has one interface, "lo".
    EXPECT_EQ(last_log_line(), summary_line("1 changes; cur l3:0 ifidx:1 mult:1 max:8"));
}

TEST_F(Admission, OpensTheSocketWhenItIsClosed)
{
    g_ovif_skfd = -1;
    EXPECT_TRUE(fits(1));
    EXPECT_EQ(num_calls(Operation::ovif_network_init_sockets), 1U);
    const int opened = g_ovif_skfd;
    EXPECT_GE(opened, 0);
    EXPECT_TRUE(fits(1));
    EXPECT_EQ(num_calls(Operation::ovif_network_init_sockets), 1U);
    EXPECT_EQ(::close(opened), 0);
}

TEST_F(Admission, TakesDescriptor0ForOpen)
{
    g_ovif_skfd = 0;
    EXPECT_TRUE(fits(1));
    EXPECT_EQ(num_calls(Operation::ovif_network_init_sockets), 0U);
}

TEST_F(Admission, TakesEveryNegativeDescriptorForClosed)
{
    g_ovif_skfd = INT_MIN;
    arm({.operation = Operation::ovif_network_init_sockets, .code = 14014});
    EXPECT_TRUE(fits(1));
    EXPECT_EQ(num_calls(Operation::ovif_network_init_sockets), 1U);
    EXPECT_EQ(g_ovif_skfd, INT_MIN);
    // The kernel is asked all the same, and nobody is told.
    EXPECT_EQ(num_calls(Operation::ovif_get_ifcount), 1U);
    EXPECT_THAT(log_lines(),
                ElementsAre(added_line(std::string(vlan_root) + "1", 1),
                            summary_line("1 changes; cur l3:0 ifidx:10 mult:1 max:8")));
    EXPECT_EQ(num_calls(Operation::bail_debug), 0U);
}

TEST_F(Admission, LoadsTheModelOnceForTheSummary)
{
    ov_system_info = {};
    host_.set("/ov/model/limits/max_interfaces", bt_uint32, "2");
    EXPECT_TRUE(fits(2));
    EXPECT_EQ(last_log_line(), summary_line("2 changes; cur l3:0 ifidx:10 mult:1 max:2"));
    EXPECT_THAT(calls_of(Operation::init_model_info), ElementsAre("init_model_info(null)"));
    EXPECT_FALSE(fits(3));
    EXPECT_EQ(num_calls(Operation::init_model_info), 1U);
}

TEST_F(Admission, LoadsTheModelWithoutTheSummary)
{
    ov_system_info = {};
    host_.set("/ov/model/limits/max_interfaces", bt_uint32, "2");
    host_.set_log_level(4);
    EXPECT_TRUE(fits(2));
    EXPECT_THAT(calls_of(Operation::init_model_info), ElementsAre("init_model_info(null)"));
    EXPECT_FALSE(fits(3));
    EXPECT_EQ(num_calls(Operation::init_model_info), 1U);
}

TEST_F(Admission, IsRefusedWhereTheModelIsNotKnown)
{
    ov_system_info = {};
    arm({.operation = Operation::init_model_info, .and_later = true, .code = 14004});
    EXPECT_FALSE(fits(1));
    EXPECT_THAT(log_lines(), ElementsAre(added_line(std::string(vlan_root) + "1", 1),
                                         summary_line("1 changes; cur l3:0 ifidx:10 mult:1 max:0"),
                                         l3_refusal(1, 0)));
    EXPECT_EQ(num_calls(Operation::init_model_info), 2U);

    host_.set_log_level(4);
    arm({.operation = Operation::init_model_info, .and_later = true, .code = 14004});
    EXPECT_FALSE(fits(1));
    EXPECT_EQ(num_calls(Operation::init_model_info), 1U);
}

TEST_F(Admission, TakesWhatTheRecordHoldsWhereTheModelIsNotKnown)
{
    ov_system_info = {.initialized = 0, .system_max_interfaces = 3};
    arm({.operation = Operation::init_model_info, .and_later = true, .code = 14004});
    EXPECT_TRUE(fits(3));
    EXPECT_FALSE(fits(4));
}

TEST_F(Admission, TakesAnyOtherMarkForALoadedModel)
{
    ov_system_info = {.initialized = 255, .system_max_interfaces = 1};
    EXPECT_TRUE(fits(1));
    EXPECT_EQ(num_calls(Operation::init_model_info), 0U);
}

TEST_F(Admission, OfNullIsRefused)
{
    EXPECT_FALSE(in_library(md_ifmgr_can_interface_be_added, nullptr, vlan_pattern, 1));
    ChangeList changes;
    EXPECT_TRUE(in_library(md_ifmgr_can_interface_be_added, changes.get(), nullptr, 1))
        << "no change is compared with it";
    changes.add(mdct_modify, std::string(vlan_root) + "a");
    EXPECT_FALSE(in_library(md_ifmgr_can_interface_be_added, changes.get(), nullptr, 1));
    const std::string line = error_line("md_utils", admission, "Unexpected NULL");
    EXPECT_THAT(log_lines(), ElementsAre(line, line));
    EXPECT_EQ(num_calls(Operation::bail_debug), 2U);
}

} // namespace
