#pragma once
// Prints results for people; each function is the renderer of a row of command_table.h. What they
// print is stable. A result that lacks something throws nlohmann::json::exception. render_error.h
// prints refusals.

#include <nlohmann/json_fwd.hpp>

#include <iosfwd>

namespace ovhost
{

void render_nothing(const nlohmann::json &result, std::ostream &out);
void render_nodes(const nlohmann::json &result, std::ostream &out);
void render_load(const nlohmann::json &result, std::ostream &out);
void render_check(const nlohmann::json &result, std::ostream &out);
void render_commit(const nlohmann::json &result, std::ostream &out);
void render_upgrade(const nlohmann::json &result, std::ostream &out);
void render_diff(const nlohmann::json &result, std::ostream &out);
void render_discard(const nlohmann::json &result, std::ostream &out);
void render_status(const nlohmann::json &result, std::ostream &out);
void render_mode(const nlohmann::json &result, std::ostream &out);

} // namespace ovhost
