// What is checked for every change of a map.
#include "orvale/md_xmap_common.h"

#include "libovmd/md_xmap_common/limits.h"
#include "libovmd/md_xmap_common/map_entry.h"
#include "libovmd/md_xmap_common/unit.h"

using namespace ovmd;

int md_xmap_check_match_exists_for_set(mdb_db_change *change, md_dbinfo *dbinfo, int mtype)
{
    BAIL_NULL(change);
    BAIL_NULL(dbinfo);
    const map_type *const type = find_policy_map_type(mtype);
    if (type == nullptr) {
        OV_LOG(ov_log_error, "UNKNOWN map type");
        return 0;
    }
    if (change->mdc_change_type != mdct_add || !name_matches(change, type->set_pattern)) {
        return 0;
    }
    const map_entry entry = entry_of(*type, change);
    BAIL_NO_ENTRY_FOR(__func__, entry);
    owned_text match;
    BUILD_PATH(match, "%s/%s/prio/%s/match", type->root, entry.map, entry.priority);
    owned_tstr_array children;
    BAIL_ERROR(
        mdb_get_tstr_array(dbinfo->commit, dbinfo->newdb, match.get(), 0, 0, 0, children.out()));
    if (length_of(children.get()) != 0) {
        return 0;
    }
    BAIL_ERROR(md_commit_set_return_status_msg(
        dbinfo->commit, 1,
        "The match parameters have to be configured before configuring the set parameters."));
    return MD_XMAP_REFUSED;
}

int md_xmap_common_change_check(mdb_db_change *change, md_dbinfo *dbinfo, int mtype, tbool *to_bail)
{
    BAIL_NULL(to_bail);
    *to_bail = false;
    BAIL_NULL(change);
    BAIL_NULL(dbinfo);

    const map_type *const type = find_policy_map_type(mtype);
    if (type == nullptr) {
        OV_LOG(ov_log_error, "UNKNOWN type in %s", __func__);
    }
    int err = md_xmap_check_limit(change, dbinfo, mtype);
    if (err == MD_XMAP_REFUSED) {
        *to_bail = true;
        return 0;
    }
    BAIL_ERROR(err);

    owned_tstring match_string;
    if (type != nullptr && change->mdc_change_type != mdct_delete &&
        name_matches(change, type->matchstr_pattern) && change->mdc_new_attribs != nullptr) {
        // That it can be read is all that is asked here: md_xmap_validate_match_str says whether it
        // is good.
        BAIL_ERROR(
            bn_attrib_array_get_attrib_tstr(change->mdc_new_attribs, ba_value, match_string.out()));
    }
    err = md_xmap_check_match_exists_for_set(change, dbinfo, mtype);
    if (err == MD_XMAP_REFUSED) {
        *to_bail = true;
        return 0;
    }
    BAIL_ERROR(err);
    return 0;
}
