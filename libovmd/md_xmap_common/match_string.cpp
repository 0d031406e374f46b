// Match strings: what is checked of them, and how one is put together.
#include "orvale/md_xmap_common.h"

#include "libovmd/frame/built_path.h"
#include "libovmd/md_xmap_common/unit.h"

#include "framework/appliance.h"

#include <cstdio>
#include <cstring>
#include <strings.h>

using namespace ovmd;

namespace
{

constexpr size_t label_pattern_size = 256;

// The only value that the library itself looks at: applications and their like are checked where
// they are configured.
constexpr char vlan_key[] = "vlan";

} // namespace

int md_xmap_validate_match_str(md_dbinfo *dbinfo, const char *mstr, tbool *ret_valid)
{
    BAIL_NULL(ret_valid);
    *ret_valid = true;
    BAIL_NULL(dbinfo);
    BAIL_NULL(mstr);

    owned_tstr_array keys;
    owned_tstr_array values;
    owned_text reason;
    if (ov_acl_validate_matchstr(mstr, keys.out(), values.out(), reason.out()) != 0) {
        BAIL_ERROR(
            md_commit_set_return_status_msg_fmt(dbinfo->commit, 1, "Invalid match string %s - %s\n",
                                                mstr, reason.get() != nullptr ? reason.get() : ""));
        *ret_valid = false;
        return 0;
    }
    const uint32 num_pairs = length_of(keys.get());
    for (uint32 i = 0; i < num_pairs; ++i) {
        const char *const key = tstr_array_get_str_quick(keys.get(), i);
        BAIL_NULL(key);
        if (strcasecmp(key, vlan_key) == 0) {
            BAIL_ERROR(md_xmap_vlan_check(dbinfo->newdb, part_of(values.get(), i)));
        }
    }
    return 0;
}

int md_xmap_vlan_check(const mdb_db *db, const char *vlan)
{
    if (md_xmap_iflabel_check(vlan, db)) {
        return 0;
    }
    return vlan != nullptr && ovlan_valid_name_check(vlan) == 0 ? 0 : -1;
}

tbool md_xmap_iflabel_check(const char *iflabel, const mdb_db *db)
{
    BAIL_NULL_ANSWER(iflabel, false);
    BAIL_NULL_ANSWER(db, false);

    char pattern[label_pattern_size];
    (void)snprintf(pattern, sizeof pattern, "/ov/iflabels/config/*/%s", iflabel);
    owned_tstr_array labels;
    BAIL_ERROR_ANSWER(
        mdb_get_matching_tstr_array(nullptr, db, pattern, mdqf_sel_class_no_state, labels.out()),
        false);
    return length_of(labels.get()) != 0;
}

int md_xmap_concat_key_value(char *buf, size_t buflen, const char *key, const char *value)
{
    if (key == nullptr || value == nullptr || buf == nullptr) {
        return 0;
    }
    const size_t used = strnlen(buf, buflen);
    char piece[MD_XMAP_MATCHSTR_SIZE];
    (void)snprintf(piece, sizeof piece, "%s%s:%s", used != 0 ? "," : "", key, value);
    const size_t length = strlen(piece);
    BAIL_REQUIRE(length < buflen - used);
    memcpy(buf + used, piece, length + 1);
    return 0;
}
