#pragma once
// One commit in the making: which modules its changes concern, the rounds of checks, and what is
// reported of them. engine.h drives it and owns what outlives the commit; supervisor.h makes the
// calls.

#include "host/commit/change_list.h"
#include "host/commit/module.h"
#include "host/commit/node_scope.h"
#include "host/commit/report.h"
#include "host/commit/supervisor.h"

#include <set>
#include <span>
#include <string>
#include <vector>

namespace ovhost
{

/// A module as the engine knows it.
struct RegisteredModule {
    Module *module = nullptr;
    std::string name;
    std::vector<NodeScope> scopes;

    /// Whether a change of this node concerns the module.
    [[nodiscard]] bool concerned_by(std::span<const std::string> node) const;
};

/// How often modules may react to one another's amendments. Real chains are two or three long; a
/// commit that needs more is being pulled to and fro.
inline constexpr unsigned max_check_rounds = 8;

class Transaction
{
  public:
    /// The modules outlive the transaction and are called in their order.
    Transaction(std::span<const RegisteredModule> modules, Tree running, Tree proposed);

    /// Lets every module check every change that concerns it. What modules write into the new
    /// database is checked against its type and becomes part of the list of changes; what is new
    /// in the list is checked in a next round, by all modules it concerns, until nothing new
    /// appears. A round is run to its end, so that all refusals of one round are collected; after a
    /// round with a refusal there is none, for what it would say may follow from the first fault.
    void check();

    /// Lets the modules put the changes into force; then is the time for what they tell others.
    /// Nothing is refused any more: what fails is a warning.
    void apply();
    void notify();

    [[nodiscard]] const std::vector<Change> &changes() const { return list_.changes(); }
    [[nodiscard]] const Tree &proposed() const { return supervisor_.proposed(); }
    [[nodiscard]] const std::vector<Refusal> &refusals() const { return refusals_; }
    [[nodiscard]] const std::vector<Warning> &warnings() const { return supervisor_.warnings(); }

  private:
    using Handler = std::function<int(md_dbinfo *)>;

    void check_round(const ChangeListUpdate &update);
    void check_by(const RegisteredModule &registered, const ChangeListUpdate &update);

    /// One call of one check about one node; an empty node means the commit as a whole.
    void check_call(const RegisteredModule &registered, const std::string &node,
                    const Handler &handler);

    void collect_refusal(const std::string &module, const std::string &node,
                         const CallResult &result);

    /// Looks over what one call has written into the new database.
    void inspect_amendments(const std::string &module, const Tree &before);

    void refuse_unsettled(const ChangeListUpdate &update);

    [[nodiscard]] bool concerned(const RegisteredModule &registered) const;
    [[nodiscard]] bool concerned(const RegisteredModule &registered,
                                 const ChangeListUpdate &update) const;

    std::span<const RegisteredModule> modules_;
    Supervisor supervisor_;
    ChangeList list_;
    std::vector<Refusal> refusals_;
    /// Modules that have written in the round that is running.
    std::set<std::string> amenders_;
};

} // namespace ovhost
