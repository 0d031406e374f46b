#include "host/mgmtd/history_requests.h"

#include "host/control/arguments.h"
#include "host/control/request_handler.h"
#include "host/mgmtd/answers.h"
#include "host/mgmtd/configuration.h"
#include "host/tree/name.h"

#include <nlohmann/json.hpp>

#include <array>
#include <string>
#include <utility>

namespace ovhost
{
namespace
{

using nlohmann::json;

constexpr std::uint32_t default_limit = 20;

// In the order of the enumeration. They are the protocol's words, whatever the store's are.
constexpr std::array confirmation_words{"none", "waiting", "confirmed", "undone"};
static_assert(confirmation_words.size() == static_cast<std::size_t>(Confirmation::undone) + 1);

json confirmation_json(const RecordedCommit &commit)
{
    if (commit.confirmation == Confirmation::none) {
        return {};
    }
    return {{"state", confirmation_words.at(static_cast<std::size_t>(commit.confirmation))},
            {"by", or_null(commit.ended_by)},
            {"undo_refusal", commit.undo_refusal.empty() ? json() : json(commit.undo_refusal)}};
}

json commit_json(const RecordedCommit &commit)
{
    return {{"number", commit.number},
            {"time", commit.time},
            {"author", {{"uid", or_null(commit.uid)}, {"user", commit.author}}},
            {"comment", commit.comment},
            {"changes", commit.changes},
            {"rollback_to", or_null(commit.rollback_to)},
            {"confirmation", confirmation_json(commit)}};
}

json confirmed_json(const Wait &waited)
{
    return {{"number", waited.number}, {"back_to", waited.back_to}};
}

std::uint32_t required_number(const json &request, const char *name)
{
    const std::optional<std::uint32_t> number = optional_number(request, name);
    if (!number) {
        throw RequestError(error_code::bad_request, std::string("\"") + name + "\" must be given");
    }
    return *number;
}

[[noreturn]] void throw_unknown(std::uint64_t number, std::uint64_t first, std::uint64_t last)
{
    const std::string held = first == 0      ? "it is empty"
                             : first == last ? "it holds only commit " + std::to_string(last)
                                             : "it goes from commit " + std::to_string(first) +
                                                   " to commit " + std::to_string(last);
    throw RequestError(error_code::not_found,
                       "there is no commit " + std::to_string(number) + " in the history: " + held);
}

/// A commit after which the configuration is known.
std::uint64_t known_commit(const Configuration &configuration, std::uint64_t number)
{
    const std::uint64_t first = configuration.oldest_known_commit();
    const std::uint64_t last = configuration.commit_number();
    if (number < first || number > last) {
        throw_unknown(number, first, last);
    }
    return number;
}

std::vector<Change> changes_of(const Store &store, std::uint64_t number)
{
    const auto value_of = [](std::optional<StoredValue> &value) -> std::optional<Value> {
        if (!value) {
            return std::nullopt;
        }
        return Value{static_cast<bn_type>(value->type), std::move(value->text)};
    };
    std::vector<Change> changes;
    for (RecordedChange &change : store.changes_of(number)) {
        changes.push_back({split_name(change.name).value_or(std::vector{change.name}),
                           value_of(change.before), value_of(change.after)});
    }
    return changes;
}

/// A remark is read by people, in one list with others, and is part of what every watcher gets.
std::string comment_of(const json &request)
{
    constexpr std::size_t longest = 4096;
    std::string comment = optional_text(request, "comment");
    if (comment.size() > longest || comment.find('\0') != std::string::npos) {
        throw RequestError(error_code::bad_value, "a comment has at most " +
                                                      std::to_string(longest) +
                                                      " bytes and no NUL character");
    }
    return comment;
}

/// Null when the changes are too many, or too long, to be sent to everybody who watches.
json changes_for_watchers(const Store &store, const RecordedCommit &commit)
{
    constexpr std::uint64_t most = 1000;
    constexpr std::size_t longest = 256UL << 10;
    if (commit.changes > most) {
        return {};
    }
    json changes = changes_json(changes_of(store, commit.number));
    const auto replace = json::error_handler_t::replace;
    return changes.dump(-1, ' ', false, replace).size() > longest ? json() : changes;
}

} // namespace

std::optional<json> commit_event(const Store &store, std::uint64_t number)
{
    const std::optional<RecordedCommit> commit = store.recorded(number);
    if (!commit) {
        return std::nullopt;
    }
    return json{{"kind", "commit"},
                {"commit", commit_json(*commit)},
                {"changes", changes_for_watchers(store, *commit)}};
}

CommitNote client_note(const json &request, const ClientInfo &client)
{
    CommitNote note;
    note.time = commit_time();
    note.uid = client.uid;
    note.author = client.user;
    note.comment = comment_of(request);
    note.confirm_within = optional_number(request, "confirm");
    if (note.confirm_within &&
        (*note.confirm_within == 0 || *note.confirm_within > longest_confirmation)) {
        throw RequestError(error_code::bad_value, "\"confirm\" must be from 1 to " +
                                                      std::to_string(longest_confirmation) +
                                                      " seconds");
    }
    return note;
}

json wait_json(const Configuration &configuration)
{
    const std::optional<Wait> &wait = configuration.store().wait();
    if (!wait) {
        return {};
    }
    const Confirmations &confirmations = configuration.confirmations();
    const auto left = confirmations.time_left().value_or(std::chrono::milliseconds(0));
    const std::string &refusal = confirmations.undo_refusal();
    return {{"number", wait->number},
            {"back_to", wait->back_to},
            {"seconds_left", std::chrono::ceil<std::chrono::seconds>(left).count()},
            {"undo_refusal", refusal.empty() ? json() : json(refusal)}};
}

json commit_answer(const Configuration &configuration, const CommitReport &report,
                   const std::optional<Wait> &waited)
{
    const bool committed = report.outcome == CommitOutcome::committed;
    json answer = {{"number", configuration.commit_number()},
                   {"changes", committed ? report.changes.size() : 0},
                   {"warnings", warnings_json(report.warnings)}};
    if (configuration.store().wait()) {
        answer["waits"] = wait_json(configuration);
    } else if (waited) {
        answer["confirmed"] = confirmed_json(*waited);
    }
    return answer;
}

json answer_history(const Configuration &configuration, const json &request)
{
    const std::uint32_t limit = optional_number(request, "limit").value_or(default_limit);
    if (limit == 0) {
        throw RequestError(error_code::bad_value, "\"limit\" must be 1 at least");
    }
    auto commits = json::array();
    for (const RecordedCommit &commit : configuration.store().history(limit)) {
        commits.push_back(commit_json(commit));
    }
    return {{"commits", std::move(commits)},
            {"oldest", configuration.store().oldest_recorded()},
            {"waits", wait_json(configuration)}};
}

json answer_show_commit(Configuration &configuration, const json &request)
{
    const std::uint64_t number = required_number(request, "number");
    const Store &store = configuration.store();
    const std::optional<RecordedCommit> commit = store.recorded(number);
    if (!commit) {
        throw_unknown(number, store.oldest_recorded(), configuration.commit_number());
    }
    return {{"commit", commit_json(*commit)}, {"changes", changes_json(changes_of(store, number))}};
}

json answer_past_diff(const Configuration &configuration, const json &request)
{
    const std::uint64_t from = known_commit(configuration, required_number(request, "after"));
    const std::uint64_t to = known_commit(
        configuration, optional_number(request, "to")
                           .value_or(static_cast<std::uint32_t>(configuration.commit_number())));
    return {{"changes", changes_json(diff(configuration.after(from), configuration.after(to)))}};
}

json answer_commit(Configuration &configuration, const json &request, const ClientInfo &client)
{
    const CommitNote note = client_note(request, client);
    const std::optional<Wait> waited = configuration.store().wait();
    const CommitReport report = configuration.commit(note);
    throw_unless_accepted(report, "the commit is refused");
    return commit_answer(configuration, report, waited);
}

json answer_rollback(Configuration &configuration, const json &request, const ClientInfo &client)
{
    const std::uint64_t number = known_commit(configuration, required_number(request, "number"));
    CommitNote note = client_note(request, client);
    const std::optional<Wait> waited = configuration.store().wait();
    const CommitReport report = configuration.rollback(number, std::move(note));
    throw_unless_accepted(report, "the rollback is refused");
    return commit_answer(configuration, report, waited);
}

json answer_confirm(Configuration &configuration)
{
    const std::optional<Wait> waited = configuration.store().wait();
    if (!waited) {
        throw RequestError(error_code::not_found, "no commit waits to be confirmed");
    }
    configuration.confirm();
    return {{"confirmed", confirmed_json(*waited)}};
}

} // namespace ovhost
