#pragma once
// The entries of maps in a legacy configuration, which have one node for each field that they
// match, and what they say in the words of match strings. legacy_faults.h judges them,
// legacy_upgrade.h has them converted.
//
// Fields, below an entry's match node, and what they become in its match string:
//
//   application               application
//   src/port, dest/port       src_port, dst_port
//   vlan, protocol, dscp      keys of the same names
//   ipver                     tells which of its addresses an entry matches by, ipv4 or ipv6
//   source/addr/FAMILY/...    src_ip, there whenever ipver has a family; dest/addr: dst_ip
//   acl                       nothing: the entry stays as it is

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

/// The text of a field; empty when the entry has none such.
[[nodiscard]] std::string legacy_text(const mdb_db &db, const LegacyEntry &entry,
                                      const char *field);

/// A field of an entry that would be passed over; nothing when there is none.
[[nodiscard]] std::optional<std::string> unknown_legacy_field(const mdb_db &db,
                                                              const LegacyEntry &entry);

/// What is wrong with the mask of an entry's IPv4 addresses, if that is what is wrong.
[[nodiscard]] std::optional<std::string> mask_fault(const mdb_db &legacy, const LegacyEntry &entry);

struct LegacyPair {
    std::string key;
    std::string text; ///< as it stands in a match string
};

/// All pairs that the match string of an entry must have for the entry to match no more than it
/// does. Both ends of a family are among them, though they be for any address: without them
/// the entry would match the other family, too.
[[nodiscard]] std::vector<LegacyPair> legacy_pairs(const mdb_db &legacy, const LegacyEntry &entry);

} // namespace ovhost
