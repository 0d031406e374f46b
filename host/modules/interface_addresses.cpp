#include "host/modules/interface_addresses.h"

#include "framework/addresses.h"
#include "framework/logging.h"
#include "host/framework/log_config.h"
#include "host/modules/commit_access.h"
#include "host/modules/interface_nodes.h"
#include "host/modules/node_access.h"
#include "host/modules/routes.h"

#include <algorithm>
#include <optional>
#include <set>

namespace ovhost
{
namespace
{

constexpr const char *ip_pattern = "/net/interface/config/*/addr/ipv4/static/*/ip";
constexpr const char *mask_pattern = "/net/interface/config/*/addr/ipv4/static/*/mask_len";

constexpr uint32 longest_mask = 32;

/// The node above an address and its mask.
std::string address_node(const std::string &leaf)
{
    return leaf.substr(0, leaf.rfind('/'));
}

std::optional<Subnet> read_address(const mdb_db *db, const std::string &node)
{
    const std::optional<std::string> ip = node_text(db, node + "/ip");
    const std::optional<uint32> mask = parse_number(node_text(db, node + "/mask_len").value_or(""));
    return ip && mask && *mask <= longest_mask
               ? std::optional(Subnet{*ip, static_cast<uint8>(*mask)})
               : std::nullopt;
}

std::set<std::string> touched_addresses(const mdb_db_change_array *changes)
{
    std::set<std::string> nodes;
    for (const mdb_db_change *const change : changes_in(changes)) {
        if (matches(change, ip_pattern) || matches(change, mask_pattern)) {
            nodes.insert(address_node(ts_str(change->mdc_name)));
        }
    }
    return nodes;
}

std::vector<Subnet> all_addresses(const mdb_db *db)
{
    std::vector<Subnet> addresses;
    for (const std::string &node : matching_nodes(db, ip_pattern)) {
        if (const std::optional<Subnet> address = read_address(db, address_node(node))) {
            addresses.push_back(*address);
        }
    }
    return addresses;
}

/// Whether an address leads into the whole of a subnet.
bool leads_into(const Subnet &address, const Subnet &subnet)
{
    return address.mask_length <= subnet.mask_length &&
           mgmt_is_same_subnet_using_masklen(address.address.c_str(), subnet.address.c_str(),
                                             address.mask_length, address.mask_length);
}

/// The subnets into which a commit leaves no address to lead.
std::vector<Subnet> lost_subnets(const md_dbinfo *dbinfo, const mdb_db_change_array *changes)
{
    const std::vector<Subnet> left = all_addresses(dbinfo->newdb);
    std::vector<Subnet> lost;
    for (const std::string &node : touched_addresses(changes)) {
        const std::optional<Subnet> before = read_address(dbinfo->olddb, node);
        if (before && std::ranges::none_of(left, [&before](const Subnet &address) {
                return leads_into(address, *before);
            })) {
            lost.push_back(*before);
        }
    }
    return lost;
}

void log_removal(const Subnet &subnet, std::size_t next_hops)
{
    log_host_line(ov_log_notice, "interface-address",
                  "the address " + subnet.address + "/" + std::to_string(subnet.mask_length) +
                      " is gone, and " + std::to_string(next_hops) +
                      (next_hops == 1 ? " next hop" : " next hops") + " behind it");
}

} // namespace

std::vector<std::string> InterfaceAddressesModule::patterns() const
{
    return {ip_pattern, mask_pattern};
}

int InterfaceAddressesModule::check_change(md_dbinfo *dbinfo, mdb_db_change *change)
{
    const std::string node = address_node(ts_str(change->mdc_name));
    const std::optional<std::string> mask = node_text(dbinfo->newdb, node + "/mask_len");
    if (node_text(dbinfo->newdb, node + "/ip").has_value() != mask.has_value()) {
        return refuse(dbinfo, "an address is ip and mask_len: " + node + " has only one of them");
    }
    if (mask && matches(change, mask_pattern) && parse_number(*mask) > longest_mask) {
        return refuse(dbinfo, "must be 0 to " + std::to_string(longest_mask) + ", not " + *mask);
    }
    return 0;
}

int InterfaceAddressesModule::check_commit(md_dbinfo *dbinfo, const mdb_db_change_array *changes)
{
    for (const Subnet &subnet : lost_subnets(dbinfo, changes)) {
        remove_next_hops(dbinfo, subnet);
    }
    return 0;
}

int InterfaceAddressesModule::apply(const md_dbinfo *dbinfo, const mdb_db_change_array *changes)
{
    for (const Subnet &subnet : lost_subnets(dbinfo, changes)) {
        if (const std::size_t gone = next_hops_in(dbinfo->olddb, subnet).size(); gone > 0) {
            log_removal(subnet, gone);
        }
    }
    return 0;
}

} // namespace ovhost
