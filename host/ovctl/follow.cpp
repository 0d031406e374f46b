#include "host/ovctl/follow.h"

#include "host/control/client.h"
#include "host/control/message.h"
#include "host/ovctl/command_table.h"
#include "host/ovctl/terminal.h"
#include "host/support/patient_write.h"
#include "host/support/signal_pipe.h"

#include <nlohmann/json.hpp>
#include <unistd.h>

#include <optional>
#include <sstream>
#include <system_error>

namespace ovhost
{

using nlohmann::json;

namespace
{

std::string text_of_event(const json &event, const Command &command, bool as_json,
                          std::ostream &out)
{
    if (as_json) {
        return to_line(event);
    }
    std::ostringstream text;
    set_terminal(text, terminal_of(out));
    command.render(event, text);
    return text.str();
}

/// Nothing when the user or mgmtd has ended it.
std::optional<json> next_event(ControlClient &client)
try {
    constexpr std::chrono::hours no_hurry(1);
    for (;;) {
        auto event = client.read_event(no_hurry);
        if (event || client.is_woken()) {
            return event;
        }
    }
} catch (const ClientError &error) {
    if (error.kind() != ClientError::Kind::stopping) {
        throw;
    }
    return std::nullopt;
}

/// False when a signal came first.
bool is_answered(ControlClient &client, const Command &command, const json &arguments)
try {
    (void)client.call(command.request, arguments);
    return true;
} catch (const ClientError &) {
    if (!client.is_woken()) {
        throw;
    }
    return false;
}

bool print(const std::string &text, int stop_fd)
{
    try {
        return write_unless_stopped(STDOUT_FILENO, text, stop_fd);
    } catch (const std::system_error &error) {
        throw std::runtime_error("cannot write to standard output: " + error.code().message());
    }
}

} // namespace

ExitCode follow_events(ControlClient &client, const Command &command, const json &arguments,
                       bool as_json, std::ostream &out)
{
    const SignalPipe stop;
    client.wake_on(stop.fd());
    if (!is_answered(client, command, arguments)) {
        return ExitCode::ok;
    }
    while (const std::optional<json> event = next_event(client)) {
        if (!print(text_of_event(*event, command, as_json, out), stop.fd())) {
            break;
        }
    }
    return ExitCode::ok;
}

} // namespace ovhost
