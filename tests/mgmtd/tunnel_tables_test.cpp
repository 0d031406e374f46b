#include "host/modules/tunnel_tables.h"

#include "orvale/md_tunbin_ht.h"

#include <gtest/gtest.h>

#include <vector>

namespace
{

using namespace ovhost;

class TunnelTables : public testing::Test
{
  protected:
    TunnelTables()
    {
        for (okv_assoc_entry_type &entry : table_) {
            entry = {0, OKV_INVALID_VALUE, 0};
        }
    }

    /// Stores a key whose home is `home`, as the library's header does.
    void add(uint32 home, uint32 number, okv_value value)
    {
        const okv_key key = (okv_key{number} << 64) | home;
        okv_value before = 0;
        ASSERT_EQ(okv_assoc_add_or_replace(table_.data(), key, value, &before), 1);
    }

    std::vector<okv_assoc_entry_type> table_{OKV_ASSOC_SIZE};
};

TEST_F(TunnelTables, AreMeasuredEmpty)
{
    const TableFacts facts = measure_table(table_);
    EXPECT_EQ(facts.slots, 65536U);
    EXPECT_EQ(facts.occupied, 0U);
    EXPECT_EQ(facts.collision_marks, 0U);
    EXPECT_EQ(facts.holes, 0U);
    EXPECT_EQ(facts.longest_probe, 0U);
}

TEST_F(TunnelTables, AreMeasuredWithSharedHomes)
{
    add(10, 1, 0);
    EXPECT_EQ(measure_table(table_).longest_probe, 1U);
    add(10, 2, 1);
    add(10, 3, TUNBIN_HT_COLLISION);
    add(500, 4, 3);
    const TableFacts facts = measure_table(table_);
    EXPECT_EQ(facts.occupied, 4U);
    EXPECT_EQ(facts.collision_marks, 1U);
    EXPECT_EQ(facts.longest_probe, 3U) << "slots 10, 11 and 12";
    EXPECT_EQ(facts.holes, 0U);
}

TEST_F(TunnelTables, AreMeasuredAroundTheEnd)
{
    add(65534, 1, 0);
    add(65534, 2, 1);
    add(65534, 3, 2);
    EXPECT_EQ(measure_table(table_).longest_probe, 3U) << "slots 65534, 65535 and 0";
    // What a delete leaves where other keys' paths cross.
    table_[65535].value = OKV_INVALID_VALUE;
    const TableFacts facts = measure_table(table_);
    EXPECT_EQ(facts.holes, 1U);
    EXPECT_EQ(facts.occupied, 2U);
}

} // namespace
