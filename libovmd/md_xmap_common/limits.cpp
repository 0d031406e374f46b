#include "libovmd/md_xmap_common/limits.h"

#include "libovmd/frame/built_path.h"
#include "libovmd/md_xmap_common/catalogue.h"
#include "libovmd/md_xmap_common/unit.h"
#include "orvale/md_xmap_common.h"

#include <cstdio>

namespace ovmd
{

namespace
{

constexpr size_t path_size = 512;

// The model's number of entries is allowed twice over.
constexpr uint32 entries_factor = 2;

bool is_below(const mdb_db_change *change, const char *level)
{
    char pattern[path_size];
    (void)snprintf(pattern, sizeof pattern, "%s/*", level);
    return bn_binding_name_parts_pattern_match(change->mdc_name_parts, true, pattern);
}

// The number of entries in the old database, without the default ones. What cannot be read is not
// counted: it must not stand in the way of a commit.
uint32 get_nbr_map_entries(const md_dbinfo *dbinfo, const map_type &type)
{
    if (!type.counts_entries) {
        return 0;
    }
    uint32 count = 0;
    owned_tstr_array maps;
    BAIL_ERROR_ANSWER(
        mdb_get_tstr_array(dbinfo->commit, dbinfo->olddb, type.root, 0, 0, 0, maps.out()), count);
    BAIL_NULL_ANSWER(maps.get(), count);
    const uint32 num_maps = length_of(maps.get());
    for (uint32 i = 0; i < num_maps; ++i) {
        const char *const map = tstr_array_get_str_quick(maps.get(), i);
        BAIL_NULL_ANSWER(map, count);
        char prio[path_size];
        (void)snprintf(prio, sizeof prio, "%s/%s/prio", type.root, map);
        owned_tstr_array priorities;
        BAIL_ERROR_ANSWER(
            mdb_get_tstr_array(dbinfo->commit, dbinfo->olddb, prio, 0, 0, 0, priorities.out()),
            count);
        const uint32 num_priorities = length_of(priorities.get());
        count += num_priorities != 0 ? num_priorities - 1 : 0;
    }
    OV_LOG(ov_log_info, "Total map entries before add: %d", count);
    return count;
}

} // namespace

int md_xmap_check_limit(mdb_db_change *change, md_dbinfo *dbinfo, int mtype)
{
    if (change->mdc_change_type != mdct_add) {
        return 0;
    }
    const map_type *const type = find_map_type(mtype);
    if (type == nullptr) {
        return 0;
    }
    const char *root = type->root;
    const char *entry_level = type->entry_level;
    owned_text vrf_root;
    owned_text vrf_entry_level;
    if (type->vrf != nullptr) {
        *vrf_root.out() = smprintf(type->root, type->vrf);
        BAIL_NULL(vrf_root.get());
        *vrf_entry_level.out() = smprintf(type->entry_level, type->vrf);
        BAIL_NULL(vrf_entry_level.get());
        root = vrf_root.get();
        entry_level = vrf_entry_level.get();
    }
    const uint32 max_entries = entries_factor * type->max_entries();

    if (type->max_maps != no_map_limit && is_below(change, root)) {
        owned_tstr_array maps;
        BAIL_ERROR(mdb_get_tstr_array(dbinfo->commit, dbinfo->olddb, root, 0, 0, 0, maps.out()));
        if (maps.get() != nullptr && tstr_array_length_quick(maps.get()) >= type->max_maps) {
            BAIL_ERROR(md_commit_set_return_status_msg(dbinfo->commit, 1,
                                                       "Cannot add map because maximum reached."));
            return MD_XMAP_REFUSED;
        }
    }
    if (!is_below(change, entry_level) || get_nbr_map_entries(dbinfo, *type) < max_entries) {
        return 0;
    }
    OV_LOG(ov_log_notice, "Can't add map entry because max (%u) reached", max_entries);
    BAIL_ERROR(md_commit_set_return_status_msg(dbinfo->commit, 1,
                                               "Cannot add map entry because maximum reached."));
    return MD_XMAP_REFUSED;
}

} // namespace ovmd
