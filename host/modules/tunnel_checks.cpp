#include "host/modules/tunnel_checks.h"

#include "framework/appliance.h"
#include "host/modules/commit_access.h"
#include "host/modules/model.h"
#include "host/modules/node_access.h"
#include "host/modules/tunnel_nodes.h"
#include "orvale/md_tunbin_ht.h"
#include "orvale/md_tunneld_defs.h"

#include <algorithm>

namespace ovhost
{
namespace
{

using Fault = std::optional<std::string>;

std::string quoted(const std::string &text)
{
    return "\"" + text + "\"";
}

bool has_tunnel(const mdb_db *db, const std::string &name)
{
    return node_text(db, tunnel_node(name)).has_value();
}

/// One more than the highest ID that a tunnel can have now and after the next start.
uint32 id_bound(const mdb_db *newdb)
{
    const uint32 present = std::min(get_max_tunnel_number(), MD_TUNBIN_HT_SIZE);
    return std::min(present, allowed_tunnels(newdb).value_or(present));
}

Fault range_fault(const mdb_db *newdb, uint32 id)
{
    const uint32 bound = id_bound(newdb);
    if (id < bound) {
        return std::nullopt;
    }
    const std::string number = "ID " + std::to_string(id);
    return bound == 0 ? number + " cannot be: the model allows no tunnels"
                      : number + " is out of range: tunnels have IDs from 0 to " +
                            std::to_string(bound - 1);
}

/// Whether a new tunnel may have an ID: it must be free, or left to it by a tunnel that is deleted
/// in the same commit.
Fault claim_fault(const mdb_db *newdb, uint32 id, const HeldIds &held)
{
    const std::string number = "ID " + std::to_string(id);
    if (const char *const owner = md_tunbin_ht_get_name_by_id(id)) {
        return has_tunnel(newdb, owner) ? Fault(number + " belongs to tunnel " + quoted(owner))
                                        : std::nullopt;
    }
    if (const auto seconds = held.seconds_left(id, present_ms())) {
        return number + " was freed a short time ago and is held back: it is free again in " +
               std::to_string(*seconds) + " s";
    }
    return std::nullopt;
}

Fault id_fault(const md_dbinfo *dbinfo, const Tunnel &tunnel, const HeldIds &held)
{
    if (!tunnel.id) {
        return std::nullopt; // no number: the schema says so
    }
    if (Fault fault = range_fault(dbinfo->newdb, *tunnel.id)) {
        return fault;
    }
    const std::optional<Tunnel> before = read_tunnel(dbinfo->olddb, tunnel.name);
    if (!before || !before->id) {
        return claim_fault(dbinfo->newdb, *tunnel.id, held);
    }
    return *before->id == *tunnel.id ? std::nullopt
                                     : Fault("must stay " + std::to_string(*before->id) +
                                             ": a tunnel keeps its ID as long as it is there");
}

Fault alias_fault(const md_dbinfo *, const Tunnel &tunnel, const HeldIds &)
{
    const std::size_t length = tunnel.alias ? tunnel.alias->size() : 1;
    return length >= 1 && length < TUNNEL_ALIAS_SIZE
               ? std::nullopt
               : Fault("must be 1 to " + std::to_string(TUNNEL_ALIAS_SIZE - 1) +
                       " bytes long, not " + std::to_string(length));
}

struct FieldCheck {
    const char *field;
    Fault (*fault)(const md_dbinfo *, const Tunnel &, const HeldIds &);
};

constexpr FieldCheck field_checks[] = {{"alias", alias_fault}, {"id", id_fault}};

Fault field_fault(const md_dbinfo *dbinfo, const std::string &name, const std::string &field,
                  const HeldIds &held)
{
    const std::optional<Tunnel> tunnel = read_tunnel(dbinfo->newdb, name);
    if (!tunnel) {
        return "there is no tunnel " + quoted(name) + ": set " + tunnel_node(name) +
               " to its name first";
    }
    for (const FieldCheck &check : field_checks) {
        if (field == check.field) {
            return check.fault(dbinfo, *tunnel, held);
        }
    }
    return std::nullopt;
}

Fault name_fault(const mdb_db_change *change, const std::string &name)
{
    if (name.size() >= TUNNEL_NAME_SIZE) {
        return "a tunnel's name is 1 to " + std::to_string(TUNNEL_NAME_SIZE - 1) +
               " bytes long, not " + std::to_string(name.size());
    }
    if (name == TUNNEL_NAME_DEFAULT) {
        return quoted(name) + " is reserved and never holds an ID: choose another name";
    }
    return own_name_fault("the tunnel's name", name, change);
}

/// A deleted tunnel must take its fields along.
Fault remnant_fault(const mdb_db *newdb, const std::string &name)
{
    const std::vector<std::string> fields = child_names(newdb, tunnel_node(name));
    return fields.empty() ? std::nullopt
                          : Fault("the tunnel is deleted but its " + fields.front() +
                                  " is not: delete them together, or keep both");
}

/// Tunnels must not lose their IDs at the next start.
Fault limit_fault(const mdb_db *newdb)
{
    const std::optional<uint32> allowed = allowed_tunnels(newdb);
    for (uint32 id = MD_TUNBIN_HT_SIZE; allowed && id > *allowed; --id) {
        const char *const name = md_tunbin_ht_get_name_by_id(id - 1);
        if (name != nullptr && has_tunnel(newdb, name)) {
            return "must be more than " + std::to_string(id - 1) + ", the ID of tunnel " +
                   quoted(name);
        }
    }
    return std::nullopt;
}

} // namespace

Fault tunnel_fault(const md_dbinfo *dbinfo, const mdb_db_change *change, const HeldIds &held)
{
    if (matches(change, max_tunnels_node)) {
        return limit_fault(dbinfo->newdb);
    }
    const std::vector<std::string> parts = name_parts(change);
    const std::string &name = parts[tunnel_name_part];
    if (matches(change, tunnel_pattern)) {
        return is_deleted(change) ? remnant_fault(dbinfo->newdb, name) : name_fault(change, name);
    }
    return is_deleted(change) ? std::nullopt
                              : field_fault(dbinfo, name, parts[tunnel_field_part], held);
}

} // namespace ovhost
