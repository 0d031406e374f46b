#pragma once
// Interfaces as configuration nodes:
//
//   /net/interface/config/NAME                              string    NAME again: its record
//   /net/interface/config/NAME/enable                       bool
//   /net/interface/config/NAME/addr/ipv4/static/N/ip        ipv4addr
//   /net/interface/config/NAME/addr/ipv4/static/N/mask_len  uint8     0 to 32
//   /ov/tunneld/net/interface/tunnel/vlan/config/NAME       string    NAME again: a VLAN
//   /ov/tunneld/net/interface/tunnel/ip/config/NAME         string    NAME again: a tunnel
//
// A VLAN or tunnel interface needs a record of its own only for what stands below one. The modules
// are net_interfaces.h, interface_addresses.h and interface_budget.h.

#include "framework/mdb_db.h"

#include <optional>
#include <string>
#include <vector>

namespace ovhost
{

inline constexpr const char *interface_records_node = "/net/interface/config";

/// The kinds of interfaces that tunneld makes.
inline constexpr const char *vlan_kind = "vlan";
inline constexpr const char *tunnel_kind = "ip";

/// Those of a kind are the node's children; "*" makes a pattern of it for those of every kind.
[[nodiscard]] std::string tunneld_interfaces_node(const std::string &kind);

/// The full names of nodes, names escaped.
[[nodiscard]] std::string interface_record(const std::string &name);
[[nodiscard]] std::string tunneld_interface(const std::string &kind, const std::string &name);

/// Whether an interface of any kind has the name.
[[nodiscard]] bool interface_exists(const mdb_db *db, const std::string &name);

/// What is wrong with the name of an interface; it is the kernel's who knows which are right.
[[nodiscard]] std::optional<std::string> interface_name_fault(const std::string &name);

} // namespace ovhost
