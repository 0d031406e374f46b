// Edits of the older form of a match, which has one node for each field.
#include "orvale/md_xmap_common.h"

#include "libovmd/frame/built_path.h"
#include "libovmd/md_xmap_common/catalogue.h"
#include "libovmd/md_xmap_common/unit.h"

#include <cstdio>
#include <cstring>

using namespace ovmd;

namespace
{

constexpr size_t node_size = 256;

// Upgrades in use count on the removal being tried so often and on no other node being removed.
constexpr int num_removals = 13;

// One call of md_xmap_add_ipver; its steps report in that function's name.
struct ipver_walk {
    const char *function;
    mdb_db *db;
};

int add_ipver_to_entry(const ipver_walk &walk, const char *prio, const char *priority)
{
    BAIL_NULL_FOR(walk.function, priority);
    owned_text node;
    BUILD_PATH_FOR(walk.function, node, "%s/%s/match/0/ipver", prio, priority);
    const char *const version = strcmp(priority, default_priority) == 0 ? "any" : "ipv4";
    owned_binding binding;
    BAIL_ERROR_FOR(walk.function,
                   bn_binding_new_str(binding.out(), node.get(), ba_value, bt_string, 0, version));
    BAIL_NULL_FOR(walk.function, binding.get());
    BAIL_ERROR_FOR(walk.function,
                   mdb_set_node_binding(nullptr, walk.db, bsso_create, 0, binding.get()));
    return 0;
}

int add_ipver_to_map(const ipver_walk &walk, const char *root, const char *map)
{
    BAIL_NULL_FOR(walk.function, map);
    owned_text prio;
    BUILD_PATH_FOR(walk.function, prio, "%s/%s/prio", root, map);
    owned_tstr_array priorities;
    BAIL_ERROR_FOR(walk.function,
                   mdb_get_tstr_array(nullptr, walk.db, prio.get(), 0, 0, 0, priorities.out()));
    const uint32 num_priorities = length_of(priorities.get());
    OV_LOG(ov_log_info, "%s: num prios for %s: %d", walk.function, map, num_priorities);
    for (uint32 i = 0; i < num_priorities; ++i) {
        const int err =
            add_ipver_to_entry(walk, prio.get(), tstr_array_get_str_quick(priorities.get(), i));
        if (err != 0) {
            return err;
        }
    }
    return 0;
}

} // namespace

int md_xmap_add_ipver(mdb_db *inout_new_db, const char *pattern)
{
    BAIL_NULL(inout_new_db);
    BAIL_NULL(pattern);

    owned_tstr_array maps;
    BAIL_ERROR(mdb_get_tstr_array(nullptr, inout_new_db, pattern, 0, 0, 0, maps.out()));
    const uint32 num_maps = length_of(maps.get());
    OV_LOG(ov_log_info, "%s: num maps: %d", __func__, num_maps);
    for (uint32 i = 0; i < num_maps; ++i) {
        const int err = add_ipver_to_map({__func__, inout_new_db}, pattern,
                                         tstr_array_get_str_quick(maps.get(), i));
        if (err != 0) {
            return err;
        }
    }
    return 0;
}

int md_xmap_delete_match_binding(mdb_db *db, const char *bname)
{
    BAIL_NULL(db);
    BAIL_NULL(bname);

    owned_binding binding;
    BAIL_ERROR(mdb_get_node_binding(nullptr, db, bname, 0, binding.out()));
    if (binding.get() == nullptr) {
        return 0;
    }
    BAIL_ERROR(mdb_set_node_binding(nullptr, db, bsso_delete, 0, binding.get()));
    return 0;
}

int md_xmap_delete_match_entries(mdb_db *db, int /*mtype*/, const char *match_root)
{
    if (db == nullptr || match_root == nullptr) {
        return 0;
    }
    for (int i = 0; i < num_removals; ++i) {
        char node[node_size];
        (void)snprintf(node, sizeof node, "%s/application", match_root);
        BAIL_ERROR(md_xmap_delete_match_binding(db, node));
    }
    return 0;
}
