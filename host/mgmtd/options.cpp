#include "host/mgmtd/options.h"

#include "framework/logging.h"
#include "host/framework/log_config.h"
#include "host/modules/default_values.h"
#include "host/support/command_line.h"
#include "host/support/version.h"

#include <CLI/CLI.hpp>

namespace ovhost
{
namespace
{

constexpr const char *footer = "Runs in the foreground and logs to standard error until a signal "
                               "ends it.\n\n"
                               "Exit codes:\n"
                               "  0  ended by SIGTERM or SIGINT\n"
                               "  1  could not start; standard error says why\n"
                               "  2  the command line is wrong\n\n"
                               "Example:\n"
                               "  mgmtd --model branch-100 --group netadmin";

/// A log level by its word or number. Those graver than an error are not offered: nothing logs at
/// them, and a daemon that does not even tell its errors is of no use.
std::string level_fault(const std::string &text)
{
    const std::optional<int> level = parse_log_level(text);
    return level && *level >= ov_log_error
               ? ""
               : "\"" + text +
                     "\" is not a log level: use error, warning, notice, info, debug or a number "
                     "from 3 to 7";
}

std::string model_fault(const std::string &text)
{
    return model_name_fault(text).value_or("");
}

CLI::Option *add_level(CLI::App &app, const char *flag, int &level, const char *help)
{
    const auto store = [&level](const std::string &text) {
        level = parse_log_level(text).value_or(level);
    };
    return app.add_option_function<std::string>(flag, store, help)
        ->check(CLI::Validator(level_fault, "LEVEL"));
}

} // namespace

std::optional<DaemonOptions> parse_options(int argc, char **argv, int &ret_exit_code)
{
    DaemonOptions options;
    CLI::App app("The management daemon: keeps the configuration, checks and applies commits.",
                 "mgmtd");
    app.footer(footer);
    app.set_version_flag("--version", program_version());
    app.add_option("--state-dir", options.state_dir, "Folder of the durable configuration")
        ->check(not_empty())
        ->capture_default_str();
    app.add_option("--socket", options.socket, "Control socket")
        ->check(not_empty())
        ->capture_default_str();
    app.add_option("--group", options.group,
                   "Group whose members may use the control socket beside this user and root")
        ->check(not_empty());
    app.add_option("--model", options.model,
                   "Model of the appliance: names its default file, defdb.conf.MODEL")
        ->check(CLI::Validator(model_fault, ""));
    app.add_option("--root", options.root,
                   "Run in a private mount namespace with /opt/orvale and /var/opt/tms below DIR")
        ->check(not_empty());
    app.add_option("--peer-buffer", options.peer_buffer_mib,
                   "MiB of events that may wait for a peer before it is disconnected")
        ->check(CLI::Range(1, 4096))
        ->capture_default_str();
    app.add_option("--history", options.history.commits, "Commits that the history keeps")
        ->check(CLI::Range(1, 1000000))
        ->capture_default_str();
    std::uint64_t history_mib = options.history.bytes >> 20;
    app.add_option("--history-size", history_mib,
                   "MiB of names and values that the history keeps; the newest commit always stays")
        ->check(CLI::Range(1, 1048576))
        ->capture_default_str();
    add_level(app, "--log-level", options.log_level, "Lines up to this level are logged (notice)");
    add_level(app, "--module-log-level", options.module_log_level,
              "Level at which the library's interface count manager logs (info)");
    try {
        app.parse(argc, argv);
        options.history.bytes = history_mib << 20;
    } catch (const CLI::ParseError &fault) {
        const int code = app.exit(fault);
        ret_exit_code = code == 0 ? 0 : 2;
        return std::nullopt;
    }
    return options;
}

} // namespace ovhost
