#include "host/mgmtd/options.h"

#include "host/framework/log_config.h"

#include <CLI/CLI.hpp>

namespace ovhost
{
namespace
{

/// A log level by its word or number.
std::string level_fault(const std::string &text)
{
    return parse_log_level(text) ? ""
                                 : "\"" + text +
                                       "\" is not a log level: use error, warning, notice, info, "
                                       "debug or a number from 3 to 7";
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
    app.set_version_flag("--version", OVMD_VERSION);
    app.add_option("--state-dir", options.state_dir, "Folder of the durable configuration")
        ->capture_default_str();
    app.add_option("--socket", options.socket, "Control socket")->capture_default_str();
    app.add_option("--model", options.model,
                   "Model of the appliance: names its default file, defdb.conf.MODEL");
    app.add_option("--root", options.root,
                   "Run in a private mount namespace with /opt/orvale and /var/opt/tms below DIR");
    app.add_option("--peer-buffer", options.peer_buffer_mib,
                   "MiB of events that may wait for a peer before it is disconnected")
        ->check(CLI::Range(1, 4096))
        ->capture_default_str();
    add_level(app, "--log-level", options.log_level, "Lines up to this level are logged (notice)");
    add_level(app, "--module-log-level", options.module_log_level,
              "Level at which the library's interface count manager logs (info)");
    try {
        app.parse(argc, argv);
    } catch (const CLI::ParseError &fault) {
        const int code = app.exit(fault);
        ret_exit_code = code == 0 ? 0 : 2;
        return std::nullopt;
    }
    return options;
}

} // namespace ovhost
