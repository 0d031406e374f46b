#include "host/modules/legacy_upgrade.h"

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

/// The nodes below which the entries of a kind have what they match.
std::vector<std::string> match_roots(const mdb_db &db, const MapKind &kind)
{
    std::vector<std::string> roots;
    for (const std::string &map : child_names(&db, kind.root)) {
        for (const std::string &priority : child_names(&db, map_node(kind, map) + "/prio")) {
            roots.push_back(entry_node(kind, map, priority) + "/" + kind.match);
        }
    }
    return roots;
}

std::vector<std::string> match_roots(const mdb_db &db)
{
    std::vector<std::string> all;
    for (const MapKind &kind : map_kinds) {
        if (has_older_form(kind)) {
            std::ranges::move(match_roots(db, kind), std::back_inserter(all));
        }
    }
    return all;
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

/// Why an entry of the text must not be handed to the library.
std::optional<std::string> fault_before(const mdb_db &running, const mdb_db &legacy,
                                        const std::string &match_root)
{
    if (node_text(&legacy, match_root + "/matchstr")) {
        return "it has a match string already; give a file whose entries are all of the older form";
    }
    if (match_root.size() > longest_match_root) {
        return "its names are too long: an upgrade takes " + std::to_string(longest_match_root) +
               " characters up to here";
    }
    if (!acl_of(legacy, match_root).empty()) {
        return std::nullopt;
    }
    const std::size_t characters = field_characters(legacy, match_root);
    if (characters > longest_fields) {
        return "its fields have " + std::to_string(characters) + " characters; " +
               std::to_string(longest_fields) + " are sure to fit a match string";
    }
    // The reference of an ACL whose node alone goes would stay.
    const std::string acl = acl_of(running, match_root);
    return acl.empty() ? std::nullopt
                       : std::optional("the entry in force matches by the ACL \"" + acl +
                                       "\" and the one of the file does not; delete the entry, "
                                       "commit, and upgrade then");
}

bool is_converted(const mdb_db &converted, const std::string &match_root)
{
    return acl_of(converted, match_root).empty()
               ? node_text(&converted, match_root + "/matchstr").has_value()
               : !node_text(&converted, match_root + "/application").has_value();
}

std::string failure_message(int err)
{
    if (err == 0) {
        return "it was not converted: an upgrade takes no map whose name holds a slash or a "
               "backslash";
    }
    const char *const text =
        lc_enum_to_string_quiet_null(lc_error_code_map, static_cast<uint32>(err));
    return "it cannot be converted (error code " + std::to_string(err) +
           (text != nullptr ? std::string(", ") + text : "") +
           "); an IPv4 address needs a mask such as 255.255.0.0 or a length such as 16";
}

/// Converts the entries of a kind. What failed ended the conversion, so that there is one entry to
/// name; what was passed over without failing is named in full.
void convert(const MapKind &kind, const mdb_db &before, mdb_db &after,
             std::vector<LineFault> &faults)
{
    const int err = md_xmap_upgrade_to_pattern_match(&after, &before, kind.type);
    const std::size_t faults_before = faults.size();
    for (const std::string &match_root : match_roots(before, kind)) {
        if (!is_converted(after, match_root)) {
            faults.push_back({0, match_root, failure_message(err)});
            if (err != 0) {
                return;
            }
        }
    }
    if (err != 0 && faults.size() == faults_before) {
        faults.push_back({0, kind.root, failure_message(err)});
    }
}

/// Lays the text, and then what the conversion has made of it, over a candidate. No edit can fail:
/// the text has been read before, and what is not there needs no removing.
void merge(Candidate &candidate, std::string_view text, const mdb_db &before, const mdb_db &after)
{
    for (const std::string &match_root : match_roots(before)) {
        (void)candidate.erase(match_root);
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
    for (const std::string &match_root : match_roots(legacy)) {
        if (auto fault = fault_before(running, legacy, match_root)) {
            result.entry_faults.push_back({0, match_root, *std::move(fault)});
        }
        ++(acl_of(legacy, match_root).empty() ? result.converted : result.by_acl);
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
        merge(candidate, text, before, after);
    }
    return result;
}

} // namespace ovhost
