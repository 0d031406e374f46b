#pragma once
// What a check needs of the commit that it is part of: the changed node's name, words to refuse the
// commit with, and the right to amend it. node_access.h reads nodes.

#include "framework/md_commit.h"

#include <optional>
#include <string>
#include <vector>

namespace ovhost
{

/// The components of the changed node's name, escapes resolved.
[[nodiscard]] std::vector<std::string> name_parts(const mdb_db_change *change);

/// The changes of a commit, without what a list may hold in place of one.
[[nodiscard]] std::vector<const mdb_db_change *> changes_in(const mdb_db_change_array *changes);

[[nodiscard]] bool matches(const mdb_db_change *change, const std::string &pattern);

[[nodiscard]] bool is_deleted(const mdb_db_change *change);

/// The changed node's new value as text; nothing for a deleted node.
[[nodiscard]] std::optional<std::string> new_text(const mdb_db_change *change);

/// What is wrong with a node that must hold its own name; `thing` says what that is.
[[nodiscard]] std::optional<std::string> own_name_fault(const char *thing, const std::string &name,
                                                        const mdb_db_change *change);

/// Refuses the commit; the answer is what a check then returns.
[[nodiscard]] int refuse(const md_dbinfo *dbinfo, const std::string &message);

/// Writes a node of the database that the commit proposes. Throws std::runtime_error, whose words
/// then refuse the commit.
void propose(const md_dbinfo *dbinfo, const std::string &node, bn_type type,
             const std::string &text);

/// Removes a node and all below it from the database that the commit proposes. Throws
/// std::runtime_error.
void propose_removal(const md_dbinfo *dbinfo, const std::string &node);

/// Brings back a deleted node when there is something below it again: it was replaced, and not
/// deleted. Whether it did.
[[nodiscard]] bool bring_back_replaced(const md_dbinfo *dbinfo, const std::string &node,
                                       bn_type type, const std::string &text);

/// Writes the node when it holds no value in the proposed database.
void propose_missing(const md_dbinfo *dbinfo, const std::string &node, bn_type type,
                     const std::string &text);

} // namespace ovhost
