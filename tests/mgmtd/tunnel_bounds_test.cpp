// How many tunnels there can be at the least and the greatest numbers that a model can allow. Each
// test does its work in a process of its own, because the number is settled once for a process.

#include "framework/appliance.h"
#include "host/modules/model.h"
#include "host/modules/node_access.h"
#include "orvale/md_tunbin_ht.h"
#include "orvale/md_tunneld_tunnel_common.h"
#include "tests/mgmtd/tunnel_fixture.h"

#include <sys/wait.h>
#include <unistd.h>

#include <cstdio>
#include <cstdlib>
#include <functional>
#include <ostream>

namespace
{

using namespace ovhost;
using namespace mgmtd_test;
using testing::Contains;
using testing::Each;
using testing::IsEmpty;

constexpr uint32 none = 65535;

/// More digits than any test needs, so that the names sort as their numbers do.
std::string numbered(const char *prefix, uint32 number)
{
    std::string digits = std::to_string(number);
    return prefix + std::string(5 - digits.size(), '0') + digits;
}

class TunnelBoundsTest : public TunnelTest
{
  protected:
    TunnelBoundsTest() : TunnelTest(Start::later) {}

    static void in_own_process(const std::function<void()> &body)
    {
        std::fflush(nullptr);
        const pid_t child = ::fork();
        ASSERT_GE(child, 0);
        if (child == 0) {
            body();
            std::fflush(nullptr);
            ::_exit(HasFailure() ? 1 : 0);
        }
        int status = -1;
        ASSERT_EQ(::waitpid(child, &status, 0), child);
        EXPECT_EQ(status, 0) << "the failures are told above";
    }

    void start_with(uint32 max_tunnels)
    {
        put_in_store(max_tunnels_node, bt_uint32, std::to_string(max_tunnels));
    }

    /// Binds IDs in the library alone: thousands of tunnels take a configuration too long.
    static void take_ids(uint32 first, uint32 end)
    {
        for (uint32 id = first; id < end; ++id) {
            ASSERT_EQ(md_set_tunnel_id(id, TstringCopy(numbered("taken", id)).get()), 0);
        }
    }

    void add_many(uint32 count)
    {
        for (uint32 i = 0; i < count; ++i) {
            add(numbered("new", i));
        }
    }

    /// The tunnels of add_many() have the first IDs, in the order of their names.
    static void expect_ids(uint32 count)
    {
        for (uint32 i = 0; i < count; ++i) {
            EXPECT_EQ(md_tunbin_ht_get_id_by_name(numbered("new", i).c_str()), i);
        }
        EXPECT_EQ(md_tunbin_ht_get_id_by_name(numbered("new", count).c_str()), none);
        EXPECT_FALSE(md_tunbin_ht_id_has_tunnel(count));
    }

    [[nodiscard]] std::vector<std::string> model_log() const
    {
        std::vector<std::string> texts;
        for (const test::LoggedLine &line : log_.lines) {
            if (line.unit == "model") {
                texts.push_back(log_level_word(line.level) + " " + line.text);
            }
        }
        return texts;
    }
};

struct Bound {
    uint32 configured;
    uint32 in_force;
    uint32 taken_from; ///< the IDs from here on are bound before the test begins
    uint32 room;       ///< so many tunnels can be added then
    std::string too_many;
    std::string one_more;
    uint32 bad_id;
    std::string bad_id_fault;
};

void PrintTo(const Bound &bound, std::ostream *stream)
{
    *stream << bound.configured;
}

const std::string too_many_at_the_largest =
    ": no IDs for 3 new tunnels: 65513 of 65535 are in use, and 20 stay in reserve (tunnels)\n";
const std::string one_more_at_the_largest =
    ": no ID for 1 new tunnel: 65515 of 65535 are in use, and 20 stay in reserve (tunnels)\n";
const std::string past_the_cache =
    ": ID 10022 is out of range: tunnels have IDs from 0 to 10021 (tunnels)\n";

// The allocator takes the reserve off without looking whether there is as much: below 20 it keeps
// none.
const Bound bounds[] = {
    {0, 0, 0, 0, ": no ID for 1 new tunnel: 0 can be given now, and no more are free (tunnels)\n",
     ": no ID for 1 new tunnel: 0 can be given now, and no more are free (tunnels)\n", 0,
     ": ID 0 cannot be: the model allows no tunnels (tunnels)\n"},
    {19, 19, 19, 19,
     ": no IDs for 20 new tunnels: 19 can be given now, and no more are free (tunnels)\n",
     ": no ID for 1 new tunnel: 0 can be given now, and no more are free (tunnels)\n", 19,
     ": ID 19 is out of range: tunnels have IDs from 0 to 18 (tunnels)\n"},
    {20, 20, 20, 0,
     ": no ID for 1 new tunnel: 0 of 20 are in use, and 20 stay in reserve (tunnels)\n",
     ": no ID for 1 new tunnel: 0 of 20 are in use, and 20 stay in reserve (tunnels)\n", 20,
     ": ID 20 is out of range: tunnels have IDs from 0 to 19 (tunnels)\n"},
    {21, 21, 21, 1,
     ": no IDs for 2 new tunnels: 0 of 21 are in use, and 20 stay in reserve (tunnels)\n",
     ": no ID for 1 new tunnel: 1 of 21 are in use, and 20 stay in reserve (tunnels)\n", 21,
     ": ID 21 is out of range: tunnels have IDs from 0 to 20 (tunnels)\n"},
    {65535, 65535, 22, 2, too_many_at_the_largest, one_more_at_the_largest, 10022, past_the_cache},
    {65536, 65535, 22, 2, too_many_at_the_largest, one_more_at_the_largest, 10022, past_the_cache},
};

class TunnelBounds : public TunnelBoundsTest, public testing::WithParamInterface<Bound>
{
  protected:
    void expect_refusals(const Bound &bound, int in_use)
    {
        add_many(bound.room + 1);
        EXPECT_EQ(commit_in_vain(), bound.too_many);
        add("x");
        set_id("x", bound.bad_id);
        EXPECT_EQ(commit_in_vain(),
                  tunnel("x", "id") + bound.bad_id_fault + (bound.room == 0 ? bound.one_more : ""));
        EXPECT_EQ(md_get_total_tunnels(), in_use);
        expect_ids(0);
    }

    void expect_as_many_as_there_is_room_for(const Bound &bound)
    {
        start_with(bound.configured);
        ASSERT_EQ(get_max_tunnel_number(), bound.in_force);
        take_ids(bound.taken_from, bound.in_force);
        const auto taken = static_cast<int>(bound.in_force - bound.taken_from);
        expect_refusals(bound, taken);

        add_many(bound.room);
        EXPECT_EQ(commit(), bound.room > 0 ? "committed" : "unchanged");
        expect_ids(bound.room);
        add("x");
        EXPECT_EQ(commit_in_vain(), bound.one_more);
        EXPECT_EQ(md_tunbin_ht_get_id_by_name("x"), none);
        EXPECT_EQ(md_get_total_tunnels(), taken + static_cast<int>(bound.room));

        restart();
        expect_ids(bound.room);
        EXPECT_EQ(md_get_total_tunnels(), static_cast<int>(bound.room)) << "the store's";
    }
};

TEST_P(TunnelBounds, LeaveRoomForSoManyAndNoMore)
{
    in_own_process([this] { expect_as_many_as_there_is_room_for(GetParam()); });
}

INSTANTIATE_TEST_SUITE_P(Models, TunnelBounds, testing::ValuesIn(bounds),
                         [](const testing::TestParamInfo<Bound> &row) {
                             return std::to_string(row.param.configured);
                         });

TEST_F(TunnelBoundsTest, IdsPastTheCacheAreOfferedButNotTaken)
{
    in_own_process([this] {
        start_with(65535);
        take_ids(0, 10021);
        add("a");
        ASSERT_EQ(commit(), "committed");
        EXPECT_EQ(stored("a"), "uint16 10021, string a");
        add("b");
        EXPECT_EQ(commit_in_vain(), tunnel("b", "id") + past_the_cache);
        EXPECT_EQ(md_get_total_tunnels(), 10022);
        EXPECT_EQ(md_tunbin_ht_get_id_by_name("b"), none);
    });
}

TEST_F(TunnelBoundsTest, MoreThanThereCanBeCountsAsTheMost)
{
    in_own_process([this] {
        start_with(65535);
        EXPECT_THAT(model_log(), IsEmpty());
        set(max_tunnels_node, bt_uint32, "65536");
        ASSERT_EQ(commit(), "committed");
        const std::string lowered = "warning model node /ov/model/limits/max_tunnels: 65536 is too "
                                    "large, 65535 is used";
        EXPECT_THAT(model_log(), Contains(lowered));
        EXPECT_THAT(model_log(), Each(lowered)) << "nothing waits for the next start";
        EXPECT_EQ(get_max_tunnel_number(), 65535U);
    });
}

} // namespace
