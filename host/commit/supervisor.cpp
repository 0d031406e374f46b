#include "host/commit/supervisor.h"

#include "host/commit/messages.h"

#include "framework/bail.h"

#include <exception>
#include <utility>

namespace ovhost
{

namespace
{

const char bail_unit[] = "commit";

/// Runs the handler; its code and its exception, if any, end up in the result.
CallResult guarded(const std::function<int(md_dbinfo *)> &handler, md_dbinfo *info)
{
    CallResult result;
    try {
        result.code = handler(info);
    } catch (const std::exception &error) {
        result.exception = error.what();
    } catch (...) {
        result.exception.emplace();
    }
    return result;
}

} // namespace

int Supervisor::Context::refuse(int code, std::string message)
{
    if (!checking) {
        ++misplaced;
        return lc_err_assertion_failed;
    }
    spoken = SpokenRefusal{code, std::move(message)};
    return 0;
}

Supervisor::Supervisor(Tree running, Tree proposed)
    : olddb_{std::move(running)}, newdb_{std::move(proposed)}, info_{&context_, &olddb_, &newdb_}
{
}

CallResult Supervisor::call(const std::string &module, Phase phase,
                            const std::function<int(md_dbinfo *)> &handler)
{
    context_.checking = phase == Phase::check;
    newdb_.writable = phase == Phase::check;
    // A module gets a view of its own, so that what it does to the three pointers harms nobody.
    md_dbinfo view = info_;
    CallResult result = guarded(handler, &view);
    newdb_.writable = false;
    context_.checking = false;
    result.refusal = std::exchange(context_.spoken, std::nullopt);
    report_breaches(module, phase, result);
    return result;
}

void Supervisor::report_breaches(const std::string &module, Phase phase, const CallResult &result)
{
    const struct {
        bool committed;
        const char *deed;
    } breaches[] = {
        {std::exchange(olddb_.refused_writes, 0U) > 0, "tried to write the old database"},
        {std::exchange(newdb_.refused_writes, 0U) > 0, "tried to write the database"},
        {std::exchange(context_.misplaced, 0U) > 0, "tried to refuse the commit"},
        {result.refusal && result.refusal->message.empty(), "refused without a message"},
    };
    for (const auto &breach : breaches) {
        if (breach.committed) {
            warn(module, phase, 0, breach_message(module, phase, breach.deed));
        }
    }
}

void Supervisor::warn(const std::string &module, Phase phase, int code, std::string message)
{
    // A quiet failure goes to the client, never to the log.
    if (code != lc_err_cancelled) {
        BAIL_LOG("%s", message.c_str());
    }
    warnings_.push_back({module, phase, code, std::move(message)});
}

} // namespace ovhost
