// References from an ACL to the map entries that name it, kept while the entries change.
#include "orvale/md_xmap_common.h"

#include "libovmd/md_xmap_common/map_entry.h"
#include "libovmd/md_xmap_common/unit.h"

using namespace ovmd;

namespace
{

// One call of md_acl_ref_processing; its steps report in that function's name.
struct reference_update {
    const char *function;
    md_dbinfo *dbinfo;
    map_entry entry;

    mdb_db *newdb() const { return const_cast<mdb_db *>(dbinfo->newdb); }
};

// The ACL that the entry names in the old database; null when it names none.
int read_old_acl(const reference_update &update, owned_text &acl)
{
    const map_entry &entry = update.entry;
    owned_text path;
    BUILD_ACL_PATH_FOR(update.function, path, entry.type, entry.map, entry.priority);
    owned_binding binding;
    BAIL_ERROR_FOR(update.function,
                   mdb_get_node_binding(update.dbinfo->commit, update.dbinfo->olddb, path.get(), 0,
                                        binding.out()));
    if (binding.get() != nullptr) {
        BAIL_ERROR_FOR(update.function,
                       bn_binding_get_str(binding.get(), ba_value, bt_string, 0, acl.out()));
    }
    return 0;
}

int add_reference(const reference_update &update, const char *acl)
{
    const map_entry &entry = update.entry;
    owned_text path;
    BUILD_PATH_FOR(update.function, path, "%s/%s/%s/%s/prio/%s", acl_root, acl, entry.type.key,
                   entry.map, entry.priority);
    OV_LOG(ov_log_info, "Creating ACL map entry %s", path.get());
    owned_binding reference;
    BAIL_ERROR_FOR(update.function, bn_binding_new_str(reference.out(), path.get(), ba_value,
                                                       bt_uint32, 0, entry.priority));
    BAIL_NULL_FOR(update.function, reference.get());
    BAIL_ERROR_FOR(update.function, mdb_set_node_binding(update.dbinfo->commit, update.newdb(),
                                                         bsso_modify, 0, reference.get()));
    return 0;
}

// The map's last reference takes the map's level with it.
int build_removed_node(const reference_update &update, const char *acl, owned_text &node)
{
    const map_entry &entry = update.entry;
    owned_text prio;
    BUILD_PATH_FOR(update.function, prio, "%s/%s/%s/%s/prio", acl_root, acl, entry.type.key,
                   entry.map);
    owned_tstr_array references;
    BAIL_ERROR_FOR(update.function, mdb_get_tstr_array(update.dbinfo->commit, update.dbinfo->newdb,
                                                       prio.get(), 0, 0, 0, references.out()));
    if (length_of(references.get()) < 2) {
        BUILD_PATH_FOR(update.function, node, "%s/%s/%s/%s", acl_root, acl, entry.type.key,
                       entry.map);
    } else {
        BUILD_PATH_FOR(update.function, node, "%s/%s/%s/%s/prio/%s", acl_root, acl, entry.type.key,
                       entry.map, entry.priority);
    }
    return 0;
}

// Nothing to do for an entry that named no ACL.
int remove_reference(const reference_update &update, const char *acl)
{
    if (acl == nullptr || *acl == '\0') {
        return 0;
    }
    owned_text node;
    const int err = build_removed_node(update, acl, node);
    if (err != 0) {
        return err;
    }
    OV_LOG(ov_log_info, "Removing %s", node.get());
    owned_binding reference;
    BAIL_ERROR_FOR(update.function, bn_binding_new_named(reference.out(), node.get()));
    BAIL_NULL_FOR(update.function, reference.get());
    BAIL_ERROR_FOR(update.function, mdb_set_node_binding(update.dbinfo->commit, update.newdb(),
                                                         bsso_delete, 0, reference.get()));
    return 0;
}

// The new reference is written before the old one is removed, also where both are of one ACL.
int process_acl(const mdb_db_change *change, const reference_update &update)
{
    OV_LOG(ov_log_info, "In map Apply ACL modify");
    owned_tstring new_acl;
    if (change->mdc_new_attribs != nullptr) {
        BAIL_ERROR_FOR(update.function, bn_attrib_array_get_attrib_tstr(change->mdc_new_attribs,
                                                                        ba_value, new_acl.out()));
    }
    BAIL_NO_ENTRY_FOR(update.function, update.entry);
    if (is_default(update.entry)) {
        return 0;
    }
    owned_text old_acl;
    int err = read_old_acl(update, old_acl);
    if (err != 0) {
        return err;
    }
    OV_LOG(ov_log_info, "refcheck: acl=%s, %s-%s, old=%s", text_of(new_acl.get()), update.entry.map,
           update.entry.priority, old_acl.get());
    if (ts_num_chars(new_acl.get()) >= 1) {
        err = add_reference(update, ts_str(new_acl.get()));
        if (err != 0) {
            return err;
        }
    }
    return remove_reference(update, old_acl.get());
}

int process_removed_entry(const reference_update &update)
{
    BAIL_NO_ENTRY_FOR(update.function, update.entry);
    if (is_default(update.entry)) {
        return 0;
    }
    owned_text old_acl;
    const int err = read_old_acl(update, old_acl);
    return err != 0 ? err : remove_reference(update, old_acl.get());
}

} // namespace

int md_acl_ref_processing(mdb_db_change *change, md_dbinfo *dbinfo, int mtype)
{
    BAIL_NULL(change);
    BAIL_NULL(dbinfo);
    BAIL_NULL(dbinfo->newdb);

    const map_type *const type = find_policy_map_type(mtype);
    if (type == nullptr) {
        OV_LOG(ov_log_error, "UNKNOWN map type");
        return 0;
    }
    switch (change->mdc_change_type) {
    case mdct_add:
    case mdct_modify:
        return name_matches(change, type->acl_pattern)
                   ? process_acl(change, {__func__, dbinfo, entry_of(*type, change)})
                   : 0;
    case mdct_delete:
        return name_matches(change, type->entry_pattern)
                   ? process_removed_entry({__func__, dbinfo, entry_of(*type, change)})
                   : 0;
    default:
        return 0;
    }
}
