#pragma once
// The entries of maps in a legacy configuration, which have one node for each field that they
// match, and what keeps one from being converted as it is. legacy_upgrade.h has them converted.
//
// Fields, below an entry's match node, and the keys that they have in a match string:
//
//   application src/port dest/port vlan protocol dscp  application src_port dst_port and as they
//   are ipver                                              the family of the addresses, ipv4 or
//   ipv6 source/addr/...                                    src_ip; written whenever there is a
//   family dest/addr/...                                      dst_ip, as src_ip acl none: the entry
//   stays as it is

#include "framework/mdb_db.h"
#include "host/modules/map_kinds.h"

#include <optional>
#include <string>
#include <vector>

namespace ovhost
{

struct LegacyEntry {
    std::string node;
    std::string match_root; ///< the node below which the entry has what it matches
};

/// Security maps came after the older form.
[[nodiscard]] constexpr bool has_older_form(const MapKind &kind)
{
    return !is_security_map(kind);
}

/// The entries of one kind of maps, or of all kinds that have an older form.
[[nodiscard]] std::vector<LegacyEntry> legacy_entries(const mdb_db &db, const MapKind &kind);
[[nodiscard]] std::vector<LegacyEntry> legacy_entries(const mdb_db &db);

[[nodiscard]] bool says_what_it_matches(const mdb_db &legacy, const LegacyEntry &entry);

[[nodiscard]] bool matches_by_acl(const mdb_db &db, const LegacyEntry &entry);

/// Why an entry must not be handed to the library, which would make less of it and say nothing.
[[nodiscard]] std::optional<std::string> fault_before_conversion(const mdb_db &legacy,
                                                                 const LegacyEntry &entry);

/// Whether the library has come to the entry.
[[nodiscard]] bool is_converted(const mdb_db &converted, const LegacyEntry &entry);

/// What the library has dropped of an entry that it has converted: an entry that says less matches
/// more.
[[nodiscard]] std::optional<std::string> loss_fault(const mdb_db &legacy, const mdb_db &converted,
                                                    const LegacyEntry &entry);

/// Of an entry that has not been converted; `err` ended the conversion.
[[nodiscard]] std::string failure_message(const mdb_db &legacy, const LegacyEntry &entry, int err);

/// The same when there is no entry to name.
[[nodiscard]] std::string failure_message(int err);

} // namespace ovhost
