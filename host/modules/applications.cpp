#include "host/modules/applications.h"

#include "host/modules/commit_access.h"
#include "host/modules/node_access.h"
#include "host/modules/plain_names.h"
#include "host/tree/name.h"
#include "orvale/md_tunneld_tunnel_common.h"

namespace ovhost
{
namespace
{

constexpr const char *rules_node = "/ov/tunneld/app/config";
constexpr const char *name_pattern = "/ov/tunneld/app/config/*/name";

/// Refuses that an application goes while it is used. Both sides of that are of the proposed
/// database, so that an application may go together with what uses it.
int check_removal(const md_dbinfo *dbinfo, const std::string &application)
{
    int rules_left = 0;
    int err = md_get_app_num_rules(dbinfo->newdb, application.c_str(), &rules_left);
    if (err == lc_err_unexpected_null) {
        return 0; // a rule has no name, which refuses the commit anyway
    }
    if (err != 0 || rules_left > 0) {
        return err;
    }
    OwnedText message;
    err = md_find_appname_in_acl_or_xxxmap(application.c_str(), dbinfo->newdb, message.out(),
                                           nullptr);
    return err == 0 && message.get() != nullptr ? refuse(dbinfo, message.get()) : err;
}

} // namespace

std::vector<std::string> ApplicationsModule::patterns() const
{
    return {std::string(rules_node) + "/**"};
}

int ApplicationsModule::check_change(md_dbinfo *dbinfo, mdb_db_change *change)
{
    if (!matches(change, name_pattern)) {
        return 0;
    }
    if (const std::optional<std::string> name = new_text(change)) {
        if (const auto fault = plain_name_fault("an application's name", *name)) {
            return refuse(dbinfo, *fault);
        }
    }
    const std::optional<std::string> before = attribute_text(change->mdc_old_attribs);
    return before ? check_removal(dbinfo, *before) : 0;
}

int ApplicationsModule::check_commit(md_dbinfo *dbinfo, const mdb_db_change_array *)
{
    for (const std::string &rule : child_names(dbinfo->newdb, rules_node)) {
        const std::string node = std::string(rules_node) + "/" + escape_component(rule);
        if (!node_text(dbinfo->newdb, node + "/name")) {
            return refuse(dbinfo, "application rule \"" + rule + "\" has no name: set " + node +
                                      "/name, or delete " + node);
        }
    }
    return 0;
}

} // namespace ovhost
