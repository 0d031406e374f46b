#include "host/modules/legacy_entries.h"

#include "framework/addresses.h"
#include "host/framework/objects.h"
#include "host/modules/map_entries.h"
#include "host/modules/node_access.h"
#include "host/tree/name.h"

#include <algorithm>
#include <iterator>
#include <string_view>

namespace ovhost
{
namespace
{

/// A field that is a pair of the match string as it stands.
struct Field {
    const char *name;
    const char *key;
    const char *anything; ///< the value that matches anything, and is left out
};

constexpr Field fields[] = {
    {"application", "application", "any"}, {"src/port", "src_port", "0"},
    {"dest/port", "dst_port", "0"},        {"vlan", "vlan", "any"},
    {"protocol", "protocol", "ip"},        {"dscp", "dscp", "any"},
};

/// One end of the traffic: the fields of its address in both families.
struct End {
    const char *key;
    const char *ipv4_address;
    const char *ipv4_mask;
    const char *ipv6_prefix;
};

constexpr End ends[] = {
    {"src_ip", "source/addr/ipv4/static/ipaddr", "source/addr/ipv4/static/mask_len",
     "source/addr/ipv6/static/ipv6prefix"},
    {"dst_ip", "dest/addr/ipv4/static/ipaddr", "dest/addr/ipv4/static/mask_len",
     "dest/addr/ipv6/static/ipv6prefix"},
};

/// All that the library looks at, but for the match string itself.
bool is_known(std::string_view name)
{
    return name == "acl" || name == "ipver" ||
           std::ranges::any_of(fields, [name](const Field &field) { return name == field.name; }) ||
           std::ranges::any_of(ends, [name](const End &end) {
               return name == end.ipv4_address || name == end.ipv4_mask || name == end.ipv6_prefix;
           });
}

/// A mask or its length as a length; nothing when the text is neither.
std::optional<std::string> mask_length(const std::string &text)
{
    OwnedText length;
    const int err = lc_mask_or_masklen_to_masklen_str(text.c_str(), length.out());
    return err == 0 ? std::optional<std::string>(length.get()) : std::nullopt;
}

LegacyPair pair_of(const char *key, const std::string &value)
{
    return {key, std::string(key) + ":" + value};
}

std::string ipv4_prefix(const mdb_db &legacy, const LegacyEntry &entry, const End &end)
{
    const std::string address = legacy_text(legacy, entry, end.ipv4_address);
    return address.empty()
               ? "0.0.0.0/0"
               : address + "/" +
                     mask_length(legacy_text(legacy, entry, end.ipv4_mask)).value_or("");
}

std::string ipv6_prefix(const mdb_db &legacy, const LegacyEntry &entry, const End &end)
{
    const std::string prefix = legacy_text(legacy, entry, end.ipv6_prefix);
    return prefix.empty() ? "::/0" : prefix;
}

} // namespace

std::vector<LegacyEntry> legacy_entries(const mdb_db &db, const MapKind &kind)
{
    std::vector<LegacyEntry> entries;
    for (const MapEntry &entry : entries_of(&db, kind)) {
        const std::string node = entry_node(kind, entry.map, entry.priority);
        entries.push_back({node, node + "/" + kind.match});
    }
    return entries;
}

std::vector<LegacyEntry> legacy_entries(const mdb_db &db)
{
    std::vector<LegacyEntry> all;
    for (const MapKind &kind : map_kinds) {
        if (has_older_form(kind)) {
            std::ranges::move(legacy_entries(db, kind), std::back_inserter(all));
        }
    }
    return all;
}

bool says_what_it_matches(const mdb_db &legacy, const LegacyEntry &entry)
{
    return !child_names(&legacy, entry.match_root).empty();
}

bool matches_by_acl(const mdb_db &db, const LegacyEntry &entry)
{
    return !legacy_text(db, entry, "acl").empty();
}

std::string legacy_text(const mdb_db &db, const LegacyEntry &entry, const char *field)
{
    return node_text(&db, entry.match_root + "/" + field).value_or("");
}

std::optional<std::string> unknown_legacy_field(const mdb_db &db, const LegacyEntry &entry)
{
    std::optional<std::string> unknown;
    const std::vector<std::string> above = *split_name(entry.match_root);
    const auto look = [&](Tree::Parts parts, const Value &) {
        if (parts.size() > above.size() && !unknown) {
            const std::string field = join_name(parts.subspan(above.size())).substr(1);
            if (!is_known(field)) {
                unknown = field;
            }
        }
    };
    db.tree.visit(look, above);
    return unknown;
}

std::optional<std::string> mask_fault(const mdb_db &legacy, const LegacyEntry &entry)
{
    for (const End &end : ends) {
        const auto mask = node_text(&legacy, entry.match_root + "/" + end.ipv4_mask);
        if (!legacy_text(legacy, entry, end.ipv4_address).empty() &&
            (!mask || !mask_length(*mask))) {
            return "an IPv4 address needs a mask such as 255.255.0.0 or a length such as 16, and " +
                   std::string(end.ipv4_mask) + " is " + (mask ? "\"" + *mask + "\"" : "missing");
        }
    }
    return std::nullopt;
}

std::vector<LegacyPair> legacy_pairs(const mdb_db &legacy, const LegacyEntry &entry)
{
    std::vector<LegacyPair> pairs;
    const std::string family = legacy_text(legacy, entry, "ipver");
    if (!family.empty() && family != "any") {
        const auto prefix = family == "ipv6" ? ipv6_prefix : ipv4_prefix;
        for (const End &end : ends) {
            pairs.push_back(pair_of(end.key, prefix(legacy, entry, end)));
        }
    }
    for (const Field &field : fields) {
        const std::string value = legacy_text(legacy, entry, field.name);
        if (!value.empty() && value != field.anything) {
            pairs.push_back(pair_of(field.key, value));
        }
    }
    return pairs;
}

} // namespace ovhost
