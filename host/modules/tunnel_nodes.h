#pragma once
// Tunnels as configuration nodes:
//
//   /ov/tunneld/tunnel/config/NAME            string  NAME again: with it the tunnel is there
//   /ov/tunneld/tunnel/config/NAME/alias      string  1 to 255 bytes; NAME when none is given
//   /ov/tunneld/tunnel/config/NAME/id         uint16  the daemon chooses it
//   /ov/tunneld/tunnel/config/NAME/remote     ipaddr
//   /ov/tunneld/tunnel/config/NAME/bandwidth  uint32
//
// The module that follows them is tunnels.h.

#include "framework/mdb_db.h"
#include "orvale/tunnel_defs.h"

#include <optional>
#include <set>
#include <string>

namespace ovhost
{

inline constexpr const char *tunnels_node = "/ov/tunneld/tunnel/config";

/// What changes of a tunnel are about: the tunnel itself, or one of its fields.
inline constexpr const char *tunnel_pattern = "/ov/tunneld/tunnel/config/*";
inline constexpr const char *tunnel_field_pattern = "/ov/tunneld/tunnel/config/*/*";

/// Components of their names, counted from 0.
inline constexpr uint32 tunnel_name_part = 4;
inline constexpr uint32 tunnel_field_part = 5;

/// What identifies a tunnel. The configuration in force has both fields of every tunnel.
struct Tunnel {
    std::string name;
    std::optional<std::string> alias;
    std::optional<uint32> id;

    bool operator==(const Tunnel &) const = default;
};

/// The full name of a tunnel's node, or of one of its fields.
[[nodiscard]] std::string tunnel_node(const std::string &name);
[[nodiscard]] std::string tunnel_node(const std::string &name, const std::string &field);

/// A tunnel of a database; nothing when it is not there.
[[nodiscard]] std::optional<Tunnel> read_tunnel(const mdb_db *db, const std::string &name);

/// The names of the tunnels that changes are about, in their order. None of a change that is about
/// something else.
[[nodiscard]] std::set<std::string> touched_tunnels(const mdb_db_change_array *changes);

/// Whether the library's cache knows the tunnel by its ID. A stored tunnel that cannot have its ID
/// is left out of it.
[[nodiscard]] bool is_taken_up(const Tunnel &tunnel);

/// The tunnel as the library's cache takes it, cut to what it can hold.
[[nodiscard]] tunnel_config_bin_t record_of(const Tunnel &tunnel);

} // namespace ovhost
