#pragma once
// Prints what `ovctl show` answers about tunnels. render.h prints everything else.

#include <nlohmann/json_fwd.hpp>

#include <iosfwd>

namespace ovhost
{

void render_tunnels(const nlohmann::json &result, std::ostream &out);
void render_tunnel(const nlohmann::json &result, std::ostream &out);
void render_tunnel_tables(const nlohmann::json &result, std::ostream &out);

} // namespace ovhost
