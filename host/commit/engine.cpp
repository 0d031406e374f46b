#include "host/commit/engine.h"

#include "framework/logging.h"
#include "host/framework/log_config.h"
#include "host/framework/objects.h"

#include <algorithm>
#include <exception>
#include <stdexcept>
#include <utility>

namespace ovhost
{

namespace
{

/// Marks the engine as busy; a commit inside a commit would pull the databases from under it.
class BusyMark
{
  public:
    explicit BusyMark(bool &busy) : busy_(busy)
    {
        if (busy_) {
            throw std::logic_error("a commit is running: a module cannot start another one");
        }
        busy_ = true;
    }
    BusyMark(const BusyMark &) = delete;
    BusyMark &operator=(const BusyMark &) = delete;
    ~BusyMark() { busy_ = false; }

  private:
    bool &busy_;
};

std::string count_text(std::size_t changes)
{
    return std::to_string(changes) + (changes == 1 ? " change" : " changes");
}

void log_commit(const CommitReport &report, const std::string &comment)
{
    log_host_line(ov_log_notice, "commit",
                  "commit " + std::to_string(report.commit_number) +
                      " is in force: " + count_text(report.changes.size()) +
                      (comment.empty() ? "" : " (" + comment + ")"));
}

} // namespace

void CommitEngine::add_module(Module &module)
{
    RegisteredModule registered{&module, module.name(), {}};
    if (registered.name.empty()) {
        throw std::invalid_argument("a module must have a name");
    }
    if (std::ranges::find(modules_, registered.name, &RegisteredModule::name) != modules_.end()) {
        throw std::invalid_argument("there are two modules of the name " + registered.name);
    }
    for (const std::string &text : module.patterns()) {
        std::optional<NodeScope> scope = NodeScope::parse(text);
        if (!scope) {
            throw std::invalid_argument("module " + registered.name + " asks for \"" + text +
                                        "\", which is not a pattern of node names");
        }
        registered.scopes.push_back(*std::move(scope));
    }
    modules_.push_back(std::move(registered));
}

void CommitEngine::load()
{
    const BusyMark mark(busy_);
    running_ = load_tree(store_);
}

void CommitEngine::start_modules()
{
    const BusyMark mark(busy_);
    mdb_db running;
    running.tree = running_;
    for (const RegisteredModule &registered : modules_) {
        registered.module->start(&running);
    }
}

CheckReport CommitEngine::check(const Candidate &candidate)
{
    const BusyMark mark(busy_);
    Transaction transaction(modules_, running_, candidate.over(running_));
    transaction.check();
    return {transaction.changes(), transaction.refusals(), transaction.warnings()};
}

CommitReport CommitEngine::commit(Candidate &candidate, const CommitNote &note)
{
    const BusyMark mark(busy_);
    Transaction transaction(modules_, running_, candidate.over(running_));
    transaction.check();

    CommitReport report;
    report.changes = transaction.changes();
    report.refusals = transaction.refusals();
    if (!report.refusals.empty()) {
        report.outcome = CommitOutcome::refused;
    } else if (!report.changes.empty()) {
        put_in_force(transaction, note, report);
    }
    if (report.accepted()) {
        candidate.discard(running_);
    }
    report.warnings = transaction.warnings();
    return report;
}

CommitReport CommitEngine::initial(Candidate &candidate, const CommitNote &note)
{
    if (running_.size() != 0) {
        throw std::logic_error("the initial configuration needs an empty running configuration");
    }
    return commit(candidate, note);
}

void CommitEngine::put_in_force(Transaction &transaction, const CommitNote &note,
                                CommitReport &report)
{
    if (!store(transaction, note, report)) {
        report.outcome = CommitOutcome::not_stored;
        return;
    }
    report.outcome = CommitOutcome::committed;
    running_ = transaction.proposed();
    log_commit(report, note.comment);
    transaction.apply();
    transaction.notify();
}

bool CommitEngine::store(const Transaction &transaction, const CommitNote &note,
                         CommitReport &report)
{
    try {
        report.commit_number = store_.commit(stored_changes(transaction.changes()), note);
        return true;
    } catch (const std::exception &error) {
        report.store_error = error.what();
        return false;
    }
}

} // namespace ovhost
