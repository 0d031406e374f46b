#include "host/modules/routes.h"

#include "framework/addresses.h"
#include "host/modules/commit_access.h"
#include "host/modules/node_access.h"
#include "host/tree/name.h"
#include "orvale/md_tunneld_tunnel_common.h"

#include <arpa/inet.h>

#include <algorithm>
#include <iterator>
#include <optional>

namespace ovhost
{
namespace
{

constexpr const char *prefixes_node = "/ov/tunneld/net/routes/config/ipv4/prefix";

constexpr std::size_t prefix_part = 7;
constexpr std::size_t nhop_part = 9;

std::string prefix_node(const std::string &prefix)
{
    return join_name(std::vector<std::string>{"ov", "tunneld", "net", "routes", "config", "ipv4",
                                              "prefix", prefix});
}

std::optional<uint32> parse_ipv4(const std::string &text)
{
    in_addr address{};
    return ::inet_pton(AF_INET, text.c_str(), &address) == 1 ? std::optional(ntohl(address.s_addr))
                                                             : std::nullopt;
}

std::string write_ipv4(uint32 number)
{
    const in_addr address{htonl(number)};
    char text[INET_ADDRSTRLEN];
    return ::inet_ntop(AF_INET, &address, text, sizeof text);
}

/// The one way to write a prefix, so that none is there twice; nothing when the text is no prefix.
std::optional<std::string> proper_prefix(const std::string &text)
{
    const std::size_t slash = text.find('/');
    if (slash == std::string::npos) {
        return std::nullopt;
    }
    const std::optional<uint32> address = parse_ipv4(text.substr(0, slash));
    const std::optional<uint32> length = parse_number(text.substr(slash + 1));
    if (!address || !length || *length > 32) {
        return std::nullopt;
    }
    const uint32 mask = *length == 0 ? 0 : ~uint32{0} << (32 - *length);
    return write_ipv4(*address & mask) + "/" + std::to_string(*length);
}

std::optional<std::string> route_fault(const std::vector<std::string> &parts)
{
    const std::string &prefix = parts[prefix_part];
    const std::optional<std::string> proper = proper_prefix(prefix);
    if (!proper) {
        return "\"" + prefix + "\" is not an IPv4 prefix: write it as 10.0.0.0\\/8";
    }
    if (*proper != prefix) {
        return "\"" + prefix + "\" is to be written as \"" + *proper + "\"";
    }
    if (parts.size() > nhop_part && parts[nhop_part - 1] == "nhop" &&
        !parse_ipv4(parts[nhop_part])) {
        return "\"" + parts[nhop_part] + "\" is not the IPv4 address of a next hop";
    }
    return std::nullopt;
}

std::string next_hops_node(const std::string &prefix)
{
    return prefix_node(prefix) + "/nhop";
}

std::vector<std::string> next_hops_of(const mdb_db *db, const std::string &prefix,
                                      const Subnet &subnet)
{
    std::vector<std::string> nodes;
    for (const std::string &hop : child_names(db, next_hops_node(prefix))) {
        if (mgmt_is_same_subnet_using_masklen(hop.c_str(), subnet.address.c_str(),
                                              subnet.mask_length, subnet.mask_length)) {
            nodes.push_back(next_hops_node(prefix) + "/" + hop);
        }
    }
    return nodes;
}

/// The library does not find a prefix that is shorter than one it has come by before, in this
/// commit or an earlier one: what is behind such a prefix goes here.
void remove_what_is_left(const md_dbinfo *dbinfo, const Subnet &subnet)
{
    for (const std::string &prefix : child_names(dbinfo->newdb, prefixes_node)) {
        const std::vector<std::string> hops = next_hops_of(dbinfo->newdb, prefix, subnet);
        for (const std::string &hop : hops) {
            propose_removal(dbinfo, hop);
        }
        if (!hops.empty() && child_names(dbinfo->newdb, next_hops_node(prefix)).empty()) {
            propose_removal(dbinfo, prefix_node(prefix));
        }
    }
}

} // namespace

std::vector<std::string> next_hops_in(const mdb_db *db, const Subnet &subnet)
{
    std::vector<std::string> nodes;
    for (const std::string &prefix : child_names(db, prefixes_node)) {
        std::ranges::copy(next_hops_of(db, prefix, subnet), std::back_inserter(nodes));
    }
    return nodes;
}

void remove_next_hops(const md_dbinfo *dbinfo, const Subnet &subnet)
{
    auto *const newdb = const_cast<mdb_db *>(dbinfo->newdb);
    require(md_tunneld_delete_dproutes(dbinfo->commit, newdb, subnet.address.c_str(),
                                       subnet.mask_length, nullptr),
            "remove the routes behind", subnet.address + "/" + std::to_string(subnet.mask_length));
    remove_what_is_left(dbinfo, subnet);
}

std::vector<std::string> RoutesModule::patterns() const
{
    return {std::string(prefixes_node) + "/**"};
}

int RoutesModule::check_change(md_dbinfo *dbinfo, mdb_db_change *change)
{
    if (is_deleted(change)) {
        return 0;
    }
    const std::vector<std::string> parts = name_parts(change);
    std::optional<std::string> fault = route_fault(parts);
    if (!fault && parts.size() == prefix_part + 1) {
        fault = own_name_fault("the prefix", parts[prefix_part], change);
    }
    if (!fault && parts.size() == nhop_part + 1 && parts[nhop_part - 1] == "nhop") {
        fault = own_name_fault("the next hop", parts[nhop_part], change);
    }
    return fault ? refuse(dbinfo, *fault) : 0;
}

} // namespace ovhost
