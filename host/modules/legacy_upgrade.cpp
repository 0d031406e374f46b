#include "host/modules/legacy_upgrade.h"

#include "host/framework/objects.h"
#include "host/modules/legacy_faults.h"
#include "host/tree/diff.h"
#include "host/tree/name.h"
#include "orvale/md_xmap_common.h"

#include <optional>
#include <string>
#include <utility>

namespace ovhost
{
namespace
{

/// Whether an entry of the text says nothing of what it matches, and so leaves that to the entry in
/// force. The library would make "any" of it, which is right for an entry that is new.
bool keeps_match_in_force(const mdb_db &running, const mdb_db &legacy, const LegacyEntry &entry)
{
    return !says_what_it_matches(legacy, entry) && running.tree.exists(*split_name(entry.node));
}

/// Converts the entries of a kind. What failed ended the conversion, so that there is one entry to
/// name; what was passed over or lost without failing is named in full.
void convert(const MapKind &kind, const mdb_db &before, mdb_db &after,
             std::vector<LineFault> &faults)
{
    const int err = md_xmap_upgrade_to_pattern_match(&after, &before, kind.type);
    for (const LegacyEntry &entry : legacy_entries(before, kind)) {
        if (!is_converted(after, entry)) {
            faults.push_back({0, entry.match_root, failure_message(before, entry, err)});
            if (err != 0) {
                return;
            }
        } else if (auto fault = loss_fault(before, after, entry)) {
            faults.push_back({0, entry.match_root, *std::move(fault)});
        }
    }
    if (err != 0) {
        faults.push_back({0, kind.root, failure_message(err)});
    }
}

/// Lays the text, and then what the conversion has made of it, over a candidate. No edit can fail:
/// the text has been read before, and what is not there needs no removing.
void merge(Candidate &candidate, std::string_view text, const mdb_db &before, const mdb_db &after)
{
    for (const LegacyEntry &entry : legacy_entries(before)) {
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
    for (const LegacyEntry &entry : legacy_entries(legacy)) {
        if (auto fault = fault_before_conversion(legacy, entry)) {
            result.entry_faults.push_back({0, entry.match_root, *std::move(fault)});
        }
        if (!keeps_match_in_force(running, legacy, entry)) {
            ++(matches_by_acl(legacy, entry) ? result.by_acl : result.converted);
        }
    }
}

/// Takes back the match strings of entries that keep what they match.
void leave_kept_matches(const mdb_db &running, const mdb_db &before, mdb_db &after)
{
    for (const LegacyEntry &entry : legacy_entries(before)) {
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
