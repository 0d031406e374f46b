#include "host/modules/tunnel_nodes.h"

#include "host/modules/commit_access.h"
#include "host/modules/node_access.h"
#include "host/tree/name.h"
#include "orvale/md_tunbin_ht.h"

#include <algorithm>
#include <cstring>

namespace ovhost
{
namespace
{

template <std::size_t size>
void copy_text(char (&target)[size], const std::string &text)
{
    const std::size_t length = std::min(text.size(), size - 1);
    std::memcpy(target, text.data(), length);
    target[length] = '\0';
}

bool is_about_a_tunnel(const mdb_db_change &change)
{
    return matches(&change, tunnel_pattern) || matches(&change, tunnel_field_pattern);
}

} // namespace

std::string tunnel_node(const std::string &name)
{
    return std::string(tunnels_node) + "/" + escape_component(name);
}

std::string tunnel_node(const std::string &name, const std::string &field)
{
    return tunnel_node(name) + "/" + escape_component(field);
}

std::optional<Tunnel> read_tunnel(const mdb_db *db, const std::string &name)
{
    if (!node_text(db, tunnel_node(name))) {
        return std::nullopt;
    }
    const std::optional<std::string> id = node_text(db, tunnel_node(name, "id"));
    return Tunnel{name, node_text(db, tunnel_node(name, "alias")),
                  id ? parse_number(*id) : std::nullopt};
}

std::set<std::string> touched_tunnels(const mdb_db_change_array *changes)
{
    std::set<std::string> names;
    for (const mdb_db_change *const change : changes_in(changes)) {
        if (is_about_a_tunnel(*change)) {
            names.emplace(tstr_array_get_str_quick(change->mdc_name_parts, tunnel_name_part));
        }
    }
    return names;
}

bool is_taken_up(const Tunnel &tunnel)
{
    return tunnel.id && md_tunbin_ht_id_has_tunnel(*tunnel.id) &&
           md_tunbin_ht_get_name_by_id(*tunnel.id) == tunnel.name;
}

tunnel_config_bin_t record_of(const Tunnel &tunnel)
{
    tunnel_config_bin_t record = {};
    copy_text(record.tp_tunnel_name, tunnel.name);
    copy_text(record.tp_tunnel_alias, tunnel.alias.value_or(tunnel.name));
    record.tp_tunnel_id = tunnel.id.value_or(TUNNEL_ID_NONE);
    return record;
}

} // namespace ovhost
