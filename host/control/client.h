#pragma once
// The client's side of the control socket (docs/control-protocol.md): one connection that asks and
// waits for the answer, or waits for events. Used by ovctl, jsond and tests; server.h is the other
// side.

#include "host/control/framing.h"
#include "host/control/request_error.h"
#include "host/support/unique_fd.h"

#include <nlohmann/json_fwd.hpp>

#include <chrono>
#include <deque>
#include <functional>
#include <memory>
#include <optional>
#include <stdexcept>
#include <string>
#include <string_view>

namespace ovhost
{

/// Why there is no answer; an answer that refuses is a RequestError instead.
class ClientError : public std::runtime_error
{
  public:
    enum class Kind {
        unreachable, ///< no daemon behind the socket
        closed,      ///< the daemon ended the connection
        stopping,    ///< the daemon ended the connection because it stops
        replaced,    ///< the daemon gave this peer's name to a newer connection
        timeout,     ///< no answer in time
        protocol,    ///< what came is not of the protocol
    };

    ClientError(Kind kind, const std::string &message) : std::runtime_error(message), kind_(kind) {}

    [[nodiscard]] Kind kind() const { return kind_; }

  private:
    Kind kind_;
};

/// How far a call is. All is sent: the daemon is at work on it.
struct CallProgress {
    std::size_t sent = 0;
    std::size_t total = 0;
};

class ControlClient
{
  public:
    using Milliseconds = std::chrono::milliseconds;

    /// Connects. `patience` is how long connecting and each call may take. Throws ClientError
    /// "unreachable" with what to do, or std::runtime_error for an impossible path.
    explicit ControlClient(const std::string &path, Milliseconds patience = Milliseconds(120000));
    ~ControlClient();
    ControlClient(const ControlClient &) = delete;
    ControlClient &operator=(const ControlClient &) = delete;

    /// Sends a request and returns the "result" of its answer. `arguments` is an object whose
    /// members are added to the request. Throws RequestError when the daemon refuses, ClientError
    /// when there is no answer. Events that arrive meanwhile are kept for read_event().
    nlohmann::json call(const std::string &command, const nlohmann::json &arguments);
    nlohmann::json call(const std::string &command);

    /// The next event (what {"event": ...} holds), in the order sent. Nothing when none came in
    /// time, or when the descriptor given to wake_on() became readable. Throws ClientError when the
    /// connection is over.
    [[nodiscard]] std::optional<nlohmann::json> read_event(Milliseconds timeout);

    /// Lets a readable descriptor (a signal's, say) end read_event() early. It is not read from.
    void wake_on(int fd) { wake_fd_ = fd; }

    /// Whether that descriptor is readable.
    [[nodiscard]] bool is_woken() const;

    /// Has `tell` called several times a second while a call is under way.
    void on_progress(std::function<void(const CallProgress &)> tell)
    {
        progress_ = std::move(tell);
    }

    /// For tools and tests that speak the protocol themselves. read_line() gives nothing in case of
    /// a timeout or a wake-up, and throws ClientError "closed" at the end of the stream.
    void send_line(std::string_view text);
    [[nodiscard]] std::optional<std::string> read_line(Milliseconds timeout);
    void shut_down_writing();

  private:
    using Deadline = std::chrono::steady_clock::time_point;

    void connect(const std::string &path);
    nlohmann::json await_answer(const std::string &command, long id);
    std::optional<nlohmann::json> take_message(const std::string &line);
    std::optional<std::string> read_line_until(Deadline deadline);
    void receive_piece();
    void tell_progress(std::size_t sent, std::size_t total);
    [[nodiscard]] int patience_of_poll(Deadline deadline) const;

    UniqueFd fd_;
    int wake_fd_ = -1;
    Milliseconds patience_;
    std::function<void(const CallProgress &)> progress_;
    CallProgress told_;
    LineSplitter input_;
    std::deque<nlohmann::json> events_;
    // Why the daemon says it ends the connection, when it said so.
    std::optional<ClientError> goodbye_;
    long last_id_ = 0;
};

} // namespace ovhost
