#include "host/ovctl/run.h"

#include "host/control/client.h"
#include "host/control/message.h"
#include "host/ovctl/follow.h"
#include "host/ovctl/progress.h"
#include "host/ovctl/render_error.h"
#include "host/ovctl/terminal.h"
#include "host/ovctl/text_input.h"
#include "host/support/printable.h"

#include <nlohmann/json.hpp>

#include <ostream>

namespace ovhost
{

using nlohmann::json;

namespace
{

/// What ends a command without an answer of mgmtd: its exit code, and the code --json prints.
struct Failure {
    ExitCode exit;
    const char *code;
};

Failure failure_of(ClientError::Kind kind)
{
    if (kind == ClientError::Kind::protocol) {
        return {ExitCode::protocol, "protocol"};
    }
    if (kind == ClientError::Kind::timeout) {
        return {ExitCode::unreachable, "timeout"};
    }
    return {ExitCode::unreachable, "unreachable"};
}

ExitCode report(const Failure &failure, const std::string &message, const Options &options,
                std::ostream &out, std::ostream &err)
{
    if (options.json) {
        render_error_json(RequestError(failure.code, message), out);
    } else {
        err << styled(err, Style::error, "ovctl:") << ' ' << message << '\n';
    }
    return failure.exit;
}

/// The file that a command sends, by the name the user gave it; empty when it sends none.
std::string file_of(const Invocation &invocation)
{
    const auto file = invocation.arguments.find("file");
    if (file == invocation.arguments.end()) {
        return {};
    }
    return file->second == "-" ? "standard input" : file->second;
}

json call_mgmtd(ControlClient &client, const Invocation &invocation, const json &arguments,
                std::ostream &err)
{
    const char *const request = invocation.command->request;
    const std::string file = file_of(invocation);
    // Other requests are short.
    if (file.empty()) {
        return client.call(request, arguments);
    }
    ProgressLine line(err, file);
    client.on_progress([&line](const CallProgress &progress) { line.update(progress); });
    json result = client.call(request, arguments);
    client.on_progress({});
    return result;
}

ExitCode ask_and_print(const Invocation &invocation, std::ostream &out, std::ostream &err)
{
    const Command &command = *invocation.command;
    const json arguments = command.build(invocation.arguments);
    const std::chrono::duration<double> patience(invocation.options.timeout_seconds);
    ControlClient client(invocation.options.socket,
                         std::chrono::ceil<std::chrono::milliseconds>(patience));
    if (command.follows) {
        return follow_events(client, command, arguments, invocation.options.json, out);
    }
    const json result = call_mgmtd(client, invocation, arguments, err);
    if (invocation.options.json) {
        out << to_line({{"ok", true}, {"result", result}});
    } else {
        command.render(result, out);
    }
    return command.is_bad != nullptr && command.is_bad(result) ? ExitCode::refused : ExitCode::ok;
}

/// What is refused, with the file by the name that the user gave it.
std::string subject_of(const Invocation &invocation)
{
    const auto file = invocation.arguments.find("file");
    const std::string subject = invocation.command->subject;
    const bool is_named = file != invocation.arguments.end() && file->second != "-";
    return is_named ? subject + " " + printable(file->second) : subject;
}

} // namespace

ExitCode run_command(const Invocation &invocation, std::ostream &out, std::ostream &err)
{
    const Options &options = invocation.options;
    const auto fail = [&](const Failure &failure, const std::string &message) {
        return report(failure, message, options, out, err);
    };
    try {
        return ask_and_print(invocation, out, err);
    } catch (const RequestError &refusal) {
        if (options.json) {
            render_error_json(refusal, out);
        } else {
            render_refusal(refusal, subject_of(invocation), err);
        }
        return ExitCode::refused;
    } catch (const ClientError &error) {
        return fail(failure_of(error.kind()), error.what());
    } catch (const UsageError &error) {
        return fail({ExitCode::usage, "usage"}, error.what());
    } catch (const json::exception &error) {
        return fail({ExitCode::protocol, "protocol"},
                    std::string("mgmtd's answer lacks something: ") + error.what());
    } catch (const std::exception &error) {
        return fail({ExitCode::usage, "usage"}, error.what());
    }
}

} // namespace ovhost
