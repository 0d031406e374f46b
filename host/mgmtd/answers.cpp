#include "host/mgmtd/answers.h"

#include "host/control/request_error.h"
#include "host/modules/node_access.h"
#include "host/tree/name.h"

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

std::vector<ErrorDetail> details_of(const std::vector<LineFault> &faults)
{
    std::vector<ErrorDetail> details;
    details.reserve(faults.size());
    for (const LineFault &fault : faults) {
        details.push_back({fault.node, fault.message, "", fault.line});
    }
    return details;
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

void throw_bad_lines(const std::string &source, const std::vector<LineFault> &faults)
{
    throw RequestError(error_code::bad_lines,
                       source + ": " + std::to_string(faults.size()) +
                           (faults.size() == 1 ? " bad line" : " bad lines") +
                           "; nothing was loaded",
                       details_of(faults));
}

void throw_bad_entries(const std::vector<LineFault> &faults)
{
    throw RequestError(error_code::refused, "entries cannot be upgraded; nothing was stored",
                       details_of(faults));
}

} // namespace ovhost
