// The tunnel ID allocator: a record for each ID, the free ones in a queue, the used ones in the
// order of their names.
#include "orvale/md_tunneld_tunnel_common.h"

#include "framework/appliance.h"
#include "framework/bail.h"
#include "framework/sys_time.h"
#include "libovmd/frame/absent.h"
#include "libovmd/md_tunneld_tunnel_common/free_id_queue.h"
#include "libovmd/md_tunneld_tunnel_common/unit.h"
#include "orvale/md_tunneld_defs.h"

#include <cstdlib>
#include <cstring>

using namespace ovmd;

namespace
{

tunnel_id_info *tunnel_ids;
tunnel_id_info_q_t free_id_list;
uint32_array *tunnel_sorted_seq;

// One byte for each ID, made from the name bound to it: a search by name passes over the IDs whose
// byte is another without looking at their records. They lie behind the records.
unsigned char *name_marks;
uint32 num_records;

// A bound that a host raises later brings no IDs: there are records for those of the start alone.
uint32 id_bound()
{
    const uint32 bound = get_max_tunnel_number();
    return tunnel_ids != nullptr && num_records < bound ? num_records : bound;
}

unsigned char mark_of(const tstring *name)
{
    uint32 hash = 2166136261u;
    for (const char *c = text_of(name); c != nullptr && *c != '\0'; ++c) {
        hash = (hash ^ static_cast<unsigned char>(*c)) * 16777619u;
    }
    return static_cast<unsigned char>(hash >> 24); // where every character has left its trace
}

// The first ID from `from` on with the mark; `bound` when there is none.
uint32 next_marked(unsigned char mark, uint32 from, uint32 bound)
{
    const void *const found = memchr(name_marks + from, mark, bound - from);
    return found != nullptr
               ? static_cast<uint32>(static_cast<const unsigned char *>(found) - name_marks)
               : bound;
}

uint64 now_ms()
{
    if (time_info_ptr == nullptr) {
        ctime_init();
    }
    return time_info_ptr != nullptr ? time_info_ptr->time_since_boot_ms : sys_time_since_boot_ms();
}

bool is_quarantined(const tunnel_id_info &record, uint64 now)
{
    return record.last_use_ts != 0 && now - record.last_use_ts <= TUNNEL_ID_QUARANTINE_MS;
}

int init_tunnel_sorted_seq()
{
    array_options options = {};
    BAIL_ERROR(array_options_get_defaults(&options));
    options.ao_elem_compare_func = tunnel_sorted_seq_compare;
    options.ao_elem_assign_func = array_std_assign_func;
    uint32_array *sequence = nullptr;
    BAIL_ERROR(uint32_array_new_full(&sequence, &options));
    tunnel_sorted_seq = sequence;
    return 0;
}

// Where the sequence could not be made, the host is not asked to change it: the answer is the one
// that an operation gives for null.
int enter_sequence(uint32 id)
{
    return tunnel_sorted_seq != nullptr ? uint32_array_insert_sorted(tunnel_sorted_seq, id)
                                        : lc_err_unexpected_null;
}

int leave_sequence(uint32 id)
{
    return tunnel_sorted_seq != nullptr ? uint32_array_delete_by_value(tunnel_sorted_seq, id)
                                        : lc_err_unexpected_null;
}

// What an earlier initialisation has left; before the first there is nothing to be freed.
void release_all()
{
    for (uint32 id = 0; id < num_records; ++id) {
        if (tunnel_ids[id].name != nullptr) {
            ts_free(&tunnel_ids[id].name);
        }
    }
    free(tunnel_ids);
    tunnel_ids = nullptr;
    num_records = 0;
    if (tunnel_sorted_seq != nullptr) {
        uint32_array_free(&tunnel_sorted_seq);
    }
    free_id_list.clear();
}

} // namespace

int md_init_tunnel_id(void)
{
    release_all();
    const uint32 num_ids = get_max_tunnel_number();
    tunnel_ids =
        static_cast<tunnel_id_info *>(calloc(num_ids, sizeof *tunnel_ids + sizeof *name_marks));
    BAIL_NULL(tunnel_ids);
    name_marks = reinterpret_cast<unsigned char *>(tunnel_ids + num_ids);
    num_records = num_ids;
    for (uint32 id = 0; id < num_ids; ++id) {
        tunnel_ids[id].id = static_cast<uint16>(id);
    }
    (void)init_tunnel_sorted_seq(); // logged there; tunnels can still be looked up by name
    for (uint32 id = 0; id < num_ids; ++id) {
        free_id_list.append(tunnel_ids[id]);
    }
    OV_LOG(ov_log_info, "TUN_IDS: Initialized");
    return 0;
}

int tunnel_sorted_seq_compare(const void *id1, const void *id2)
{
    if (id1 == nullptr || id2 == nullptr) {
        return (id1 != nullptr) - (id2 != nullptr);
    }
    const uint32 first = *static_cast<const uint32 *>(id1);
    const uint32 second = *static_cast<const uint32 *>(id2);
    const uint32 bound = id_bound();
    if (first == second || (first >= bound && second >= bound)) {
        return 0;
    }
    if (first >= bound) {
        return -1;
    }
    if (second >= bound) {
        return 1;
    }
    if (tunnel_ids == nullptr) {
        return 0;
    }
    return ts_cmp(tunnel_ids[first].name, tunnel_ids[second].name);
}

int md_get_next_n_available_tunnel_ids(uint32 num_tunnels, uint32_array *tun_ids)
{
    OV_LOG(ov_log_info, "Received request for %d available tunnel IDs", num_tunnels);
    if (num_tunnels == 0 || tun_ids == nullptr) {
        return 0;
    }
    const auto num_used = static_cast<uint32>(md_get_total_tunnels());
    if (num_used + num_tunnels > get_max_tunnel_number() - TUNNEL_ID_RESERVE) {
        return 1;
    }
    uint32 count = 0;
    for (const tunnel_id_info *record = free_id_list.first(); record != nullptr;
         record = record->tailq_entry.next) {
        const uint64 now = now_ms();
        // Those behind it were freed later still.
        if (is_quarantined(*record, now)) {
            OV_LOG(ov_log_info,
                   "TUN_IDS: skipping allocating entry %d because it has been freed too "
                   "recently:%lu, %lu, %d",
                   count, now, record->last_use_ts, record->id);
            return 1;
        }
        OV_LOG(ov_log_info, "TUN_IDS: next available tunnel index %d", record->id);
        BAIL_ERROR_ANSWER(uint32_array_append(tun_ids, record->id), 1);
        ++count;
        if (count == num_tunnels) {
            return static_cast<uint32>(uint32_array_length_quick(tun_ids)) == num_tunnels ? 0 : 1;
        }
    }
    OV_LOG(ov_log_error, "md_get_next_n_available_tunnel_ids: error in alloc id, idx=%d", count);
    return 1;
}

int md_set_tunnel_id(uint32 id, const tstring *tun_name)
{
    BAIL_NULL(tun_name);
    if (strcmp(ts_str(tun_name), TUNNEL_NAME_DEFAULT) == 0) {
        return 0;
    }
    BAIL_NULL(tunnel_ids);
    BAIL_REQUIRE(id < id_bound());

    tunnel_id_info &record = tunnel_ids[id];
    if (record.name != nullptr) {
        ts_free(&record.name);
        BAIL_ERROR(leave_sequence(id));
    } else {
        free_id_list.remove(record);
    }
    BAIL_ERROR(ts_dup(tun_name, &record.name));
    name_marks[id] = mark_of(record.name);
    BAIL_ERROR(enter_sequence(id));
    OV_LOG(ov_log_info, "TUN_IDS: SET tunnel index %d content to %s", id, ts_str(tun_name));
    return 0;
}

int md_free_tunnel_id(const tstring *tun_name)
{
    BAIL_NULL(tun_name);
    BAIL_NULL(tunnel_ids);

    uint32 id = TUNNEL_ID_NONE;
    const int found = md_get_tunnel_id(tun_name, &id);
    if (found != 0) {
        OV_LOG(ov_log_error, "Unable to free tunnel %s because tunnel ID not found.",
               ts_str(tun_name));
        return found;
    }
    if (id >= id_bound()) {
        return 0;
    }
    tunnel_id_info &record = tunnel_ids[id];
    ts_free(&record.name);
    record.last_use_ts = now_ms();
    // The ID is free whatever the sequence says: it must not be lost to both.
    const int err = leave_sequence(id);
    if (err != 0) {
        (void)BAIL_REPORT(err);
    }
    free_id_list.append(record);
    OV_LOG(ov_log_info, "TUN_IDS: Freed tunnel at index %d (%s)", id, ts_str(tun_name));
    return err;
}

int md_get_tunnel_id(const tstring *tun_name, uint32 *id)
{
    BAIL_NULL(tun_name);
    BAIL_NULL(id);
    BAIL_NULL(tunnel_ids);

    const unsigned char mark = mark_of(tun_name);
    const uint32 bound = id_bound();
    for (uint32 candidate = next_marked(mark, 0, bound); candidate < bound;
         candidate = next_marked(mark, candidate + 1, bound)) {
        if (tunnel_ids[candidate].name != nullptr &&
            ts_equal(tunnel_ids[candidate].name, tun_name)) {
            *id = candidate;
            return 0;
        }
    }
    OV_LOG(ov_log_info, "md_get_tunnel_id: - could not find id for tunnel: %s", ts_str(tun_name));
    return lc_err_not_found;
}

int md_get_tunnel_id_sorted(tstring *tunname, uint32 *ret_tun_id)
{
    static uint32 start_idx = 0;

    BAIL_NULL(ret_tun_id);
    *ret_tun_id = TUNNEL_ID_NONE;
    const auto total = static_cast<uint32>(md_get_total_tunnels());
    if (start_idx >= total) {
        start_idx = 0;
    }
    BAIL_NULL(tunnel_ids);
    uint32 position = start_idx;
    for (uint32 n = 0; n < total; ++n) {
        const uint32 id = uint32_array_get_quick(tunnel_sorted_seq, position);
        BAIL_REQUIRE(id < id_bound());
        if (ts_cmp(tunnel_ids[id].name, tunname) == 0) {
            *ret_tun_id = id;
            start_idx = position;
            return 0;
        }
        ++position;
        if (position == total) {
            position = 0;
        }
    }
    return lc_err_not_found;
}

int md_get_tunnel_name_str_sorted(uint32 idx, const char **tun_name)
{
    BAIL_NULL(tun_name);
    const auto position = static_cast<int>(idx);
    if (position < 0 || position >= md_get_total_tunnels()) {
        return lc_err_not_found;
    }
    const uint32 id = uint32_array_get_quick(tunnel_sorted_seq, idx);
    if (id >= id_bound()) {
        return lc_err_not_found;
    }
    BAIL_NULL(tunnel_ids);
    *tun_name = text_of(tunnel_ids[id].name);
    return 0;
}

int md_get_total_tunnels(void)
{
    return tunnel_sorted_seq != nullptr ? uint32_array_length_quick(tunnel_sorted_seq) : 0;
}
