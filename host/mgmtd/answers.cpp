#include "host/mgmtd/answers.h"

#include "host/control/request_error.h"
#include "host/modules/node_access.h"
#include "host/tree/name.h"

#include <nlohmann/json.hpp>

namespace ovhost
{

using nlohmann::json;

namespace
{

json value_json(const std::optional<Value> &value)
{
    return value ? json{{"type", type_name(value->type)}, {"value", value->text}} : json();
}

json change_json(const Change &change)
{
    const char *const kind = !change.before ? "add" : !change.after ? "delete" : "modify";
    return {{"change", kind},
            {"name", join_name(change.parts)},
            {"old", value_json(change.before)},
            {"new", value_json(change.after)}};
}

} // namespace

json changes_json(const std::vector<Change> &changes)
{
    auto list = json::array();
    for (const Change &change : changes) {
        list.push_back(change_json(change));
    }
    return list;
}

json warnings_json(const std::vector<Warning> &warnings)
{
    auto texts = json::array();
    for (const Warning &warning : warnings) {
        texts.push_back(warning.message);
    }
    return texts;
}

void throw_refused(const char *what, const std::vector<Refusal> &refusals)
{
    std::vector<ErrorDetail> details;
    details.reserve(refusals.size());
    for (const Refusal &refusal : refusals) {
        details.push_back({refusal.node, refusal.message, refusal.module, 0});
    }
    throw RequestError(error_code::refused, what, std::move(details));
}

void throw_unless_accepted(const CommitReport &report, const char *refusal)
{
    if (report.outcome == CommitOutcome::not_stored) {
        throw RequestError(error_code::internal, report.store_error);
    }
    if (!report.accepted()) {
        throw_refused(refusal, report.refusals);
    }
}

} // namespace ovhost
