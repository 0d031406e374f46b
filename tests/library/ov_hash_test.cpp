#include "orvale/ov_hash.h"

#include "tests/library/literal_table.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <random>

using namespace ovtest;
using testing::Each;
using testing::ElementsAre;

namespace
{

struct Vector {
    std::string text;
    uint64 seed;
    uint64 high;
    uint64 low;
};

// As long as the longest alias, and every byte but NUL once.
std::string bytes_from_1_to_255()
{
    std::string text;
    for (int byte = 1; byte <= 255; ++byte) {
        text += static_cast<char>(byte);
    }
    return text;
}

// Worked out from the hash's description by a program in another language.
const Vector vectors[] = {
    {"", 0, 0x9e3779b97f4a7c13, 0x0000000000000000},
    {"a", 0, 0x1d48fd74d88633ac, 0x0000000000000061},
    {"tunnel1", 0, 0x08cd99bcfab02067, 0x0000000000000039},
    {"tunnel-8", 0, 0xf07aa89810d2b84d, 0x000000000000001d},
    {"abcdefghijklmnopqrstuvw", 0, 0xcfb2f9104e2e9985, 0x0000000000000060},
    {"abcdefghijklmnopqrstuvwx", 0, 0xde6eb17ce0db5212, 0x3bb62985e70a3253},
    {"abcdefghijklmnopqrstuvwxy", 0, 0x25a121e6ab7e8dbe, 0x3bb62985e70a322a},
    {"ABCDEFGHIJKLMNOPQRSTUVWXYZABCDEFGHIJKLMNOPQRSTU", 0, 0xe5d6253b8e981198, 0xa1a9ee078050ecf9},
    {"ABCDEFGHIJKLMNOPQRSTUVWXYZABCDEFGHIJKLMNOPQRSTUV", 0, 0x4d81a16b4b327ba6, 0x9b449d5cfb4d645c},
    {"ahovcjqxelszgnubipwdkryfmtahovcjqxelszgnubipwdkryfmtahovcjqxelsz", 0, 0xc8502d8fb625d17f,
     0x91320c2c888b1b0e},
    {"\200\377\303\251\177", 0, 0xf7744ce850c4abb0, 0x000000000000006a},
    {"", 1804289383, 0x9e3779b97f4a7c13, 0x000000006b8b4567},
    {"a", 1804289383, 0x5075380e479bb4b7, 0x000000006b8b4506},
    {"tunnel1", 1804289383, 0xaeaeda958960ec66, 0x000000006b8b455e},
    {"tunnel-8", 1804289383, 0x091927c106588e1a, 0x000000006b8b457a},
    {"abcdefghijklmnopqrstuvw", 1804289383, 0xbb830c9b2099e22c, 0x000000006b8b4507},
    {"abcdefghijklmnopqrstuvwx", 1804289383, 0xf67ac1fd61cc55aa, 0x174a5edda2fcc491},
    {"abcdefghijklmnopqrstuvwxy", 1804289383, 0xc44af4e59e813235, 0x174a5edda2fcc4e8},
    {"ABCDEFGHIJKLMNOPQRSTUVWXYZABCDEFGHIJKLMNOPQRSTU", 1804289383, 0xac1dc3dbb47907ed,
     0x0827282f7e817e78},
    {"ABCDEFGHIJKLMNOPQRSTUVWXYZABCDEFGHIJKLMNOPQRSTUV", 1804289383, 0xe9210a56658ddd60,
     0xa7ea1b15b2cb1762},
    {"ahovcjqxelszgnubipwdkryfmtahovcjqxelszgnubipwdkryfmtahovcjqxelsz", 1804289383,
     0x2cc7b26e346fa63e, 0xda2a7df5ed54ea18},
    {"\200\377\303\251\177", 1804289383, 0x1a1c29c390fc9366, 0x000000006b8b450d},
    {"", 2147483647, 0x9e3779b97f4a7c13, 0x000000007fffffff},
    {"a", 2147483647, 0x7a0ba091068c03f4, 0x000000007fffff9e},
    {"tunnel1", 2147483647, 0x5a3e93c40cbf6e0d, 0x000000007fffffc6},
    {"tunnel-8", 2147483647, 0x496b916d72588519, 0x000000007fffffe2},
    {"abcdefghijklmnopqrstuvw", 2147483647, 0x3fe5e9242afa681c, 0x000000007fffff9f},
    {"abcdefghijklmnopqrstuvwx", 2147483647, 0x6b739fc76b4d8199, 0x2155b5dc118dfa5a},
    {"abcdefghijklmnopqrstuvwxy", 2147483647, 0xaa7b703c930de6ad, 0x2155b5dc118dfa23},
    {"ABCDEFGHIJKLMNOPQRSTUVWXYZABCDEFGHIJKLMNOPQRSTU", 2147483647, 0xf7ae1ba5e8f8885f,
     0xe59fbc520393bc0f},
    {"ABCDEFGHIJKLMNOPQRSTUVWXYZABCDEFGHIJKLMNOPQRSTUV", 2147483647, 0x42321e6d6e04791d,
     0xc20025637a28fe82},
    {"ahovcjqxelszgnubipwdkryfmtahovcjqxelszgnubipwdkryfmtahovcjqxelsz", 2147483647,
     0x469efa6140758363, 0xbf69cd148f997b17},
    {"\200\377\303\251\177", 2147483647, 0xd5001075b3c3afcf, 0x000000007fffff95},
    {bytes_from_1_to_255(), 0, 0x2263d3baf08f258c, 0x9b3d24b5b596872e},
    {bytes_from_1_to_255(), 1804289383, 0x12aa9579d54ff9b6, 0x3de0fba8240400d2},
    {bytes_from_1_to_255(), 2147483647, 0x8fa00b1926f91906, 0x7cdd5244c581f3a0},
};

std::pair<uint64, uint64> halves_of(const std::string &text, uint64 seed)
{
    hash64_state state = {};
    const okv_key key = hash64_key(text.c_str(), seed, &state);
    return {okv_key_high(key), okv_key_low(key)};
}

TEST(Hash, HasTheseKeys)
{
    for (const Vector &vector : vectors) {
        EXPECT_EQ(halves_of(vector.text, vector.seed), std::pair(vector.high, vector.low))
            << vector.text << " with seed " << vector.seed;
    }
}

// The slow one is held to the same keys, because other tests hold the library to it.
TEST(Hash, TheLiteralOneHasTheseKeysToo)
{
    for (const Vector &vector : vectors) {
        EXPECT_EQ(literal_key(vector.text, vector.seed), (LiteralKey{vector.high, vector.low}))
            << vector.text << " with seed " << vector.seed;
    }
}

TEST(Hash, MixesThreeWords)
{
    uint64 a = 1;
    uint64 b = 2;
    uint64 c = 3;
    hash64_mix(&a, &b, &c);
    EXPECT_EQ(a, 0xebfc3de4f8df43d9U);
    EXPECT_EQ(b, 0x1446690e098cb4d1U);
    EXPECT_EQ(c, 0x9e598c95e5dbf7d5U);
}

TEST(Hash, AgreesWithTheLiteralOneAtEveryLength)
{
    std::mt19937 random(1);
    std::string text;
    for (std::size_t length = 0; length <= 300; ++length) {
        const uint64 seed = random() >> 1;
        const LiteralKey expected = literal_key(text, seed);
        EXPECT_EQ(halves_of(text, seed), std::pair(expected.high, expected.low)) << length;
        text += static_cast<char>(random() % 255 + 1);
    }
}

TEST(Hash, OfTheEmptyTextIsTheGoldenRatioAndTheSeed)
{
    EXPECT_EQ(halves_of("", 12345), std::pair(uint64{0x9e3779b97f4a7c13}, uint64{12345}));
}

TEST(Hash, OfAShortTextIsTheSeedButForOneByteInItsLowHalf)
{
    constexpr uint64 seed = 0x12345678;
    EXPECT_EQ(halves_of("ab", seed).second, seed ^ ('a' ^ 'b'));
    EXPECT_EQ(halves_of("ba", seed).second, seed ^ ('a' ^ 'b'));
    EXPECT_NE(halves_of("ab", seed).first, halves_of("ba", seed).first);
    EXPECT_EQ(halves_of("\xff", seed).second, seed ^ 0xff);
    EXPECT_EQ(halves_of("abcdefghijklmnopqrstuvw", seed).second >> 8, seed >> 8);
    EXPECT_NE(halves_of("abcdefghijklmnopqrstuvwx", seed).second >> 8, seed >> 8);
}

// The bytes that are looked at do not depend on where the text lies.
TEST(Hash, OfATextAnywhereInMemory)
{
    for (const std::string &text : {std::string("tunnel1"), std::string(64, 'x')}) {
        const auto expected = halves_of(text, 7);
        for (std::size_t offset = 1; offset < 16; ++offset) {
            const std::string shifted = std::string(offset, '#') + text;
            hash64_state state = {};
            const okv_key key = hash64_key(shifted.c_str() + offset, 7, &state);
            EXPECT_EQ(std::pair(okv_key_high(key), okv_key_low(key)), expected) << offset;
        }
    }
}

TEST(Hash, LeavesItsStateBehind)
{
    hash64_state state = {};
    (void)hash64_key("abcdefghijklmnopqrstuvwxy", 1, &state);
    EXPECT_EQ(state.a, 0x5e91dfff46efa447U);
    EXPECT_EQ(state.b, 0x2442cc7d3016039aU);
    EXPECT_EQ(state.c, 0xf5ec06ea2c7c5d4eU);
    EXPECT_EQ(state.nleftover, 1);
    EXPECT_THAT(state.leftover.words, ElementsAre('y', 0, 0));
    EXPECT_EQ(state.leftover.bytes[0], 'y');
}

TEST(Hash, PadsWhatIsLeftOverWithZeros)
{
    hash64_state state;
    memset(&state, 0xee, sizeof state);
    (void)hash64_key("abc", 9, &state);
    EXPECT_EQ(state.a, 9U);
    EXPECT_EQ(state.b, 9U);
    EXPECT_EQ(state.c, 0x9e3779b97f4a7c13U);
    EXPECT_EQ(state.nleftover, 3);
    EXPECT_THAT(state.leftover.words, ElementsAre(0x636261U, 0U, 0U));
}

TEST(Hash, WithoutALeftOverLeavesTheBufferAlone)
{
    hash64_state state;
    for (const char *text : {"", "abcdefghijklmnopqrstuvwx"}) {
        memset(&state, 0xee, sizeof state);
        (void)hash64_key(text, 9, &state);
        EXPECT_EQ(state.nleftover, 0);
        EXPECT_THAT(state.leftover.bytes, Each(0xee));
    }
}

} // namespace
