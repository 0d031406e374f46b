#include "host/modules/legacy_upgrade.h"

#include "host/framework/objects.h"
#include "host/tree/diff.h"
#include "host/tree/name.h"
#include "orvale/md_xmap_common.h"

#include <optional>
#include <string>

namespace ovhost
{
namespace
{

using Parts = std::vector<std::string>;

struct LegacyKind {
    int mtype;
    const char *maps; ///< the component that tells the kind of maps
};

/// The kinds of maps that have an older form.
constexpr LegacyKind legacy_kinds[] = {
    {MAP_TYPE_R, "route_map"}, {MAP_TYPE_O, "opt_map"}, {MAP_TYPE_Q, "qos_map"},
    {MAP_TYPE_S, "stats_map"}, {MAP_TYPE_N, "nat_map"},
};

Parts operator/(Parts parts, const char *child)
{
    parts.emplace_back(child);
    return parts;
}

Parts operator/(Parts parts, const std::string &child)
{
    return std::move(parts) / child.c_str();
}

Parts root_of(const LegacyKind &kind)
{
    return {"ov", "tunneld", kind.maps, "config", "map"};
}

/// The match nodes of all entries of a kind.
std::vector<Parts> match_nodes(const Tree &tree, const LegacyKind &kind)
{
    std::vector<Parts> nodes;
    const Parts root = root_of(kind);
    for (const std::string &map : tree.children(root)) {
        const Parts entries = root / map / "prio";
        for (const std::string &priority : tree.children(entries)) {
            nodes.push_back(entries / priority / "match" / "0");
        }
    }
    return nodes;
}

std::vector<Parts> match_nodes(const Tree &tree)
{
    std::vector<Parts> all;
    for (const LegacyKind &kind : legacy_kinds) {
        const std::vector<Parts> nodes = match_nodes(tree, kind);
        all.insert(all.end(), nodes.begin(), nodes.end());
    }
    return all;
}

LineFault entry_fault(const Parts &node, std::string message)
{
    return {0, join_name(node), std::move(message)};
}

bool has_text(const Tree &tree, const Parts &name)
{
    const Value *const value = tree.value(name);
    return value != nullptr && !value->text.empty();
}

/// How many characters the fields of an entry have together.
std::size_t field_characters(const Tree &tree, const Parts &match)
{
    std::size_t characters = 0;
    tree.visit([&characters](Tree::Parts, const Value &value) { characters += value.text.size(); },
               match);
    return characters;
}

/// The library drops what does not fit a match string, and an entry that says less matches more.
/// Keys, colons, commas and the slashes of addresses take up 72 characters at most.
constexpr std::size_t longest_fields = MD_XMAP_MATCHSTR_SIZE - 1 - 72;

/// The library cuts the name of a field of an entry with an ACL behind 255 characters, and would
/// then remove another node.
constexpr std::size_t longest_match_node = 255 - std::string_view("/application").size();

/// Why an entry must not be handed to the library.
std::optional<std::string> fault_before(const Tree &running, const Tree &legacy, const Parts &match)
{
    if (legacy.value(match / "matchstr") != nullptr) {
        return "it has a match string already; give a file whose entries are all of the older form";
    }
    if (join_name(match).size() > longest_match_node) {
        return "the entry's names are too long: an upgrade takes " +
               std::to_string(longest_match_node) + " characters up to here";
    }
    const bool has_acl = has_text(legacy, match / "acl");
    if (const std::size_t characters = field_characters(legacy, match);
        !has_acl && characters > longest_fields) {
        return "its fields have " + std::to_string(characters) + " characters; " +
               std::to_string(longest_fields) + " are sure to fit a match string";
    }
    if (!has_acl && has_text(running, match / "acl")) {
        // The reference of an ACL whose node alone goes would stay.
        return "the entry in force matches by the ACL \"" + running.value(match / "acl")->text +
               "\" and the one of the file does not; delete the entry, commit, and upgrade then";
    }
    return std::nullopt;
}

bool is_converted(const Tree &converted, const Parts &match)
{
    return has_text(converted, match / "acl") ? converted.value(match / "application") == nullptr
                                              : has_text(converted, match / "matchstr");
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
void convert(const LegacyKind &kind, const mdb_db &before, mdb_db &after,
             std::vector<LineFault> &faults)
{
    const int err = md_xmap_upgrade_to_pattern_match(&after, &before, kind.mtype);
    const std::size_t faults_before = faults.size();
    for (const Parts &match : match_nodes(before.tree, kind)) {
        if (!is_converted(after.tree, match)) {
            faults.push_back(entry_fault(match, failure_message(err)));
            if (err != 0) {
                return;
            }
        }
    }
    if (err != 0 && faults.size() == faults_before) {
        faults.push_back(entry_fault(root_of(kind), failure_message(err)));
    }
}

/// Lays the text, and then what the conversion has made of it, over a candidate. No edit can fail:
/// the text has been read before, and what is not there needs no removing.
void merge(Candidate &candidate, std::string_view text, const Tree &before, const Tree &after)
{
    for (const Parts &match : match_nodes(before)) {
        (void)candidate.erase(join_name(match));
    }
    (void)load_text(candidate, text);
    for (const Change &change : diff(before, after)) {
        const std::string name = join_name(change.parts);
        (void)(change.after ? candidate.set(name, change.after->type, change.after->text)
                            : candidate.erase(name));
    }
}

} // namespace

LegacyUpgrade upgrade_legacy(Candidate &candidate, std::string_view text)
{
    LegacyUpgrade result;
    Candidate legacy;
    result.line_faults = load_text(legacy, text).faults;
    for (const Parts &match : match_nodes(legacy.tree())) {
        if (auto fault = fault_before(candidate.tree(), legacy.tree(), match)) {
            result.entry_faults.push_back(entry_fault(match, *std::move(fault)));
        }
        ++(has_text(legacy.tree(), match / "acl") ? result.by_acl : result.converted);
    }
    if (!result.is_done()) {
        return result;
    }
    mdb_db before;
    before.tree = legacy.tree();
    mdb_db after = before;
    after.writable = true;
    for (const LegacyKind &kind : legacy_kinds) {
        convert(kind, before, after, result.entry_faults);
    }
    if (result.is_done()) {
        merge(candidate, text, before.tree, after.tree);
    }
    return result;
}

} // namespace ovhost
