#include "host/modules/legacy_upgrade.h"

#include "framework/addresses.h"
#include "host/framework/objects.h"
#include "host/modules/map_kinds.h"
#include "host/modules/node_access.h"
#include "host/tree/diff.h"
#include "host/tree/name.h"
#include "orvale/md_xmap_common.h"

#include <algorithm>
#include <iterator>
#include <optional>
#include <string>

namespace ovhost
{
namespace
{

/// Security maps came after the older form.
bool has_older_form(const MapKind &kind)
{
    return !is_security_map(kind);
}

struct LegacyEntry {
    std::string node;
    std::string match_root; ///< the node below which the entry has what it matches
};

std::vector<LegacyEntry> entries_of(const mdb_db &db, const MapKind &kind)
{
    std::vector<LegacyEntry> entries;
    for (const std::string &map : child_names(&db, kind.root)) {
        for (const std::string &priority : child_names(&db, map_node(kind, map) + "/prio")) {
            const std::string node = entry_node(kind, map, priority);
            entries.push_back({node, node + "/" + kind.match});
        }
    }
    return entries;
}

std::vector<LegacyEntry> entries_of(const mdb_db &db)
{
    std::vector<LegacyEntry> all;
    for (const MapKind &kind : map_kinds) {
        if (has_older_form(kind)) {
            std::ranges::move(entries_of(db, kind), std::back_inserter(all));
        }
    }
    return all;
}

bool says_what_it_matches(const mdb_db &legacy, const LegacyEntry &entry)
{
    return !child_names(&legacy, entry.match_root).empty();
}

/// Whether an entry of the text says nothing of what it matches, and so leaves that to the entry in
/// force. The library would make "any" of it, which is right for an entry that is new.
bool keeps_match_in_force(const mdb_db &running, const mdb_db &legacy, const LegacyEntry &entry)
{
    return !says_what_it_matches(legacy, entry) && running.tree.exists(*split_name(entry.node));
}

/// The ACL that an entry matches by; empty when there is none.
std::string acl_of(const mdb_db &db, const std::string &match_root)
{
    return node_text(&db, match_root + "/acl").value_or("");
}

/// How many characters the fields of an entry have together.
std::size_t field_characters(const mdb_db &db, const std::string &match_root)
{
    std::size_t characters = 0;
    db.tree.visit(
        [&characters](Tree::Parts, const Value &value) { characters += value.text.size(); },
        *split_name(match_root));
    return characters;
}

/// The library drops what does not fit a match string, and an entry that says less matches more.
/// Keys, colons, commas and the slashes of addresses take up 72 characters at most.
constexpr std::size_t longest_fields = MD_XMAP_MATCHSTR_SIZE - 1 - 72;

/// The library cuts the name of a field of an entry with an ACL behind 255 characters, and would
/// then remove another node.
constexpr std::size_t longest_match_root = 255 - std::string_view("/application").size();

/// All that the library looks at, but for the match string itself.
constexpr std::string_view known_fields[] = {
    "acl",
    "application",
    "ipver",
    "src/port",
    "dest/port",
    "vlan",
    "protocol",
    "dscp",
    "source/addr/ipv4/static/ipaddr",
    "source/addr/ipv4/static/mask_len",
    "source/addr/ipv6/static/ipv6prefix",
    "dest/addr/ipv4/static/ipaddr",
    "dest/addr/ipv4/static/mask_len",
    "dest/addr/ipv6/static/ipv6prefix",
};

/// A field of an entry that would be passed over; nothing when there is none.
std::optional<std::string> unknown_field(const mdb_db &db, const std::string &match_root)
{
    std::optional<std::string> unknown;
    const std::vector<std::string> above = *split_name(match_root);
    const auto look = [&](Tree::Parts parts, const Value &) {
        if (parts.size() > above.size() && !unknown) {
            const std::string field = join_name(parts.subspan(above.size())).substr(1);
            if (std::ranges::find(known_fields, field) == std::end(known_fields)) {
                unknown = field;
            }
        }
    };
    db.tree.visit(look, above);
    return unknown;
}

/// Why an entry of the text must not be handed to the library.
std::optional<std::string> fault_before(const mdb_db &legacy, const std::string &match_root)
{
    if (node_text(&legacy, match_root + "/matchstr")) {
        return "it has a match string already; give a file whose entries are all of the older form";
    }
    if (match_root.size() > longest_match_root) {
        return "its names are too long: an upgrade takes " + std::to_string(longest_match_root) +
               " characters up to here";
    }
    if (const auto unknown = unknown_field(legacy, match_root)) {
        return "an upgrade knows no field \"" + *unknown +
               "\", and without it the entry would match more; mend its name, or remove it";
    }
    const std::size_t characters = field_characters(legacy, match_root);
    if (acl_of(legacy, match_root).empty() && characters > longest_fields) {
        return "its fields have " + std::to_string(characters) + " characters; " +
               std::to_string(longest_fields) + " are sure to fit a match string";
    }
    return std::nullopt;
}

bool is_converted(const mdb_db &converted, const std::string &match_root)
{
    return acl_of(converted, match_root).empty()
               ? node_text(&converted, match_root + "/matchstr").has_value()
               : !node_text(&converted, match_root + "/application").has_value();
}

bool is_mask(const std::string &text)
{
    char *length = nullptr;
    const int err = lc_mask_or_masklen_to_masklen_str(text.c_str(), &length);
    const TextPtr owned(length);
    return err == 0;
}

/// What is wrong with the mask of an entry's IPv4 addresses, if that is what is wrong.
std::optional<std::string> mask_fault(const mdb_db &legacy, const std::string &match_root)
{
    for (const std::string side : {"source", "dest"}) {
        const std::string fields = side + "/addr/ipv4/static/";
        const std::string address =
            node_text(&legacy, match_root + "/" + fields + "ipaddr").value_or("");
        const auto mask = node_text(&legacy, match_root + "/" + fields + "mask_len");
        if (!address.empty() && (!mask || !is_mask(*mask))) {
            return "an IPv4 address needs a mask such as 255.255.0.0 or a length such as 16, and " +
                   fields + "mask_len is " + (mask ? "\"" + *mask + "\"" : "missing");
        }
    }
    return std::nullopt;
}

/// Of an entry that has not been converted; `err` ended the conversion.
std::string failure_message(const mdb_db &legacy, const std::string &match_root, int err)
{
    if (err == 0) {
        return "it was not converted: an upgrade takes no map whose name holds a slash or a "
               "backslash";
    }
    const char *const text =
        lc_enum_to_string_quiet_null(lc_error_code_map, static_cast<uint32>(err));
    return mask_fault(legacy, match_root).value_or("it cannot be converted") + " (error code " +
           std::to_string(err) + (text != nullptr ? std::string(", ") + text : "") + ")";
}

/// Converts the entries of a kind. What failed ended the conversion, so that there is one entry to
/// name; what was passed over without failing is named in full.
void convert(const MapKind &kind, const mdb_db &before, mdb_db &after,
             std::vector<LineFault> &faults)
{
    const int err = md_xmap_upgrade_to_pattern_match(&after, &before, kind.type);
    const std::size_t faults_before = faults.size();
    for (const auto &[node, match_root] : entries_of(before, kind)) {
        if (!is_converted(after, match_root)) {
            faults.push_back({0, match_root, failure_message(before, match_root, err)});
            if (err != 0) {
                return;
            }
        }
    }
    if (err != 0 && faults.size() == faults_before) {
        faults.push_back({0, kind.root, failure_message(before, kind.root, err)});
    }
}

/// Lays the text, and then what the conversion has made of it, over a candidate. No edit can fail:
/// the text has been read before, and what is not there needs no removing.
void merge(Candidate &candidate, std::string_view text, const mdb_db &before, const mdb_db &after)
{
    for (const LegacyEntry &entry : entries_of(before)) {
        if (says_what_it_matches(before, entry)) {
            (void)candidate.erase(entry.match_root);
        }
    }
    (void)load_text(candidate, text);
    for (const Change &change : diff(before.tree, after.tree)) {
        const std::string name = join_name(change.parts);
        (void)(change.after ? candidate.set(name, change.after->type, change.after->text)
                            : candidate.erase(name));
    }
}

/// Counts the entries, and finds those that must not be converted.
void judge_entries(const mdb_db &running, const mdb_db &legacy, LegacyUpgrade &result)
{
    for (const LegacyEntry &entry : entries_of(legacy)) {
        if (auto fault = fault_before(legacy, entry.match_root)) {
            result.entry_faults.push_back({0, entry.match_root, *std::move(fault)});
        }
        if (!keeps_match_in_force(running, legacy, entry)) {
            ++(acl_of(legacy, entry.match_root).empty() ? result.converted : result.by_acl);
        }
    }
}

/// Takes back the match strings of entries that keep what they match.
void leave_kept_matches(const mdb_db &running, const mdb_db &before, mdb_db &after)
{
    for (const LegacyEntry &entry : entries_of(before)) {
        if (keeps_match_in_force(running, before, entry)) {
            (void)after.tree.erase(*split_name(entry.match_root + "/matchstr"));
        }
    }
}

} // namespace

LegacyUpgrade upgrade_legacy(Candidate &candidate, std::string_view text)
{
    LegacyUpgrade result;
    Candidate legacy;
    result.line_faults = load_text(legacy, text).faults;
    if (!result.is_done()) {
        return result;
    }
    mdb_db running;
    running.tree = candidate.tree();
    mdb_db before;
    before.tree = legacy.tree();
    judge_entries(running, before, result);
    if (!result.is_done()) {
        return result;
    }
    mdb_db after = before;
    after.writable = true;
    for (const MapKind &kind : map_kinds) {
        if (has_older_form(kind)) {
            convert(kind, before, after, result.entry_faults);
        }
    }
    if (result.is_done()) {
        leave_kept_matches(running, before, after);
        merge(candidate, text, before, after);
    }
    return result;
}

} // namespace ovhost
