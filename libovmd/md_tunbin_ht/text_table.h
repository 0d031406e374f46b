// The family of the two reverse tables: from a tunnel's name, or its alias, to its ID.
//
// Written once; md_tunbin_ht_tunname.cpp and md_tunbin_ht_tunalias.cpp instantiate it with a Table:
//   assoc()             the table's OKV_ASSOC_SIZE entries
//   state(), seed()     the unit's hash state and seed
//   init_name, ...      the operations' own names
//   conflict_format ... the log formats, which name what the table holds
#pragma once

#include "framework/errors.h"
#include "framework/logging.h"
#include "libovmd/md_tunbin_ht/slot_index.h"
#include "orvale/md_tunbin_ht.h"

#include <cstdlib>
#include <sys/time.h>

namespace ovmd
{

template <typename Table>
class text_table
{
  public:
    static int init()
    {
        index_.clear(Table::assoc());
        OV_LOG(ov_log_info, " %s: OKVSZ:%ld sizeof:%ld assoc:%p", Table::init_name, table_size,
               table_size, static_cast<void *>(Table::assoc()));
        // Keys differ from one start to the next: nothing that was hashed may be kept.
        timeval now = {};
        (void)gettimeofday(&now, nullptr);
        srand(static_cast<unsigned>(now.tv_sec * 1000000 + now.tv_usec));
        Table::seed() = static_cast<uint64>(rand());
        return 0;
    }

    // The three that are called for each tunnel have the hash within them, and what is rare
    // outside: calls and saved registers would be a noticeable part of what they take.
    [[gnu::flatten]] static void add(const char *text, uint32 id)
    {
        const okv_key key = key_of(text);
        const uint32 slot = index_.find(Table::assoc(), key);
        if (slot != slot_index::no_slot) {
            add_to_present(text, id, key, slot);
            return;
        }
        if (id == OKV_INVALID_VALUE) {
            return;
        }
        if (store<Table::failed_format>(key, id, text, OKV_KEY_ARGS(key), id)) {
            OV_LOG(ov_log_info, Table::added_format, Table::add_name, text, OKV_KEY_ARGS(key), id);
        }
    }

    [[gnu::flatten]] static void del(const char *text)
    {
        const okv_key key = key_of(text);
        const uint32 slot = index_.find(Table::assoc(), key);
        if (slot == slot_index::no_slot) {
            OV_LOG(ov_log_info, "%s: could not remove tun=%s from hash table. key=" OKV_KEY_FORMAT,
                   Table::del_name, text, OKV_KEY_ARGS(key));
            return;
        }
        index_.remove(Table::assoc(), key, slot);
    }

    [[gnu::flatten]] static int find(const char *text, uint32 *tid)
    {
        const uint32 slot = index_.find(Table::assoc(), key_of(text));
        if (slot == slot_index::no_slot || Table::assoc()[slot].value == TUNBIN_HT_COLLISION) {
            return lc_err_not_found;
        }
        if (tid != nullptr) {
            *tid = Table::assoc()[slot].value;
        }
        return 0;
    }

    static uint32 dump()
    {
        unsigned long total = 0;
        for (uint32 slot = 0; slot < OKV_ASSOC_SIZE; ++slot) {
            const okv_assoc_entry &entry = Table::assoc()[slot];
            if (entry.value != OKV_INVALID_VALUE) {
                OV_LOG(ov_log_info, "%s: key=" OKV_KEY_FORMAT ", value=%d, count=%d",
                       Table::dump_name, OKV_KEY_ARGS(entry.key), entry.value, entry.count);
                ++total;
            }
        }
        OV_LOG(ov_log_info, "%s: total %lu entries dumped", Table::dump_name, total);
        return static_cast<uint32>(total);
    }

  private:
    static constexpr long table_size = OKV_ASSOC_SIZE * sizeof(okv_assoc_entry);

    static okv_key key_of(const char *text)
    {
        return hash64_key(text, Table::seed(), &Table::state());
    }

    // The first owner must not keep the text: an ambiguous one never leads to the wrong tunnel.
    [[gnu::noinline]] static void add_to_present(const char *text, uint32 id, okv_key key,
                                                 uint32 slot)
    {
        if (Table::assoc()[slot].value == id) {
            return;
        }
        OV_LOG(ov_log_error, Table::conflict_format, Table::add_name, text, OKV_KEY_ARGS(key), id);
        index_.remove(Table::assoc(), key, slot);
        (void)store<Table::collision_failed_format>(key, TUNBIN_HT_COLLISION);
    }

    // Stores a key that is not there; when there is no room for it a line says so, made of the
    // operation's name and the arguments.
    template <const auto &failed_format, typename... Arguments>
    static bool store(okv_key key, okv_value value, Arguments... arguments)
    {
        const bool is_stored = index_.insert(Table::assoc(), key, value);
        if (!is_stored) {
            OV_LOG(ov_log_error, failed_format, Table::add_name, arguments...);
        }
        return is_stored;
    }

    static slot_index index_;
};

template <typename Table>
slot_index text_table<Table>::index_;

} // namespace ovmd
