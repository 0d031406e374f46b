#pragma once
// Who uses an interface, and the module of those nodes:
//
//   /ov/wccpd/wccp/srv_grp/config/GROUP/interface    the interface of a WCCP service group
//   /ov/redd/net/interface/vrrp/config/ENTRY         the interface of a VRRP entry
//   /ov/tunneld/system/config/mode/router/N/ifname   an interface of router mode
//
// They can name only interfaces that are there; net_interfaces.h keeps an interface there while
// they do.

#include "host/commit/module.h"

#include <string>
#include <vector>

namespace ovhost
{

struct InterfaceUse {
    std::string node; ///< the one that names the interface
    std::string text; ///< what the user calls it, "wccp group 10"
};

/// All uses of an interface: by WCCP, by VRRP, and by router mode. Throws std::runtime_error when
/// the library fails.
[[nodiscard]] std::vector<InterfaceUse> interface_uses(const mdb_db *db, const std::string &name);

class InterfaceUsersModule : public Module
{
  public:
    [[nodiscard]] std::string name() const override { return "interface-user"; }
    [[nodiscard]] std::vector<std::string> patterns() const override;

    int check_change(md_dbinfo *dbinfo, mdb_db_change *change) override;
};

} // namespace ovhost
