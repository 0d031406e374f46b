#include "host/mgmtd/requests.h"

#include "framework/appliance.h"
#include "framework/logging.h"
#include "host/control/arguments.h"
#include "host/control/server.h"
#include "host/framework/time_refresh.h"
#include "host/mgmtd/answers.h"
#include "host/mgmtd/daemon_log.h"
#include "host/mgmtd/history_requests.h"
#include "host/mgmtd/library_requests.h"
#include "host/mgmtd/show.h"
#include "host/mgmtd/upgrade_requests.h"
#include "host/modules/node_access.h"
#include "host/support/version.h"
#include "host/tree/name.h"

#include <nlohmann/json.hpp>
#include <unistd.h>

#include <algorithm>

namespace ovhost
{
namespace
{

using nlohmann::json;

std::vector<std::string> required_name(const json &request)
{
    const std::string name = required_text(request, "name");
    auto parts = split_name(name);
    if (!parts) {
        throw RequestError(error_code::bad_value,
                           "\"" + name + "\" is not a node name: write it as /part/part");
    }
    return std::move(*parts);
}

/// The number of nodes that hold a value at or below a name.
std::size_t count_values(const Tree &tree, Tree::Parts below)
{
    std::size_t count = 0;
    tree.visit([&count](Tree::Parts, const Value &) { ++count; }, below);
    return count;
}

} // namespace

struct Requests::Command {
    const char *name;
    json (Requests::*handler)(const json &request, const ClientInfo &client);
};

const Requests::Command Requests::commands[] = {
    {"get", &Requests::get},           {"set", &Requests::set},
    {"delete", &Requests::erase},      {"load", &Requests::load},
    {"discard", &Requests::discard},   {"diff", &Requests::diff},
    {"check", &Requests::check},       {"commit", &Requests::commit},
    {"status", &Requests::status},     {"show", &Requests::show},
    {"upgrade", &Requests::upgrade},   {"history", &Requests::history},
    {"rollback", &Requests::rollback}, {"confirm", &Requests::confirm},
    {"enable", &Requests::enable},     {"clear", &Requests::clear},
    {"alarm", &Requests::alarm},
};

Requests::Requests(Configuration &configuration, DaemonView daemon)
    : configuration_(configuration), daemon_(std::move(daemon))
{
}

json Requests::handle(const json &request, const ClientInfo &client)
{
    const std::string name = required_text(request, "command");
    const auto *const command =
        std::find_if(std::begin(commands), std::end(commands),
                     [&name](const Command &candidate) { return name == candidate.name; });
    if (command == std::end(commands)) {
        throw RequestError(error_code::unknown_command, "unknown command \"" + name + "\"");
    }
    refresh_time_info();
    return (this->*command->handler)(request, client);
}

json Requests::get(const json &request, const ClientInfo &)
{
    const auto name = required_name(request);
    const std::string from = optional_text(request, "from", "running");
    if (from != "running" && from != "candidate") {
        throw RequestError(error_code::bad_request,
                           R"(get: "from" must be "running" or "candidate")");
    }
    const bool subtree = optional_flag(request, "subtree");
    const Tree &tree =
        from == "running" ? configuration_.running() : configuration_.candidate().tree();
    if (!name.empty() && !tree.exists(name)) {
        throw RequestError(error_code::not_found,
                           "no node " + join_name(name) + " in the " + from + " configuration");
    }
    auto nodes = json::array();
    const auto add = [&nodes](Tree::Parts node, const Value &value) {
        nodes.push_back(
            {{"name", join_name(node)}, {"type", type_name(value.type)}, {"value", value.text}});
    };
    if (subtree) {
        tree.visit(add, name);
    } else if (const Value *const value = tree.value(name)) {
        add(name, *value);
    }
    return {{"nodes", std::move(nodes)}};
}

json Requests::set(const json &request, const ClientInfo &)
{
    const std::string name = required_text(request, "name");
    const std::string type_text = required_text(request, "type");
    const std::optional<bn_type> type = find_type(type_text);
    if (!type) {
        throw RequestError(error_code::bad_value, name + ": unknown type \"" + type_text + "\"");
    }
    if (const auto fault =
            configuration_.candidate().set(name, *type, required_text(request, "value"))) {
        throw RequestError(error_code::bad_value, *fault);
    }
    return json::object();
}

json Requests::erase(const json &request, const ClientInfo &)
{
    const auto name = required_name(request);
    if (name.empty()) {
        throw RequestError(error_code::bad_value,
                           "\"/\" cannot be deleted: it is the root of all nodes");
    }
    Candidate &candidate = configuration_.candidate();
    const std::size_t removed = count_values(candidate.tree(), name);
    if (const auto fault = candidate.erase(join_name(name))) {
        throw RequestError(error_code::not_found, *fault);
    }
    return {{"removed", removed}};
}

json Requests::load(const json &request, const ClientInfo &)
{
    const LoadResult result = load_text(configuration_.candidate(), required_text(request, "text"));
    const std::string source = optional_text(request, "source", "text");
    if (!result.faults.empty()) {
        throw_bad_lines(source, result.faults);
    }
    log_line(ov_log_info, "loaded " + source);
    return {{"set", result.set}, {"removed", result.removed}};
}

json Requests::discard(const json &, const ClientInfo &)
{
    const auto dropped = configuration_.candidate().pending(configuration_.running()).size();
    configuration_.discard();
    return {{"changes", dropped}};
}

json Requests::diff(const json &request, const ClientInfo &)
{
    if (request.contains("after") || request.contains("to")) {
        return answer_past_diff(configuration_, request);
    }
    return {
        {"changes", changes_json(configuration_.candidate().pending(configuration_.running()))}};
}

json Requests::check(const json &, const ClientInfo &)
{
    const CheckReport report = configuration_.check();
    if (!report.accepted()) {
        throw_refused("the candidate would be refused", report.refusals);
    }
    return {{"changes", report.changes.size()}, {"warnings", warnings_json(report.warnings)}};
}

json Requests::store(Storing carry_out, const json &request, const ClientInfo &client)
{
    daemon_.before_events();
    json answer = carry_out(configuration_, request, client);
    daemon_.after_commit();
    return answer;
}

json Requests::commit(const json &request, const ClientInfo &client)
{
    return store(answer_commit, request, client);
}

json Requests::history(const json &request, const ClientInfo &)
{
    return answer_history(configuration_, request);
}

json Requests::rollback(const json &request, const ClientInfo &client)
{
    return store(answer_rollback, request, client);
}

json Requests::confirm(const json &, const ClientInfo &)
{
    json answer = answer_confirm(configuration_);
    daemon_.after_commit();
    return answer;
}

json Requests::enable(const json &request, const ClientInfo &)
{
    return answer_enable(configuration_, request);
}

json Requests::clear(const json &request, const ClientInfo &)
{
    return answer_clear(configuration_, request);
}

json Requests::alarm(const json &request, const ClientInfo &)
{
    return answer_alarm(request);
}

json Requests::upgrade(const json &request, const ClientInfo &client)
{
    return store(answer_upgrade, request, client);
}

json Requests::status(const json &, const ClientInfo &)
{
    auto peers = json::array();
    for (const PeerStatus &peer : daemon_.peers()) {
        peers.push_back({{"name", peer.name},
                         {"pid", peer.pid},
                         {"events_sent", peer.events_sent},
                         {"bytes_waiting", peer.bytes_waiting}});
    }
    const char *const model = get_config_name();
    const Candidate &candidate = configuration_.candidate();
    const auto uptime = std::chrono::duration_cast<std::chrono::seconds>(
        std::chrono::steady_clock::now() - started_);
    json answer = {
        {"version", program_version()},
        {"pid", ::getpid()},
        {"model", model != nullptr ? json(model) : json()},
        {"commit", configuration_.commit_number()},
        {"nodes",
         {{"running", configuration_.running().size()}, {"candidate", candidate.tree().size()}}},
        {"candidate_changes", candidate.pending(configuration_.running()).size()},
        {"peers", std::move(peers)},
        {"uptime_seconds", uptime.count()}};
    if (configuration_.store().wait()) {
        answer["waits"] = wait_json(configuration_);
    }
    return answer;
}

json Requests::show(const json &request, const ClientInfo &)
{
    return answer_show(configuration_, request);
}

} // namespace ovhost
