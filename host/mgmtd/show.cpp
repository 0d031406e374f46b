#include "host/mgmtd/show.h"

#include "framework/appliance.h"
#include "host/control/arguments.h"
#include "host/control/request_error.h"
#include "host/mgmtd/answers.h"
#include "host/mgmtd/configuration.h"
#include "host/mgmtd/history_requests.h"
#include "host/mgmtd/show_interfaces.h"
#include "host/mgmtd/show_maps.h"
#include "host/modules/mode.h"
#include "host/modules/tunnel_lookup.h"
#include "host/modules/tunnel_tables.h"
#include "orvale/md_tunbin_ht.h"
#include "orvale/md_tunneld_defs.h"
#include "orvale/md_tunneld_tunnel_common.h"

#include <nlohmann/json.hpp>

#include <algorithm>

namespace ovhost
{
namespace
{

using nlohmann::json;

json show_mode(Configuration &configuration, const json &)
{
    const ModeAnswers answers = ask_mode(configuration.running_db());
    return {{"mode", or_null(answers.mode)},
            {"submode", answers.submode},
            {"bridge", answers.bridge},
            {"router", answers.router},
            {"server", answers.server},
            {"inline_router", answers.inline_router},
            {"router_interfaces", answers.router_interfaces},
            {"ten_gigabit", answers.ten_gigabit},
            {"bonding", answers.bonding}};
}

json tunnel_list(const std::vector<TunnelFacts> &tunnels)
{
    auto list = json::array();
    for (const TunnelFacts &tunnel : tunnels) {
        list.push_back({{"name", tunnel.name},
                        {"id", or_null(tunnel.id)},
                        {"alias", tunnel.alias},
                        {"alias_is_ambiguous", tunnel.alias_is_ambiguous},
                        {"remote", or_null(tunnel.remote)},
                        {"bandwidth", or_null(tunnel.bandwidth)}});
    }
    return list;
}

json show_tunnels(Configuration &configuration, const json &)
{
    return {{"tunnels", tunnel_list(list_tunnels(configuration.running_db()))}};
}

json tunnel_answer(const TunnelAnswer &answer, const char *by, const json &value)
{
    if (answer.tunnels.empty()) {
        const bool is_id = value.is_number();
        throw RequestError(error_code::not_found,
                           "no tunnel has the " + std::string(is_id ? "ID" : by) + " " +
                               (is_id ? std::to_string(value.get<uint32>())
                                      : "\"" + value.get<std::string>() + "\""));
    }
    return {{"by", by},
            {"value", value},
            {"ambiguous", answer.ambiguous},
            {"tunnels", tunnel_list(answer.tunnels)}};
}

json show_tunnel(Configuration &configuration, const json &request)
{
    const mdb_db *const db = configuration.running_db();
    const auto is_given = [&request](const char *key) {
        return request.contains(key) && !request.at(key).is_null();
    };
    if (is_given("name") + is_given("alias") + is_given("tunnel_id") != 1) {
        throw RequestError(error_code::bad_request,
                           R"(show: give one of "name", "alias" and "tunnel_id")");
    }
    if (const std::optional<uint32> id = optional_number(request, "tunnel_id")) {
        return tunnel_answer(find_tunnel_by_id(db, *id), "id", *id);
    }
    if (is_given("name")) {
        const std::string name = required_text(request, "name");
        return tunnel_answer(find_tunnel_by_name(db, name), "name", name);
    }
    const std::string alias = required_text(request, "alias");
    return tunnel_answer(find_tunnel_by_alias(db, alias), "alias", alias);
}

json table_json(const TableFacts &facts)
{
    return {{"slots", facts.slots},
            {"occupied", facts.occupied},
            {"collision_marks", facts.collision_marks},
            {"holes", facts.holes},
            {"longest_probe", facts.longest_probe}};
}

json show_tunnel_tables(Configuration &configuration, const json &)
{
    auto held = json::array();
    for (const HeldId &id : configuration.held_ids().list(present_ms())) {
        held.push_back({{"id", id.id}, {"seconds", id.seconds}});
    }
    return {{"names", table_json(measure_table(tunname_assoc))},
            {"aliases", table_json(measure_table(tunalias_assoc))},
            {"ids",
             {{"allowed", get_max_tunnel_number()},
              {"reserve", TUNNEL_ID_RESERVE},
              {"in_use", md_get_total_tunnels()},
              {"held_back", std::move(held)}}}};
}

struct Subject {
    const char *what;
    json (*answer)(Configuration &, const json &);
};

constexpr Subject subjects[] = {
    {"mode", show_mode},
    {"tunnels", show_tunnels},
    {"tunnel", show_tunnel},
    {"tunnel-tables", show_tunnel_tables},
    {"maps", show_maps},
    {"acl", show_acl},
    {"references", show_references},
    {"interfaces", show_interfaces},
    {"budget", show_budget},
    {"commit", answer_show_commit},
};

} // namespace

json answer_show(Configuration &configuration, const json &request)
{
    const std::string what = required_text(request, "what");
    const auto *const subject = std::ranges::find(subjects, what, &Subject::what);
    if (subject == std::end(subjects)) {
        throw RequestError(error_code::unknown_command,
                           "show: there is no \"" + what + "\" to show");
    }
    return subject->answer(configuration, request);
}

} // namespace ovhost
