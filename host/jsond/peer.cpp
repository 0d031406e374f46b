#include "host/jsond/peer.h"

#include "host/control/client.h"

#include <nlohmann/json.hpp>
#include <poll.h>

#include <cerrno>
#include <optional>

namespace ovhost
{

using nlohmann::json;

JsondPeer::JsondPeer(JsondOptions options, int stop_fd, EventWriter &writer, Backoff backoff,
                     Report report)
    : options_(std::move(options)), stop_fd_(stop_fd), writer_(writer), backoff_(backoff),
      report_(std::move(report))
{
}

int JsondPeer::run()
{
    for (;;) {
        const End end = serve_one_connection();
        if (end == End::stopped) {
            return 0;
        }
        if (end == End::replaced || !options_.retry) {
            return 1;
        }
        if (!pause()) {
            return 0;
        }
    }
}

JsondPeer::End JsondPeer::serve_one_connection()
try {
    constexpr std::chrono::seconds patience(10);
    ControlClient client(options_.socket, patience);
    client.wake_on(stop_fd_);
    static_cast<void>(client.call("hello", {{"peer", "jsond"}}));
    backoff_.reset();
    reported_.clear();
    report_("registered with mgmtd at " + options_.socket);

    constexpr std::chrono::hours no_hurry(1);
    for (;;) {
        const std::optional<json> event = client.read_event(no_hurry);
        if (event && !writer_.write(*event)) {
            return End::stopped;
        }
        if (!event && stop_wanted(0)) {
            return End::stopped;
        }
    }
} catch (const RequestError &refusal) {
    report_once(std::string("mgmtd does not take jsond as a peer: ") + refusal.what());
    return End::lost;
} catch (const ClientError &error) {
    // A stop also ends the wait for the answer to the hello.
    if (stop_wanted(0)) {
        return End::stopped;
    }
    if (error.kind() == ClientError::Kind::replaced) {
        report_(error.what());
        return End::replaced;
    }
    report_once(error.what());
    return End::lost;
}

/// While mgmtd is away every try fails the same way: that is said once.
void JsondPeer::report_once(const std::string &message)
{
    if (message == reported_) {
        return;
    }
    reported_ = message;
    report_(options_.retry ? message : message + " (--retry keeps trying)");
}

/// False when told to stop meanwhile.
bool JsondPeer::pause()
{
    return !stop_wanted(static_cast<int>(backoff_.next().count()));
}

bool JsondPeer::stop_wanted(int milliseconds) const
{
    pollfd watched{.fd = stop_fd_, .events = POLLIN, .revents = 0};
    return ::poll(&watched, 1, milliseconds) > 0;
}

} // namespace ovhost
