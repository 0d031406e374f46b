#include "host/modules/tunnels.h"

#include "framework/appliance.h"
#include "framework/logging.h"
#include "host/framework/log_config.h"
#include "host/modules/commit_access.h"
#include "host/modules/model.h"
#include "host/modules/node_access.h"
#include "host/modules/tunnel_checks.h"
#include "host/modules/tunnel_ids.h"
#include "host/modules/tunnel_nodes.h"
#include "orvale/md_tunbin_ht.h"
#include "orvale/md_tunneld_tunnel_common.h"

#include <algorithm>
#include <optional>
#include <stdexcept>

namespace ovhost
{
namespace
{

struct TunnelChange {
    std::optional<Tunnel> before;
    std::optional<Tunnel> after;

    [[nodiscard]] bool is_new() const { return !before && after; }
};

/// The tunnels of which a commit changes anything that allocator or cache know of.
std::vector<TunnelChange> identity_changes(const md_dbinfo *dbinfo,
                                           const mdb_db_change_array *changes)
{
    std::vector<TunnelChange> result;
    for (const std::string &name : touched_tunnels(changes)) {
        TunnelChange change{read_tunnel(dbinfo->olddb, name), read_tunnel(dbinfo->newdb, name)};
        if (change.before && !is_taken_up(*change.before)) {
            // It stays left out as long as it asks for the ID that it cannot have.
            if (change.after && change.after->id == change.before->id) {
                continue;
            }
            change.before.reset();
        }
        if (change.before != change.after) {
            result.push_back(std::move(change));
        }
    }
    return result;
}

/// Goes on after a failure, so that one tunnel does not cost the others; the first code counts.
class Outcome
{
  public:
    void add(int err, const char *deed, const Tunnel &tunnel)
    {
        if (err == 0) {
            return;
        }
        log_host_line(ov_log_error, "tunnels",
                      "cannot " + std::string(deed) + " tunnel \"" + tunnel.name +
                          "\": error code " + std::to_string(err));
        first_ = first_ != 0 ? first_ : err;
    }

    [[nodiscard]] int code() const { return first_; }

  private:
    int first_ = 0;
};

int bind_id(const Tunnel &tunnel)
{
    return md_set_tunnel_id(tunnel.id.value_or(TUNNEL_ID_NONE), TstringCopy(tunnel.name).get());
}

int cache(const Tunnel &tunnel)
{
    const tunnel_config_bin_t record = record_of(tunnel);
    return md_tunbin_ht_add(&record);
}

/// Takes tunnels out of the cache. Answers the aliases that were ambiguous: the cache has then
/// forgotten those who still claim them, too.
std::set<std::string> forget(const std::vector<TunnelChange> &changes, Outcome &outcome)
{
    std::set<std::string> ambiguous;
    for (const TunnelChange &change : changes) {
        if (!change.before) {
            continue;
        }
        const tunnel_config_bin_t record = record_of(*change.before);
        if (md_tunbin_ht_get_id_by_alias(record.tp_tunnel_alias) == TUNNEL_ID_NONE) {
            ambiguous.emplace(record.tp_tunnel_alias);
        }
        outcome.add(md_tunbin_ht_del(&record), "forget", *change.before);
    }
    return ambiguous;
}

/// Tells the cache again of the tunnels that keep an alias which was ambiguous.
void remember(const mdb_db *newdb, const std::set<std::string> &aliases,
              const std::vector<TunnelChange> &changes, Outcome &outcome)
{
    if (aliases.empty()) {
        return;
    }
    const auto is_changed = [&changes](const std::string &name) {
        return std::ranges::any_of(changes, [&name](const TunnelChange &change) {
            return change.after && change.after->name == name;
        });
    };
    for (const std::string &name : child_names(newdb, tunnels_node)) {
        const std::optional<Tunnel> tunnel = read_tunnel(newdb, name);
        if (tunnel && aliases.contains(tunnel->alias.value_or(name)) && !is_changed(name) &&
            is_taken_up(*tunnel)) {
            outcome.add(cache(*tunnel), "remember", *tunnel);
        }
    }
}

/// Why a stored tunnel cannot be taken up; nothing when it can.
std::optional<std::string> obstacle(const Tunnel &tunnel)
{
    const uint32 bound = std::min(get_max_tunnel_number(), MD_TUNBIN_HT_SIZE);
    if (!tunnel.id) {
        return "it has no ID";
    }
    if (*tunnel.id >= bound) {
        return "its ID " + std::to_string(*tunnel.id) + " is past what the model allows, " +
               std::to_string(bound) + " tunnels";
    }
    if (const char *const owner = md_tunbin_ht_get_name_by_id(*tunnel.id)) {
        return "its ID " + std::to_string(*tunnel.id) + " belongs to tunnel \"" + owner + "\"";
    }
    return std::nullopt;
}

void take_up(const Tunnel &tunnel)
{
    if (const auto reason = obstacle(tunnel)) {
        log_host_line(ov_log_error, "tunnels",
                      "tunnel \"" + tunnel.name + "\" is left out: " + *reason +
                          "; delete it, commit, and add it again");
        return;
    }
    Outcome outcome;
    outcome.add(bind_id(tunnel), "bind the ID of", tunnel);
    outcome.add(cache(tunnel), "remember", tunnel);
}

} // namespace

std::vector<std::string> TunnelsModule::patterns() const
{
    return {tunnel_pattern, tunnel_field_pattern, max_tunnels_node};
}

void TunnelsModule::start(const mdb_db *running)
{
    held_.clear();
    if (const int err = md_init_tunnel_id(); err != 0) {
        throw std::runtime_error("the tunnel IDs cannot be set up: error code " +
                                 std::to_string(err));
    }
    (void)md_tunbin_ht_init(); // cannot fail
    for (const std::string &name : child_names(running, tunnels_node)) {
        if (const std::optional<Tunnel> tunnel = read_tunnel(running, name)) {
            take_up(*tunnel);
        }
    }
}

int TunnelsModule::check_change(md_dbinfo *dbinfo, mdb_db_change *change)
{
    const std::optional<std::string> fault = tunnel_fault(dbinfo, change, held_);
    return fault ? refuse(dbinfo, *fault) : 0;
}

int TunnelsModule::check_commit(md_dbinfo *dbinfo, const mdb_db_change_array *changes)
{
    const std::optional<std::string> fault = complete_tunnels(dbinfo, changes, held_);
    return fault ? refuse(dbinfo, *fault) : 0;
}

int TunnelsModule::apply(const md_dbinfo *dbinfo, const mdb_db_change_array *changes)
{
    const std::vector<TunnelChange> tunnels = identity_changes(dbinfo, changes);
    std::set<std::optional<uint32>> handed_on;
    for (const TunnelChange &change : tunnels) {
        if (change.is_new()) {
            handed_on.insert(change.after->id);
        }
    }
    Outcome outcome;
    const std::set<std::string> ambiguous = forget(tunnels, outcome);
    for (const TunnelChange &change : tunnels) {
        if (change.before && !change.after && !handed_on.contains(change.before->id)) {
            outcome.add(md_free_tunnel_id(TstringCopy(change.before->name).get()), "free the ID of",
                        *change.before);
            held_.freed(change.before->id.value_or(TUNNEL_ID_NONE), present_ms());
        }
    }
    remember(dbinfo->newdb, ambiguous, tunnels, outcome);
    for (const TunnelChange &change : tunnels) {
        if (change.is_new()) {
            outcome.add(bind_id(*change.after), "bind the ID of", *change.after);
            held_.taken(change.after->id.value_or(TUNNEL_ID_NONE));
        }
        if (change.after) {
            outcome.add(cache(*change.after), "remember", *change.after);
        }
    }
    return outcome.code();
}

} // namespace ovhost
