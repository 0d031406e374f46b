#pragma once
// Prints what ovctl answers about the history of commits. render.h prints everything else.

#include <nlohmann/json_fwd.hpp>

#include <iosfwd>

namespace ovhost
{

void render_history(const nlohmann::json &result, std::ostream &out);
void render_recorded_commit(const nlohmann::json &result, std::ostream &out);
void render_confirmation(const nlohmann::json &result, std::ostream &out);

/// What ovctl watch shows of an event: a commit with its changes, or how many were missed.
void render_event(const nlohmann::json &event, std::ostream &out);

/// What a result says of commits that wait for their confirmation, or have just been confirmed;
/// prints nothing when it says nothing.
void render_wait(const nlohmann::json &result, std::ostream &out);

} // namespace ovhost
