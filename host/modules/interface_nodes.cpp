#include "host/modules/interface_nodes.h"

#include "host/modules/node_access.h"
#include "host/tree/name.h"

#include <net/if.h>

#include <algorithm>

namespace ovhost
{
namespace
{

constexpr std::size_t longest_name = IFNAMSIZ - 1;

/// The kernel makes no interface with blanks in its name, and takes "%" for the place of a number;
/// a backslash would be an escape in the names of nodes that the library builds.
bool is_bad(char character)
{
    return static_cast<unsigned char>(character) <= ' ' || character == '\x7f' ||
           std::string("/:%\\*").find(character) != std::string::npos;
}

} // namespace

std::string interface_record(const std::string &name)
{
    return std::string(interface_records_node) + "/" + escape_component(name);
}

std::string tunneld_interfaces_node(const std::string &kind)
{
    return "/ov/tunneld/net/interface/tunnel/" + kind + "/config";
}

std::string tunneld_interface(const std::string &kind, const std::string &name)
{
    return tunneld_interfaces_node(escape_component(kind)) + "/" + escape_component(name);
}

bool interface_exists(const mdb_db *db, const std::string &name)
{
    return !name.empty() && (node_text(db, interface_record(name)) ||
                             node_text(db, tunneld_interface(vlan_kind, name)) ||
                             node_text(db, tunneld_interface(tunnel_kind, name)));
}

std::optional<std::string> interface_name_fault(const std::string &name)
{
    if (name.empty() || name.size() > longest_name) {
        return "an interface's name is 1 to " + std::to_string(longest_name) + " bytes long, not " +
               std::to_string(name.size());
    }
    const bool is_good = name != "." && name != ".." && std::ranges::none_of(name, is_bad);
    return is_good ? std::nullopt
                   : std::optional("\"" + name +
                                   "\" is not a name that an interface can have: leave out blanks "
                                   "and the characters / : % \\ *");
}

} // namespace ovhost
