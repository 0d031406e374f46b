#include "host/ovctl/command_table.h"

#include "host/control/arguments.h"
#include "host/ovctl/render.h"
#include "host/ovctl/render_history.h"
#include "host/ovctl/render_interfaces.h"
#include "host/ovctl/render_maps.h"
#include "host/ovctl/render_tunnels.h"
#include "host/ovctl/text_input.h"

#include <nlohmann/json.hpp>

#include <iterator>

namespace ovhost
{

using nlohmann::json;

namespace
{

using enum ArgumentSpec::Kind;

constexpr ArgumentSpec get_arguments[] = {
    {positional, "name", "The node's full name"},
    {flag, "subtree", "The node and everything below it"},
    {flag, "candidate", "From the candidate, not from the running configuration"},
};

constexpr ArgumentSpec set_arguments[] = {
    {positional, "name", "The node's full name"},
    {positional, "type", "The type's name, such as uint32, bool, string or ipv4addr"},
    {positional, "value", "The value as text"},
};

constexpr ArgumentSpec delete_arguments[] = {
    {positional, "name", "The node's full name"},
};

constexpr ArgumentSpec clear_arguments[] = {
    {positional, "name", "The full name of the node that stays"},
};

constexpr ArgumentSpec enable_arguments[] = {
    {positional, "name", "The interface's name"},
};

constexpr ArgumentSpec alarm_arguments[] = {
    {positional, "text", "The alarm, one line"},
};

constexpr ArgumentSpec load_arguments[] = {
    {positional, "file",
     "A file of lines NAME,TYPE,VALUE to set, -NAME to remove, and # comments; a value cannot hold "
     "a comma; - is standard input"},
};

constexpr ArgumentSpec upgrade_arguments[] = {
    {positional, "file",
     "A file of lines NAME,TYPE,VALUE in which the entries of maps have a node for each field; it "
     "is only read; - is standard input"},
    {text, "comment", "A remark for the history and for mgmtd's log"},
    {number, "confirm",
     "Undo the upgrade after so many seconds (1 to 86400) unless it is confirmed"},
};

constexpr ArgumentSpec commit_arguments[] = {
    {text, "comment", "A remark for the history and for mgmtd's log"},
    {number, "confirm",
     "Undo the commit after so many seconds (1 to 86400) unless it is confirmed"},
};

constexpr ArgumentSpec diff_arguments[] = {
    {optional, "from", "A commit: what has changed since"},
    {optional, "to", "Another commit, to which the changes are listed"},
};

constexpr ArgumentSpec history_arguments[] = {
    {number, "limit", "How many commits to list (20)"},
};

constexpr ArgumentSpec show_commit_arguments[] = {
    {positional, "number", "The commit's number"},
};

constexpr ArgumentSpec rollback_arguments[] = {
    {positional, "number", "The number of a commit in the history"},
    {text, "comment", "A remark for the history and for mgmtd's log"},
    {number, "confirm",
     "Undo the rollback after so many seconds (1 to 86400) unless it is confirmed"},
};

constexpr ArgumentSpec tunnel_arguments[] = {
    {text, "name", "The tunnel of this name"},
    {text, "alias", "The tunnel of this alias"},
    {text, "id", "The tunnel of this ID"},
};

constexpr ArgumentSpec acl_arguments[] = {
    {positional, "name", "The ACL's name"},
};

constexpr ArgumentSpec references_arguments[] = {
    {flag, "check", "Compare them with the maps; exit code 1 when they differ"},
};

json no_arguments(const Arguments &)
{
    return json::object();
}

json get_request(const Arguments &arguments)
{
    return {{"name", checked_utf8(arguments.at("name"), "NAME")},
            {"subtree", arguments.contains("subtree")},
            {"from", arguments.contains("candidate") ? "candidate" : "running"}};
}

json set_request(const Arguments &arguments)
{
    return {{"name", checked_utf8(arguments.at("name"), "NAME")},
            {"type", checked_utf8(arguments.at("type"), "TYPE")},
            {"value", checked_utf8(arguments.at("value"), "VALUE")}};
}

json delete_request(const Arguments &arguments)
{
    return {{"name", checked_utf8(arguments.at("name"), "NAME")}};
}

json enable_request(const Arguments &arguments)
{
    return {{"name", checked_utf8(arguments.at("name"), "NAME")}, {"enabled", true}};
}

json disable_request(const Arguments &arguments)
{
    return {{"name", checked_utf8(arguments.at("name"), "NAME")}, {"enabled", false}};
}

json alarm_request(const Arguments &arguments)
{
    return {{"text", checked_utf8(arguments.at("text"), "the alarm")}};
}

json load_request(const Arguments &arguments)
{
    const std::string &file = arguments.at("file");
    return {{"text", read_text(file)}, {"source", file == "-" ? "standard input" : file}};
}

/// What the commands that commit have in common.
json commit_request(const Arguments &arguments)
{
    json request = json::object();
    if (const auto comment = arguments.find("comment"); comment != arguments.end()) {
        request["comment"] = checked_utf8(comment->second, "the comment");
    }
    if (const auto confirm = arguments.find("confirm"); confirm != arguments.end()) {
        request["confirm"] =
            checked_number(confirm->second, "--confirm", {1, longest_confirmation});
    }
    return request;
}

json upgrade_request(const Arguments &arguments)
{
    json request = load_request(arguments);
    request.update(commit_request(arguments));
    return request;
}

json rollback_request(const Arguments &arguments)
{
    json request = commit_request(arguments);
    request["number"] = checked_number(arguments.at("number"), "the commit");
    return request;
}

json diff_request(const Arguments &arguments)
{
    json request = json::object();
    if (const auto from = arguments.find("from"); from != arguments.end()) {
        request["after"] = checked_number(from->second, "FROM");
    }
    if (const auto to = arguments.find("to"); to != arguments.end()) {
        request["to"] = checked_number(to->second, "TO");
    }
    return request;
}

json history_request(const Arguments &arguments)
{
    const auto limit = arguments.find("limit");
    if (limit == arguments.end()) {
        return json::object();
    }
    return {{"limit", checked_number(limit->second, "--limit", {.first = 1})}};
}

json show_commit_request(const Arguments &arguments)
{
    return {{"what", "commit"}, {"number", checked_number(arguments.at("number"), "the commit")}};
}

json show_mode_request(const Arguments &)
{
    return {{"what", "mode"}};
}

json show_tunnels_request(const Arguments &)
{
    return {{"what", "tunnels"}};
}

json show_tunnel_tables_request(const Arguments &)
{
    return {{"what", "tunnel-tables"}};
}

json show_tunnel_request(const Arguments &arguments)
{
    if (arguments.size() != 1) {
        throw UsageError("give one of --name, --alias and --id");
    }
    const auto &[key, value] = *arguments.begin();
    // A request has an "id" of its own.
    if (key == "id") {
        return {{"what", "tunnel"}, {"tunnel_id", checked_number(value, "the ID")}};
    }
    return {{"what", "tunnel"}, {key, checked_utf8(value, "the " + key)}};
}

json show_interfaces_request(const Arguments &)
{
    return {{"what", "interfaces"}};
}

json show_budget_request(const Arguments &)
{
    return {{"what", "budget"}};
}

json show_maps_request(const Arguments &)
{
    return {{"what", "maps"}};
}

json show_acl_request(const Arguments &arguments)
{
    return {{"what", "acl"}, {"name", checked_utf8(arguments.at("name"), "NAME")}};
}

json show_references_request(const Arguments &arguments)
{
    return {{"what", "references"}, {"check", arguments.contains("check")}};
}

constexpr Command table[] = {
    {"get", "Print nodes as lines NAME TYPE VALUE", "ovctl get /ov/tunneld/system/config/mode",
     get_arguments, "get", get_request, render_nodes, "the query"},
    {"set", "Set a node in the candidate", "ovctl set /ov/tunneld/system/config/mode string router",
     set_arguments, "set", set_request, render_nothing, "the change"},
    {"delete", "Remove a node and everything below it from the candidate",
     "ovctl delete /ov/tunneld/system/config/mode", delete_arguments, "delete", delete_request,
     render_nothing, "the change"},
    {"clear", "Remove everything below a node from the candidate, and keep the node",
     "ovctl clear /ov/iflabels/config/lan", clear_arguments, "clear", delete_request, render_clear,
     "the change"},
    {"enable", "Set an interface's enable flag in the candidate", "ovctl enable eth0",
     enable_arguments, "enable", enable_request, render_nothing, "the change"},
    {"disable", "Take back an interface's enable flag in the candidate", "ovctl disable eth0",
     enable_arguments, "enable", disable_request, render_nothing, "the change"},
    {"load", "Apply the lines of a file to the candidate, all or none",
     "ovctl load site.db && ovctl commit", load_arguments, "load", load_request, render_load,
     "the file"},
    {"check",
     "Try the commit of the candidate without doing it",
     "ovctl check",
     {},
     "check",
     no_arguments,
     render_check,
     "the candidate"},
    {"commit", "Make the candidate the running configuration",
     "ovctl commit --comment \"router mode for the new site\"", commit_arguments, "commit",
     commit_request, render_commit, "the commit"},
    {"diff", "List what the candidate, or commits, change: + added, - removed, ~ modified",
     "ovctl diff 3 5", diff_arguments, "diff", diff_request, render_diff, "the query"},
    {"history", "List the last commits, the newest first", "ovctl history --limit 5",
     history_arguments, "history", history_request, render_history, "the query"},
    {"rollback", "Commit the configuration as it was after an earlier commit",
     "ovctl rollback 3 --confirm 60", rollback_arguments, "rollback", rollback_request,
     render_commit, "the rollback"},
    {"confirm",
     "Keep the commits that would be undone",
     "ovctl confirm",
     {},
     "confirm",
     no_arguments,
     render_confirmation,
     "the confirmation"},
    {"discard",
     "Drop the changes of the candidate",
     "ovctl discard",
     {},
     "discard",
     no_arguments,
     render_discard,
     "the change"},
    {"upgrade",
     "Convert a legacy configuration, show what changes, and commit it if all of it could be "
     "converted",
     "ovctl upgrade legacy.db", upgrade_arguments, "upgrade", upgrade_request, render_upgrade,
     "the file"},
    {"watch",
     "Print each commit as it is stored, until interrupted; with --json one event a line",
     "ovctl watch",
     {},
     "watch",
     no_arguments,
     render_event,
     "the query",
     nullptr,
     true},
    {"alarm", "Append a line to the alarms of software upgrades",
     "ovctl alarm \"restart the appliance\"", alarm_arguments, "alarm", alarm_request,
     render_nothing, "the alarm"},
    {"status",
     "Print facts about the daemon",
     "ovctl status",
     {},
     "status",
     no_arguments,
     render_status,
     "the query"},
    {"show commit", "Print a commit of the history with its changes", "ovctl show commit 3",
     show_commit_arguments, "show", show_commit_request, render_recorded_commit, "the query"},
    {"show mode",
     "Print the deployment mode and what follows from it",
     "ovctl show mode",
     {},
     "show",
     show_mode_request,
     render_mode,
     "the query"},
    {"show tunnels",
     "List all tunnels with their IDs, in the order of their names",
     "ovctl show tunnels",
     {},
     "show",
     show_tunnels_request,
     render_tunnels,
     "the query"},
    {"show tunnel", "Find a tunnel by its name, its alias or its ID",
     "ovctl show tunnel --alias hq", tunnel_arguments, "show", show_tunnel_request, render_tunnel,
     "the query"},
    {"show tunnel-tables",
     "Print how full the tables of tunnel names, aliases and IDs are",
     "ovctl show tunnel-tables",
     {},
     "show",
     show_tunnel_tables_request,
     render_tunnel_tables,
     "the query"},
    {"show interfaces",
     "List all interfaces, whether they are enabled, and who uses them",
     "ovctl show interfaces",
     {},
     "show",
     show_interfaces_request,
     render_interfaces,
     "the query"},
    {"show budget",
     "Print how many VLAN and tunnel interfaces there are, and how many more fit",
     "ovctl show budget",
     {},
     "show",
     show_budget_request,
     render_budget,
     "the query"},
    {"show maps",
     "List the entries of all maps with what they match",
     "ovctl show maps",
     {},
     "show",
     show_maps_request,
     render_maps,
     "the query"},
    {"show acl", "Print an ACL's entries and the map entries that refer to it",
     "ovctl show acl web", acl_arguments, "show", show_acl_request, render_acl, "the query"},
    {"show references", "List the references from ACLs to the map entries that name them",
     "ovctl show references --check", references_arguments, "show", show_references_request,
     render_references, "the query", has_reference_faults},
};

} // namespace

std::span<const Command> commands()
{
    return table;
}

const char *group_help(const std::string &group)
{
    return group == "show" ? "Print what the running configuration amounts to" : "";
}

} // namespace ovhost
