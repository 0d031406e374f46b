// The tunnel ID allocator before it is set up.
#include "orvale/md_tunneld_tunnel_common.h"
#include "tests/library/library_test.h"
#include "tests/library/tunnel_ids.h"

#include <vector>

using namespace ovtest;
using testing::ElementsAre;
using testing::IsEmpty;

namespace
{

std::string null_line(const std::string &function)
{
    return error_line("md_tunneld_tunnel_common", function, "Unexpected NULL");
}

class TunnelIdsBeforeInit : public LibraryTest
{
  protected:
    TunnelIdsBeforeInit() { planted().tunnel_bounds = {100}; }
};

TEST_F(TunnelIdsBeforeInit, NoTunnelIsThere)
{
    EXPECT_EQ(in_library(md_get_total_tunnels), 0);
    EXPECT_EQ(name_at(0), "14004 old");
    EXPECT_THAT(log_lines(), IsEmpty());
}

TEST_F(TunnelIdsBeforeInit, NoIdIsOffered)
{
    EXPECT_EQ(offer(1), "1");
    EXPECT_THAT(
        log_lines(),
        ElementsAre(gated_line(6, "Received request for 1 available tunnel IDs"),
                    gated_line(3, "md_get_next_n_available_tunnel_ids: error in alloc id, idx=0")));
}

TEST_F(TunnelIdsBeforeInit, NoIdIsBound)
{
    EXPECT_EQ(set_id(5, "alpha"), 14001);
    EXPECT_THAT(log_lines(), ElementsAre(null_line("md_set_tunnel_id")));
    EXPECT_EQ(num_calls(Operation::bail_debug), 1U);
}

// The records are asked for before the bound.
TEST_F(TunnelIdsBeforeInit, NoIdPastTheBoundIsBound)
{
    EXPECT_EQ(set_id(100, "alpha"), 14001);
}

TEST_F(TunnelIdsBeforeInit, TheDefaultNameIsNotBoundAnyway)
{
    EXPECT_EQ(set_id(5, "default"), 0);
    EXPECT_THAT(log_lines(), IsEmpty());
}

TEST_F(TunnelIdsBeforeInit, NoIdIsFreed)
{
    EXPECT_EQ(free_id("alpha"), 14001);
    EXPECT_THAT(log_lines(), ElementsAre(null_line("md_free_tunnel_id")));
}

TEST_F(TunnelIdsBeforeInit, NoIdIsFound)
{
    EXPECT_EQ(id_of("alpha"), "14001 77");
    EXPECT_EQ(sorted_id_of("alpha"), "14001 65535");
    EXPECT_THAT(log_lines(),
                ElementsAre(null_line("md_get_tunnel_id"), null_line("md_get_tunnel_id_sorted")));
}

TEST_F(TunnelIdsBeforeInit, IdsAreOrderedByTheBoundAlone)
{
    const auto order = [](uint32 first, uint32 second) {
        return in_library(tunnel_sorted_seq_compare, &first, &second);
    };
    EXPECT_EQ(order(1, 2), 0);
    EXPECT_LT(order(100, 2), 0);
    EXPECT_GT(order(2, 100), 0);
}

} // namespace
