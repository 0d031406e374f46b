#include "host/modules/legacy_entries.h"

#include "framework/addresses.h"
#include "framework/errors.h"
#include "host/framework/objects.h"
#include "host/modules/map_entries.h"
#include "host/modules/node_access.h"
#include "host/tree/name.h"
#include "orvale/md_xmap_common.h"

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

/// The library cuts the name of a field of an entry with an ACL behind 255 characters, and would
/// then remove another node.
constexpr std::size_t longest_match_root = 255 - std::string_view("/application").size();

std::string text_of(const mdb_db &db, const LegacyEntry &entry, const char *field)
{
    return node_text(&db, entry.match_root + "/" + field).value_or("");
}

/// A field of an entry that would be passed over; nothing when there is none.
std::optional<std::string> unknown_field(const mdb_db &db, const LegacyEntry &entry)
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

/// A mask or its length as a length; nothing when the text is neither.
std::optional<std::string> mask_length(const std::string &text)
{
    OwnedText length;
    const int err = lc_mask_or_masklen_to_masklen_str(text.c_str(), length.out());
    return err == 0 ? std::optional<std::string>(length.get()) : std::nullopt;
}

/// What is wrong with the mask of an entry's IPv4 addresses, if that is what is wrong.
std::optional<std::string> mask_fault(const mdb_db &legacy, const LegacyEntry &entry)
{
    for (const End &end : ends) {
        const auto mask = node_text(&legacy, entry.match_root + "/" + end.ipv4_mask);
        if (!text_of(legacy, entry, end.ipv4_address).empty() && (!mask || !mask_length(*mask))) {
            return "an IPv4 address needs a mask such as 255.255.0.0 or a length such as 16, and " +
                   std::string(end.ipv4_mask) + " is " + (mask ? "\"" + *mask + "\"" : "missing");
        }
    }
    return std::nullopt;
}

struct Pair {
    std::string key;
    std::string text; ///< as it stands in a match string
};

Pair pair_of(const char *key, const std::string &value)
{
    return {key, std::string(key) + ":" + value};
}

std::string ipv4_prefix(const mdb_db &legacy, const LegacyEntry &entry, const End &end)
{
    const std::string address = text_of(legacy, entry, end.ipv4_address);
    return address.empty()
               ? "0.0.0.0/0"
               : address + "/" + mask_length(text_of(legacy, entry, end.ipv4_mask)).value_or("");
}

std::string ipv6_prefix(const mdb_db &legacy, const LegacyEntry &entry, const End &end)
{
    const std::string prefix = text_of(legacy, entry, end.ipv6_prefix);
    return prefix.empty() ? "::/0" : prefix;
}

/// All pairs that the match string of an entry must have for the entry to match no more than it
/// does. Both ends of a family are among them, though they be for any address: without them
/// the entry would match the other family, too.
std::vector<Pair> pairs_of(const mdb_db &legacy, const LegacyEntry &entry)
{
    std::vector<Pair> pairs;
    const std::string family = text_of(legacy, entry, "ipver");
    if (!family.empty() && family != "any") {
        const auto prefix = family == "ipv6" ? ipv6_prefix : ipv4_prefix;
        for (const End &end : ends) {
            pairs.push_back(pair_of(end.key, prefix(legacy, entry, end)));
        }
    }
    for (const Field &field : fields) {
        const std::string value = text_of(legacy, entry, field.name);
        if (!value.empty() && value != field.anything) {
            pairs.push_back(pair_of(field.key, value));
        }
    }
    return pairs;
}

/// The values in a legacy configuration hold no commas.
std::vector<std::string> split_pairs(const std::string &match_string)
{
    std::vector<std::string> pairs;
    for (std::size_t begin = 0; begin <= match_string.size();) {
        const std::size_t end = std::min(match_string.find(',', begin), match_string.size());
        pairs.push_back(match_string.substr(begin, end - begin));
        begin = end + 1;
    }
    return pairs;
}

std::size_t joined_size(const std::vector<Pair> &pairs)
{
    std::size_t size = pairs.empty() ? 0 : pairs.size() - 1;
    for (const Pair &pair : pairs) {
        size += pair.text.size();
    }
    return size;
}

std::string with_code(const std::string &fault, int err)
{
    const char *const text =
        lc_enum_to_string_quiet_null(lc_error_code_map, static_cast<uint32>(err));
    return fault + " (error code " + std::to_string(err) +
           (text != nullptr ? std::string(", ") + text : "") + ")";
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
    return !text_of(db, entry, "acl").empty();
}

std::optional<std::string> fault_before_conversion(const mdb_db &legacy, const LegacyEntry &entry)
{
    if (node_text(&legacy, entry.match_root + "/matchstr")) {
        return "it has a match string already; give a file whose entries are all of the older form";
    }
    if (entry.match_root.size() > longest_match_root) {
        return "its names are too long: an upgrade takes " + std::to_string(longest_match_root) +
               " characters up to here";
    }
    if (const auto unknown = unknown_field(legacy, entry)) {
        return "an upgrade knows no field \"" + *unknown +
               "\", and without it the entry would match more; mend its name, or remove it";
    }
    return std::nullopt;
}

bool is_converted(const mdb_db &converted, const LegacyEntry &entry)
{
    return matches_by_acl(converted, entry)
               ? !node_text(&converted, entry.match_root + "/application").has_value()
               : node_text(&converted, entry.match_root + "/matchstr").has_value();
}

std::optional<std::string> loss_fault(const mdb_db &legacy, const mdb_db &converted,
                                      const LegacyEntry &entry)
{
    if (matches_by_acl(legacy, entry)) {
        return std::nullopt;
    }
    const std::vector<Pair> wanted = pairs_of(legacy, entry);
    const std::vector<std::string> present = split_pairs(text_of(converted, entry, "matchstr"));
    std::string lost;
    for (const Pair &pair : wanted) {
        if (std::ranges::find(present, pair.text) == present.end()) {
            lost += (lost.empty() ? "" : ", ") + pair.key;
        }
    }
    return lost.empty() ? std::nullopt
                        : std::optional("its match string would lack " + lost +
                                        ", and the entry would match more: it needs " +
                                        std::to_string(joined_size(wanted)) +
                                        " characters, and there is "
                                        "room for " +
                                        std::to_string(MD_XMAP_MATCHSTR_SIZE - 1));
}

std::string failure_message(const mdb_db &legacy, const LegacyEntry &entry, int err)
{
    if (err == 0) {
        return "it was not converted: an upgrade takes no map whose name holds a slash or a "
               "backslash";
    }
    const auto fault = mask_fault(legacy, entry);
    return fault ? with_code(*fault, err) : failure_message(err);
}

std::string failure_message(int err)
{
    return with_code("it cannot be converted", err);
}

} // namespace ovhost
