#include "host/modules/commit_access.h"

#include "host/modules/node_access.h"

namespace ovhost
{
namespace
{

void write(const md_dbinfo *dbinfo, int operation, bn_type type, const char *text,
           const std::string &node)
{
    // The checks of a commit may write the database that it proposes.
    auto *const newdb = const_cast<mdb_db *>(dbinfo->newdb);
    const int err =
        mdb_set_node_str(dbinfo->commit, newdb, operation, 0, type, text, "%s", node.c_str());
    require(err, "write", node);
}

} // namespace

std::vector<std::string> name_parts(const mdb_db_change *change)
{
    return texts_of(change->mdc_name_parts);
}

std::vector<const mdb_db_change *> changes_in(const mdb_db_change_array *changes)
{
    std::vector<const mdb_db_change *> list;
    const auto count = static_cast<uint32>(mdb_db_change_array_length_quick(changes));
    for (uint32 i = 0; i < count; ++i) {
        if (const mdb_db_change *const change = mdb_db_change_array_get_quick(changes, i)) {
            list.push_back(change);
        }
    }
    return list;
}

bool matches(const mdb_db_change *change, const std::string &pattern)
{
    return bn_binding_name_parts_pattern_match(change->mdc_name_parts, true, pattern.c_str());
}

bool is_deleted(const mdb_db_change *change)
{
    return change->mdc_change_type == mdct_delete;
}

std::optional<std::string> new_text(const mdb_db_change *change)
{
    return attribute_text(change->mdc_new_attribs);
}

std::optional<std::string> own_name_fault(const char *thing, const std::string &name,
                                          const mdb_db_change *change)
{
    return new_text(change) == name
               ? std::nullopt
               : std::optional(std::string("must hold ") + thing + ", \"" + name + "\"");
}

int refuse(const md_dbinfo *dbinfo, const std::string &message)
{
    return md_commit_set_return_status_msg(dbinfo->commit, 1, message.c_str());
}

void propose(const md_dbinfo *dbinfo, const std::string &node, bn_type type,
             const std::string &text)
{
    write(dbinfo, bsso_modify, type, text.c_str(), node);
}

void propose_removal(const md_dbinfo *dbinfo, const std::string &node)
{
    write(dbinfo, bsso_delete, bt_none, nullptr, node);
}

bool bring_back_replaced(const md_dbinfo *dbinfo, const std::string &node, bn_type type,
                         const std::string &text)
{
    if (child_names(dbinfo->newdb, node).empty()) {
        return false;
    }
    propose(dbinfo, node, type, text);
    return true;
}

void propose_missing(const md_dbinfo *dbinfo, const std::string &node, bn_type type,
                     const std::string &text)
{
    if (!node_text(dbinfo->newdb, node)) {
        propose(dbinfo, node, type, text);
    }
}

} // namespace ovhost
