// Rewrites entries of the older form, one node for each field, to match strings.
#include "orvale/md_xmap_common.h"

#include "framework/addresses.h"
#include "libovmd/frame/built_path.h"
#include "libovmd/md_xmap_common/catalogue.h"
#include "libovmd/md_xmap_common/unit.h"

#include <cstdio>

using namespace ovmd;

namespace
{

constexpr size_t match_node_size = 512;
constexpr size_t field_size = 1024;
constexpr size_t address_size = 1024;

constexpr char application_node[] = "application";
constexpr char ipver_node[] = "ipver";

// A field whose value goes into the match string as it is, unless it says nothing.
struct plain_field {
    const char *node;
    const char *key;
    const char *says_nothing;
};

constexpr plain_field application_field = {application_node, "application", "any"};

// In the order of the match string, behind the addresses.
constexpr plain_field plain_fields[] = {
    {"src/port", "src_port", "0"},  {"dest/port", "dst_port", "0"}, {"vlan", "vlan", "any"},
    {"protocol", "protocol", "ip"}, {"dscp", "dscp", "any"},
};

struct address_fields {
    const char *key;
    const char *ipv6_prefix;
    const char *ipv4_address;
    const char *ipv4_mask;
};

constexpr address_fields addresses[] = {
    {"src_ip", "source/addr/ipv6/static/ipv6prefix", "source/addr/ipv4/static/ipaddr",
     "source/addr/ipv4/static/mask_len"},
    {"dst_ip", "dest/addr/ipv6/static/ipv6prefix", "dest/addr/ipv4/static/ipaddr",
     "dest/addr/ipv4/static/mask_len"},
};

constexpr char any_ipv4[] = "0.0.0.0/0";
constexpr char any_ipv6[] = "::/0";

bool is_empty(const tstring *value)
{
    return value == nullptr || ts_length(value) <= 0;
}

// One entry on its way to a match string; reports in the exported function's name, and whoever
// calls a step that fails passes the code on without another line.
class entry_upgrade
{
  public:
    entry_upgrade(const char *function, mdb_db *new_db, const mdb_db *db, const char *match_node)
        : function_(function), new_db_(new_db), db_(db), match_node_(match_node)
    {
    }

    int find_acl(bool &ret_has_acl) const
    {
        owned_tstring acl;
        const int err = read("acl", acl);
        ret_has_acl = err == 0 && !is_empty(acl.get());
        return err;
    }

    int convert()
    {
        int err = convert_plain(application_field);
        if (err == 0) {
            err = convert_addresses();
        }
        for (const plain_field &field : plain_fields) {
            if (err == 0) {
                err = convert_plain(field);
            }
        }
        if (err != 0) {
            return err;
        }
        if (match_string_[0] == '\0') {
            (void)snprintf(match_string_, sizeof match_string_, "any");
        }
        OV_LOG(ov_log_info, "Converted match string %s", match_string_);
        return write_match_string();
    }

  private:
    void name_of(const char *field, char (&node)[field_size]) const
    {
        (void)snprintf(node, sizeof node, "%s/%s", match_node_, field);
    }

    int read(const char *field, owned_tstring &value) const
    {
        char node[field_size];
        name_of(field, node);
        BAIL_ERROR_FOR(function_,
                       mdb_get_node_value_tstr(nullptr, db_, node, 0, nullptr, value.out()));
        return 0;
    }

    // The conversion goes on with a field that cannot be removed: it is told, and is no error exit.
    void remove(const char *field) const
    {
        char node[field_size];
        name_of(field, node);
        const int err = md_xmap_delete_match_binding(new_db_, node);
        if (err != 0 && err != lc_err_cancelled) {
            bail_log_code(err, function_, bail_unit, __LINE__);
        }
    }

    int take(const char *field, owned_tstring &value) const
    {
        const int err = read(field, value);
        if (err == 0) {
            remove(field);
        }
        return err;
    }

    // A pair for which there is no room is left out.
    void append(const char *key, const char *value)
    {
        (void)md_xmap_concat_key_value(match_string_, sizeof match_string_, key, value);
    }

    int convert_plain(const plain_field &field)
    {
        owned_tstring value;
        const int err = take(field.node, value);
        if (err == 0 && !is_empty(value.get()) &&
            !ts_equal_str(value.get(), field.says_nothing, false)) {
            append(field.key, ts_str(value.get()));
        }
        return err;
    }

    int convert_addresses()
    {
        owned_tstring version;
        int err = take(ipver_node, version);
        if (err != 0) {
            return err;
        }
        const bool has_addresses =
            !is_empty(version.get()) && !ts_equal_str(version.get(), "any", false);
        const bool is_ipv6 = has_addresses && ts_equal_str(version.get(), "ipv6", false);
        const bool is_ipv4 = has_addresses && !is_ipv6;
        for (const address_fields &fields : addresses) {
            if (is_ipv6 && err == 0) {
                err = convert_ipv6(fields);
            } else if (!is_ipv6) {
                remove(fields.ipv6_prefix);
            }
        }
        for (const address_fields &fields : addresses) {
            if (is_ipv4 && err == 0) {
                err = convert_ipv4(fields);
            } else if (!is_ipv4 && err == 0) {
                remove(fields.ipv4_address);
                remove(fields.ipv4_mask);
            }
        }
        return err;
    }

    // The prefix that means every address is written, not left out.
    int convert_ipv6(const address_fields &fields)
    {
        owned_tstring prefix;
        const int err = read(fields.ipv6_prefix, prefix);
        if (err == 0) {
            append(fields.key, is_empty(prefix.get()) ? any_ipv6 : ts_str(prefix.get()));
            remove(fields.ipv6_prefix);
        }
        return err;
    }

    int convert_ipv4(const address_fields &fields)
    {
        owned_tstring address;
        owned_tstring mask;
        int err = take(fields.ipv4_address, address);
        if (err == 0) {
            err = take(fields.ipv4_mask, mask);
        }
        if (err != 0) {
            return err;
        }
        if (is_empty(address.get())) {
            append(fields.key, any_ipv4);
            return 0;
        }
        owned_text length;
        BAIL_ERROR_FOR(function_,
                       lc_mask_or_masklen_to_masklen_str(text_of(mask.get()), length.out()));
        BAIL_NULL_FOR(function_, length.get());
        char prefix[address_size];
        (void)snprintf(prefix, sizeof prefix, "%s/%s", ts_str(address.get()), length.get());
        append(fields.key, prefix);
        return 0;
    }

    int write_match_string() const
    {
        char node[field_size];
        name_of("matchstr", node);
        owned_binding binding;
        BAIL_ERROR_FOR(function_, bn_binding_new_str(binding.out(), node, ba_value, bt_string, 0,
                                                     match_string_));
        BAIL_NULL_FOR(function_, binding.get());
        BAIL_ERROR_FOR(function_,
                       mdb_set_node_binding(nullptr, new_db_, bsso_modify, 0, binding.get()));
        return 0;
    }

    const char *function_;
    mdb_db *new_db_;
    const mdb_db *db_;
    const char *match_node_;
    char match_string_[MD_XMAP_MATCHSTR_SIZE] = "";
};

} // namespace

int md_xmap_upgrade_to_pattern_match(mdb_db *new_db, const mdb_db *db, int mtype)
{
    BAIL_NULL(new_db);
    BAIL_NULL(db);
    const map_type *const type = find_map_type(mtype);
    BAIL_REQUIRE(type != nullptr && type->has_legacy_form);

    // What the last entry visited has left, when its clean-up failed: every read that succeeds
    // clears it.
    int pending = 0;
    owned_tstr_array maps;
    BAIL_ERROR(mdb_get_tstr_array(nullptr, db, type->root, 0, 0, 0, maps.out()));
    const uint32 num_maps = length_of(maps.get());
    for (uint32 i = 0; i < num_maps; ++i) {
        const char *const map = tstr_array_get_str_quick(maps.get(), i);
        BAIL_NULL(map);
        char node[match_node_size];
        (void)snprintf(node, sizeof node, "%s/%s/prio", type->root, map);
        owned_tstr_array priorities;
        BAIL_ERROR(mdb_get_tstr_array(nullptr, db, node, 0, 0, 0, priorities.out()));
        pending = 0;
        const uint32 num_priorities = length_of(priorities.get());
        for (uint32 j = 0; j < num_priorities; ++j) {
            const char *const priority = tstr_array_get_str_quick(priorities.get(), j);
            BAIL_NULL(priority);
            (void)snprintf(node, sizeof node, "%s/%s/prio/%s/match/0", type->root, map, priority);
            entry_upgrade entry(__func__, new_db, db, node);
            bool has_acl = false;
            int err = entry.find_acl(has_acl);
            if (err == 0 && !has_acl) {
                err = entry.convert();
            }
            if (err != 0) {
                return err;
            }
            pending = 0;
            if (!has_acl) {
                continue;
            }
            // An entry that matches by ACL keeps its other nodes and gets no match string. That
            // one has been passed over is told even where the operation was cancelled.
            pending = md_xmap_delete_match_entries(new_db, mtype, node);
            if (pending != 0) {
                bail_log_code(pending, __func__, bail_unit, __LINE__);
            }
        }
    }
    return pending;
}
