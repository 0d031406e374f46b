// The key hash and the table once more, the slow way: byte by byte, slot by slot. What the
// library's own, quicker ones have to agree with.
#pragma once

#include "framework/types.h"

#include <array>
#include <cstddef>
#include <optional>
#include <string>
#include <utility>
#include <vector>

namespace ovtest
{

struct LiteralKey {
    uint64 high = 0;
    uint64 low = 0;

    bool operator==(const LiteralKey &) const = default;
};

// One mixing step of the three words.
void literal_mix(std::array<uint64, 3> &words);

// What a hashing leaves behind.
struct LiteralState {
    std::array<uint64, 3> words = {};
    std::string leftover; // not padded
};

LiteralKey literal_key(const std::string &text, uint64 seed, LiteralState *state = nullptr);

// A text of 24 bytes with this key: the mixing is turned back. There are very many; `which` chooses
// one.
std::string text_with_key(const LiteralKey &key, uint64 seed, unsigned which);

class LiteralTable
{
  public:
    static constexpr uint32 num_slots = 65536;
    static constexpr uint32 empty = 65535;

    struct Slot {
        LiteralKey key;
        uint32 value = empty;
        uint32 count = 0;
    };

    // Whether the key now has the value, and the value that it had.
    std::pair<bool, uint32> add_or_replace(const LiteralKey &key, uint32 value);

    // The slot of a live key.
    std::optional<uint32> find(const LiteralKey &key) const;

    // False when the key is not there.
    bool remove(const LiteralKey &key);

    const Slot &at(uint32 slot) const { return slots_[slot]; }

  private:
    static uint32 home(const LiteralKey &key) { return static_cast<uint32>(key.low % num_slots); }
    static uint32 next(uint32 slot) { return (slot + 1) % num_slots; }
    void lower(uint32 from, uint32 to);
    std::pair<bool, uint32> take(uint32 hole, const LiteralKey &key, uint32 value);

    std::vector<Slot> slots_ = std::vector<Slot>(num_slots);
};

// The table of names, or of aliases, on top of it.
class LiteralTextTable
{
  public:
    explicit LiteralTextTable(uint64 seed) : seed_(seed) {}

    // What the add says in the log: "ADDED", "CONFLICT", "FAILED", or nothing.
    std::string add(const std::string &text, uint32 id);
    bool del(const std::string &text);
    std::optional<uint32> find(const std::string &text) const;

    const LiteralTable &table() const { return table_; }

  private:
    static constexpr uint32 collision = 65534;

    uint64 seed_;
    LiteralTable table_;
};

} // namespace ovtest
