#include "host/modules/tunnel_lookup.h"

#include "host/modules/node_access.h"
#include "host/modules/tunnel_nodes.h"
#include "orvale/md_tunbin_ht.h"
#include "orvale/md_tunneld_tunnel_common.h"

#include <algorithm>
#include <functional>

namespace ovhost
{
namespace
{

TunnelFacts facts_of(const mdb_db *db, const std::string &name, std::optional<uint32> id)
{
    TunnelFacts facts;
    facts.name = name;
    facts.id = id;
    facts.alias = node_text(db, tunnel_node(name, "alias")).value_or(name);
    facts.alias_is_ambiguous =
        facts.id && md_tunbin_ht_get_id_by_alias(facts.alias.c_str()) == TUNNEL_ID_NONE;
    facts.remote = node_text(db, tunnel_node(name, "remote"));
    const std::optional<std::string> bandwidth = node_text(db, tunnel_node(name, "bandwidth"));
    facts.bandwidth = bandwidth ? parse_number(*bandwidth) : std::nullopt;
    return facts;
}

using Claim = std::function<bool(const Tunnel &)>;

/// The tunnels that have a name or an alias. Goes through all of them: only for what the cache
/// cannot resolve.
TunnelAnswer find_claims(const mdb_db *db, const Claim &claims)
{
    TunnelAnswer answer;
    for (const std::string &name : child_names(db, tunnels_node)) {
        const std::optional<Tunnel> tunnel = read_tunnel(db, name);
        if (tunnel && claims(*tunnel)) {
            answer.tunnels.push_back(
                facts_of(db, name, is_taken_up(*tunnel) ? tunnel->id : std::nullopt));
        }
    }
    std::ranges::sort(answer.tunnels, {}, &TunnelFacts::name);
    answer.ambiguous = answer.tunnels.size() > 1;
    return answer;
}

} // namespace

std::vector<TunnelFacts> list_tunnels(const mdb_db *db)
{
    std::vector<TunnelFacts> tunnels;
    const auto count = static_cast<uint32>(md_get_total_tunnels());
    for (uint32 position = 0; position < count; ++position) {
        const char *name = nullptr;
        int err = md_get_tunnel_name_str_sorted(position, &name);
        uint32 id = TUNNEL_ID_NONE;
        if (err == 0) {
            err = name != nullptr ? md_get_tunnel_id_sorted(TstringCopy(name).get(), &id)
                                  : lc_err_unexpected_null;
        }
        require(err, "list tunnel", std::to_string(position) + " of " + std::to_string(count));
        tunnels.push_back(facts_of(db, name, id));
    }
    return tunnels;
}

TunnelAnswer find_tunnel_by_name(const mdb_db *db, const std::string &name)
{
    const uint32 id =
        is_whole_text(name) ? md_tunbin_ht_get_id_by_name(name.c_str()) : TUNNEL_ID_NONE;
    if (id != TUNNEL_ID_NONE) {
        return {false, {facts_of(db, name, id)}};
    }
    return find_claims(db, [&name](const Tunnel &tunnel) { return tunnel.name == name; });
}

TunnelAnswer find_tunnel_by_alias(const mdb_db *db, const std::string &alias)
{
    const uint32 id =
        is_whole_text(alias) ? md_tunbin_ht_get_id_by_alias(alias.c_str()) : TUNNEL_ID_NONE;
    if (id != TUNNEL_ID_NONE) {
        return find_tunnel_by_id(db, id);
    }
    return find_claims(
        db, [&alias](const Tunnel &tunnel) { return tunnel.alias.value_or(tunnel.name) == alias; });
}

TunnelAnswer find_tunnel_by_id(const mdb_db *db, uint32 id)
{
    if (!md_tunbin_ht_id_has_tunnel(id)) {
        return {};
    }
    return {false, {facts_of(db, md_tunbin_ht_get_name_by_id(id), id)}};
}

} // namespace ovhost
