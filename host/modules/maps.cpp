#include "host/modules/maps.h"

#include "host/modules/acl_references.h"
#include "host/modules/commit_access.h"
#include "host/modules/map_checks.h"
#include "host/modules/match_strings.h"
#include "orvale/md_xmap_common.h"

namespace ovhost
{
namespace
{

std::string match_pattern(const MapKind &kind, const char *leaf)
{
    return std::string(kind.root_pattern) + "/*/prio/*/" + kind.match + "/" + leaf;
}

/// The library looks for a record when an entry goes and when it names another ACL. An entry that
/// is replaced, or loses the node that names its ACL alone, would leave it for ever.
void follow_lost_acl(const MapKind &kind, const md_dbinfo *dbinfo, const mdb_db_change *change,
                     const MapChange &changed)
{
    if (!matches(change, match_pattern(kind, "acl"))) {
        return;
    }
    const MapEntry entry{&kind, changed.map, *changed.priority};
    if (const std::string acl = acl_of(dbinfo->olddb, entry); !acl.empty()) {
        forget_reference(dbinfo, acl, entry);
    }
}

} // namespace

std::vector<std::string> MapsModule::patterns() const
{
    return {std::string(kind_.root_pattern) + "/**"};
}

int MapsModule::check_change(md_dbinfo *dbinfo, mdb_db_change *change)
{
    const std::optional<MapChange> changed = map_change(kind_, change);
    if (!changed || bring_back(kind_, dbinfo, change, *changed)) {
        return 0;
    }
    if (!is_deleted(change)) {
        if (const auto fault = map_fault(kind_, dbinfo, change, *changed)) {
            return refuse(dbinfo, *fault);
        }
    }
    tbool refused = false;
    if (const int err = md_xmap_common_change_check(change, dbinfo, kind_.type, &refused);
        err != 0 || refused) {
        return err;
    }
    if (!is_deleted(change) && matches(change, match_pattern(kind_, "matchstr"))) {
        const MatchStringVerdict verdict = check_match_string(dbinfo, change);
        if (verdict.code != 0 || verdict.refused) {
            return verdict.code;
        }
    }
    if (const int err = md_acl_ref_processing(change, dbinfo, kind_.type); err != 0) {
        return err;
    }
    if (is_deleted(change)) {
        follow_lost_acl(kind_, dbinfo, change, *changed);
    } else {
        complete_map(kind_, dbinfo, *changed);
    }
    return 0;
}

} // namespace ovhost
