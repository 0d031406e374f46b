// The tables of names and of aliases: every test runs on both.
#include "tests/library/library_test.h"
#include "tests/library/literal_table.h"
#include "tests/library/tunnel_cache.h"

#include <algorithm>
#include <map>
#include <ostream>

using namespace ovtest;
using testing::ElementsAre;
using testing::IsEmpty;
using testing::Pair;

namespace
{

// A short text's home is the exclusive-or of its bytes, counted from here.
constexpr uint32 seed_mask = 0xffff;
constexpr uint32 seed_end = 0x7f00;

class TextTable : public LibraryTest, public testing::WithParamInterface<TableOperations>
{
  protected:
    TextTable()
    {
        (void)table().init();
        forget_calls();
    }

    static const TableOperations &table() { return GetParam(); }
    static std::string name_of(const std::string &operation) { return table().name_of(operation); }

    uint64 seed() const { return seed_; }
    std::string key_of(const std::string &text) const
    {
        const LiteralKey key = literal_key(text, seed_);
        return key_text(key.high, key.low);
    }

    void add(std::string text, uint32 id) { in_library(table().add, text.data(), id); }
    void del(std::string text) { in_library(table().del, text.data()); }

    // Status and ID, which is 77 before the call: "0 5".
    std::string find(const std::string &text)
    {
        uint32 id = 77;
        const int status = in_library(table().find, text.c_str(), &id);
        return std::to_string(status) + ' ' + std::to_string(id);
    }

    // The lines that an operation writes.
    std::string added(const std::string &text, uint32 id) const
    {
        return gated_line(6, name_of("add") + ": ADDED " + table().word + ' ' + text +
                                 " key=" + key_of(text) + ", tid:" + std::to_string(id));
    }
    std::string conflict(const std::string &text, uint32 id) const
    {
        return gated_line(3, name_of("add") + ": CONFLICT " + table().word + ' ' + text +
                                 " key=" + key_of(text) + ", tid:" + std::to_string(id));
    }
    std::string failed(const std::string &text, uint32 id) const
    {
        return gated_line(3, name_of("add") + ": FAILED to add " + table().word + ' ' + text +
                                 " key=" + key_of(text) + ", tid:" + std::to_string(id));
    }
    std::string not_removed(const std::string &text) const
    {
        return gated_line(6, name_of("del") + ": could not remove tun=" + text +
                                 " from hash table. key=" + key_of(text));
    }
    std::string dumped(const std::string &text, uint32 value, uint32 count) const
    {
        return gated_line(6, name_of("dump") + ": key=" + key_of(text) + ", value=" +
                                 std::to_string(value) + ", count=" + std::to_string(count));
    }
    std::string total(unsigned number) const
    {
        return gated_line(6, name_of("dump") + ": total " + std::to_string(number) +
                                 " entries dumped");
    }

    // Slots counted from the seed's low bits, as "VALUE xCOUNT", "-" for an empty one; those
    // without a value and a count are left out.
    using Contents = std::map<uint32, std::string>;
    Contents contents() const
    {
        Contents all;
        for (uint32 slot = 0; slot < OKV_ASSOC_SIZE; ++slot) {
            const okv_assoc_entry &entry = table().slots[slot];
            if (entry.value != OKV_INVALID_VALUE || entry.count != 0) {
                const bool is_empty = entry.value == OKV_INVALID_VALUE;
                all[(slot - seed_end) % OKV_ASSOC_SIZE] =
                    (is_empty ? "-" : std::to_string(entry.value)) + " x" +
                    std::to_string(entry.count);
            }
        }
        return all;
    }

  private:
    static uint64 time_of_seed()
    {
        static const uint64 time = time_with_seed_ending(seed_end, seed_mask);
        return time;
    }

    const uint64 time_ = time_of_seed();
    const uint64 seed_ = seed_at(time_);
    const PlantedTimeOfDay planted_time_{time_};
};

TEST_P(TextTable, IsEmptyAfterItsInit)
{
    add("alpha", 5);
    add("beta", 6);
    EXPECT_EQ(in_library(table().init), 0);
    EXPECT_EQ(find("alpha"), "14004 77");
    for (uint32 slot = 0; slot < OKV_ASSOC_SIZE; ++slot) {
        const okv_assoc_entry &entry = table().slots[slot];
        ASSERT_TRUE(entry.key == 0 && entry.value == 65535 && entry.count == 0) << slot;
    }
}

TEST_P(TextTable, SaysWhereItIs)
{
    EXPECT_EQ(in_library(table().init), 0);
    char address[32];
    (void)snprintf(address, sizeof address, "%p", static_cast<void *>(table().slots));
    EXPECT_THAT(log_lines(),
                ElementsAre(gated_line(6, " " + name_of("init") +
                                              ": OKVSZ:2097152 sizeof:2097152 assoc:" + address)));
}

TEST_P(TextTable, IsSeededFromTheTimeOfDay)
{
    EXPECT_EQ(seed_of(table()), seed());
    const uint64 later = uint64{1700000123} * 1000000 + 999999;
    const PlantedTimeOfDay planted_time(later);
    (void)in_library(table().init);
    // Seconds and microseconds in one number, of which srand takes the lowest 32 bits.
    srand(static_cast<unsigned>(1700000123999999U % 4294967296U));
    EXPECT_EQ(seed_of(table()), static_cast<uint64>(rand()));
}

TEST_P(TextTable, LeadsFromATextToAnId)
{
    add("t1", 5);
    EXPECT_EQ(find("t1"), "0 5");
    EXPECT_EQ(find("t2"), "14004 77");
    EXPECT_EQ(find("T1"), "14004 77");
    EXPECT_THAT(log_lines(), ElementsAre(added("t1", 5)));
}

TEST_P(TextTable, AddingTheSameTwiceChangesNothing)
{
    add("t1", 5);
    add("t1", 5);
    EXPECT_EQ(find("t1"), "0 5");
    EXPECT_THAT(log_lines(), ElementsAre(added("t1", 5)));
    EXPECT_THAT(contents(), ElementsAre(Pair('t' ^ '1', "5 x1")));
}

TEST_P(TextTable, ATextOfTwoTunnelsLeadsToNone)
{
    add("t1", 5);
    add("t1", 6);
    EXPECT_EQ(find("t1"), "14004 77");
    EXPECT_EQ(in_library(table().dump), 1U);
    EXPECT_THAT(log_lines(),
                ElementsAre(added("t1", 5), conflict("t1", 6), dumped("t1", 65534, 1), total(1)));
}

TEST_P(TextTable, ATextOfTwoTunnelsStaysSo)
{
    add("t1", 5);
    add("t1", 6);
    add("t1", 5);
    add("t1", 7);
    EXPECT_EQ(find("t1"), "14004 77");
    EXPECT_THAT(log_lines(), ElementsAre(added("t1", 5), conflict("t1", 6), conflict("t1", 5),
                                         conflict("t1", 7)));
    EXPECT_THAT(contents(), ElementsAre(Pair('t' ^ '1', "65534 x1")));
}

TEST_P(TextTable, TheMarkItselfIsNoConflictWithItself)
{
    add("t1", 5);
    add("t1", 6);
    forget_calls();
    add("t1", 65534);
    EXPECT_THAT(log_lines(), IsEmpty());
}

TEST_P(TextTable, TheMarkMayBeAddedAndLeadsToNothing)
{
    add("t1", 65534);
    EXPECT_EQ(find("t1"), "14004 77");
    EXPECT_THAT(log_lines(), ElementsAre(added("t1", 65534)));
}

TEST_P(TextTable, NoIdIsNotAdded)
{
    add("t1", 65535);
    EXPECT_EQ(find("t1"), "14004 77");
    EXPECT_THAT(log_lines(), IsEmpty());
    EXPECT_THAT(contents(), IsEmpty());
}

TEST_P(TextTable, NoIdIsAConflictWithAnId)
{
    add("t1", 5);
    add("t1", 65535);
    EXPECT_EQ(find("t1"), "14004 77");
    EXPECT_THAT(log_lines(), ElementsAre(added("t1", 5), conflict("t1", 65535)));
}

TEST_P(TextTable, TheSmallestAndTheLargestIdAreIds)
{
    add("t1", 0);
    add("t2", 65533);
    EXPECT_EQ(find("t1"), "0 0");
    EXPECT_EQ(find("t2"), "0 65533");
}

// IDs of tunnels have 16 bits, the tables' have 32.
TEST_P(TextTable, LargerIdsAreNotCut)
{
    add("t1", 65536);
    add("t2", 70000);
    EXPECT_EQ(find("t1"), "0 65536");
    EXPECT_EQ(find("t2"), "0 70000");
    EXPECT_THAT(log_lines(), ElementsAre(added("t1", 65536), added("t2", 70000)));
}

TEST_P(TextTable, FindNeedsNoPlaceForTheId)
{
    add("t1", 5);
    EXPECT_EQ(in_library(table().find, "t1", nullptr), 0);
    EXPECT_EQ(in_library(table().find, "t2", nullptr), 14004);
}

TEST_P(TextTable, ForgetsAText)
{
    add("t1", 5);
    forget_calls();
    del("t1");
    EXPECT_EQ(find("t1"), "14004 77");
    EXPECT_THAT(log_lines(), IsEmpty());
    EXPECT_THAT(contents(), IsEmpty());
}

TEST_P(TextTable, TheKeyOfAForgottenTextStaysInItsSlot)
{
    add("t1", 5);
    del("t1");
    const LiteralKey key = literal_key("t1", seed());
    const okv_assoc_entry &entry = table().slots[key.low % OKV_ASSOC_SIZE];
    EXPECT_EQ(okv_key_high(entry.key), key.high);
    EXPECT_EQ(okv_key_low(entry.key), key.low);
}

TEST_P(TextTable, ATextOfTwoTunnelsIsForgottenToo)
{
    add("t1", 5);
    add("t1", 6);
    forget_calls();
    del("t1");
    EXPECT_THAT(log_lines(), IsEmpty());
    EXPECT_EQ(find("t1"), "14004 77");
    add("t1", 6);
    EXPECT_EQ(find("t1"), "0 6");
    EXPECT_THAT(log_lines(), ElementsAre(added("t1", 6)));
}

TEST_P(TextTable, SaysWhatIsNotThereToForget)
{
    del("t1");
    add("t1", 5);
    del("t1");
    del("t1");
    EXPECT_THAT(log_lines(), ElementsAre(not_removed("t1"), added("t1", 5), not_removed("t1")));
}

TEST_P(TextTable, TextsOfOneHomeStandInARow)
{
    add("ab", 1);
    add("ba", 2);
    EXPECT_THAT(contents(), ElementsAre(Pair(3, "1 x2"), Pair(4, "2 x1")));
    EXPECT_EQ(find("ab"), "0 1");
    EXPECT_EQ(find("ba"), "0 2");
}

TEST_P(TextTable, IsSearchedBeyondAHole)
{
    add("ab", 1);
    add("ba", 2);
    del("ab");
    EXPECT_THAT(contents(), ElementsAre(Pair(3, "- x1"), Pair(4, "2 x1")));
    EXPECT_EQ(find("ab"), "14004 77");
    EXPECT_EQ(find("ba"), "0 2");
    // The same ID again changes nothing, so that the entry stays beyond the hole.
    add("ba", 2);
    EXPECT_THAT(contents(), ElementsAre(Pair(3, "- x1"), Pair(4, "2 x1")));
    // A conflict moves up.
    add("ba", 3);
    EXPECT_THAT(contents(), ElementsAre(Pair(3, "65534 x1")));
}

TEST_P(TextTable, AHoleIsTakenByTheNextText)
{
    add("ab", 1);
    add("ba", 2);
    del("ab");
    add("ab", 7);
    EXPECT_THAT(contents(), ElementsAre(Pair(3, "7 x2"), Pair(4, "2 x1")));
}

TEST_P(TextTable, TheEmptyTextIsATextToo)
{
    add("", 5);
    EXPECT_EQ(find(""), "0 5");
    EXPECT_THAT(contents(), ElementsAre(Pair(0, "5 x1")));
    EXPECT_THAT(log_lines(), ElementsAre(gated_line(6, name_of("add") + ": ADDED " + table().word +
                                                           "  key=9e3779b97f4a7c13" +
                                                           key_of("").substr(16) + ", tid:5")));
}

TEST_P(TextTable, BytesAbove127AreBytes)
{
    add("\xff\x80", 5);
    EXPECT_EQ(find("\xff\x80"), "0 5");
    EXPECT_THAT(contents(), ElementsAre(Pair(0x7f, "5 x1")));
}

TEST_P(TextTable, LongTextsAreKeptApart)
{
    const std::string first(255, 'x');
    const std::string second = first.substr(1) + 'y';
    add(first, 1);
    add(second, 2);
    EXPECT_EQ(find(first), "0 1");
    EXPECT_EQ(find(second), "0 2");
    EXPECT_EQ(find(first.substr(1)), "14004 77");
}

// Texts are told apart by their keys alone.
TEST_P(TextTable, TextsOfOneKeyAreOneText)
{
    const LiteralKey key = {0x123456789abcdef0, 0x7f00};
    const std::string first = text_with_key(key, seed(), 0);
    const std::string second = text_with_key(key, seed(), 1);
    ASSERT_NE(first, second);
    add(first, 5);
    EXPECT_EQ(find(second), "0 5");
    add(second, 5);
    add(second, 6);
    EXPECT_THAT(log_lines(), ElementsAre(added(first, 5), conflict(second, 6)));
    del(second);
    add(first, 6);
    EXPECT_EQ(find(second), "0 6");
}

TEST_P(TextTable, KeysOfOneHomeDifferInEitherHalf)
{
    const LiteralKey keys[] = {{1, 0x7f00}, {1, 0x17f00}, {1, 0x27f00}, {2, 0x17f00}, {2, 0x7f00}};
    std::vector<std::string> texts;
    for (const LiteralKey &key : keys) {
        texts.push_back(text_with_key(key, seed(), 0));
        add(texts.back(), static_cast<uint32>(texts.size()));
    }
    EXPECT_THAT(contents(), ElementsAre(Pair(0, "1 x5"), Pair(1, "2 x4"), Pair(2, "3 x3"),
                                        Pair(3, "4 x2"), Pair(4, "5 x1")));
    del(texts[1]);
    EXPECT_EQ(find(texts[0]), "0 1");
    EXPECT_EQ(find(texts[1]), "14004 77");
    EXPECT_EQ(find(texts[2]), "0 3");
    EXPECT_EQ(find(texts[3]), "0 4");
    EXPECT_EQ(find(texts[4]), "0 5");
}

TEST_P(TextTable, IsDumpedInTheOrderOfItsSlots)
{
    add("b", 1);
    add("a", 2);
    add("ab", 3);
    add("ba", 4);
    del("ab");
    forget_calls();
    EXPECT_EQ(in_library(table().dump), 3U);
    // 'a' ^ 'b' is 3: "ba" stands at 4, behind a hole.
    EXPECT_THAT(log_lines(),
                ElementsAre(dumped("ba", 4, 1), dumped("a", 2, 1), dumped("b", 1, 1), total(3)));
}

TEST_P(TextTable, AnEmptyTableIsDumped)
{
    EXPECT_EQ(in_library(table().dump), 0U);
    EXPECT_THAT(log_lines(), ElementsAre(total(0)));
}

TEST_P(TextTable, IsCountedEvenWhenNothingIsLogged)
{
    host_.set_log_level(5);
    add("a", 2);
    EXPECT_EQ(in_library(table().dump), 1U);
    EXPECT_THAT(log_lines(), IsEmpty());
}

TEST_P(TextTable, ErrorsAreLoggedAtTheLevelOfErrors)
{
    host_.set_log_level(3);
    (void)in_library(table().init);
    add("a", 2);
    add("a", 3);
    del("b");
    EXPECT_THAT(log_lines(), ElementsAre(conflict("a", 3)));
    host_.set_log_level(2);
    add("a", 4);
    EXPECT_THAT(log_lines(), ElementsAre(conflict("a", 3)));
}

TEST_P(TextTable, TheDaemonsThresholdGoesBeforeTheGeneralOne)
{
    G_log_level = 7;
    G_daemon_log_level = 5;
    add("a", 2);
    EXPECT_THAT(log_lines(), IsEmpty());
    G_log_level = 0;
    G_daemon_log_level = 6;
    add("b", 2);
    EXPECT_THAT(log_lines(), ElementsAre(added("b", 2)));
}

std::string name_of_table(const testing::TestParamInfo<TableOperations> &about)
{
    return about.param.word;
}

INSTANTIATE_TEST_SUITE_P(Both, TextTable, testing::ValuesIn(table_operations), name_of_table);

using TextTables = LibraryTest;

// What one table holds is nothing to the other.
TEST_F(TextTables, AreApart)
{
    for (const TableOperations &table : table_operations) {
        (void)table.init();
    }
    char text[] = "t1";
    tunbin_tunname_ht_add(text, 5);
    EXPECT_EQ(tunbin_tunalias_ht_find(text, nullptr), 14004);
    tunbin_tunalias_ht_add(text, 6);
    uint32 id = 0;
    EXPECT_EQ(tunbin_tunname_ht_find(text, &id), 0);
    EXPECT_EQ(id, 5U);
    EXPECT_EQ(tunbin_tunalias_ht_find(text, &id), 0);
    EXPECT_EQ(id, 6U);
}

TEST_F(TextTables, HaveSeedsOfTheirOwn)
{
    const uint64 first = 1700000000123456;
    const uint64 second = 1700000000654321;
    {
        const PlantedTimeOfDay now(first);
        (void)tunbin_tunname_ht_init();
    }
    {
        const PlantedTimeOfDay now(second);
        (void)tunbin_tunalias_ht_init();
    }
    EXPECT_EQ(seed_of(table_operations[0]), seed_at(first));
    EXPECT_EQ(seed_of(table_operations[1]), seed_at(second));
}

} // namespace
