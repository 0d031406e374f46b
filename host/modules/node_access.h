#pragma once
// What modules need of nodes: the operations of framework/ with C++'s own types for what they hand
// out, and exceptions for what fails. To a check, a node that cannot be read is not one that is
// absent: "nobody uses it" would be the answer of a guard that could not look.
//
// commit_access.h has what checks need besides.

#include "framework/mdb_db.h"
#include "host/framework/owners.h"

#include <optional>
#include <string>
#include <string_view>
#include <vector>

namespace ovhost
{

/// Throws std::runtime_error, "cannot DEED: error code N" or "cannot DEED OBJECT: error code N",
/// for every code but 0. Every function below that asks the database throws it with the node's
/// name.
void require(int err, std::string_view deed, std::string_view object = {});

/// The value among a change's attributes; nothing when there is none.
[[nodiscard]] std::optional<std::string> attribute_text(const bn_attrib_array *attribs);

/// The value of a node as text; nothing when it is absent.
[[nodiscard]] std::optional<std::string> node_text(const mdb_db *db, const std::string &name);

/// The names of a node's children, escapes resolved.
[[nodiscard]] std::vector<std::string> child_names(const mdb_db *db, const std::string &parent);

/// The full names of the nodes that match a pattern.
[[nodiscard]] std::vector<std::string> matching_nodes(const mdb_db *db, const std::string &pattern);

/// The texts of an array; none when it is null.
[[nodiscard]] std::vector<std::string> texts_of(const tstr_array *array);

/// Whether a text is the same to an operation, to which it ends at its first NUL byte.
[[nodiscard]] bool is_whole_text(std::string_view text);

/// A decimal number; nothing when the text is none or it is too large.
[[nodiscard]] std::optional<uint32> parse_number(std::string_view text);

/// A copy of a text as the library takes it. Throws std::bad_alloc.
class TstringCopy
{
  public:
    explicit TstringCopy(const std::string &text);

    [[nodiscard]] tstring *get() const { return copy_.get(); }

  private:
    OwnedString copy_;
};

/// The name of a type ("uint32"); its number when it has none.
[[nodiscard]] std::string type_name(bn_type type);

/// The type of a name; nothing when no type has it.
[[nodiscard]] std::optional<bn_type> find_type(const std::string &name);

} // namespace ovhost
