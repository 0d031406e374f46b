#pragma once
// What the model of an appliance says of itself: its configuration nodes, the fields they fill, and
// what counts when a node is absent. appliance.cpp answers the library from a ModelInfo.

#include "framework/bnode.h"
#include "host/tree/tree.h"

#include <array>
#include <limits>
#include <string>

namespace ovhost
{

struct ModelInfo {
    std::string config_name;
    uint32 max_interfaces = 0;
    uint32 max_tunnels = 0;
    uint32 max_rmap_entries = 0;
    uint32 max_omap_entries = 0;
    uint32 max_qmap_entries = 0;
    uint32 max_smap_entries = 0;
    uint32 max_nmap_entries = 0;
    uint32 max_dns_proxy_map_entries = 0;
};

/// The name of the model's configuration, a string. Absent: none.
inline constexpr const char *model_name_node = "/ov/model/config/name";

/// One limit of the model, a uint32.
struct ModelLimit {
    const char *node;
    uint32 ModelInfo::*field;
    uint32 when_absent;
    /// A greater value is lowered to this one.
    uint32 largest = std::numeric_limits<uint32>::max();
};

/// Tunnel IDs are kept in 16 bits, and the last of them means "no ID".
inline constexpr uint32 most_tunnels = 65535;

inline constexpr std::array<ModelLimit, 8> model_limits = {{
    {"/ov/model/limits/max_interfaces", &ModelInfo::max_interfaces, 256},
    {"/ov/model/limits/max_tunnels", &ModelInfo::max_tunnels, 1024, most_tunnels},
    {"/ov/model/limits/max_rmap_entries", &ModelInfo::max_rmap_entries, 300},
    {"/ov/model/limits/max_omap_entries", &ModelInfo::max_omap_entries, 300},
    {"/ov/model/limits/max_qmap_entries", &ModelInfo::max_qmap_entries, 300},
    {"/ov/model/limits/max_smap_entries", &ModelInfo::max_smap_entries, 300},
    {"/ov/model/limits/max_nmap_entries", &ModelInfo::max_nmap_entries, 300},
    {"/ov/model/limits/max_dns_proxy_map_entries", &ModelInfo::max_dns_proxy_map_entries, 128},
}};

/// What counts when no node is there.
[[nodiscard]] ModelInfo default_model_info();

/// Reads all nodes. Returns 0; 14020 when one is of another type, with a log line that names it,
/// and `info` is then unchanged. May throw std::bad_alloc.
[[nodiscard]] int read_model_info(const Tree &tree, ModelInfo &info);

} // namespace ovhost
