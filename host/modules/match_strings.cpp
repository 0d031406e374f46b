#include "host/modules/match_strings.h"

#include "framework/appliance.h"
#include "host/modules/commit_access.h"
#include "host/modules/node_access.h"
#include "orvale/md_xmap_common.h"

#include <strings.h>

namespace ovhost
{
namespace
{

/// What the library answers, without words, to a VLAN that cannot be.
constexpr int bad_vlan = -1;

bool matches_vlan(const std::string &text, const std::string &name)
{
    tstr_array *keys = nullptr;
    tstr_array *values = nullptr;
    char *reason = nullptr;
    const int err = ov_acl_validate_matchstr(text.c_str(), &keys, &values, &reason);
    const TstrArrayPtr owned_keys(keys);
    const TstrArrayPtr owned_values(values);
    const TextPtr owned_reason(reason);
    const auto count =
        err == 0 && keys != nullptr ? static_cast<uint32>(tstr_array_length_quick(keys)) : 0;
    for (uint32 i = 0; i < count; ++i) {
        if (::strcasecmp(tstr_array_get_str_quick(keys, i), "vlan") == 0 &&
            name == tstr_array_get_str_quick(values, i)) {
            return true;
        }
    }
    return false;
}

} // namespace

MatchStringVerdict check_match_string(md_dbinfo *dbinfo, const mdb_db_change *change)
{
    const std::string text = new_text(change).value_or("");
    tbool is_valid = true;
    const int err = md_xmap_validate_match_str(dbinfo, text.c_str(), &is_valid);
    if (err == bad_vlan) {
        return {refuse(dbinfo, "the VLAN of \"" + text +
                                   "\" is neither an interface label nor a name that a VLAN can "
                                   "have"),
                true};
    }
    return {err, !is_valid};
}

std::optional<MapEntry> entry_that_matches_vlan(const mdb_db *db, const std::string &name)
{
    for (const MapKind &kind : map_kinds) {
        for (const std::string &map : child_names(db, kind.root)) {
            for (const std::string &priority : child_names(db, map_node(kind, map) + "/prio")) {
                const auto text = node_text(db, match_node(kind, map, priority, "matchstr"));
                if (text && matches_vlan(*text, name)) {
                    return MapEntry{&kind, map, priority};
                }
            }
        }
    }
    return std::nullopt;
}

} // namespace ovhost
