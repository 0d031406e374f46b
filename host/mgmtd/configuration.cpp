#include "host/mgmtd/configuration.h"

#include "framework/appliance.h"
#include "framework/logging.h"
#include "host/commit/past.h"
#include "host/framework/appliance_config.h"
#include "host/framework/model_nodes.h"
#include "host/framework/time_refresh.h"
#include "host/mgmtd/daemon_log.h"
#include "host/mgmtd/rollback_target.h"
#include "host/modules/default_values.h"
#include "host/modules/node_access.h"
#include "orvale/md_dyna_limits.h"

#include <stdexcept>

namespace ovhost
{
namespace
{

DefaultsReport logged_defaults()
{
    return {
        [](const DefaultsSummary &summary) {
            log_line(ov_log_notice, summary.source + ": " + std::to_string(summary.set) + " set, " +
                                        std::to_string(summary.removed) + " removed");
        },
        [](const std::string &warning) { log_line(ov_log_warning, warning); },
    };
}

/// What a first commit that was not accepted says: there is no client to show it to.
std::string describe_first(const CommitReport &report)
{
    const bool is_refused = report.outcome == CommitOutcome::refused;
    return (is_refused ? "the first configuration is refused\n  " : "") +
           failure_text(report, "\n  ");
}

/// Defaults and limits would come from two models at the next first start.
void warn_of_another_model(const mdb_db &configuration)
{
    const char *const in_force = get_config_name();
    const std::optional<std::string> stored = node_text(&configuration, model_name_node);
    if (in_force != nullptr && stored && *stored != in_force) {
        log_line(ov_log_warning, "the configuration is of model \"" + *stored +
                                     "\", --model is \"" + in_force +
                                     "\": start without --model, or with the stored one");
    }
}

} // namespace

Configuration::Configuration(const std::filesystem::path &state_dir, const HistoryBounds &history)
    : store_(Store::open(state_dir, history)), adapter_(store_), engine_(adapter_)
{
    modules_.add_to(engine_);
    engine_.load();
    candidate_.discard(engine_.running());
    set_running_db_source([this] { return running_db(); });
}

Configuration::~Configuration()
{
    set_running_db_source({});
}

const mdb_db *Configuration::running_db()
{
    running_db_.tree = engine_.running();
    return &running_db_;
}

/// The modules start with the model that `configuration` describes: what they set up by it stays
/// for the life of the process.
void Configuration::start_modules(const Tree &configuration)
{
    mdb_db db;
    db.tree = configuration;
    if (const int err = init_model_info(&db); err != 0) {
        throw std::runtime_error("the model's limits cannot be read from the configuration (error "
                                 "code " +
                                 std::to_string(err) + "): see the log for the node");
    }
    warn_of_another_model(db);
    engine_.start_modules();
}

void Configuration::commit_first()
{
    const CommitReport report = engine_.initial(candidate_, daemon_note("initial configuration"));
    if (!report.accepted()) {
        throw std::runtime_error(describe_first(report));
    }
    for (const Warning &warning : report.warnings) {
        log_line(ov_log_warning, warning.message);
    }
    // Only now are the preserved values safe in the store.
    retire_preserved_values();
    log_line(ov_log_notice,
             "first configuration stored: " + std::to_string(running().size()) + " nodes");
}

void Configuration::start()
{
    if (store_.empty()) {
        apply_default_values(candidate_, logged_defaults());
        start_modules(candidate_.tree());
        commit_first();
    } else {
        start_modules(running());
        confirmations_.take_up();
        undo_if_due();
    }
    // The file may have been lost while the daemon was away; the library logs why it fails.
    if (write_dyna_limits_conf(running_db()) != 0) {
        log_line(ov_log_warning, "/var/opt/tms/dynalimits.conf could not be written: look at that "
                                 "folder, its rights and its free space");
    }
}

CommitReport Configuration::commit(const CommitNote &note)
{
    return confirmations_.commit(candidate_, note);
}

CommitReport Configuration::rollback(std::uint64_t number, CommitNote note)
{
    note.rollback_to = number;
    if (note.comment.empty()) {
        note.comment = "rollback to commit " + std::to_string(number);
    }
    Candidate past(running());
    past.replace(rollback_target(after(number), running()));
    CommitReport report = confirmations_.commit(past, note);
    candidate_.rebase(running());
    return report;
}

void Configuration::undo_if_due()
{
    refresh_time_info();
    if (confirmations_.undo_if_due()) {
        candidate_.rebase(running());
    }
}

std::uint64_t Configuration::oldest_known_commit() const
{
    return ovhost::oldest_known_commit(store_);
}

Tree Configuration::after(std::uint64_t commit) const
{
    return configuration_after(store_, running(), commit);
}

} // namespace ovhost
