// jsond: writes each event of mgmtd as one JSON line. This file reads the command line; peer.h does
// the work.

#include "host/jsond/peer.h"
#include "host/support/command_line.h"
#include "host/support/signal_pipe.h"
#include "host/support/standard_fds.h"
#include "host/support/version.h"

#include <csignal>
#include <iostream>

namespace
{

constexpr int exit_usage = 2;

constexpr const char *footer = "Exit codes: 0 ended by SIGTERM or SIGINT, 1 mgmtd or the output "
                               "failed, 2 usage.\n\n"
                               "Example:\n"
                               "  jsond --retry --output /var/log/mgmtd-events.jsonl";

void report(const std::string &message)
{
    std::cerr << "jsond: " << message << std::endl;
}

int work(const ovhost::JsondOptions &options)
{
    using std::chrono::milliseconds;
    std::signal(SIGPIPE, SIG_IGN);
    const ovhost::SignalPipe stop;
    ovhost::EventWriter writer(options.output, stop.fd());
    ovhost::JsondPeer peer(options, stop.fd(), writer,
                           ovhost::Backoff(milliseconds(100), milliseconds(5000)), report);
    return peer.run();
}

int run(int argc, char **argv, bool has_standard_output)
{
    ovhost::JsondOptions options{.socket = "/run/mgmtd/control.sock", .output = {}, .retry = false};
    CLI::App app("Registers with mgmtd as the peer \"jsond\" and writes each event as a JSON line.",
                 "jsond");
    app.footer(footer);
    app.set_version_flag("--version", ovhost::program_version());
    app.add_option("--socket", options.socket, "The control socket of mgmtd")
        ->check(ovhost::not_empty())
        ->capture_default_str();
    app.add_option("--output", options.output,
                   "The file events are appended to (standard output when not given)")
        ->check(ovhost::not_empty());
    app.add_flag("--retry", options.retry, "Wait for mgmtd, and come back when it went away");
    try {
        app.parse(argc, argv);
    } catch (const CLI::ParseError &error) {
        return app.exit(error) == 0 ? 0 : exit_usage;
    }
    if (options.output.empty() && !has_standard_output) {
        report("standard output is closed: give a file with --output");
        return exit_usage;
    }
    return work(options);
}

} // namespace

int main(int argc, char **argv)
{
    const ovhost::StandardFds were_open = ovhost::fill_standard_fds();
    try {
        return run(argc, argv, were_open.output);
    } catch (const std::exception &error) {
        report(error.what());
        return 1;
    }
}
