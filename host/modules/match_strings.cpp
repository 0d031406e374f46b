#include "host/modules/match_strings.h"

#include "host/framework/match_string.h"
#include "host/modules/acl_nodes.h"
#include "host/modules/commit_access.h"
#include "host/modules/map_entries.h"
#include "host/modules/node_access.h"
#include "host/modules/refusal_capture.h"
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
    MatchString match;
    if (parse_match_string(text, match)) {
        return false;
    }
    for (std::size_t i = 0; i < match.keys.size(); ++i) {
        if (::strcasecmp(match.keys[i].c_str(), "vlan") == 0 && match.values[i] == name) {
            return true;
        }
    }
    return false;
}

bool node_matches_vlan(const mdb_db *db, const std::string &node, const std::string &name)
{
    const auto text = node_text(db, node);
    return text && matches_vlan(*text, name);
}

std::optional<MatchingEntry> acl_entry_that_matches_vlan(const mdb_db *db, const std::string &name)
{
    for (const std::string &acl : child_names(db, acls_node)) {
        for (const std::string &number : child_names(db, acl_node(acl) + "/entry")) {
            if (node_matches_vlan(db, acl_entry_node(acl, number) + "/matchstr", name)) {
                return MatchingEntry{"an ACL", "ACL " + acl + ", entry " + number};
            }
        }
    }
    return std::nullopt;
}

/// Whoever sends a text that is far too long need not get it back in whole.
std::string shortened(std::string message, const std::string &text)
{
    constexpr std::size_t shown = 60;
    const std::size_t position = message.find(text);
    return position == std::string::npos
               ? message
               : message.replace(position, text.size(),
                                 text.substr(0, shown) + "... (" + std::to_string(text.size()) +
                                     " bytes)");
}

/// Has the library check a text; says its words in short.
int check_long_text(const md_dbinfo *dbinfo, const std::string &text, tbool &is_valid)
{
    RefusalCapture capture;
    md_dbinfo view = *dbinfo;
    view.commit = &capture;
    const int err = md_xmap_validate_match_str(&view, text.c_str(), &is_valid);
    return capture.message()
               ? md_commit_set_return_status_msg(dbinfo->commit, capture.code(),
                                                 shortened(*capture.message(), text).c_str())
               : err;
}

} // namespace

MatchStringVerdict check_match_string(md_dbinfo *dbinfo, const mdb_db_change *change)
{
    const std::string text = new_text(change).value_or("");
    tbool is_valid = true;
    const int err = text.size() < MD_XMAP_MATCHSTR_SIZE
                        ? md_xmap_validate_match_str(dbinfo, text.c_str(), &is_valid)
                        : check_long_text(dbinfo, text, is_valid);
    if (err == bad_vlan) {
        return {refuse(dbinfo, "the VLAN of \"" + text +
                                   "\" is neither an interface label nor a name that a VLAN can "
                                   "have"),
                true};
    }
    return {err, !is_valid};
}

std::optional<MatchingEntry> entry_that_matches_vlan(const mdb_db *db, const std::string &name)
{
    for (const MapKind &kind : map_kinds) {
        for (const MapEntry &entry : entries_of(db, kind)) {
            if (node_matches_vlan(db, match_node(entry, "matchstr"), name)) {
                return MatchingEntry{"a " + std::string(kind.name), describe(entry)};
            }
        }
    }
    return acl_entry_that_matches_vlan(db, name);
}

} // namespace ovhost
