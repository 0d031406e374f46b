// The entries of one kind while a file is being read: as many slots as the file has lines of that
// kind, filled from the front. What is not handed over is released.
#pragma once

#include "orvale/md_db_default.h"

#include <cstdlib>

namespace ovmd
{

inline void free_entry_texts(const bn_str_value &entry)
{
    free(entry.bv_name);
    free(entry.bv_value);
}

inline void free_entries(bn_str_value *entries, uint32 count)
{
    for (uint32 i = 0; i < count; ++i) {
        free_entry_texts(entries[i]);
    }
    free(entries);
}

class entry_array
{
  public:
    entry_array() = default;
    entry_array(const entry_array &) = delete;
    entry_array &operator=(const entry_array &) = delete;
    ~entry_array() { free_entries(entries_, count_); }

    // Makes room for the lines counted; false when there is no memory.
    bool reserve(uint32 slots)
    {
        if (slots == 0) {
            return true;
        }
        entries_ = static_cast<bn_str_value *>(calloc(slots, sizeof *entries_));
        return entries_ != nullptr;
    }

    void append(const bn_str_value &entry)
    {
        // Room is made for every line that is appended, which no analyzer can know.
        entries_[count_] = entry; // NOLINT(clang-analyzer-core.CallAndMessage)
        ++count_;
    }

    uint32 count() const { return count_; }

    void hand_over(bn_str_value **ret_entries, uint32 *ret_count)
    {
        if (ret_count != nullptr) {
            *ret_count = count_;
        }
        if (ret_entries != nullptr) {
            *ret_entries = entries_;
            entries_ = nullptr;
            count_ = 0;
        }
    }

  private:
    bn_str_value *entries_ = nullptr;
    uint32 count_ = 0;
};

} // namespace ovmd
