#include "host/commit/transaction.h"

#include "host/commit/messages.h"
#include "host/tree/value_type.h"

#include <algorithm>
#include <utility>

namespace ovhost
{

bool RegisteredModule::concerned_by(std::span<const std::string> node) const
{
    return scopes.empty() ||
           std::ranges::any_of(scopes, [&](const NodeScope &scope) { return scope.holds(node); });
}

Transaction::Transaction(std::span<const RegisteredModule> modules, Tree running, Tree proposed)
    : modules_(modules), supervisor_(std::move(running), std::move(proposed))
{
}

void Transaction::check()
{
    ChangeListUpdate update = list_.replace(diff(supervisor_.running(), proposed()));
    for (unsigned round = 1; !update.empty(); ++round) {
        if (round > max_check_rounds) {
            refuse_unsettled(update);
            return;
        }
        check_round(update);
        if (!refusals_.empty() || amenders_.empty()) {
            return;
        }
        update = list_.replace(diff(supervisor_.running(), proposed()));
    }
}

void Transaction::check_round(const ChangeListUpdate &update)
{
    amenders_.clear();
    for (const RegisteredModule &registered : modules_) {
        check_by(registered, update);
    }
}

void Transaction::check_by(const RegisteredModule &registered, const ChangeListUpdate &update)
{
    for (const std::size_t position : update.fresh) {
        if (registered.concerned_by(list_.changes()[position].parts)) {
            check_call(registered, list_.name(position), [&](md_dbinfo *info) {
                return registered.module->check_change(info, list_.record(position));
            });
        }
    }
    if (concerned(registered, update)) {
        check_call(registered, "", [&](md_dbinfo *info) {
            return registered.module->check_commit(info, list_.array());
        });
    }
}

void Transaction::check_call(const RegisteredModule &registered, const std::string &node,
                             const Handler &handler)
{
    const Tree before = proposed();
    const CallResult result = supervisor_.call(registered.name, Phase::check, handler);
    collect_refusal(registered.name, node, result);
    inspect_amendments(registered.name, before);
}

void Transaction::collect_refusal(const std::string &module, const std::string &node,
                                  const CallResult &result)
{
    Refusal refusal{node, module, result.code, {}};
    if (result.exception) {
        refusal.code = lc_err_generic_error;
        refusal.message = *result.exception;
    } else if (result.refusal) {
        // A refusal with the code for success is a refusal all the same.
        refusal.code = result.refusal->code != 0 ? result.refusal->code : lc_err_generic_error;
        refusal.message = result.refusal->message;
    } else if (result.code == 0) {
        return;
    }
    if (refusal.message.empty()) {
        refusal.message = refusal.code == lc_err_cancelled
                              ? cancelled_message()
                              : check_failed_message(module, node, refusal.code);
    }
    refusals_.push_back(std::move(refusal));
}

void Transaction::inspect_amendments(const std::string &module, const Tree &before)
{
    for (const Change &amendment : diff(before, proposed())) {
        amenders_.insert(module);
        if (!amendment.after) {
            continue;
        }
        const auto &[type, text] = *amendment.after;
        if (const std::optional<std::string> reason = value_fault(type, text)) {
            const std::string node = join_name(amendment.parts);
            refusals_.push_back(
                {node, module, lc_err_bad_type, describe_fault(node, type, text, *reason)});
        }
    }
}

void Transaction::refuse_unsettled(const ChangeListUpdate &update)
{
    const std::string node = update.fresh.empty() ? join_name(update.withdrawn.front())
                                                  : list_.name(update.fresh.front());
    refusals_.push_back({node, join_names(amenders_), lc_err_generic_error,
                         unsettled_message(amenders_, node, max_check_rounds)});
}

void Transaction::apply()
{
    for (const RegisteredModule &registered : modules_) {
        if (!concerned(registered)) {
            continue;
        }
        const CallResult result =
            supervisor_.call(registered.name, Phase::apply, [&](md_dbinfo *info) {
                return registered.module->apply(info, list_.array());
            });
        if (result.exception) {
            supervisor_.warn(registered.name, Phase::apply, lc_err_generic_error,
                             exception_message(registered.name, Phase::apply, *result.exception));
        } else if (result.code != 0) {
            supervisor_.warn(registered.name, Phase::apply, result.code,
                             apply_failed_message(registered.name, result.code));
        }
    }
}

void Transaction::notify()
{
    for (const RegisteredModule &registered : modules_) {
        if (!concerned(registered)) {
            continue;
        }
        const CallResult result =
            supervisor_.call(registered.name, Phase::notify, [&](md_dbinfo *) {
                registered.module->notify(list_.array());
                return 0;
            });
        if (result.exception) {
            supervisor_.warn(registered.name, Phase::notify, lc_err_generic_error,
                             exception_message(registered.name, Phase::notify, *result.exception));
        }
    }
}

bool Transaction::concerned(const RegisteredModule &registered) const
{
    return std::ranges::any_of(
        changes(), [&](const Change &change) { return registered.concerned_by(change.parts); });
}

bool Transaction::concerned(const RegisteredModule &registered,
                            const ChangeListUpdate &update) const
{
    return std::ranges::any_of(update.fresh,
                               [&](std::size_t position) {
                                   return registered.concerned_by(changes()[position].parts);
                               }) ||
           std::ranges::any_of(update.withdrawn, [&](const std::vector<std::string> &node) {
               return registered.concerned_by(node);
           });
}

} // namespace ovhost
