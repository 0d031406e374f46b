// Removes everything below a node, but not the node.
#include "orvale/md_utils.h"

#include "libovmd/frame/built_path.h"
#include "libovmd/md_utils/unit.h"

using namespace ovmd;

int md_delete_children(md_commit *commit, const mdb_db *db, const char *parent, int *num)
{
    int uncounted = 0;
    int &count = num != nullptr ? *num : uncounted;
    count = 0;
    BAIL_NULL(db);
    BAIL_NULL(parent);

    owned_tstr_array children;
    BAIL_ERROR(mdb_get_tstr_array(commit, db, parent, 0, 0, 0, children.out()));
    const uint32 num_children = length_of(children.get());
    for (uint32 i = 0; i < num_children; ++i) {
        const char *const child = tstr_array_get_str_quick(children.get(), i);
        BAIL_NULL(child);
        BAIL_ERROR(mdb_set_node_str(commit, const_cast<mdb_db *>(db), bsso_delete, 0, bt_string, "",
                                    "%s/%s", parent, child));
        ++count;
        OV_LOG(ov_log_info, "Child %s removed", child);
    }
    return 0;
}
