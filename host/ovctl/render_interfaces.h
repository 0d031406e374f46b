#pragma once
// Prints what mgmtd answers about interfaces and their budget, and how much a clear removed.
// render.h prints everything else.

#include <nlohmann/json_fwd.hpp>

#include <iosfwd>

namespace ovhost
{

void render_interfaces(const nlohmann::json &result, std::ostream &out);
void render_budget(const nlohmann::json &result, std::ostream &out);
void render_clear(const nlohmann::json &result, std::ostream &out);

} // namespace ovhost
