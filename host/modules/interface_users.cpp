#include "host/modules/interface_users.h"

#include "host/modules/commit_access.h"
#include "host/modules/interface_nodes.h"
#include "host/modules/node_access.h"
#include "host/modules/plain_names.h"
#include "orvale/md_tunneld_tunnel_common.h"

#include <algorithm>
#include <iterator>

namespace ovhost
{
namespace
{

struct User {
    const char *pattern;
    /// What has a name of its own, and which component of the node's name it is. The library builds
    /// node names of these without escaping them. Null: nothing has one.
    const char *named;
    std::size_t name_part;
};

constexpr const char *router_pattern = "/ov/tunneld/system/config/mode/router/*/ifname";

constexpr User users[] = {
    {router_pattern, nullptr, 0},
    {"/ov/wccpd/wccp/srv_grp/config/*/interface", "a WCCP group's name", 5},
    {"/ov/redd/net/interface/vrrp/config/*", "a VRRP entry's name", 6},
};

/// The library knows what these nodes are called, but does not look for them.
std::vector<std::string> router_nodes(const mdb_db *db, const std::string &name)
{
    std::vector<std::string> nodes = matching_nodes(db, router_pattern);
    std::erase_if(nodes, [&](const std::string &node) { return node_text(db, node) != name; });
    return nodes;
}

std::vector<std::string> use_nodes(const mdb_db *db, std::string name)
{
    OwnedStrings found;
    require(md_interface_usage_check(db, name.data(), found.out()),
            "look for who uses an interface");
    std::vector<std::string> nodes = texts_of(found.get());
    std::ranges::copy(router_nodes(db, name), std::back_inserter(nodes));
    return nodes;
}

} // namespace

std::vector<InterfaceUse> interface_uses(const mdb_db *db, const std::string &name)
{
    std::vector<InterfaceUse> uses;
    for (const std::string &node : use_nodes(db, name)) {
        OwnedString text;
        require(md_interface_usage_to_usertext(node.c_str(), text.out()),
                "name who uses an interface");
        if (text.get() != nullptr) {
            uses.push_back({node, ts_str(text.get())});
        }
    }
    return uses;
}

std::vector<std::string> InterfaceUsersModule::patterns() const
{
    std::vector<std::string> patterns;
    for (const User &user : users) {
        patterns.emplace_back(user.pattern);
    }
    return patterns;
}

int InterfaceUsersModule::check_change(md_dbinfo *dbinfo, mdb_db_change *change)
{
    if (is_deleted(change)) {
        return 0;
    }
    const User &user = *std::ranges::find_if(
        users, [change](const User &candidate) { return matches(change, candidate.pattern); });
    if (user.named != nullptr) {
        if (const auto fault = plain_name_fault(user.named, name_parts(change)[user.name_part])) {
            return refuse(dbinfo, *fault);
        }
    }
    const std::string name = new_text(change).value_or("");
    return interface_exists(dbinfo->newdb, name)
               ? 0
               : refuse(dbinfo, "there is no interface \"" + name + "\": add " +
                                    interface_record(name) + " before, or in the same commit");
}

} // namespace ovhost
