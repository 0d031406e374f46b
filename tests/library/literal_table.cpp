#include "tests/library/literal_table.h"

#include <iterator>

namespace ovtest
{

namespace
{

constexpr std::size_t block_size = 24;
constexpr uint64 golden_ratio = 0x9e3779b97f4a7c13;

// To the right, or when negative to the left.
constexpr int shifts[] = {43, -9, 8, 38, -23, 5, 35, -49, 11, 12, -18, 22};

uint64 shifted(uint64 word, int shift)
{
    return shift > 0 ? word >> shift : word << -shift;
}

// Adds up to 24 bytes to the three words, the first of each eight at the low end.
void add_bytes(std::array<uint64, 3> &words, const std::string &bytes)
{
    std::array<uint64, 3> sums = {};
    for (std::size_t i = 0; i < bytes.size(); ++i) {
        const uint64 byte = static_cast<unsigned char>(bytes[i]);
        sums[i / 8] += byte << (8 * (i % 8));
    }
    for (std::size_t i = 0; i < 3; ++i) {
        words[i] += sums[i];
    }
}

void unmix(std::array<uint64, 3> &words)
{
    for (std::size_t turn = std::size(shifts); turn-- > 0;) {
        uint64 &word = words[turn % 3];
        const uint64 next = words[(turn + 1) % 3];
        const uint64 last = words[(turn + 2) % 3];
        word ^= shifted(last, shifts[turn]);
        word += last;
        word += next;
    }
}

// The block that turns the first words of a hashing into these.
std::string block_that_leads_to(std::array<uint64, 3> words, uint64 seed)
{
    unmix(words);
    words[0] -= seed;
    words[1] -= seed;
    words[2] -= golden_ratio;
    std::string block;
    for (std::size_t i = 0; i < block_size; ++i) {
        block += static_cast<char>(words[i / 8] >> (8 * (i % 8)) & 0xff);
    }
    return block;
}

} // namespace

void literal_mix(std::array<uint64, 3> &words)
{
    for (std::size_t turn = 0; turn < std::size(shifts); ++turn) {
        uint64 &word = words[turn % 3];
        const uint64 next = words[(turn + 1) % 3];
        const uint64 last = words[(turn + 2) % 3];
        word -= next;
        word -= last;
        word ^= shifted(last, shifts[turn]);
    }
}

LiteralKey literal_key(const std::string &text, uint64 seed, LiteralState *state)
{
    std::array<uint64, 3> words = {seed, seed, golden_ratio};
    std::size_t at = 0;
    for (; text.size() - at >= block_size; at += block_size) {
        add_bytes(words, text.substr(at, block_size));
        literal_mix(words);
    }
    const std::string leftover = text.substr(at);
    if (state != nullptr) {
        *state = {words, leftover};
    }
    LiteralKey key = {words[2], words[1]};
    if (!leftover.empty()) {
        add_bytes(words, leftover);
        words[2] += leftover.size();
        literal_mix(words);
        key.high = words[2];
    }
    for (const char c : text) {
        key.low ^= static_cast<unsigned char>(c);
    }
    return key;
}

std::string text_with_key(const LiteralKey &key, uint64 seed, unsigned which)
{
    // The first word does not show in the key, and the bytes of the text change the low half: both
    // are tried until they fit.
    for (uint64 first = 0;; ++first) {
        const uint64 second = key.low ^ (first & 0xff);
        const std::string text = block_that_leads_to({first, second, key.high}, seed);
        if (text.find('\0') == std::string::npos && literal_key(text, seed) == key &&
            which-- == 0) {
            return text;
        }
    }
}

void LiteralTable::lower(uint32 from, uint32 to)
{
    for (uint32 slot = from; slot != to; slot = next(slot)) {
        --slots_[slot].count;
    }
}

std::pair<bool, uint32> LiteralTable::add_or_replace(const LiteralKey &key, uint32 value)
{
    const uint32 first = home(key);
    uint32 slot = first;
    for (uint32 n = 0; n < num_slots; ++n) {
        Slot &here = slots_[slot];
        if (here.value == empty) {
            return take(slot, key, value);
        }
        if (here.key == key) {
            lower(first, slot);
            return {true, std::exchange(here.value, value)};
        }
        ++here.count;
        slot = next(slot);
    }
    for (Slot &each : slots_) {
        --each.count;
    }
    return {false, empty};
}

std::pair<bool, uint32> LiteralTable::take(uint32 hole, const LiteralKey &key, uint32 value)
{
    const uint32 first = home(key);
    uint32 old = empty;
    for (uint32 j = next(hole); j != first && slots_[j].count != 0; j = next(j)) {
        if (slots_[j].value != empty && slots_[j].key == key) {
            old = std::exchange(slots_[j].value, empty);
            --slots_[j].count;
            lower(first, j);
            break;
        }
    }
    ++slots_[hole].count;
    slots_[hole].value = value;
    slots_[hole].key = key;
    return {true, old};
}

std::optional<uint32> LiteralTable::find(const LiteralKey &key) const
{
    uint32 slot = home(key);
    for (uint32 n = 0; n < num_slots && slots_[slot].count != 0; ++n) {
        if (slots_[slot].value != empty && slots_[slot].key == key) {
            return slot;
        }
        slot = next(slot);
    }
    return std::nullopt;
}

bool LiteralTable::remove(const LiteralKey &key)
{
    const std::optional<uint32> slot = find(key);
    if (!slot) {
        return false;
    }
    slots_[*slot].value = empty;
    --slots_[*slot].count;
    lower(home(key), *slot);
    return true;
}

std::string LiteralTextTable::add(const std::string &text, uint32 id)
{
    const LiteralKey key = literal_key(text, seed_);
    const std::optional<uint32> slot = table_.find(key);
    if (slot) {
        if (table_.at(*slot).value == id) {
            return "";
        }
        table_.remove(key);
        const auto [stored, old] = table_.add_or_replace(key, collision);
        return stored && old == LiteralTable::empty ? "CONFLICT" : "FAILED";
    }
    if (id == LiteralTable::empty) {
        return "";
    }
    const auto [stored, old] = table_.add_or_replace(key, id);
    return stored && old == LiteralTable::empty ? "ADDED" : "FAILED";
}

bool LiteralTextTable::del(const std::string &text)
{
    return table_.remove(literal_key(text, seed_));
}

std::optional<uint32> LiteralTextTable::find(const std::string &text) const
{
    const std::optional<uint32> slot = table_.find(literal_key(text, seed_));
    if (!slot || table_.at(*slot).value == collision) {
        return std::nullopt;
    }
    return table_.at(*slot).value;
}

} // namespace ovtest
