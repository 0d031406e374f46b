#include "host/modules/tunnel_ids.h"

#include "framework/appliance.h"
#include "host/modules/commit_access.h"
#include "host/modules/node_access.h"
#include "host/modules/tunnel_nodes.h"
#include "orvale/md_tunbin_ht.h"
#include "orvale/md_tunneld_defs.h"
#include "orvale/md_tunneld_tunnel_common.h"

#include <map>
#include <stdexcept>
#include <utility>
#include <vector>

namespace ovhost
{
namespace
{

using Fault = std::optional<std::string>;

/// What a commit does that the allocator has to know of.
struct IdNeeds {
    std::vector<std::string> without_id;   ///< new tunnels that need one
    std::map<uint32, std::string> claimed; ///< IDs that new tunnels come with
    uint32 freed = 0;                      ///< tunnels that are deleted
    std::optional<std::string> contested;  ///< two tunnels claim one ID
};

void write_field(const md_dbinfo *dbinfo, const std::string &name, const char *field, bn_type type,
                 const std::string &text)
{
    propose(dbinfo, tunnel_node(name, field), type, text);
}

void write_id(const md_dbinfo *dbinfo, const std::string &name, uint32 id)
{
    write_field(dbinfo, name, "id", bt_uint16, std::to_string(id));
}

void note_claim(IdNeeds &needs, uint32 id, const std::string &name)
{
    const auto [other, is_first] = needs.claimed.emplace(id, name);
    if (!is_first && !needs.contested) {
        needs.contested = "tunnels \"" + other->second + "\" and \"" + name +
                          "\" ask for one ID, " + std::to_string(id);
    }
}

/// Completes what can be without the allocator, and notes the rest.
void look_at(const md_dbinfo *dbinfo, const std::string &name, IdNeeds &needs)
{
    const std::optional<Tunnel> before = read_tunnel(dbinfo->olddb, name);
    const std::optional<Tunnel> after = read_tunnel(dbinfo->newdb, name);
    if (!after) {
        needs.freed += before ? 1 : 0;
        return;
    }
    if (!after->alias) {
        write_field(dbinfo, name, "alias", bt_string, name);
    }
    const std::optional<uint32> former = before ? before->id : std::nullopt;
    if (!after->id && former) {
        write_id(dbinfo, name, *former);
    } else if (!after->id) {
        needs.without_id.push_back(name);
    } else if (!former) {
        note_claim(needs, *after->id, name);
    }
}

std::string seconds(const HeldId &held)
{
    return std::to_string(held.seconds) + " s";
}

/// Why the allocator has offered only `offered` of `wanted` IDs.
std::string describe_want(uint32 wanted, uint32 offered, const IdNeeds &needs, const HeldIds &held)
{
    const auto in_use = static_cast<uint32>(md_get_total_tunnels());
    const uint32 bound = get_max_tunnel_number();
    const std::string start = wanted == 1
                                  ? "no ID for 1 new tunnel: "
                                  : "no IDs for " + std::to_string(wanted) + " new tunnels: ";
    // The allocator's own condition.
    if (in_use + wanted > bound - TUNNEL_ID_RESERVE) {
        return start + std::to_string(in_use) + " of " + std::to_string(bound) + " are in use" +
               (needs.freed > 0 ? " until deletions are committed" : "") + ", and " +
               std::to_string(TUNNEL_ID_RESERVE) + " stay in reserve";
    }
    const std::vector<HeldId> waiting = held.list(present_ms());
    const std::string available = std::to_string(offered) + " can be given now";
    if (waiting.size() < wanted - offered) {
        return start + available + ", and no more are free";
    }
    const std::size_t last = wanted - offered - 1;
    return start + available + ", and freed ones are held back for " +
           std::to_string(TUNNEL_ID_QUARANTINE_MS / 1000) + " s: the first is free again in " +
           seconds(waiting.front()) + (last > 0 ? ", enough are in " + seconds(waiting[last]) : "");
}

/// Asks the allocator for IDs for all tunnels that are new to it, and gives them to those that have
/// none. IDs that tunnels come with are asked for too: the reserve counts for them as well, and the
/// allocator may offer just these.
Fault give_ids(const md_dbinfo *dbinfo, const IdNeeds &needs, const HeldIds &held)
{
    auto wanted = static_cast<uint32>(needs.without_id.size());
    for (const auto &claim : needs.claimed) {
        wanted += md_tunbin_ht_id_has_tunnel(claim.first) ? 0 : 1;
    }
    OwnedIntegers offered;
    if (uint32_array_new_full(offered.out(), nullptr) != 0) {
        throw std::bad_alloc();
    }
    const int err = md_get_next_n_available_tunnel_ids(wanted, offered.get());
    const auto count = static_cast<uint32>(uint32_array_length_quick(offered.get()));
    if (err != 0) {
        return describe_want(wanted, count, needs, held);
    }
    auto name = needs.without_id.begin();
    for (uint32 i = 0; i < count && name != needs.without_id.end(); ++i) {
        const uint32 id = uint32_array_get_quick(offered.get(), i);
        if (!needs.claimed.contains(id)) {
            write_id(dbinfo, *name++, id);
        }
    }
    return std::nullopt;
}

} // namespace

Fault complete_tunnels(const md_dbinfo *dbinfo, const mdb_db_change_array *changes,
                       const HeldIds &held)
{
    IdNeeds needs;
    for (const std::string &name : touched_tunnels(changes)) {
        look_at(dbinfo, name, needs);
    }
    return needs.contested ? needs.contested : give_ids(dbinfo, needs, held);
}

} // namespace ovhost
