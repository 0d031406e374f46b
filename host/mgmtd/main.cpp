// The management daemon: puts the parts together, runs until a signal ends it.

#include "framework/logging.h"
#include "host/control/event_loop.h"
#include "host/control/server.h"
#include "host/framework/appliance_config.h"
#include "host/framework/log_config.h"
#include "host/mgmtd/commit_watch.h"
#include "host/mgmtd/configuration.h"
#include "host/mgmtd/daemon_log.h"
#include "host/mgmtd/options.h"
#include "host/mgmtd/peer_sessions.h"
#include "host/mgmtd/private_root.h"
#include "host/mgmtd/requests.h"
#include "host/mgmtd/undo_timer.h"
#include "host/support/standard_fds.h"
#include "host/support/user_name.h"

#include <nlohmann/json.hpp>

#include <csignal>
#include <cstdio>
#include <optional>
#include <stdexcept>
#include <string>

namespace
{

using namespace ovhost;

void log_control_line(ControlLogLevel level, const std::string &text)
{
    constexpr int levels[] = {ov_log_error, ov_log_warning, ov_log_info, ov_log_debug};
    log_host_line(levels[static_cast<int>(level)], "control", text);
}

/// The group whose members may use the socket beside this user and root.
std::optional<gid_t> group_of(const DaemonOptions &options)
{
    if (options.group.empty()) {
        return std::nullopt;
    }
    const std::optional<gid_t> group = find_group(options.group);
    if (!group) {
        throw std::runtime_error("there is no group \"" + options.group +
                                 "\": make it (groupadd), or choose another --group");
    }
    return group;
}

void run(const DaemonOptions &options)
{
    G_daemon_log_level = static_cast<signed char>(options.log_level);
    ov_log_module_levels[ov_log_module_ovmd] = static_cast<unsigned char>(options.module_log_level);
    if (!options.root.empty()) {
        enter_private_root(options.root);
    }
    set_config_name(options.model);

    // A file that may not grow is a failing write, which refuses a commit.
    std::signal(SIGXFSZ, SIG_IGN);

    Configuration configuration(options.state_dir, options.history);
    std::optional<PeerSessions> sessions;
    std::optional<CommitWatch> watch;
    ControlServer *server_view = nullptr;
    EventLoop loop;
    loop.stop_on_signals();
    UndoTimer undo_timer(
        loop, [&configuration] { return configuration.confirmations().time_left(); },
        [&] {
            sessions->update();
            configuration.undo_if_due();
            watch->update();
        });
    Requests requests(configuration, {[&server_view] { return server_view->peers(); },
                                      [&sessions] { sessions->update(); },
                                      [&undo_timer, &watch] {
                                          undo_timer.set();
                                          watch->update();
                                      }});
    ServerLimits limits;
    limits.max_events_waiting = std::size_t{options.peer_buffer_mib} << 20;
    ControlServer server(loop, options.socket, limits, requests, log_control_line,
                         AccessPolicy(group_of(options)));
    server_view = &server;
    sessions.emplace(server);

    // The socket is ours before anything is built: a second daemon must not get that far.
    configuration.start();
    watch.emplace(configuration, CommitWatch::Watchers{[&server] { return server.has_watchers(); },
                                                       [&server](const nlohmann::json &event) {
                                                           server.report(event);
                                                       }});
    undo_timer.set();
    log_line(ov_log_notice, "ready on " + options.socket);
    const int signal = loop.run();
    log_line(ov_log_notice, "stopping on signal " + std::to_string(signal));
    sessions.reset();
}

} // namespace

int main(int argc, char **argv)
{
    ovhost::fill_standard_fds();
    int exit_code = 0;
    const auto options = parse_options(argc, argv, exit_code);
    if (!options) {
        return exit_code;
    }
    try {
        run(*options);
    } catch (const std::exception &fault) {
        std::fprintf(stderr, "mgmtd: %s\n", fault.what());
        return 1;
    }
    return 0;
}
