// Long random sequences of operations on the tables of names and of aliases: after them every slot
// is what the literal table has there.
#include "tests/library/library_test.h"
#include "tests/library/literal_table.h"
#include "tests/library/tunnel_cache.h"
#include "tests/support/sanitized.h"

#include <algorithm>
#include <ostream>
#include <random>
#include <unordered_set>

using namespace ovtest;
using testing::ElementsAre;
using testing::IsEmpty;

namespace
{

class Random
{
  public:
    explicit Random(uint32 seed) : engine_(seed) {}

    uint32 below(std::size_t end) { return static_cast<uint32>(engine_() % end); }

    std::mt19937 &engine() { return engine_; }

  private:
    std::mt19937 engine_;
};

// Which texts a sequence is about. Without NUL, and all different.
struct Texts {
    std::size_t number;
    std::size_t shortest;
    std::size_t longest;
    bool is_tail_random_only; // all but the last four bytes are the same in all of them
};

struct Sequence {
    const char *name;
    Texts texts;
    uint32 seed_ending; // the seed's lowest 16 bits
    unsigned steps;
};

// Short texts' homes are the 256 slots around the seed's ending: with ffff their paths lead around
// the end of the table.
constexpr Sequence sequences[] = {
    {"ShortOnes", {300, 0, 9, false}, 0x1234, 120000},
    {"ShortOnesAroundTheEnd", {500, 1, 23, false}, 0xffff, 120000},
    {"ManyShortOnesAroundTheEnd", {2500, 5, 23, false}, 0xffab, 40000},
    {"LongOnes", {3000, 24, 255, false}, 0x8000, 100000},
    {"LongOnesThatDifferInTheTail", {600, 64, 64, true}, 0xfff0, 60000},
    {"VeryManyLongOnes", {70000, 24, 40, false}, 0x0000, 100000},
};

std::vector<std::string> make_texts(const Texts &texts, Random &random)
{
    constexpr std::size_t tail_size = 4;
    std::unordered_set<std::string> seen;
    std::vector<std::string> all;
    while (all.size() < texts.number) {
        const std::size_t size = texts.shortest + random.below(texts.longest - texts.shortest + 1);
        const std::size_t same = texts.is_tail_random_only ? size - tail_size : 0;
        std::string text(same, 'x');
        while (text.size() < size) {
            text += static_cast<char>(random.below(255) + 1);
        }
        if (seen.insert(text).second) {
            all.push_back(std::move(text));
        }
    }
    return all;
}

// One table, and the literal one that goes with it.
class Twins
{
  public:
    Twins(const TableOperations &table, uint32 seed_ending)
        : time_(time_with_seed_ending(seed_ending, 0xffff)), table_(table)
    {
        begin_anew();
    }

    // Both empty, with the seed that they had.
    void begin_anew()
    {
        (void)table_.init();
        literal_ = LiteralTextTable(seed());
    }

    uint64 seed() const { return seed_at(time_); }

    void add(std::string text, uint32 id)
    {
        (void)literal_.add(text, id);
        table_.add(text.data(), id);
    }

    // With the line that this writes, shortened to its word.
    void add_and_compare_lines(std::string text, uint32 id)
    {
        forget_calls();
        in_library(table_.add, text.data(), id);
        std::string word;
        for (const std::string &line : log_lines()) {
            const std::size_t start = line.find("_ht_add: ") + 9;
            word += line.substr(start, line.find(' ', start) - start);
        }
        EXPECT_EQ(word, literal_.add(text, id));
    }

    void del(std::string text)
    {
        (void)literal_.del(text);
        table_.del(text.data());
    }

    void compare_find(const std::string &text) const
    {
        uint32 id = OKV_INVALID_VALUE;
        const bool is_found = table_.find(text.c_str(), &id) == 0;
        const std::optional<uint32> expected = literal_.find(text);
        ASSERT_EQ(is_found, expected.has_value());
        ASSERT_EQ(id, expected.value_or(OKV_INVALID_VALUE));
    }

    void compare_all_slots() const
    {
        for (uint32 slot = 0; slot < OKV_ASSOC_SIZE; ++slot) {
            const okv_assoc_entry &entry = table_.slots[slot];
            const LiteralTable::Slot &expected = literal_.table().at(slot);
            if (okv_key_high(entry.key) != expected.key.high ||
                okv_key_low(entry.key) != expected.key.low || entry.value != expected.value ||
                entry.count != expected.count) {
                FAIL() << "slot " << slot << " has value " << entry.value << " and count "
                       << entry.count << " in place of " << expected.value << " and "
                       << expected.count;
            }
        }
    }

    uint32 num_live() const
    {
        return static_cast<uint32>(
            std::count_if(table_.slots, table_.slots + OKV_ASSOC_SIZE,
                          [](const auto &entry) { return entry.value != OKV_INVALID_VALUE; }));
    }

  private:
    uint64 time_;
    PlantedTimeOfDay planted_time_{time_};
    const TableOperations &table_;
    LiteralTextTable literal_{0};
};

// Mostly a text's own ID; now and then another tunnel's, the mark of a collision, or none.
uint32 random_id(std::size_t text, Random &random)
{
    switch (random.below(32)) {
    case 0:
        return 65535;
    case 1:
        return 65534;
    case 2:
    case 3:
        return random.below(65534);
    default:
        return static_cast<uint32>(text % 65534);
    }
}

// Adds a text, as often as so many of 8 times, or removes it.
void change(Twins &twins, const std::vector<std::string> &texts, unsigned adds_of_8, Random &random)
{
    const std::size_t i = random.below(texts.size());
    if (random.below(8) < adds_of_8) {
        twins.add(texts[i], random_id(i, random));
    } else {
        twins.del(texts[i]);
    }
}

// A table grows, stays, shrinks and stays.
constexpr unsigned adds_of_8_in_turn[] = {7, 4, 2, 4};

class TextTableModel : public LibraryTest,
                       public testing::WithParamInterface<std::tuple<TableOperations, Sequence>>
{
  protected:
    TextTableModel() { host_.set_log_level(2); }

    static const TableOperations &table() { return std::get<0>(GetParam()); }
    static const Sequence &sequence() { return std::get<1>(GetParam()); }

    Random random_{20240607};
};

TEST_P(TextTableModel, EverySlotIsAsTheLiteralTableHasIt)
{
    constexpr unsigned steps_between_comparisons = 2000;
    const std::vector<std::string> texts = make_texts(sequence().texts, random_);
    Twins twins(table(), sequence().seed_ending);
    uint32 most = 0;
    for (unsigned step = 0; step < sequence().steps; ++step) {
        // All turns twice, the second time from the beginning.
        const unsigned adds = adds_of_8_in_turn[step * 8 / sequence().steps % 4];
        if (step == sequence().steps / 2) {
            twins.begin_anew();
        }
        change(twins, texts, adds, random_);
        ASSERT_NO_FATAL_FAILURE(twins.compare_find(texts[random_.below(texts.size())]));
        if ((step + 1) % steps_between_comparisons == 0) {
            ASSERT_NO_FATAL_FAILURE(twins.compare_all_slots()) << "after step " << step;
            most = std::max(most, twins.num_live());
        }
    }
    RecordProperty("most_live", static_cast<int>(most));
    // The sequence has met what it is about.
    EXPECT_GT(most, std::min<std::size_t>(sequence().texts.number, sequence().steps) / 5);
}

std::string name_of_sequence(const testing::TestParamInfo<TextTableModel::ParamType> &about)
{
    return std::string(std::get<0>(about.param).word) + std::get<1>(about.param).name;
}

INSTANTIATE_TEST_SUITE_P(Both, TextTableModel,
                         testing::Combine(testing::ValuesIn(table_operations),
                                          testing::ValuesIn(sequences)),
                         name_of_sequence);

// One table is enough: both are of one making.
class TableOfNames : public LibraryTest
{
  protected:
    TableOfNames() { host_.set_log_level(2); }

    Random random_{20240610};
};

TEST_F(TableOfNames, IsAsTheLiteralOneAfterAMillionSteps)
{
    constexpr unsigned steps = sanitized ? 100000 : 1000000;
    // No multiples of each other: the table is looked at in all its turns.
    constexpr unsigned steps_between_comparisons = steps / 8;
    constexpr unsigned steps_of_a_turn = steps / 42;
    const std::vector<std::string> texts = make_texts({200, 1, 9, false}, random_);
    Twins twins(table_operations[0], 0xffc0);
    uint32 most = 0;
    for (unsigned step = 0; step < steps; ++step) {
        change(twins, texts, adds_of_8_in_turn[step / steps_of_a_turn % 4], random_);
        if (step % 8 == 0) {
            ASSERT_NO_FATAL_FAILURE(twins.compare_find(texts[random_.below(texts.size())]));
        }
        if ((step + 1) % steps_between_comparisons == 0) {
            ASSERT_NO_FATAL_FAILURE(twins.compare_all_slots()) << "after step " << step;
            most = std::max(most, twins.num_live());
        }
    }
    EXPECT_GT(most, texts.size() / 2);
}

class TextTableAsAWhole : public LibraryTest, public testing::WithParamInterface<TableOperations>
{
  protected:
    TextTableAsAWhole() { host_.set_log_level(2); }

    static const TableOperations &table() { return GetParam(); }

    Random random_{20240608};
};

TEST_P(TextTableAsAWhole, SaysOfEachAddWhatBecameOfIt)
{
    const std::vector<std::string> texts = make_texts({60, 0, 30, false}, random_);
    Twins twins(table(), 0xffff);
    host_.set_log_level(7);
    for (unsigned step = 0; step < 20000; ++step) {
        const std::size_t i = random_.below(texts.size());
        if (random_.below(2) == 0) {
            twins.add_and_compare_lines(texts[i], random_id(i, random_));
        } else {
            twins.del(texts[i]);
        }
    }
    twins.compare_all_slots();
}

// However few bits of the keys are looked at on the way to a slot.
TEST_P(TextTableAsAWhole, KeepsApartKeysThatShareMostOfTheirBits)
{
    constexpr unsigned keys_of_a_kind = 60;
    Twins twins(table(), 0x4000);
    std::vector<std::string> texts;
    for (uint64 n = 1; n <= keys_of_a_kind; ++n) {
        for (const unsigned bits : {0U, 16U, 32U, 48U}) {
            texts.push_back(text_with_key({n << bits, 0x7f00}, twins.seed(), 0));
            if (bits != 0) {
                texts.push_back(text_with_key({0x5555, n << bits | 0x7f00}, twins.seed(), 0));
            }
        }
    }
    for (unsigned step = 0; step < 10000; ++step) {
        const std::size_t i = random_.below(texts.size());
        if (random_.below(4) != 0) {
            twins.add(texts[i], static_cast<uint32>(i));
        } else {
            twins.del(texts[i]);
        }
        ASSERT_NO_FATAL_FAILURE(twins.compare_find(texts[random_.below(texts.size())]));
    }
    ASSERT_NO_FATAL_FAILURE(twins.compare_all_slots());
    EXPECT_GT(twins.num_live(), texts.size() / 2);
}

TEST_P(TextTableAsAWhole, IsFilledToTheLastSlotAndEmptiedAgain)
{
    const std::vector<std::string> texts = make_texts({66000, 24, 40, false}, random_);
    Twins twins(table(), 0x8421);
    for (std::size_t i = 0; i < OKV_ASSOC_SIZE; ++i) {
        twins.add(texts[i], static_cast<uint32>(i % 65534));
    }
    ASSERT_EQ(twins.num_live(), OKV_ASSOC_SIZE);
    ASSERT_NO_FATAL_FAILURE(twins.compare_all_slots());

    // One more is refused, a present one is found, and a conflict finds the slot it has left.
    host_.set_log_level(3);
    twins.add_and_compare_lines(texts[65536], 7);
    twins.add_and_compare_lines(texts[65537], 65534);
    twins.add_and_compare_lines(texts[5], 5);
    twins.add_and_compare_lines(texts[5], 6);
    EXPECT_THAT(log_lines().size(), 1U);
    ASSERT_NO_FATAL_FAILURE(twins.compare_all_slots());
    host_.set_log_level(2);
    EXPECT_EQ(table().dump(), OKV_ASSOC_SIZE);

    // Around the last few slots.
    for (unsigned step = 0; step < 400; ++step) {
        const std::size_t i = random_.below(texts.size());
        if (random_.below(2) == 0) {
            twins.add(texts[i], static_cast<uint32>(i % 65534));
        } else {
            twins.del(texts[i]);
        }
        ASSERT_NO_FATAL_FAILURE(twins.compare_find(texts[random_.below(texts.size())]));
    }
    ASSERT_NO_FATAL_FAILURE(twins.compare_all_slots());

    std::vector<std::string> leaving = texts;
    std::ranges::shuffle(leaving, random_.engine());
    for (const std::string &text : leaving) {
        twins.del(text);
    }
    ASSERT_NO_FATAL_FAILURE(twins.compare_all_slots());
    EXPECT_EQ(twins.num_live(), 0U);
    EXPECT_TRUE(std::all_of(table().slots, table().slots + OKV_ASSOC_SIZE,
                            [](const auto &entry) { return entry.count == 0; }));
}

TEST_P(TextTableAsAWhole, ARefusedAddSaysWhichTextAndId)
{
    const std::vector<std::string> texts = make_texts({65537, 24, 40, false}, random_);
    {
        Twins twins(table(), 0x8421);
        for (std::size_t i = 0; i < OKV_ASSOC_SIZE; ++i) {
            twins.add(texts[i], 1);
        }
    }
    const uint64 seed = seed_at(time_with_seed_ending(0x8421, 0xffff));
    const LiteralKey key = literal_key("one too many", seed);
    host_.set_log_level(3);
    char text[] = "one too many";
    in_library(table().add, text, 9U);
    EXPECT_THAT(log_lines(),
                ElementsAre(gated_line(
                    3, table().name_of("add") + ": FAILED to add " + table().word +
                           " one too many key=" + key_text(key.high, key.low) + ", tid:9")));
    EXPECT_EQ(in_library(table().find, text, nullptr), 14004);
}

std::string name_of_table(const testing::TestParamInfo<TableOperations> &about)
{
    return about.param.word;
}

INSTANTIATE_TEST_SUITE_P(Both, TextTableAsAWhole, testing::ValuesIn(table_operations),
                         name_of_table);

} // namespace
