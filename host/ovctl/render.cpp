#include "host/ovctl/render.h"

#include "host/ovctl/render_history.h"
#include "host/ovctl/render_parts.h"
#include "host/ovctl/terminal.h"
#include "host/support/printable.h"

#include <nlohmann/json.hpp>

#include <ostream>

namespace ovhost
{

using nlohmann::json;

namespace
{

std::string changes(long count)
{
    return counted(count, "change", "changes");
}

void print_warnings(const json &result, std::ostream &out)
{
    for (const json &warning : result.at("warnings")) {
        out << styled(out, Style::warning, "warning:") << ' '
            << printable(warning.get_ref<const std::string &>()) << '\n';
    }
}

std::string yes_or_no(const json &object, const char *member)
{
    return object.at(member).get<bool>() ? "yes" : "no";
}

/// 93784 seconds are "1d 02:03:04".
std::string duration(long seconds)
{
    char clock[16];
    std::snprintf(clock, sizeof(clock), "%02ld:%02ld:%02ld", seconds / 3600 % 24, seconds / 60 % 60,
                  seconds % 60);
    const long days = seconds / 86400;
    return days > 0 ? std::to_string(days) + "d " + clock : clock;
}

std::string describe_peer(const json &peer)
{
    std::string text = text_of(peer, "name") + " (pid " + std::to_string(count_of(peer, "pid")) +
                       ", " + counted(count_of(peer, "events_sent"), "event", "events") + " sent";
    if (const long waiting = count_of(peer, "bytes_waiting"); waiting > 0) {
        text += ", " + counted(waiting, "byte", "bytes") + " waiting";
    }
    return text + ")";
}

std::string type_and_value(const json &node)
{
    return text_of(node, "type") + " " + text_of(node, "value");
}

void print_modification(const json &change, std::ostream &out)
{
    const json &before = change.at("old");
    const json &after = change.at("new");
    // The types are worth a word only where they differ.
    const bool same_type = before.at("type") == after.at("type");
    const auto side = [same_type](const json &node) {
        return same_type ? text_of(node, "value") : type_and_value(node);
    };
    const std::string line =
        "~ " + text_of(change, "name") + ": " + side(before) + " -> " + side(after);
    out << styled(out, Style::modified, line) << '\n';
}

void print_change(const json &change, std::ostream &out)
{
    const auto &kind = change.at("change").get_ref<const std::string &>();
    if (kind == "modify") {
        print_modification(change, out);
        return;
    }
    const bool added = kind == "add";
    const std::string line = (added ? "+ " : "- ") + text_of(change, "name") + " " +
                             type_and_value(change.at(added ? "new" : "old"));
    out << styled(out, added ? Style::added : Style::removed, line) << '\n';
}

void print_commit(const json &result, long change_count, std::ostream &out)
{
    if (change_count == 0) {
        out << "nothing to commit\n";
    } else {
        out << "commit " << count_of(result, "number") << ": " << changes(change_count) << '\n';
    }
}

} // namespace

void render_nothing(const json &, std::ostream &) {}

void render_nodes(const json &result, std::ostream &out)
{
    for (const json &node : result.at("nodes")) {
        out << text_of(node, "name") << ' ' << type_and_value(node) << '\n';
    }
}

void render_load(const json &result, std::ostream &out)
{
    out << "loaded " << counted(count_of(result, "set"), "value", "values") << " and "
        << counted(count_of(result, "removed"), "removal", "removals") << '\n';
}

void render_check(const json &result, std::ostream &out)
{
    print_warnings(result, out);
    out << "a commit would make " << changes(count_of(result, "changes")) << '\n';
}

void render_commit(const json &result, std::ostream &out)
{
    print_warnings(result, out);
    print_commit(result, count_of(result, "changes"), out);
    render_wait(result, out);
}

void render_diff(const json &result, std::ostream &out)
{
    for (const json &change : result.at("changes")) {
        print_change(change, out);
    }
}

void render_upgrade(const json &result, std::ostream &out)
{
    render_diff(result, out);
    print_warnings(result, out);
    out << counted(count_of(result, "converted"), "entry", "entries")
        << " converted to match strings, " << count_of(result, "by_acl") << " by ACL as before\n";
    print_commit(result, static_cast<long>(result.at("changes").size()), out);
    render_wait(result, out);
}

void render_discard(const json &result, std::ostream &out)
{
    out << "discarded " << changes(count_of(result, "changes")) << '\n';
}

void render_status(const json &result, std::ostream &out)
{
    const json &nodes = result.at("nodes");
    print_fact(out, "version", text_of(result, "version"));
    print_fact(out, "pid", std::to_string(count_of(result, "pid")));
    print_fact(out, "uptime", duration(count_of(result, "uptime_seconds")));
    print_fact(out, "model", text_or(result, "model", "none"));
    print_fact(out, "last commit", std::to_string(count_of(result, "commit")));
    print_fact(out, "running nodes", std::to_string(count_of(nodes, "running")));
    print_fact(out, "candidate nodes", std::to_string(count_of(nodes, "candidate")));
    print_fact(out, "candidate changes", std::to_string(count_of(result, "candidate_changes")));
    for (const json &peer : result.at("peers")) {
        print_fact(out, "peer", describe_peer(peer));
    }
    render_wait(result, out);
}

void render_mode(const json &result, std::ostream &out)
{
    print_fact(out, "mode", text_or(result, "mode", "not set"));
    print_fact(out, "submode", text_or(result, "submode", "not set"));
    print_fact(out, "bridge", yes_or_no(result, "bridge"));
    print_fact(out, "router", yes_or_no(result, "router"));
    print_fact(out, "server", yes_or_no(result, "server"));
    print_fact(out, "inline router", yes_or_no(result, "inline_router"));
    print_fact(out, "router interfaces", std::to_string(count_of(result, "router_interfaces")));
    print_fact(out, "10 gigabit", yes_or_no(result, "ten_gigabit"));
    print_fact(out, "bonding", yes_or_no(result, "bonding"));
}

} // namespace ovhost
