// What the library adds to the host's work for interfaces and routes: who uses an interface, and
// the removal of the routes behind a subnet. Each stands beside the host operations that the same
// work cannot do without, called one after the other with all names at hand.

#include "bench/bare_work.h"
#include "framework/addresses.h"
#include "framework/logging.h"
#include "host/framework/owners.h"
#include "orvale/md_tunneld_tunnel_common.h"

#include <string>
#include <vector>

namespace
{

using namespace ovbench;
using ovhost::OwnedBinding;
using ovhost::OwnedString;
using ovhost::OwnedStrings;

constexpr char group_root[] = "/ov/wccpd/wccp/srv_grp/config";
constexpr char vrrp_root[] = "/ov/redd/net/interface/vrrp/config";
constexpr char prefix_root[] = "/ov/tunneld/net/routes/config/ipv4/prefix";

/// So many service groups and as many VRRP entries, of which one each is on the interface.
struct InterfaceUsers {
    explicit InterfaceUsers(int number)
    {
        for (int i = 0; i < number; ++i) {
            groups.push_back(std::string(group_root) + '/' + std::to_string(i) + "/interface");
            vrrp_entries.push_back(std::string(vrrp_root) + "/vr" + std::to_string(i));
        }
        for (const auto *nodes : {&groups, &vrrp_entries}) {
            for (const std::string &node : *nodes) {
                set(db, node, bt_string, "lan0");
            }
            set(db, (*nodes)[nodes->size() / 2], bt_string, "wan0");
        }
    }

    [[nodiscard]] int check()
    {
        OwnedStrings usages;
        const int status = md_interface_usage_check(&db, ifname, usages.out());
        return is_whole(usages) ? status : -1;
    }

    [[nodiscard]] int query()
    {
        OwnedStrings usages;
        int status = tstr_array_new(usages.out(), nullptr);
        status |= query(group_root, groups, usages);
        status |= query(vrrp_root, vrrp_entries, usages);
        return is_whole(usages) ? status : -1;
    }

    [[nodiscard]] int query(const char *root, const std::vector<std::string> &nodes,
                            const OwnedStrings &usages) const
    {
        OwnedStrings children;
        int status = mdb_get_tstr_array(nullptr, &db, root, 0, 0, 0, children.out());
        for (const std::string &node : nodes) {
            OwnedString value;
            status |= mdb_get_node_value_tstr(nullptr, &db, node.c_str(), 0, nullptr, value.out());
            if (ts_equal_str(value.get(), ifname, true)) {
                status |= tstr_array_append_str(usages.get(), node.c_str());
            }
        }
        return status;
    }

    static bool is_whole(const OwnedStrings &usages)
    {
        return usages.get() != nullptr && tstr_array_length_quick(usages.get()) == 2;
    }

    mdb_db db;
    char ifname[5] = "wan0";
    std::vector<std::string> groups;
    std::vector<std::string> vrrp_entries;
};

/// So many prefixes with two next hops each. A tenth of them loses both, another tenth one.
struct Routes {
    struct Prefix {
        std::string node;
        std::string nhop_list;
        std::string escaped;
        struct NextHop {
            std::string node;
            std::string address;
        };
        std::vector<NextHop> nhops;
    };

    explicit Routes(int number)
    {
        for (int i = 0; i < number; ++i) {
            // All names are of one length, so that the library finds every one of them.
            Prefix prefix;
            prefix.escaped = "10." + std::to_string(100 + i / 100) + '.' +
                             std::to_string(100 + i % 100) + ".0\\/24";
            prefix.node = std::string(prefix_root) + '/' + prefix.escaped;
            prefix.nhop_list = prefix.node + "/nhop";
            for (const std::string &address : {i % 10 <= 1 ? inside + "1" : outside + "1",
                                               i % 10 == 0 ? inside + "2" : outside + "2"}) {
                prefix.nhops.push_back({prefix.nhop_list + '/' + address, address});
                set(db, prefix.nhops.back().node, bt_ipv4addr, address);
            }
            prefixes.push_back(std::move(prefix));
        }
        newdb.writable = true;
        begin();
    }

    void begin() { newdb.tree = db.tree; }

    [[nodiscard]] int remove()
    {
        uint32 count = 0;
        const int status =
            md_tunneld_delete_dproutes(nullptr, &newdb, interface_address.c_str(), masklen, &count);
        return count == num_removed() ? status : -1;
    }

    [[nodiscard]] int query()
    {
        OwnedStrings names;
        int status = mdb_get_tstr_array(nullptr, &newdb, prefix_root, 0, 0, 0, names.out());
        std::size_t total = 0;
        for (const Prefix &prefix : prefixes) {
            status |= query(prefix, total);
        }
        return total == num_removed() ? status : -1;
    }

    [[nodiscard]] int query(const Prefix &prefix, std::size_t &total)
    {
        OwnedStrings nhops;
        int status =
            mdb_get_tstr_array(nullptr, &newdb, prefix.nhop_list.c_str(), 0, 0, 0, nhops.out());
        std::size_t count = 0;
        for (const Prefix::NextHop &nhop : prefix.nhops) {
            if (mgmt_is_same_subnet_using_masklen(nhop.address.c_str(), interface_address.c_str(),
                                                  masklen, masklen)) {
                status |= remove_node(nhop.node, nhop.address);
                ++count;
            }
        }
        if (count == prefix.nhops.size()) {
            status |= remove_node(prefix.node, prefix.escaped);
        }
        total += count;
        return status;
    }

    [[nodiscard]] int remove_node(const std::string &node, const std::string &value)
    {
        OwnedBinding binding;
        const int status =
            bn_binding_new_str(binding.out(), node.c_str(), ba_value, bt_string, 0, value.c_str());
        return status | mdb_set_node_binding(nullptr, &newdb, bsso_delete, 0, binding.get());
    }

    [[nodiscard]] std::size_t num_removed() const { return prefixes.size() / 10 * 3; }

    static constexpr uint8 masklen = 24;
    const std::string interface_address = "192.0.2.9";
    const std::string inside = "192.0.2.";
    const std::string outside = "198.51.100.";

    mdb_db db;
    mdb_db newdb;
    std::vector<Prefix> prefixes;
};

constexpr Work works[] = {
    {"usage", "usage check, groups and VRRP entries",
     repeat<InterfaceUsers, &InterfaceUsers::check>,
     repeat<InterfaceUsers, &InterfaceUsers::query>},
    {"routes", "route deletion, prefixes", repeat_anew<Routes, &Routes::remove>,
     repeat_anew<Routes, &Routes::query>},
};

} // namespace

int main(int argc, char **argv)
{
    G_daemon_log_level = ov_log_error;
    for (const int number : {10, 1'000}) {
        require_same_end<Routes, &Routes::remove, &Routes::query>(number);
    }
    return run_beside_bare(argc, argv,
                           {"Interfaces and routes",
                            "So many service groups and as many VRRP entries, one each on the "
                            "interface; prefixes with two next hops, a tenth of them losing both "
                            "and another tenth one",
                            "of them"},
                           works);
}
