// The tunnel ID allocator, one behaviour after the other; tunnel_id_model_test.cpp has long
// sequences.
#include "tests/library/library_test.h"
#include "tests/library/tunnel_ids.h"

#include <algorithm>
#include <numeric>

using namespace ovtest;
using testing::Contains;
using testing::ElementsAre;
using testing::IsEmpty;

namespace
{

constexpr char reserved_name[] = "default";

std::string line_of(const std::string &function, const std::string &text)
{
    return error_line("md_tunneld_tunnel_common", function, text);
}

std::string null_line(const std::string &function)
{
    return line_of(function, "Unexpected NULL");
}

std::string offered(uint32 id)
{
    return gated_line(6, "TUN_IDS: next available tunnel index " + std::to_string(id));
}

std::string requested(uint32 number)
{
    return gated_line(6, "Received request for " + std::to_string(static_cast<int>(number)) +
                             " available tunnel IDs");
}

// The status and the IDs from `first` on, `count` of them.
std::string ids_from(int status, uint32 first, uint32 count)
{
    std::string text = std::to_string(status);
    for (uint32 id = first; id < first + count; ++id) {
        text += ' ' + std::to_string(id);
    }
    return text;
}

class TunnelIds : public LibraryTest
{
  protected:
    static constexpr uint32 bound = 100;
    static constexpr uint64 start_time = 1000000;

    TunnelIds()
    {
        host_.set_time(start_time);
        begin_tunnel_ids(bound);
    }

    void TearDown() override
    {
        end_tunnel_ids();
        LibraryTest::TearDown();
    }

    // Binds the IDs from `first` on to names of their own.
    static void take(uint32 first, uint32 count)
    {
        for (uint32 id = first; id < first + count; ++id) {
            ASSERT_EQ(set_id(id, name_of(id)), 0);
        }
        forget_calls();
    }
    static std::string name_of(uint32 id) { return "tunnel" + std::to_string(100000 + id); }
};

TEST_F(TunnelIds, TheBeginningIsLogged)
{
    EXPECT_EQ(in_library(md_init_tunnel_id), 0);
    EXPECT_THAT(log_lines(), ElementsAre(gated_line(6, "TUN_IDS: Initialized")));
    EXPECT_EQ(in_library(md_get_total_tunnels), 0);
}

TEST_F(TunnelIds, TheSequenceIsMadeAsTheHostExpectsIt)
{
    EXPECT_EQ(in_library(md_init_tunnel_id), 0);
    EXPECT_EQ(num_calls(Operation::array_options_get_defaults), 1U);
    EXPECT_THAT(calls_of(Operation::uint32_array_new_full),
                ElementsAre("uint32_array_new_full(*, *)"));
}

TEST_F(TunnelIds, TheFirstBeginningFreesNothing)
{
    end_tunnel_ids();
    planted().tunnel_bounds = {bound};
    forget_calls();
    EXPECT_EQ(in_library(md_init_tunnel_id), 0);
    EXPECT_EQ(num_calls(Operation::ts_free), 0U);
    EXPECT_EQ(num_calls(Operation::uint32_array_free), 0U);
}

TEST_F(TunnelIds, ANewBeginningFreesNamesAndSequence)
{
    take(0, 3);
    EXPECT_EQ(in_library(md_init_tunnel_id), 0);
    EXPECT_EQ(num_calls(Operation::ts_free), 3U);
    EXPECT_EQ(num_calls(Operation::uint32_array_free), 1U);
}

TEST_F(TunnelIds, ANewBeginningForgetsEverything)
{
    take(0, 3);
    EXPECT_EQ(free_id(name_of(1)), 0);
    EXPECT_EQ(in_library(md_init_tunnel_id), 0);
    EXPECT_EQ(in_library(md_get_total_tunnels), 0);
    EXPECT_EQ(offer(3), "0 0 1 2");
    EXPECT_EQ(id_of(name_of(0)), "14004 77");
}

TEST_F(TunnelIds, AreOfferedInAscendingOrder)
{
    EXPECT_EQ(offer(3), "0 0 1 2");
    EXPECT_EQ(offer(3), "0 0 1 2");
    EXPECT_THAT(log_lines(), ElementsAre(requested(3), offered(0), offered(1), offered(2),
                                         requested(3), offered(0), offered(1), offered(2)));
    EXPECT_EQ(in_library(md_get_total_tunnels), 0);
}

TEST_F(TunnelIds, ARequestForNoneIsGranted)
{
    EXPECT_EQ(offer(0), "0");
    EXPECT_EQ(in_library(md_get_next_n_available_tunnel_ids, 5U, nullptr), 0);
    EXPECT_EQ(in_library(md_get_next_n_available_tunnel_ids, 500U, nullptr), 0);
    EXPECT_THAT(log_lines(), ElementsAre(requested(0), requested(5), requested(500)));
}

TEST_F(TunnelIds, TheLast20AreNotOffered)
{
    EXPECT_EQ(offer(80), ids_from(0, 0, 80));
    forget_calls();
    EXPECT_EQ(offer(81), "1");
    EXPECT_THAT(log_lines(), ElementsAre(requested(81)));
    take(0, 79);
    EXPECT_EQ(offer(1), "0 79");
    EXPECT_EQ(offer(2), "1");
    take(79, 1);
    EXPECT_EQ(offer(1), "1");
}

// Those that are in use count, not those that were.
TEST_F(TunnelIds, AFreedOneMakesRoom)
{
    take(0, 80);
    EXPECT_EQ(offer(1), "1");
    EXPECT_EQ(free_id(name_of(5)), 0);
    EXPECT_EQ(offer(1), "0 80");
}

TEST_F(TunnelIds, TheSumOfARequestMayOverflow)
{
    take(0, 1);
    // 1 + 4294967295 is 0: the request is not refused, and all that are free are offered.
    EXPECT_EQ(offer(4294967295), ids_from(1, 1, 99));
    EXPECT_EQ(log_lines().front(), requested(4294967295));
    EXPECT_EQ(log_lines().back(),
              gated_line(3, "md_get_next_n_available_tunnel_ids: error in alloc id, idx=99"));
}

TEST_F(TunnelIds, IntoAnArrayThatIsNotEmptyTheyAreOfferedInVain)
{
    const TestIds ids = new_ids();
    ASSERT_EQ(uint32_array_append(ids.get(), 7), 0);
    EXPECT_EQ(in_library(md_get_next_n_available_tunnel_ids, 2U, ids.get()), 1);
    EXPECT_THAT(elements(ids.get()), ElementsAre(7, 0, 1));
    EXPECT_THAT(log_lines(), ElementsAre(requested(2), offered(0), offered(1)));
}

TEST_F(TunnelIds, IdsInUseAreNotOffered)
{
    EXPECT_EQ(set_id(0, "a"), 0);
    EXPECT_EQ(set_id(2, "b"), 0);
    EXPECT_EQ(set_id(99, "c"), 0);
    EXPECT_EQ(offer(3), "0 1 3 4");
}

TEST_F(TunnelIds, ANameIsBound)
{
    EXPECT_EQ(set_id(5, "alpha"), 0);
    EXPECT_THAT(log_lines(),
                ElementsAre(gated_line(6, "TUN_IDS: SET tunnel index 5 content to alpha")));
    EXPECT_EQ(id_of("alpha"), "0 5");
    EXPECT_EQ(sorted_id_of("alpha"), "0 5");
    EXPECT_EQ(name_at(0), "0 alpha");
    EXPECT_EQ(in_library(md_get_total_tunnels), 1);
}

TEST_F(TunnelIds, ANameIsCopied)
{
    const TestString name = string_of("alpha");
    EXPECT_EQ(in_library(md_set_tunnel_id, 5U, name.get()), 0);
    EXPECT_EQ(num_calls(Operation::ts_dup), 1U);
    EXPECT_THAT(live_objects(), ElementsAre(testing::AnyOf("tstring", "uint32_array"),
                                            testing::AnyOf("tstring", "uint32_array")));
}

TEST_F(TunnelIds, TheReservedNameIsNotBound)
{
    EXPECT_EQ(set_id(5, reserved_name), 0);
    EXPECT_THAT(log_lines(), IsEmpty());
    EXPECT_EQ(in_library(md_get_total_tunnels), 0);
    EXPECT_EQ(offer(6), "0 0 1 2 3 4 5");
    EXPECT_EQ(id_of(reserved_name), "14004 77");
    EXPECT_EQ(free_id(reserved_name), 14004);
    // It is looked at before the ID is.
    EXPECT_EQ(set_id(bound, reserved_name), 0);
}

TEST_F(TunnelIds, TheReservedNameLeavesABoundIdAsItWas)
{
    EXPECT_EQ(set_id(5, "alpha"), 0);
    EXPECT_EQ(set_id(5, reserved_name), 0);
    EXPECT_EQ(id_of("alpha"), "0 5");
}

TEST_F(TunnelIds, NamesLikeTheReservedOneAreBound)
{
    EXPECT_EQ(set_id(1, "defaul"), 0);
    EXPECT_EQ(set_id(2, "default1"), 0);
    EXPECT_EQ(set_id(3, "Default"), 0);
    EXPECT_EQ(in_library(md_get_total_tunnels), 3);
}

TEST_F(TunnelIds, NullNamesAreRefused)
{
    uint32 id = 77;
    EXPECT_EQ(in_library(md_set_tunnel_id, 5U, nullptr), 14001);
    EXPECT_EQ(in_library(md_set_tunnel_id, 500U, nullptr), 14001);
    EXPECT_EQ(in_library(md_free_tunnel_id, nullptr), 14001);
    EXPECT_EQ(in_library(md_get_tunnel_id, nullptr, &id), 14001);
    EXPECT_EQ(id, 77U);
    EXPECT_THAT(log_lines(),
                ElementsAre(null_line("md_set_tunnel_id"), null_line("md_set_tunnel_id"),
                            null_line("md_free_tunnel_id"), null_line("md_get_tunnel_id")));
    EXPECT_EQ(num_calls(Operation::bail_debug), 4U);
}

TEST_F(TunnelIds, NullAddressesAreRefused)
{
    take(0, 1);
    const TestString name = string_of(name_of(0));
    EXPECT_EQ(in_library(md_get_tunnel_id, name.get(), nullptr), 14001);
    EXPECT_EQ(in_library(md_get_tunnel_id_sorted, name.get(), nullptr), 14001);
    EXPECT_EQ(in_library(md_get_tunnel_name_str_sorted, 0U, nullptr), 14001);
    EXPECT_THAT(log_lines(),
                ElementsAre(null_line("md_get_tunnel_id"), null_line("md_get_tunnel_id_sorted"),
                            null_line("md_get_tunnel_name_str_sorted")));
}

TEST_F(TunnelIds, ANullNameIsNotFoundInOrder)
{
    take(0, 2);
    uint32 id = 77;
    EXPECT_EQ(in_library(md_get_tunnel_id_sorted, nullptr, &id), 14004);
    EXPECT_EQ(id, 65535U);
    EXPECT_THAT(log_lines(), IsEmpty());
}

TEST_F(TunnelIds, IdsPastTheBoundAreNotBound)
{
    for (const uint32 id : {bound, bound + 1, 65535U, 65536U, 4294967295U}) {
        forget_calls();
        EXPECT_EQ(set_id(id, "alpha"), 14002);
        EXPECT_THAT(log_lines(),
                    ElementsAre(line_of("md_set_tunnel_id", "Required condition was not met")));
        EXPECT_EQ(num_calls(Operation::bail_debug), 1U);
    }
    EXPECT_EQ(in_library(md_get_total_tunnels), 0);
    EXPECT_EQ(set_id(bound - 1, "alpha"), 0);
    EXPECT_EQ(id_of("alpha"), "0 99");
}

TEST_F(TunnelIds, AnIdIsBoundAnew)
{
    take(0, 3);
    EXPECT_EQ(set_id(1, "zeta"), 0);
    EXPECT_EQ(id_of(name_of(1)), "14004 77");
    EXPECT_EQ(id_of("zeta"), "0 1");
    EXPECT_EQ(in_library(md_get_total_tunnels), 3);
    EXPECT_THAT(names_in_order(), ElementsAre(name_of(0), name_of(2), "zeta"));
    EXPECT_EQ(offer(1), "0 3");
}

TEST_F(TunnelIds, AnIdIsBoundAnewToItsName)
{
    take(0, 2);
    EXPECT_EQ(set_id(0, name_of(0)), 0);
    EXPECT_EQ(id_of(name_of(0)), "0 0");
    EXPECT_EQ(in_library(md_get_total_tunnels), 2);
}

TEST_F(TunnelIds, OfTwoWithOneNameTheLowestIsFound)
{
    EXPECT_EQ(set_id(8, "alpha"), 0);
    EXPECT_EQ(set_id(3, "alpha"), 0);
    EXPECT_EQ(id_of("alpha"), "0 3");
    EXPECT_EQ(in_library(md_get_total_tunnels), 2);
    EXPECT_EQ(free_id("alpha"), 0);
    EXPECT_EQ(id_of("alpha"), "0 8");
    EXPECT_THAT(names_in_order(), ElementsAre("alpha"));
}

TEST_F(TunnelIds, NamesAreComparedByteForByte)
{
    EXPECT_EQ(set_id(1, "alpha"), 0);
    EXPECT_EQ(set_id(2, "Alpha"), 0);
    EXPECT_EQ(set_id(3, "alph"), 0);
    EXPECT_EQ(set_id(4, "\xc3\xa4"), 0);
    EXPECT_EQ(set_id(5, ""), 0);
    EXPECT_EQ(id_of("alpha"), "0 1");
    EXPECT_EQ(id_of("Alpha"), "0 2");
    EXPECT_EQ(id_of("alph"), "0 3");
    EXPECT_EQ(id_of("\xc3\xa4"), "0 4");
    EXPECT_EQ(id_of(""), "0 5");
    EXPECT_EQ(id_of("alphabet"), "14004 77");
    EXPECT_THAT(names_in_order(), ElementsAre("", "Alpha", "alph", "alpha", "\xc3\xa4"));
}

TEST_F(TunnelIds, NamesOfAnyLengthAreBound)
{
    uint32 id = 0;
    for (const std::size_t length : {64U, 65U, 300U}) {
        EXPECT_EQ(set_id(++id, std::string(length, 'x')), 0);
        EXPECT_EQ(id_of(std::string(length, 'x')), "0 " + std::to_string(id));
    }
    EXPECT_EQ(id_of(std::string(66, 'x')), "14004 77");
    EXPECT_EQ(free_id(std::string(300, 'x')), 0);
    EXPECT_EQ(in_library(md_get_total_tunnels), 2);
}

TEST_F(TunnelIds, ANameThatIsNotThereIsLogged)
{
    EXPECT_EQ(id_of("alpha"), "14004 77");
    EXPECT_THAT(log_lines(), ElementsAre(gated_line(
                                 6, "md_get_tunnel_id: - could not find id for tunnel: alpha")));
    EXPECT_EQ(num_calls(Operation::bail_debug), 0U);
}

TEST_F(TunnelIds, AFreedNameIsGone)
{
    take(0, 3);
    EXPECT_EQ(free_id(name_of(1)), 0);
    EXPECT_THAT(log_lines(),
                ElementsAre(gated_line(6, "TUN_IDS: Freed tunnel at index 1 (tunnel100001)")));
    EXPECT_EQ(id_of(name_of(1)), "14004 77");
    EXPECT_EQ(in_library(md_get_total_tunnels), 2);
    EXPECT_THAT(names_in_order(), ElementsAre(name_of(0), name_of(2)));
}

TEST_F(TunnelIds, AnUnknownNameIsNotFreed)
{
    EXPECT_EQ(free_id("alpha"), 14004);
    EXPECT_THAT(
        log_lines(),
        ElementsAre(gated_line(6, "md_get_tunnel_id: - could not find id for tunnel: alpha"),
                    gated_line(3, "Unable to free tunnel alpha because tunnel ID not found.")));
    EXPECT_EQ(num_calls(Operation::bail_debug), 0U);
}

TEST_F(TunnelIds, AFreedIdIsOfferedLast)
{
    take(0, 3);
    EXPECT_EQ(free_id(name_of(0)), 0);
    EXPECT_EQ(offer(2), "0 3 4");
    EXPECT_EQ(offer(80 - 2), ids_from(0, 3, 78));
}

class TunnelIdQuarantine : public TunnelIds
{
  protected:
    // All IDs were in use and all but 29 are freed, 28 first and then one each millisecond.
    TunnelIdQuarantine()
    {
        planted().tunnel_bounds = {30};
        EXPECT_EQ(in_library(md_init_tunnel_id), 0);
        for (uint32 id = 0; id < 30; ++id) {
            EXPECT_EQ(set_id(id, name_of(id)), 0);
        }
        for (uint32 id = 0; id < 29; ++id) {
            host_.set_time(start_time + id);
            EXPECT_EQ(free_id(name_of(28 - id)), 0);
        }
        host_.set_time(start_time);
        forget_calls();
    }

    // What is said of an ID freed so many milliseconds behind the start.
    static std::string skipped(uint32 position, uint64 now, uint64 freed, uint32 id)
    {
        return gated_line(6, "TUN_IDS: skipping allocating entry " + std::to_string(position) +
                                 " because it has been freed too recently:" + std::to_string(now) +
                                 ", " + std::to_string(freed) + ", " + std::to_string(id));
    }
};

TEST_F(TunnelIdQuarantine, HoldsAnIdBackFor60Seconds)
{
    EXPECT_EQ(offer(1), "1");
    host_.set_time(start_time + 60000);
    EXPECT_EQ(offer(1), "1");
    host_.set_time(start_time + 60001);
    EXPECT_EQ(offer(1), "0 28");
    EXPECT_THAT(log_lines(),
                ElementsAre(requested(1), skipped(0, start_time, start_time, 28), requested(1),
                            skipped(0, start_time + 60000, start_time, 28), requested(1),
                            offered(28)));
}

TEST_F(TunnelIdQuarantine, OffersThoseThatAreOutOfIt)
{
    host_.set_time(start_time + 60003);
    EXPECT_EQ(offer(3), "0 28 27 26");
    forget_calls();
    EXPECT_EQ(offer(5), "1 28 27 26");
    EXPECT_THAT(log_lines(), ElementsAre(requested(5), offered(28), offered(27), offered(26),
                                         skipped(3, start_time + 60003, start_time + 3, 25)));
}

TEST_F(TunnelIdQuarantine, DoesNotKeepAnIdFromBeingBound)
{
    EXPECT_EQ(set_id(27, "alpha"), 0);
    EXPECT_EQ(id_of("alpha"), "0 27");
    host_.set_time(start_time + 60003);
    EXPECT_EQ(offer(2), "0 28 26");
}

TEST_F(TunnelIdQuarantine, BeginsAnewWithEveryRelease)
{
    ASSERT_EQ(set_id(28, "alpha"), 0);
    host_.set_time(start_time + 50000);
    ASSERT_EQ(free_id("alpha"), 0);
    // The last 20 are never offered: so many have to stand behind it.
    for (uint32 id = 27; id >= 8; --id) {
        ASSERT_EQ(set_id(id, "beta"), 0);
        ASSERT_EQ(free_id("beta"), 0);
    }
    host_.set_time(start_time + 110000);
    forget_calls();
    EXPECT_EQ(offer(9), "1 7 6 5 4 3 2 1 0");
    EXPECT_EQ(log_lines().back(), skipped(8, start_time + 110000, start_time + 50000, 28));
    host_.set_time(start_time + 110001);
    EXPECT_EQ(offer(9), "0 7 6 5 4 3 2 1 0 28");
}

TEST_F(TunnelIdQuarantine, AClockThatStandsStillHoldsAllBack)
{
    for (int i = 0; i < 3; ++i) {
        EXPECT_EQ(offer(1), "1");
    }
}

// The difference is unsigned: a time before the release is a very long time after it.
TEST_F(TunnelIdQuarantine, AClockThatIsSetBackHoldsNothingBack)
{
    host_.set_time(start_time - 1);
    EXPECT_EQ(offer(2), "0 28 27");
}

TEST_F(TunnelIds, AnIdThatIsFreedAtTimeZeroWasNeverFreed)
{
    take(0, bound - 20);
    host_.set_time(0);
    for (uint32 id = 0; id < bound - 20; ++id) {
        ASSERT_EQ(free_id(name_of(id)), 0);
    }
    EXPECT_EQ(offer(22), ids_from(0, 80, 20) + " 0 1");
}

TEST_F(TunnelIds, WithoutTimeRecordOneIsMade)
{
    time_info_ptr = nullptr;
    take(0, 1);
    EXPECT_EQ(free_id(name_of(0)), 0);
    EXPECT_EQ(num_calls(Operation::ctime_init), 1U);
    EXPECT_EQ(num_calls(Operation::sys_time_since_boot_ms), 0U);
    ASSERT_NE(time_info_ptr, nullptr);
    EXPECT_EQ(offer(2), "0 1 2");
    EXPECT_EQ(num_calls(Operation::ctime_init), 1U);
}

TEST_F(TunnelIds, WithoutAnyTimeRecordTheTimeIsReadAnew)
{
    planted().tunnel_bounds = {22};
    ASSERT_EQ(in_library(md_init_tunnel_id), 0);
    take(0, 22);
    time_info_ptr = nullptr;
    planted().without_time_info = true;
    planted().ms_since_boot = 5000;
    ASSERT_EQ(free_id(name_of(3)), 0);
    EXPECT_EQ(num_calls(Operation::ctime_init), 1U);
    EXPECT_EQ(num_calls(Operation::sys_time_since_boot_ms), 1U);
    for (uint32 id = 4; id < 22; ++id) {
        ASSERT_EQ(free_id(name_of(id)), 0);
    }
    ASSERT_EQ(free_id(name_of(0)), 0);
    ASSERT_EQ(free_id(name_of(1)), 0);
    forget_calls();
    planted().ms_since_boot = 65000;
    EXPECT_EQ(offer(1), "1");
    planted().ms_since_boot = 65001;
    EXPECT_EQ(offer(1), "0 3");
    // Once for each record that is looked at.
    EXPECT_EQ(num_calls(Operation::ctime_init), 2U);
    EXPECT_EQ(num_calls(Operation::sys_time_since_boot_ms), 2U);
}

TEST_F(TunnelIds, TheLookupInOrderGoesOnWhereItEnded)
{
    take(0, 10);
    const auto comparisons_for = [](uint32 id) {
        forget_calls();
        EXPECT_EQ(sorted_id_of(name_of(id)), "0 " + std::to_string(id));
        return num_calls(Operation::ts_cmp);
    };
    EXPECT_EQ(comparisons_for(0), 1U);
    EXPECT_EQ(comparisons_for(0), 1U);
    EXPECT_EQ(comparisons_for(1), 2U);
    EXPECT_EQ(comparisons_for(2), 2U);
    EXPECT_EQ(comparisons_for(9), 8U);
    EXPECT_EQ(comparisons_for(3), 5U); // the last one, then 0 to 3
    EXPECT_EQ(comparisons_for(2), 10U);
    // A name that is not there leaves the position as it is.
    forget_calls();
    EXPECT_EQ(sorted_id_of("none"), "14004 65535");
    EXPECT_EQ(num_calls(Operation::ts_cmp), 10U);
    EXPECT_EQ(comparisons_for(2), 1U);
    // With fewer tunnels it begins anew.
    EXPECT_EQ(comparisons_for(9), 8U);
    EXPECT_EQ(free_id(name_of(0)), 0);
    EXPECT_EQ(comparisons_for(1), 1U);
}

TEST_F(TunnelIds, TheLookupInOrderFindsNothingAmongNone)
{
    EXPECT_EQ(sorted_id_of("alpha"), "14004 65535");
    EXPECT_THAT(log_lines(), IsEmpty());
}

TEST_F(TunnelIds, NamesByTheirPosition)
{
    EXPECT_EQ(set_id(7, "beta"), 0);
    EXPECT_EQ(set_id(3, "gamma"), 0);
    EXPECT_EQ(set_id(9, "alpha"), 0);
    forget_calls();
    EXPECT_EQ(name_at(0), "0 alpha");
    EXPECT_EQ(name_at(1), "0 beta");
    EXPECT_EQ(name_at(2), "0 gamma");
    EXPECT_EQ(name_at(3), "14004 old");
    EXPECT_EQ(name_at(2147483648), "14004 old");
    EXPECT_EQ(name_at(4294967295), "14004 old");
    EXPECT_THAT(log_lines(), IsEmpty());
}

// A host must not do this; the library stays within its records all the same.
class TunnelIdsUnderALowerBound : public TunnelIds
{
  protected:
    TunnelIdsUnderALowerBound()
    {
        EXPECT_EQ(set_id(50, "alpha"), 0);
        forget_calls();
    }
};

TEST_F(TunnelIdsUnderALowerBound, AnIdPastItIsNotFoundInOrder)
{
    planted().tunnel_bounds = {50};
    EXPECT_EQ(sorted_id_of("alpha"), "14002 65535");
    EXPECT_EQ(name_at(0), "14004 old");
    EXPECT_EQ(id_of("alpha"), "14004 77");
    EXPECT_EQ(log_lines().front(),
              line_of("md_get_tunnel_id_sorted", "Required condition was not met"));
}

TEST_F(TunnelIdsUnderALowerBound, AnIdPastItIsNotFreed)
{
    planted().tunnel_bounds = {bound, 50, bound};
    EXPECT_EQ(free_id("alpha"), 0);
    EXPECT_THAT(log_lines(), IsEmpty());
    EXPECT_EQ(id_of("alpha"), "0 50");
}

TEST_F(TunnelIds, GainNoIdsFromABoundThatRises)
{
    planted().tunnel_bounds = {bound + 100};
    EXPECT_EQ(id_of("alpha"), "14004 77");
    EXPECT_EQ(set_id(bound, "alpha"), lc_err_assertion_failed);
    EXPECT_EQ(set_id(bound - 1, "alpha"), 0);
    EXPECT_EQ(id_of("alpha"), "0 99");
    const uint32 past = bound;
    const uint32 last = bound - 1;
    EXPECT_EQ(tunnel_sorted_seq_compare(&past, &last), -1);
}

class TunnelIdsWithoutSequence : public TunnelIds
{
  protected:
    TunnelIdsWithoutSequence()
    {
        arm({.operation = Operation::uint32_array_new_full});
        EXPECT_EQ(in_library(md_init_tunnel_id), 0);
        disarm();
        forget_calls();
    }
};

TEST_F(TunnelIdsWithoutSequence, NoTunnelsAreCounted)
{
    EXPECT_EQ(in_library(md_get_total_tunnels), 0);
    EXPECT_EQ(name_at(0), "14004 old");
    EXPECT_EQ(sorted_id_of("alpha"), "14004 65535");
    EXPECT_EQ(offer(2), "0 0 1");
}

TEST_F(TunnelIdsWithoutSequence, BindingFailsAndTheNameIsFoundAllTheSame)
{
    EXPECT_EQ(set_id(0, "alpha"), 14001);
    EXPECT_THAT(log_lines(), ElementsAre(line_of("md_set_tunnel_id",
                                                 "Error code 14001 (unexpected NULL) returned")));
    EXPECT_EQ(id_of("alpha"), "0 0");
    EXPECT_EQ(offer(1), "0 1");
    // It can be freed.
    forget_calls();
    EXPECT_EQ(free_id("alpha"), 14001);
    EXPECT_THAT(
        log_lines(),
        ElementsAre(line_of("md_free_tunnel_id", "Error code 14001 (unexpected NULL) returned"),
                    gated_line(6, "TUN_IDS: Freed tunnel at index 0 (alpha)")));
    EXPECT_EQ(num_calls(Operation::bail_debug), 1U);
    EXPECT_EQ(id_of("alpha"), "14004 77");
    EXPECT_EQ(offer(2), "0 1 2");
}

TEST_F(TunnelIdsWithoutSequence, AnIdIsNotBoundAnewAndItsNameIsGone)
{
    EXPECT_EQ(set_id(0, "alpha"), 14001);
    forget_calls();
    EXPECT_EQ(set_id(0, "beta"), 14001);
    EXPECT_THAT(log_lines(), ElementsAre(line_of("md_set_tunnel_id",
                                                 "Error code 14001 (unexpected NULL) returned")));
    EXPECT_EQ(num_calls(Operation::bail_debug), 1U);
    EXPECT_EQ(num_calls(Operation::ts_dup), 0U);
    EXPECT_EQ(id_of("alpha"), "14004 77");
    EXPECT_EQ(id_of("beta"), "14004 77");
    EXPECT_EQ(offer(1), "0 1");
}

TEST_F(TunnelIdsWithoutSequence, TheHostIsNotAskedAboutIt)
{
    EXPECT_EQ(set_id(0, "alpha"), 14001);
    EXPECT_EQ(set_id(0, "beta"), 14001);
    EXPECT_EQ(set_id(0, "gamma"), 14001);
    EXPECT_EQ(free_id("gamma"), 14001);
    EXPECT_EQ(num_calls(Operation::uint32_array_insert_sorted), 0U);
    EXPECT_EQ(num_calls(Operation::uint32_array_delete_by_value), 0U);
}

// What a failing host array leaves: nothing is lost for good.
TEST_F(TunnelIds, AnIdWhoseNameCouldNotBeCopiedCanBeSetAgain)
{
    arm({.operation = Operation::ts_dup, .code = 14000});
    EXPECT_EQ(set_id(0, "alpha"), 14000);
    disarm();
    EXPECT_EQ(id_of("alpha"), "14004 77");
    EXPECT_EQ(offer(2), "0 1 2");
    EXPECT_EQ(set_id(0, "alpha"), 0);
    EXPECT_EQ(id_of("alpha"), "0 0");
    EXPECT_EQ(offer(2), "0 1 2");
    EXPECT_EQ(free_id("alpha"), 0);
    EXPECT_EQ(in_library(md_get_total_tunnels), 0);
}

TEST_F(TunnelIds, AnIdThatCouldNotLeaveTheSequenceCanBeSetAgain)
{
    take(0, 2);
    arm({.operation = Operation::uint32_array_delete_by_value, .code = 14000});
    EXPECT_EQ(set_id(0, "alpha"), 14000);
    disarm();
    EXPECT_EQ(id_of(name_of(0)), "14004 77");
    EXPECT_EQ(in_library(md_get_total_tunnels), 2);
    EXPECT_EQ(set_id(0, "alpha"), 0);
    EXPECT_EQ(id_of("alpha"), "0 0");
    EXPECT_EQ(offer(1), "0 2");
}

TEST_F(TunnelIds, AnIdThatCouldNotEnterTheSequenceCanBeFreed)
{
    arm({.operation = Operation::uint32_array_insert_sorted, .code = 14000});
    EXPECT_EQ(set_id(0, "alpha"), 14000);
    disarm();
    EXPECT_EQ(id_of("alpha"), "0 0");
    EXPECT_EQ(free_id("alpha"), 14004);
    EXPECT_EQ(id_of("alpha"), "14004 77");
    EXPECT_EQ(set_id(0, "alpha"), 0);
    EXPECT_EQ(in_library(md_get_total_tunnels), 1);
}

int compare(const uint32 *first, const uint32 *second)
{
    const int order = in_library(tunnel_sorted_seq_compare, first, second);
    return (order > 0) - (order < 0);
}

TEST_F(TunnelIds, AreOrderedByTheirNames)
{
    EXPECT_EQ(set_id(1, "beta"), 0);
    EXPECT_EQ(set_id(2, "alpha"), 0);
    EXPECT_EQ(set_id(3, "beta"), 0);
    const uint32 ids[] = {0, 1, 2, 3};
    EXPECT_EQ(compare(&ids[1], &ids[2]), 1);
    EXPECT_EQ(compare(&ids[2], &ids[1]), -1);
    EXPECT_EQ(compare(&ids[1], &ids[3]), 0);
    EXPECT_EQ(compare(&ids[1], &ids[1]), 0);
    EXPECT_EQ(compare(&ids[0], &ids[2]), -1) << "without a name";
}

TEST_F(TunnelIds, PastTheBoundStandBeforeAllOthers)
{
    const uint32 in_range = 99;
    const uint32 past = 100;
    const uint32 far_past = 4294967295;
    EXPECT_EQ(compare(&past, &in_range), -1);
    EXPECT_EQ(compare(&in_range, &far_past), 1);
    EXPECT_EQ(compare(&past, &far_past), 0);
    EXPECT_EQ(compare(&past, &past), 0);
}

TEST_F(TunnelIds, ANullPointerStandsFirst)
{
    const uint32 id = 5;
    const uint32 past = 500;
    EXPECT_EQ(compare(nullptr, nullptr), 0);
    EXPECT_EQ(compare(nullptr, &id), -1);
    EXPECT_EQ(compare(&id, nullptr), 1);
    EXPECT_EQ(compare(nullptr, &past), -1);
}

// The bound less the reserve is an unsigned number.
TEST_F(TunnelIds, BoundsAroundTheReserve)
{
    const auto offer_with_bound = [](uint32 bound_now, uint32 number) {
        begin_tunnel_ids(bound_now);
        return offer(number);
    };
    EXPECT_EQ(offer_with_bound(20, 1), "1");
    EXPECT_EQ(offer_with_bound(21, 1), "0 0");
    EXPECT_EQ(offer_with_bound(21, 2), "1");
    // Below the reserve there is no end to what may be requested, but to what there is.
    EXPECT_EQ(offer_with_bound(19, 19), ids_from(0, 0, 19));
    EXPECT_EQ(offer_with_bound(19, 20), ids_from(1, 0, 19));
    EXPECT_EQ(log_lines().back(),
              gated_line(3, "md_get_next_n_available_tunnel_ids: error in alloc id, idx=19"));
    EXPECT_EQ(offer_with_bound(0, 1), "1");
    EXPECT_THAT(log_lines(),
                ElementsAre(requested(1), gated_line(3, "md_get_next_n_available_tunnel_ids: error "
                                                        "in alloc id, idx=0")));
}

TEST_F(TunnelIds, WithoutAnyIdNothingIsBoundOrFound)
{
    begin_tunnel_ids(0);
    EXPECT_EQ(set_id(0, "alpha"), 14002);
    EXPECT_EQ(id_of("alpha"), "14004 77");
    EXPECT_EQ(sorted_id_of("alpha"), "14004 65535");
    EXPECT_EQ(free_id("alpha"), 14004);
}

TEST_F(TunnelIds, TheLargestBound)
{
    host_.set_log_level(5);
    begin_tunnel_ids(65535);
    EXPECT_EQ(set_id(65534, "alpha"), 0);
    EXPECT_EQ(set_id(65535, "beta"), 14002);
    EXPECT_EQ(id_of("alpha"), "0 65534");
    EXPECT_EQ(offer(65514), ids_from(0, 0, 65514));
    EXPECT_EQ(offer(65515), "1");
    EXPECT_EQ(free_id("alpha"), 0);
}

TEST_F(TunnelIds, NothingIsLoggedBelowTheThreshold)
{
    host_.set_log_level(5);
    EXPECT_EQ(offer(1), "0 0");
    EXPECT_EQ(set_id(0, "alpha"), 0);
    EXPECT_EQ(id_of("beta"), "14004 77");
    EXPECT_EQ(free_id("alpha"), 0);
    EXPECT_THAT(log_lines(), IsEmpty());
    host_.set_log_level(3);
    EXPECT_EQ(free_id("alpha"), 14004);
    EXPECT_THAT(log_lines(), ElementsAre(gated_line(
                                 3, "Unable to free tunnel alpha because tunnel ID not found.")));
    host_.set_log_level(2);
    EXPECT_EQ(free_id("alpha"), 14004);
    EXPECT_EQ(log_lines().size(), 1U);
}

} // namespace
