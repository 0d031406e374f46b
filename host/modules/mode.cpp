#include "host/modules/mode.h"

#include "host/modules/node_access.h"
#include "orvale/md_tunneld_tunnel_common.h"

namespace ovhost
{
namespace
{

/// Runs one of the library's text getters.
std::optional<std::string> ask_text(int (*getter)(const mdb_db *, char **), const mdb_db *db,
                                    const char *what)
{
    OwnedText text;
    require(getter(db, text.out()), "read the", what);
    return text.get() != nullptr ? std::optional<std::string>(text.get()) : std::nullopt;
}

} // namespace

ModeAnswers ask_mode(const mdb_db *db)
{
    ModeAnswers answers;
    answers.mode = ask_text(md_get_db_system_mode, db, "system mode");
    answers.submode = ask_text(md_get_db_bridge_submode, db, "bridge sub-mode").value_or("");
    answers.bridge = md_is_db_system_bridge_mode(db);
    answers.router = md_is_db_system_router_mode(db);
    answers.server = md_is_db_system_server_mode(db);
    answers.inline_router = md_is_db_system_inline_router_mode(db);
    require(md_get_number_router_mode_interfaces(db, &answers.router_interfaces),
            "count the router interfaces");
    answers.ten_gigabit = md_is_10g_enabled(db);
    answers.bonding = md_is_bonding_enabled(db);
    return answers;
}

} // namespace ovhost
