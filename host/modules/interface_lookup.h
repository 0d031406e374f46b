#pragma once
// All interfaces with what is known of them: what `ovctl show interfaces` prints.

#include "host/modules/interface_users.h"

#include <optional>
#include <string>
#include <vector>

namespace ovhost
{

struct InterfaceFacts {
    std::string name;
    bool is_vlan = false;
    bool is_tunnel = false;
    std::optional<bool> is_enabled; ///< nothing when it has no flag
    std::vector<InterfaceUse> uses;
};

/// In the order of their names. Throws std::runtime_error when the library fails.
[[nodiscard]] std::vector<InterfaceFacts> list_interfaces(const mdb_db *db);

} // namespace ovhost
