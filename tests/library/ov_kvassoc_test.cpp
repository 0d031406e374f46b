// The table operation of the shared header, on tables with planted contents.
#include "orvale/ov_kvassoc.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <csignal>
#include <map>
#include <memory>
#include <ostream>

#ifdef OVTEST_COVERAGE
extern "C" void __gcov_dump(void);
#endif

using testing::ElementsAre;
using testing::IsEmpty;
using testing::Pair;

namespace
{

// What differs from an empty table: value and count of each slot, "-" for an empty one.
using Contents = std::map<uint32, std::string>;

class KvAssoc : public testing::Test
{
  protected:
    KvAssoc()
    {
        for (uint32 slot = 0; slot < OKV_ASSOC_SIZE; ++slot) {
            table_[slot] = {0, OKV_INVALID_VALUE, 0};
        }
    }

    // The n-th key with this home.
    static okv_key key(uint64 home, uint64 n) { return okv_key_of(n, 0xabcdef0000 | home); }

    // Answer and old value: "1 65535".
    std::string add(okv_key key, okv_value value)
    {
        okv_value old = 77;
        const int answer = okv_assoc_add_or_replace(table_.get(), key, value, &old);
        return std::to_string(answer) + ' ' + std::to_string(old);
    }

    void plant(uint32 slot, okv_key key, okv_value value, uint32 count)
    {
        table_[slot] = {key, value, count};
    }

    Contents contents() const
    {
        Contents all;
        for (uint32 slot = 0; slot < OKV_ASSOC_SIZE; ++slot) {
            const okv_assoc_entry &entry = table_[slot];
            const bool is_empty = entry.value == OKV_INVALID_VALUE;
            if (!is_empty || entry.count != 0) {
                all[slot] = (is_empty ? "-" : std::to_string(entry.value)) + " x" +
                            std::to_string(entry.count);
            }
        }
        return all;
    }

    okv_key key_at(uint32 slot) const { return table_[slot].key; }

    std::unique_ptr<okv_assoc_entry[]> table_ = std::make_unique<okv_assoc_entry[]>(OKV_ASSOC_SIZE);
};

TEST_F(KvAssoc, AKeyStandsAtItsHome)
{
    EXPECT_EQ(add(key(500, 1), 3), "1 65535");
    EXPECT_THAT(contents(), ElementsAre(Pair(500, "3 x1")));
    EXPECT_EQ(key_at(500), key(500, 1));
}

TEST_F(KvAssoc, TheHomeIsTheLowest16BitsOfTheLowHalf)
{
    EXPECT_EQ(okv_home(okv_key_of(0x1111222233334444, 0x5555666677778888)), 0x8888U);
}

TEST_F(KvAssoc, TheLowHalfStandsFirst)
{
    (void)add(okv_key_of(0x1111222233334444, 0x5555666677770007), 3);
    uint64 halves[2];
    memcpy(halves, &table_[7], sizeof halves);
    EXPECT_EQ(halves[0], 0x5555666677770007U);
    EXPECT_EQ(halves[1], 0x1111222233334444U);
}

TEST_F(KvAssoc, KeysOfOneHomeStandInARow)
{
    EXPECT_EQ(add(key(500, 1), 3), "1 65535");
    EXPECT_EQ(add(key(500, 2), 4), "1 65535");
    EXPECT_EQ(add(key(500, 3), 5), "1 65535");
    EXPECT_THAT(contents(), ElementsAre(Pair(500, "3 x3"), Pair(501, "4 x2"), Pair(502, "5 x1")));
}

TEST_F(KvAssoc, KeysDifferInEitherHalf)
{
    EXPECT_EQ(add(okv_key_of(1, 500), 3), "1 65535");
    EXPECT_EQ(add(okv_key_of(2, 500), 4), "1 65535");
    EXPECT_EQ(add(okv_key_of(1, 0x10000 + 500), 5), "1 65535");
    EXPECT_THAT(contents(), ElementsAre(Pair(500, "3 x3"), Pair(501, "4 x2"), Pair(502, "5 x1")));
}

TEST_F(KvAssoc, APathLeadsThroughOtherHomes)
{
    (void)add(key(500, 1), 3);
    (void)add(key(501, 1), 4);
    EXPECT_EQ(add(key(500, 2), 5), "1 65535");
    EXPECT_THAT(contents(), ElementsAre(Pair(500, "3 x2"), Pair(501, "4 x2"), Pair(502, "5 x1")));
}

TEST_F(KvAssoc, ReplacingAtHomeChangesNoCount)
{
    (void)add(key(500, 1), 3);
    (void)add(key(500, 2), 4);
    EXPECT_EQ(add(key(500, 1), 9), "1 3");
    EXPECT_THAT(contents(), ElementsAre(Pair(500, "9 x2"), Pair(501, "4 x1")));
}

TEST_F(KvAssoc, ReplacingFurtherAlongChangesNoCount)
{
    (void)add(key(500, 1), 3);
    (void)add(key(500, 2), 4);
    (void)add(key(500, 3), 5);
    EXPECT_EQ(add(key(500, 3), 9), "1 5");
    EXPECT_THAT(contents(), ElementsAre(Pair(500, "3 x3"), Pair(501, "4 x2"), Pair(502, "9 x1")));
}

TEST_F(KvAssoc, ReplacingWithTheSameValueReportsIt)
{
    (void)add(key(500, 1), 3);
    EXPECT_EQ(add(key(500, 1), 3), "1 3");
    EXPECT_THAT(contents(), ElementsAre(Pair(500, "3 x1")));
}

TEST_F(KvAssoc, TheEndIsFollowedByTheBeginning)
{
    for (okv_value value = 1; value <= 4; ++value) {
        EXPECT_EQ(add(key(65534, value), value), "1 65535");
    }
    EXPECT_EQ(add(key(65534, 4), 9), "1 4");
    EXPECT_THAT(contents(), ElementsAre(Pair(0, "3 x2"), Pair(1, "9 x1"), Pair(65534, "1 x4"),
                                        Pair(65535, "2 x3")));
}

TEST_F(KvAssoc, AHoleIsTaken)
{
    plant(500, key(500, 1), OKV_INVALID_VALUE, 1);
    plant(501, key(500, 2), 4, 1);
    EXPECT_EQ(add(key(500, 3), 5), "1 65535");
    EXPECT_THAT(contents(), ElementsAre(Pair(500, "5 x2"), Pair(501, "4 x1")));
    EXPECT_EQ(key_at(500), key(500, 3));
}

// The bits of a deleted key stay in its slot, and mean nothing.
TEST_F(KvAssoc, TheKeyOfAnEmptySlotIsNoKey)
{
    plant(500, key(500, 1), OKV_INVALID_VALUE, 0);
    EXPECT_EQ(add(key(500, 1), 5), "1 65535");
    EXPECT_THAT(contents(), ElementsAre(Pair(500, "5 x1")));
}

TEST_F(KvAssoc, ACopyBeyondAHoleMovesUp)
{
    // 1 stood at 500 and is gone; 2 is at 501.
    plant(500, key(500, 1), OKV_INVALID_VALUE, 1);
    plant(501, key(500, 2), 4, 1);
    EXPECT_EQ(add(key(500, 2), 9), "1 4");
    EXPECT_THAT(contents(), ElementsAre(Pair(500, "9 x1")));
    EXPECT_EQ(key_at(500), key(500, 2));
    EXPECT_EQ(key_at(501), key(500, 2)) << "the key's bits stay behind";
}

TEST_F(KvAssoc, ACopyBeyondAHoleInTheMiddleMovesUp)
{
    // Home 500: 1 at 500, a hole at 501, 3 at 502, another home's at 503, 4 at 504, 5 at 505.
    plant(500, key(500, 1), 11, 4);
    plant(501, key(500, 2), OKV_INVALID_VALUE, 3);
    plant(502, key(500, 3), 13, 3);
    plant(503, key(503, 1), 16, 3);
    plant(504, key(500, 4), 14, 2);
    plant(505, key(500, 5), 15, 1);
    EXPECT_EQ(add(key(500, 4), 9), "1 14");
    EXPECT_THAT(contents(), ElementsAre(Pair(500, "11 x4"), Pair(501, "9 x3"), Pair(502, "13 x2"),
                                        Pair(503, "16 x2"), Pair(504, "- x1"), Pair(505, "15 x1")));
}

TEST_F(KvAssoc, ACopyBeyondTwoHolesMovesIntoTheFirst)
{
    plant(500, key(500, 1), OKV_INVALID_VALUE, 2);
    plant(501, key(500, 2), OKV_INVALID_VALUE, 2);
    plant(502, key(500, 3), 13, 2);
    plant(503, key(500, 4), 14, 1);
    EXPECT_EQ(add(key(500, 4), 9), "1 14");
    EXPECT_THAT(contents(), ElementsAre(Pair(500, "9 x2"), Pair(501, "- x1"), Pair(502, "13 x1")));
}

TEST_F(KvAssoc, TheKeyBitsOfAHoleAreNoCopy)
{
    plant(500, key(500, 1), OKV_INVALID_VALUE, 1);
    plant(501, key(500, 3), OKV_INVALID_VALUE, 1);
    plant(502, key(500, 2), 12, 1);
    EXPECT_EQ(add(key(500, 3), 9), "1 65535");
    EXPECT_THAT(contents(), ElementsAre(Pair(500, "9 x2"), Pair(501, "- x1"), Pair(502, "12 x1")));
}

TEST_F(KvAssoc, TheSearchForACopyEndsWhereNoPathLeads)
{
    plant(500, key(500, 1), OKV_INVALID_VALUE, 0);
    plant(502, key(500, 2), 12, 1); // no path of this home leads over 501
    EXPECT_EQ(add(key(500, 2), 9), "1 65535");
    EXPECT_THAT(contents(), ElementsAre(Pair(500, "9 x1"), Pair(502, "12 x1")));
}

TEST_F(KvAssoc, ACopyBeyondTheEndMovesUp)
{
    plant(65534, key(65534, 1), 11, 3);
    plant(65535, key(65534, 2), OKV_INVALID_VALUE, 2);
    plant(0, key(65534, 3), 13, 2);
    plant(1, key(65534, 4), 14, 1);
    EXPECT_EQ(add(key(65534, 4), 9), "1 14");
    EXPECT_THAT(contents(),
                ElementsAre(Pair(0, "13 x1"), Pair(65534, "11 x3"), Pair(65535, "9 x2")));
}

TEST_F(KvAssoc, TheSearchForACopyEndsAtHome)
{
    // Every slot has a count, and the only hole is the last slot of the path.
    for (uint32 slot = 0; slot < OKV_ASSOC_SIZE; ++slot) {
        plant(slot, key(slot, 1), 1, 1);
    }
    plant(499, key(499, 1), OKV_INVALID_VALUE, 1);
    EXPECT_EQ(add(key(500, 2), 9), "1 65535");
    EXPECT_EQ(key_at(499), key(500, 2));
    EXPECT_EQ(table_[499].count, 2U);
    EXPECT_EQ(table_[498].count, 2U);
    EXPECT_EQ(table_[500].count, 2U);
}

TEST_F(KvAssoc, AHoleAtHomeIsFollowedAllTheWayRound)
{
    for (uint32 slot = 0; slot < OKV_ASSOC_SIZE; ++slot) {
        plant(slot, key(slot, 1), 1, 1);
    }
    plant(500, key(500, 1), OKV_INVALID_VALUE, 1);
    plant(499, key(500, 2), 8, 1);
    EXPECT_EQ(add(key(500, 2), 9), "1 8");
    EXPECT_EQ(table_[500].value, 9U);
    EXPECT_EQ(table_[500].count, 1U);
    EXPECT_EQ(table_[499].value, OKV_INVALID_VALUE);
    EXPECT_EQ(table_[499].count, 0U);
    EXPECT_EQ(table_[501].count, 0U);
}

TEST_F(KvAssoc, AFullTableStaysAsItWas)
{
    for (uint32 slot = 0; slot < OKV_ASSOC_SIZE; ++slot) {
        plant(slot, key(slot, 1), 7, slot % 5 + 1);
    }
    const Contents before = contents();
    EXPECT_EQ(add(key(500, 2), 9), "0 65535");
    EXPECT_EQ(add(key(0, 2), 9), "0 65535");
    EXPECT_EQ(add(key(65535, 2), 9), "0 65535");
    EXPECT_EQ(contents(), before);
}

TEST_F(KvAssoc, AFullTableLetsItsKeysBeReplaced)
{
    for (uint32 slot = 0; slot < OKV_ASSOC_SIZE; ++slot) {
        plant(slot, key(slot, 1), 7, 1);
    }
    plant(499, key(500, 2), 8, 1);
    Contents expected = contents();
    EXPECT_EQ(add(key(500, 2), 9), "1 8");
    expected[499] = "9 x1";
    EXPECT_EQ(contents(), expected);
}

TEST_F(KvAssoc, TheMarkOfACollisionIsAValueLikeAnyOther)
{
    EXPECT_EQ(add(key(500, 1), 65534), "1 65535");
    EXPECT_EQ(add(key(500, 1), 0), "1 65534");
    EXPECT_THAT(contents(), ElementsAre(Pair(500, "0 x1")));
}

// What an aborted process has run counts as well.
void keep_coverage_of_an_abort()
{
#ifdef OVTEST_COVERAGE
    (void)std::signal(SIGABRT, [](int signal) {
        __gcov_dump();
        (void)std::signal(signal, SIG_DFL);
        (void)std::raise(signal);
    });
#endif
}

using KvAssocDeathTest = KvAssoc;

TEST_F(KvAssocDeathTest, TheMarkOfAnEmptySlotIsNotStored)
{
    okv_value old = 77;
    const auto store_the_mark = [&] {
        keep_coverage_of_an_abort();
        (void)okv_assoc_add_or_replace(table_.get(), key(500, 1), 65535, &old);
    };
    EXPECT_EXIT(store_the_mark(), testing::KilledBySignal(SIGABRT),
                "ov_kvassoc\\.h:99: .*v!=OKV_INVALID_VALUE");
    EXPECT_EQ(old, 77U);
    EXPECT_THAT(contents(), IsEmpty());
}

} // namespace
