#include "host/mgmtd/upgrade_requests.h"

#include "host/control/arguments.h"
#include "host/control/request_error.h"
#include "host/mgmtd/answers.h"
#include "host/mgmtd/configuration.h"
#include "host/mgmtd/history_requests.h"
#include "host/modules/legacy_upgrade.h"

#include <string>

namespace ovhost
{
namespace
{

using nlohmann::json;

/// Drops the candidate's edits at the end, whatever that is.
struct DiscardAtEnd {
    Configuration &configuration;
    ~DiscardAtEnd() { configuration.discard(); }
};

/// Lays the text over the candidate; whatever keeps it from that is thrown.
LegacyUpgrade convert(Candidate &candidate, const std::string &text, const std::string &source)
{
    LegacyUpgrade result = upgrade_legacy(candidate, text);
    if (!result.line_faults.empty()) {
        throw_bad_lines(source, result.line_faults);
    }
    if (!result.entry_faults.empty()) {
        throw_bad_entries(result.entry_faults);
    }
    if (result.converted + result.by_acl == 0) {
        throw RequestError(error_code::refused,
                           "there are no map entries to convert; nothing was stored (use load for "
                           "a file of other nodes)");
    }
    return result;
}

} // namespace

json answer_upgrade(Configuration &configuration, const json &request, const ClientInfo &client)
{
    const std::string text = required_text(request, "text");
    const std::string source = optional_text(request, "source", "text");
    Candidate &candidate = configuration.candidate();
    // They would be stored with the upgrade, or be lost with it.
    if (!candidate.pending(configuration.running()).empty()) {
        throw RequestError(error_code::refused,
                           "the candidate has edits: commit or discard them first");
    }
    const DiscardAtEnd restore{configuration};
    configuration.discard();
    const LegacyUpgrade result = convert(candidate, text, source);
    CommitNote note = client_note(request, client);
    if (note.comment.empty()) {
        note.comment = "upgrade from " + source;
    }
    const std::optional<Wait> waited = configuration.store().wait();
    const CommitReport report = configuration.commit(note);
    throw_unless_accepted(report, "the upgraded configuration is refused");
    json answer = commit_answer(configuration, report, waited);
    answer["changes"] = changes_json(report.changes);
    answer["converted"] = result.converted;
    answer["by_acl"] = result.by_acl;
    return answer;
}

} // namespace ovhost
