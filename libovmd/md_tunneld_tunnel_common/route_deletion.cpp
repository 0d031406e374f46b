// Removes the next hops of a subnet from the data plane's routes.
#include "orvale/md_tunneld_tunnel_common.h"

#include "framework/addresses.h"
#include "libovmd/frame/built_path.h"
#include "libovmd/md_tunneld_tunnel_common/unit.h"

#include <cstdio>

using namespace ovmd;

namespace
{

constexpr char prefix_root[] = "/ov/tunneld/net/routes/config/ipv4/prefix";

constexpr size_t nhop_list_size = 200;
constexpr size_t node_size = 256;
constexpr size_t escaped_size = 256;

size_t escaped_length(const char *text)
{
    size_t length = 0;
    for (; *text != '\0'; ++text) {
        length += *text == '/' ? 2 : 1;
    }
    return length;
}

// Makes one component of a node's name of a text that has slashes in it. The result has no
// terminating NUL of its own, and the next call overwrites it: routes are found in the order and by
// the names that this has always led to. The text must be fit to be escaped. Not inlined, because a
// compiler that sees how long the result can be warns of the node names that it makes too long:
// they are to be cut.
[[gnu::noinline]] const char *add_escape_for_bname(const char *str)
{
    static char bname_esc[escaped_size];
    char *end = bname_esc;
    for (const char *c = str; c != nullptr && *c != '\0'; ++c) {
        if (*c == '/') {
            *end++ = '\\';
        }
        *end++ = *c;
    }
    return str != nullptr ? bname_esc : nullptr;
}

// The buffer's last byte stays a NUL whatever was escaped before.
bool fits_escaped(const char *text)
{
    return escaped_length(text) < escaped_size;
}

// One call of md_tunneld_delete_dproutes; its steps report in that function's name.
struct route_removal {
    const char *function;
    md_commit *commit;
    mdb_db *db;
    const char *address;
    uint8 masklen;
};

int remove_node(const route_removal &removal, const char *node, const char *value)
{
    owned_binding binding;
    BAIL_ERROR_FOR(removal.function,
                   bn_binding_new_str(binding.out(), node, ba_value, bt_string, 0, value));
    BAIL_NULL_FOR(removal.function, binding.get());
    BAIL_ERROR_FOR(removal.function,
                   mdb_set_node_binding(removal.commit, removal.db, bsso_delete, 0, binding.get()));
    return 0;
}

// Removes those next hops of a list that are in the subnet.
int remove_next_hops(const route_removal &removal, const char *list_node, const tstr_array *nhops,
                     uint32 &count)
{
    const uint32 num_nhops = length_of(nhops);
    for (uint32 i = 0; i < num_nhops; ++i) {
        const char *const nhop = tstr_array_get_str_quick(nhops, i);
        BAIL_NULL_FOR(removal.function, nhop);
        if (!mgmt_is_same_subnet_using_masklen(nhop, removal.address, removal.masklen,
                                               removal.masklen)) {
            continue;
        }
        char node[node_size];
        (void)snprintf(node, sizeof node, "%s/%s", list_node, nhop);
        const int err = remove_node(removal, node, nhop);
        if (err != 0) {
            return err;
        }
        OV_LOG(ov_log_info, "DPR/VLAN %s deleted\n", node);
        ++count;
    }
    return 0;
}

// A prefix that has lost all its next hops goes with them.
int remove_from_prefix(const route_removal &removal, const char *prefix, uint32 &total)
{
    const char *const escaped = add_escape_for_bname(prefix);
    char list_node[nhop_list_size];
    (void)snprintf(list_node, sizeof list_node, "%s/%s/nhop", prefix_root, escaped);
    owned_tstr_array nhops;
    BAIL_ERROR_FOR(removal.function,
                   mdb_get_tstr_array(removal.commit, removal.db, list_node, 0, 0, 0, nhops.out()));
    uint32 count = 0;
    int err = remove_next_hops(removal, list_node, nhops.get(), count);
    if (err == 0 && count > 0 && count >= length_of(nhops.get())) {
        char node[node_size];
        (void)snprintf(node, sizeof node, "%s/%s", prefix_root, escaped);
        err = remove_node(removal, node, escaped);
    }
    total += count;
    return err;
}

} // namespace

int md_tunneld_delete_dproutes(md_commit *commit, mdb_db *db, const char *ipa, uint8 masklen,
                               uint32 *ret_count)
{
    if (ret_count != nullptr) {
        *ret_count = 0;
    }
    BAIL_NULL(db);
    BAIL_NULL(ipa);

    const route_removal removal = {__func__, commit, db, ipa, masklen};
    owned_tstr_array prefixes;
    BAIL_ERROR(mdb_get_tstr_array(commit, db, prefix_root, 0, 0, 0, prefixes.out()));
    uint32 total = 0;
    const uint32 num_prefixes = length_of(prefixes.get());
    for (uint32 i = 0; i < num_prefixes; ++i) {
        const char *const prefix = tstr_array_get_str_quick(prefixes.get(), i);
        BAIL_NULL(prefix);
        BAIL_REQUIRE(fits_escaped(prefix));
        const int err = remove_from_prefix(removal, prefix, total);
        if (err != 0) {
            return err;
        }
    }
    if (ret_count != nullptr) {
        *ret_count = total;
    }
    return 0;
}
