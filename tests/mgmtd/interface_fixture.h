#pragma once
// Interfaces of a configuration, their users, addresses and routes, in few words.

#include "tests/mgmtd/configuration_fixture.h"

#include <string>

namespace mgmtd_test
{

inline std::string record(const std::string &below)
{
    return "/net/interface/config/" + below;
}

inline std::string vlan(const std::string &name)
{
    return "/ov/tunneld/net/interface/tunnel/vlan/config/" + name;
}

inline std::string tunnel_interface(const std::string &name)
{
    return "/ov/tunneld/net/interface/tunnel/ip/config/" + name;
}

inline std::string wccp(const std::string &group)
{
    return "/ov/wccpd/wccp/srv_grp/config/" + group + "/interface";
}

inline std::string vrrp(const std::string &entry)
{
    return "/ov/redd/net/interface/vrrp/config/" + entry;
}

inline std::string router(const std::string &index)
{
    return "/ov/tunneld/system/config/mode/router/" + index + "/ifname";
}

/// A prefix of the data plane's routes, its slash escaped, or a next hop of it.
inline std::string route(const std::string &prefix, const std::string &next_hop = {})
{
    const std::size_t slash = prefix.find('/');
    const std::string name =
        slash == std::string::npos ? prefix : prefix.substr(0, slash) + "\\" + prefix.substr(slash);
    return "/ov/tunneld/net/routes/config/ipv4/prefix/" + name +
           (next_hop.empty() ? "" : "/nhop/" + next_hop);
}

class InterfaceTest : public ConfigurationTest
{
  protected:
    void add_interface(const std::string &name) { set(record(name), name); }
    void add_vlan(const std::string &name) { set(vlan(name), name); }
    void add_tunnel_interface(const std::string &name) { set(tunnel_interface(name), name); }

    void add_route(const std::string &prefix, const std::string &next_hop)
    {
        set(route(prefix), bt_ipv4prefix, prefix);
        set(route(prefix, next_hop), bt_ipv4addr, next_hop);
    }

    void set_address(const std::string &interface, const std::string &number, const std::string &ip,
                     const std::string &mask_length)
    {
        const std::string node = record(interface + "/addr/ipv4/static/" + number);
        set(node + "/ip", bt_ipv4addr, ip);
        set(node + "/mask_len", bt_uint8, mask_length);
    }
};

} // namespace mgmtd_test
