#include "host/modules/acls.h"

#include "host/modules/acl_nodes.h"
#include "host/modules/acl_references.h"
#include "host/modules/commit_access.h"
#include "host/modules/match_strings.h"
#include "host/modules/node_access.h"
#include "host/modules/plain_names.h"
#include "host/modules/refusal_capture.h"
#include "orvale/md_xmap_common.h"

#include <algorithm>

namespace ovhost
{
namespace
{

using Fault = std::optional<std::string>;
using Parts = std::vector<std::string>;

constexpr std::size_t kind_part = acl_name_part + 1;
constexpr std::size_t number_part = acl_name_part + 2;
constexpr std::size_t field_part = acl_name_part + 3;
constexpr std::size_t reference_size = acl_name_part + 5;

// The ACL itself.

/// Whether there is something of the user's below the ACL.
bool has_own_nodes(const mdb_db *db, const std::string &acl)
{
    return std::ranges::any_of(child_names(db, acl_node(acl)), [](const std::string &child) {
        return find_map_kind(child) == nullptr;
    });
}

/// Who keeps an ACL, for people: the first ten entries, and how many more there are.
std::string list_users(const md_dbinfo *dbinfo, const std::string &acl)
{
    constexpr std::size_t most = 10;
    std::string list;
    std::size_t count = 0;
    for (const MapEntry &entry : recorded_references(dbinfo->olddb, acl)) {
        if (acl_of(dbinfo->newdb, entry) == acl && ++count <= most) {
            list += "\n  Used by " + describe(entry) + ".";
        }
    }
    return count <= most ? list : list + "\n  And " + std::to_string(count - most) + " more.";
}

int check_deleted_acl(const md_dbinfo *dbinfo, mdb_db_change *change, const std::string &acl)
{
    if (has_own_nodes(dbinfo->newdb, acl)) {
        // Replaced, and not deleted.
        propose(dbinfo, acl_node(acl), bt_string, acl);
        return 0;
    }
    RefusalCapture capture;
    md_dbinfo view = *dbinfo;
    view.commit = &capture;
    for (const MapKind &kind : map_kinds) {
        if (const int err = md_acl_not_used_in_map(change, &view, kind.type); err != 0) {
            return err;
        }
        if (capture.message()) {
            const std::string message = *capture.message() + list_users(dbinfo, acl);
            return md_commit_set_return_status_msg(dbinfo->commit, capture.code(), message.c_str());
        }
    }
    return 0;
}

// Its entries.

int check_protocol(md_dbinfo *dbinfo, const mdb_db_change *change)
{
    // Refused, the words are those of the library.
    tbool found = true;
    return md_validate_proto(dbinfo, new_text(change).value_or("").c_str(), &found);
}

int check_field(md_dbinfo *dbinfo, const mdb_db_change *change, const Parts &parts)
{
    const bool is_direct = parts.size() == field_part + 1;
    if (is_direct && parts[field_part] == "protocol") {
        return check_protocol(dbinfo, change);
    }
    return is_direct && parts[field_part] == "matchstr" ? check_match_string(dbinfo, change).code
                                                        : 0;
}

int check_entry(md_dbinfo *dbinfo, const mdb_db_change *change, const Parts &parts)
{
    const std::string &acl = parts[acl_name_part];
    const std::string &number = parts[number_part];
    const std::string node = acl_entry_node(acl, number);
    const bool is_entry = parts.size() == field_part;
    if (is_deleted(change)) {
        if (is_entry) {
            (void)bring_back_replaced(dbinfo, node, bt_uint16, number);
        }
        return 0;
    }
    Fault fault = entry_number_fault("an ACL entry's number", number);
    if (!fault && is_entry) {
        fault = own_name_fault("the entry's number", number, change);
    }
    if (fault) {
        return refuse(dbinfo, *fault);
    }
    if (is_entry) {
        return 0;
    }
    propose_missing(dbinfo, node, bt_uint16, number);
    return check_field(dbinfo, change, parts);
}

// The references to it.

/// Whether what the commit makes of a reference is what the maps say. So it is when the library has
/// written it; users can take away what does not agree with the maps, and no more.
Fault reference_fault(const md_dbinfo *dbinfo, const mdb_db_change *change, const Parts &parts)
{
    const std::string &acl = parts[acl_name_part];
    const std::string general = "references to ACLs are kept by the daemon: ";
    const bool is_record = parts.size() == reference_size && parts[reference_size - 2] == "prio";
    if (!is_record) {
        return is_deleted(change) ? std::nullopt : Fault(general + "set the ACL of a map's entry");
    }
    const MapEntry entry{find_map_kind(parts[kind_part]), parts[kind_part + 1], parts.back()};
    const bool is_named = acl_of(dbinfo->newdb, entry) == acl;
    if (is_deleted(change)) {
        return is_named && has_acl(dbinfo->newdb, acl)
                   ? Fault(general + describe(entry) +
                           " names this ACL; to replace the ACL, delete its entries and not itself")
                   : std::nullopt;
    }
    const bool was_named = acl_of(dbinfo->olddb, entry) == acl;
    return is_named && !was_named && new_text(change) == entry.priority
               ? std::nullopt
               : Fault(general + "set the ACL of " + describe(entry));
}

int check_reference(const md_dbinfo *dbinfo, const mdb_db_change *change, const Parts &parts)
{
    const Fault fault = reference_fault(dbinfo, change, parts);
    return fault ? refuse(dbinfo, *fault) : 0;
}

} // namespace

std::vector<std::string> AclsModule::patterns() const
{
    return {std::string(acls_node) + "/**"};
}

int AclsModule::check_change(md_dbinfo *dbinfo, mdb_db_change *change)
{
    const Parts parts = name_parts(change);
    const std::string &acl = parts[acl_name_part];
    const bool is_acl = parts.size() == kind_part;
    if (is_deleted(change) && is_acl) {
        return check_deleted_acl(dbinfo, change, acl);
    }
    if (!is_acl && find_map_kind(parts[kind_part]) != nullptr) {
        return check_reference(dbinfo, change, parts);
    }
    if (!is_deleted(change)) {
        Fault fault = plain_name_fault("an ACL's name", acl);
        if (!fault && is_acl) {
            fault = own_name_fault("the ACL's name", acl, change);
        }
        if (fault) {
            return refuse(dbinfo, *fault);
        }
        propose_missing(dbinfo, acl_node(acl), bt_string, acl);
    }
    const bool is_about_entry = parts.size() > number_part && parts[kind_part] == "entry";
    return is_about_entry ? check_entry(dbinfo, change, parts) : 0;
}

} // namespace ovhost
