#include "host/mgmtd/rollback_target.h"

#include "host/modules/acl_nodes.h"
#include "host/modules/map_kinds.h"
#include "host/tree/name.h"

#include <string>
#include <utility>
#include <vector>

namespace ovhost
{
namespace
{

using Parts = std::vector<std::string>;

void leave_references(Tree &past, const Tree &running, const Parts &acl)
{
    for (const MapKind &kind : map_kinds) {
        Parts references = acl;
        references.emplace_back(kind.key);
        past.erase(references);
        running.visit([&past](Tree::Parts name, const Value &value) { past.set(name, value); },
                      references);
    }
}

} // namespace

Tree rollback_target(Tree past, const Tree &running)
{
    const Parts root = split_name(acls_node).value_or(Parts{});
    for (std::string &name : past.children(root)) {
        Parts acl = root;
        acl.push_back(std::move(name));
        leave_references(past, running, acl);
    }
    return past;
}

} // namespace ovhost
