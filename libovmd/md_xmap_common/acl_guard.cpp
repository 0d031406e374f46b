// Keeps an ACL from being removed while map entries name it.
#include "orvale/md_xmap_common.h"

#include "libovmd/md_xmap_common/map_entry.h"
#include "libovmd/md_xmap_common/unit.h"

#include <cstdio>

using namespace ovmd;

namespace
{

constexpr size_t acl_name_size = 256;
constexpr size_t message_size = 256;

// Components of a node's name.
constexpr uint32 acl_part = 4;
constexpr uint32 reference_map_part = 6;
constexpr uint32 reference_priority_part = 8;

// One call of md_acl_not_used_in_map; its steps report in that function's name.
struct removed_acl {
    const char *function;
    const md_dbinfo *dbinfo;
    const map_type &type;
    const char *name;
};

int find_references(const removed_acl &acl, owned_tstr_array &references)
{
    owned_text pattern;
    BUILD_PATH_FOR(acl.function, pattern, "%s/%s/%s/*/prio/*", acl_root, acl.name, acl.type.key);
    BAIL_ERROR_FOR(acl.function,
                   mdb_get_matching_tstr_array(acl.dbinfo->commit, acl.dbinfo->olddb, pattern.get(),
                                               mdqf_sel_iterate_subtree | mdqf_sel_class_no_state,
                                               references.out()));
    return 0;
}

// Whether the entry of a reference names the ACL in the new database: it may be gone by now, or
// have another.
int entry_names_acl(const removed_acl &acl, const char *reference, bool &ret_names)
{
    BAIL_NULL_FOR(acl.function, reference);
    owned_tstr_array parts;
    BAIL_ERROR_FOR(acl.function, bn_binding_name_to_parts(reference, parts.out(), false));
    const char *const map = part_of(parts.get(), reference_map_part);
    BAIL_NULL_FOR(acl.function, map);
    const char *const priority = part_of(parts.get(), reference_priority_part);
    BAIL_NULL_FOR(acl.function, priority);

    owned_text path;
    BUILD_ACL_PATH_FOR(acl.function, path, acl.type, map, priority);
    owned_tstring value;
    BAIL_ERROR_FOR(acl.function, mdb_get_node_value_tstr(acl.dbinfo->commit, acl.dbinfo->newdb,
                                                         path.get(), 0, nullptr, value.out()));
    ret_names = false;
    if (value.get() != nullptr) {
        OV_LOG(ov_log_info, "Ref <%s/%s>, <%s/%s>", map, priority, ts_str(value.get()), acl.name);
        ret_names = ts_cmp_str(value.get(), acl.name, false) == 0;
    }
    return 0;
}

int refuse(const removed_acl &acl)
{
    char message[message_size];
    (void)snprintf(message, sizeof message,
                   "Cannot delete an ACL when used by a %s.\n"
                   "  Please remove ACL from associated %s first.",
                   acl.type.user_name, acl.type.user_name);
    BAIL_ERROR_FOR(acl.function, md_commit_set_return_status_msg(acl.dbinfo->commit, 1, message));
    return 0;
}

} // namespace

int md_acl_not_used_in_map(mdb_db_change *change, md_dbinfo *dbinfo, int mtype)
{
    BAIL_NULL(change);
    BAIL_NULL(dbinfo);
    if (change->mdc_change_type != mdct_delete ||
        !name_matches(change, "/ov/tunneld/acl/config/*")) {
        return 0;
    }
    const map_type *const type = find_policy_map_type(mtype);
    if (type == nullptr) {
        OV_LOG(ov_log_error, "UNKNOWN map type");
        return 0;
    }
    const char *const removed = part_of(change->mdc_name_parts, acl_part);
    BAIL_NULL(removed);
    char name[acl_name_size];
    (void)snprintf(name, sizeof name, "%s", removed);
    const removed_acl acl = {__func__, dbinfo, *type, name};

    owned_tstr_array references;
    int err = find_references(acl, references);
    if (err != 0) {
        return err;
    }
    const uint32 num_references = length_of(references.get());
    OV_LOG(ov_log_notice, "ACL %s used by %d %s", name, num_references, type->user_name);
    for (uint32 i = 0; i < num_references; ++i) {
        bool names_acl = false;
        err = entry_names_acl(acl, tstr_array_get_str_quick(references.get(), i), names_acl);
        if (err != 0) {
            return err;
        }
        if (names_acl) {
            return refuse(acl);
        }
    }
    return 0;
}
