#pragma once
// Prints what `ovctl show` answers about maps, ACLs and the references between them. render.h
// prints everything else.

#include <nlohmann/json_fwd.hpp>

#include <iosfwd>

namespace ovhost
{

void render_maps(const nlohmann::json &result, std::ostream &out);
void render_acl(const nlohmann::json &result, std::ostream &out);

/// The list of references, or what a check of them has found.
void render_references(const nlohmann::json &result, std::ostream &out);

/// Whether a check of the references has found anything.
[[nodiscard]] bool has_reference_faults(const nlohmann::json &result);

} // namespace ovhost
