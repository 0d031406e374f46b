// What the library adds to the host's work for policy maps: the checks of a commit, and the upgrade
// of maps of the older form. Each stands beside the host operations that the same work cannot do
// without, called one after the other with all names at hand.

#include "bench/bare_work.h"
#include "bench/policy_maps.h"
#include "framework/addresses.h"
#include "framework/logging.h"
#include "host/framework/owners.h"
#include "orvale/md_xmap_common.h"

#include <array>
#include <memory>
#include <string>
#include <vector>

namespace
{

using namespace ovbench;
using ovhost::OwnedBinding;
using ovhost::OwnedString;
using ovhost::OwnedStrings;
using ovhost::OwnedText;

constexpr char entry_pattern[] = "/ov/tunneld/route_map/config/map/*/prio/*";

bool matches(const NodeChange &change, const char *pattern)
{
    return bn_binding_name_parts_pattern_match(change.parts(), true, pattern);
}

/// The names of a node's children, which nobody looks at.
int list(md_commit *commit, const mdb_db &db, const std::string &node)
{
    OwnedStrings names;
    const int status = mdb_get_tstr_array(commit, &db, node.c_str(), 0, 0, 0, names.out());
    benchmark::DoNotOptimize(names.get());
    return status;
}

/// Entries that all match by one ACL, as they are before a commit.
struct ReferringMaps {
    explicit ReferringMaps(int num_entries) : names(entry_names(num_entries))
    {
        for (const EntryName &name : names) {
            set(db, name.node() + "/match/0/acl", bt_string, "office");
            set(db, name.node() + "/set/0/nexthop", bt_ipv4addr, "10.0.0.1");
            set(db, name.reference("office"), bt_uint32, name.priority);
        }
    }

    std::vector<EntryName> names;
    mdb_db db;
};

/// One more entry.
struct EntryAddition {
    explicit EntryAddition(int num_entries) : maps(num_entries)
    {
        for (int map = 0; map < num_maps; ++map) {
            prio_nodes.push_back(std::string(route_root) + "/branch-office-" + std::to_string(map) +
                                 "/prio");
        }
        dbinfo = {.commit = &commit, .olddb = &maps.db, .newdb = &maps.db};
    }

    [[nodiscard]] int check()
    {
        tbool to_bail = false;
        const int status =
            md_xmap_common_change_check(change.record(), &dbinfo, MAP_TYPE_R, &to_bail);
        return to_bail ? MD_XMAP_REFUSED : status;
    }

    /// Whether the change is a map or an entry, how many entries there are, and whether it is a
    /// match string or sets something.
    [[nodiscard]] int query()
    {
        int status = matches(change, "/ov/tunneld/route_map/config/map/*") ? -1 : 0;
        status |= matches(change, entry_pattern) ? 0 : -1;
        status |= list(&commit, maps.db, route_root);
        for (const std::string &node : prio_nodes) {
            status |= list(&commit, maps.db, node);
        }
        status |= matches(change, "/ov/tunneld/route_map/config/map/*/prio/*/match/*/matchstr");
        status |= matches(change, "/ov/tunneld/route_map/config/map/*/prio/*/set/*");
        return status;
    }

    ReferringMaps maps;
    std::vector<std::string> prio_nodes;
    CountingCommit commit;
    md_dbinfo dbinfo;
    NodeChange change{mdct_add, std::string(route_root) + "/branch-office-0/prio/7", nullptr};
};

/// An entry of each map gets another ACL.
struct AclChanges {
    struct Change {
        explicit Change(const EntryName &name)
            : record(mdct_modify, name.node() + "/match/0/acl", "branch"), priority(name.priority),
              acl(name.node() + "/match/0/acl"), added(name.reference("branch")),
              removed(name.reference("office")), references(removed.substr(0, removed.rfind('/')))
        {
        }

        NodeChange record;
        std::string priority;
        std::string acl;
        std::string added;
        std::string removed;
        std::string references;
    };

    explicit AclChanges(int num_entries) : maps(num_entries)
    {
        const auto per_map = static_cast<std::size_t>(num_entries / num_maps);
        for (std::size_t map = 0; map < num_maps; ++map) {
            changes.emplace_back(std::make_unique<Change>(maps.names[map * per_map + per_map / 2]));
        }
        proposed = maps.db;
        for (const auto &change : changes) {
            set(proposed, change->acl, bt_string, "branch");
        }
        newdb.writable = true;
        begin();
        dbinfo = {.commit = &commit, .olddb = &maps.db, .newdb = &newdb};
    }

    /// The proposed database is as it is before the references are looked after.
    void begin() { newdb.tree = proposed.tree; }

    [[nodiscard]] int process()
    {
        int status = 0;
        for (const auto &change : changes) {
            status |= md_acl_ref_processing(change->record.record(), &dbinfo, MAP_TYPE_R);
        }
        return status;
    }

    [[nodiscard]] int query()
    {
        int status = 0;
        for (const auto &change : changes) {
            status |= query(*change);
        }
        return status;
    }

    [[nodiscard]] int query(Change &change)
    {
        int status = matches(change.record, "/ov/tunneld/route_map/config/map/*/prio/*/match/*/acl")
                         ? 0
                         : -1;
        OwnedString new_acl;
        status |= bn_attrib_array_get_attrib_tstr(change.record.record()->mdc_new_attribs, ba_value,
                                                  new_acl.out());
        OwnedBinding old_binding;
        OwnedText old_acl;
        status |= mdb_get_node_binding(&commit, &maps.db, change.acl.c_str(), 0, old_binding.out());
        status |= bn_binding_get_str(old_binding.get(), ba_value, bt_string, 0, old_acl.out());
        OwnedBinding added;
        status |= bn_binding_new_str(added.out(), change.added.c_str(), ba_value, bt_uint32, 0,
                                     change.priority.c_str());
        status |= mdb_set_node_binding(&commit, &newdb, bsso_modify, 0, added.get());
        status |= list(&commit, newdb, change.references);
        OwnedBinding removed;
        status |= bn_binding_new_named(removed.out(), change.removed.c_str());
        status |= mdb_set_node_binding(&commit, &newdb, bsso_delete, 0, removed.get());
        return status;
    }

    ReferringMaps maps;
    std::vector<std::unique_ptr<Change>> changes;
    mdb_db proposed;
    mdb_db newdb;
    CountingCommit commit;
    md_dbinfo dbinfo;
};

/// An ACL goes, and none of the entries that refer to it names it any more.
struct AclRemoval {
    explicit AclRemoval(int num_entries) : maps(num_entries)
    {
        for (const EntryName &name : maps.names) {
            acl_nodes.push_back(name.node() + "/match/0/acl");
            set(newdb, acl_nodes.back(), bt_string, "branch");
        }
        dbinfo = {.commit = &commit, .olddb = &maps.db, .newdb = &newdb};
    }

    [[nodiscard]] int guard()
    {
        const int status = md_acl_not_used_in_map(change.record(), &dbinfo, MAP_TYPE_R);
        return commit.refusals == 0 ? status : MD_XMAP_REFUSED;
    }

    [[nodiscard]] int query()
    {
        int status = matches(change, "/ov/tunneld/acl/config/*") ? 0 : -1;
        OwnedStrings references;
        status |= mdb_get_matching_tstr_array(
            &commit, &maps.db, "/ov/tunneld/acl/config/office/rmap/*/prio/*",
            mdqf_sel_iterate_subtree | mdqf_sel_class_no_state, references.out());
        for (uint32 i = 0; i < acl_nodes.size(); ++i) {
            OwnedStrings parts;
            status |= bn_binding_name_to_parts(tstr_array_get_str_quick(references.get(), i),
                                               parts.out(), false);
            OwnedString acl;
            status |= mdb_get_node_value_tstr(&commit, &newdb, acl_nodes[i].c_str(), 0, nullptr,
                                              acl.out());
            status |= ts_cmp_str(acl.get(), "office", false) == 0 ? -1 : 0;
        }
        return status;
    }

    ReferringMaps maps;
    std::vector<std::string> acl_nodes;
    mdb_db newdb;
    CountingCommit commit;
    md_dbinfo dbinfo;
    NodeChange change{mdct_delete, "/ov/tunneld/acl/config/office", nullptr};
};

/// What an entry of the older form holds, in the order in which it is taken apart.
struct LegacyField {
    const char *node;
    const char *value; ///< null: absent
    bool is_read;
};

constexpr std::array<LegacyField, 13> legacy_fields = {{
    {"application", "web", true},
    {"ipver", "ipv4", true},
    {"source/addr/ipv6/static/ipv6prefix", nullptr, false},
    {"dest/addr/ipv6/static/ipv6prefix", nullptr, false},
    {"source/addr/ipv4/static/ipaddr", "10.1.0.0", true},
    {"source/addr/ipv4/static/mask_len", "255.255.0.0", true},
    {"dest/addr/ipv4/static/ipaddr", "10.2.3.0", true},
    {"dest/addr/ipv4/static/mask_len", "24", true},
    {"src/port", "0", true},
    {"dest/port", "443", true},
    {"vlan", "any", true},
    {"protocol", "tcp", true},
    {"dscp", "any", true},
}};

constexpr char match_string[] = "application:web,src_ip:10.1.0.0/16,dst_ip:10.2.3.0/24,"
                                "dst_port:443,protocol:tcp";

/// Entries of the older form.
struct LegacyMaps {
    explicit LegacyMaps(int num_entries)
    {
        for (const EntryName &name : entry_names(num_entries)) {
            const std::string match_node = name.node() + "/match/0/";
            Entry entry = {match_node + "acl", {}, match_node + "matchstr"};
            for (std::size_t i = 0; i < legacy_fields.size(); ++i) {
                entry.fields[i] = match_node + legacy_fields[i].node;
                if (legacy_fields[i].value != nullptr) {
                    set(db, entry.fields[i], bt_string, legacy_fields[i].value);
                }
            }
            entries.push_back(std::move(entry));
        }
        for (int map = 0; map < num_maps; ++map) {
            prio_nodes.push_back(std::string(route_root) + "/branch-office-" + std::to_string(map) +
                                 "/prio");
        }
        newdb.writable = true;
        begin();
    }

    void begin() { newdb.tree = db.tree; }

    [[nodiscard]] int upgrade()
    {
        return md_xmap_upgrade_to_pattern_match(&newdb, &db, MAP_TYPE_R);
    }

    [[nodiscard]] int query()
    {
        int status = list(nullptr, db, route_root);
        for (const std::string &node : prio_nodes) {
            status |= list(nullptr, db, node);
        }
        for (const Entry &entry : entries) {
            status |= query(entry);
        }
        return status;
    }

    struct Entry {
        std::string acl;
        std::array<std::string, legacy_fields.size()> fields;
        std::string match_string;
    };

    [[nodiscard]] int query(const Entry &entry)
    {
        int status = read(entry.acl);
        for (std::size_t i = 0; i < legacy_fields.size(); ++i) {
            if (legacy_fields[i].is_read) {
                status |= read(entry.fields[i]);
            }
            OwnedBinding field;
            status |=
                mdb_get_node_binding(nullptr, &newdb, entry.fields[i].c_str(), 0, field.out());
            if (field.get() != nullptr) {
                status |= mdb_set_node_binding(nullptr, &newdb, bsso_delete, 0, field.get());
            }
        }
        for (const char *mask : {"255.255.0.0", "24"}) {
            OwnedText length;
            status |= lc_mask_or_masklen_to_masklen_str(mask, length.out());
        }
        OwnedBinding made;
        status |= bn_binding_new_str(made.out(), entry.match_string.c_str(), ba_value, bt_string, 0,
                                     match_string);
        return status | mdb_set_node_binding(nullptr, &newdb, bsso_modify, 0, made.get());
    }

    [[nodiscard]] int read(const std::string &node) const
    {
        OwnedString value;
        const int status =
            mdb_get_node_value_tstr(nullptr, &db, node.c_str(), 0, nullptr, value.out());
        benchmark::DoNotOptimize(value.get());
        return status;
    }

    mdb_db db;
    mdb_db newdb;
    std::vector<Entry> entries;
    std::vector<std::string> prio_nodes;
};

void require_same_ends()
{
    for (const int num_entries : {10, 1'000}) {
        require_same_end<AclChanges, &AclChanges::process, &AclChanges::query>(num_entries);
        require_same_end<LegacyMaps, &LegacyMaps::upgrade, &LegacyMaps::query>(num_entries);
    }
}

constexpr Work works[] = {
    {"check", "common change check of a new entry", repeat<EntryAddition, &EntryAddition::check>,
     repeat<EntryAddition, &EntryAddition::query>},
    {"references", "reference processing of 10 changed ACLs",
     repeat_anew<AclChanges, &AclChanges::process>, repeat_anew<AclChanges, &AclChanges::query>},
    {"guard", "deletion guard of an ACL", repeat<AclRemoval, &AclRemoval::guard>,
     repeat<AclRemoval, &AclRemoval::query>},
    {"upgrade", "upgrade of all entries", repeat_anew<LegacyMaps, &LegacyMaps::upgrade>,
     repeat_anew<LegacyMaps, &LegacyMaps::query>},
};

} // namespace

int main(int argc, char **argv)
{
    G_daemon_log_level = ov_log_error;
    allow_many_entries();
    require_same_ends();
    return run_beside_bare(
        argc, argv,
        {"Policy maps", "Route maps, ten of them with the entries spread evenly", "entries"},
        works);
}
