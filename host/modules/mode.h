#pragma once
// The mode questions, all at once: what `ovctl show mode` prints.

#include "framework/mdb_db.h"

#include <optional>
#include <string>

namespace ovhost
{

struct ModeAnswers {
    std::optional<std::string> mode; ///< nothing when none is set
    std::string submode;
    bool bridge = false;
    bool router = false;
    bool server = false;
    bool inline_router = false;
    int router_interfaces = 0;
    bool ten_gigabit = false;
    bool bonding = false;
};

/// Asks the library about a database. Throws std::runtime_error when a question fails.
[[nodiscard]] ModeAnswers ask_mode(const mdb_db *db);

} // namespace ovhost
