#include "host/modules/acl_nodes.h"

#include "host/modules/node_access.h"
#include "host/tree/name.h"

namespace ovhost
{

std::string acl_node(const std::string &acl)
{
    return std::string(acls_node) + "/" + escape_component(acl);
}

std::string acl_entry_node(const std::string &acl, const std::string &number)
{
    return acl_node(acl) + "/entry/" + escape_component(number);
}

bool has_acl(const mdb_db *db, const std::string &acl)
{
    return !acl.empty() && node_text(db, acl_node(acl)).has_value();
}

} // namespace ovhost
