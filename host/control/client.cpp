#include "host/control/client.h"

#include "host/control/message.h"
#include "host/control/socket_address.h"

#include <nlohmann/json.hpp>
#include <poll.h>
#include <sys/socket.h>

#include <algorithm>
#include <array>
#include <cerrno>
#include <climits>
#include <cstring>
#include <thread>

namespace ovhost
{

using nlohmann::json;
using std::chrono::steady_clock;
using Kind = ClientError::Kind;

namespace
{

// Answers are as long as the configuration is large; a daemon is trusted this far.
constexpr std::size_t longest_answer = std::size_t{1} << 30;

struct ConnectHint {
    int error;
    const char *text;
};

constexpr ConnectHint connect_hints[] = {
    {ENOENT, "; is mgmtd running, and is this its --socket?"},
    {ECONNREFUSED, "; no mgmtd listens there: start it"},
    {EACCES,
     "; run this as the user that mgmtd runs as, as root, or as a member of mgmtd's --group"},
    {EAGAIN, "; mgmtd is there but takes no connections: try again later"},
};

[[noreturn]] void fail_to_connect(const std::string &path, int error)
{
    const auto *const hint =
        std::find_if(std::begin(connect_hints), std::end(connect_hints),
                     [error](const ConnectHint &row) { return row.error == error; });
    throw ClientError(Kind::unreachable, "cannot connect to " + path + ": " + std::strerror(error) +
                                             (hint == std::end(connect_hints) ? "" : hint->text));
}

int milliseconds_left(steady_clock::time_point deadline)
{
    const auto left =
        std::chrono::ceil<std::chrono::milliseconds>(deadline - steady_clock::now()).count();
    return static_cast<int>(std::clamp<decltype(left)>(left, 0, INT_MAX));
}

std::string in_seconds(std::chrono::milliseconds span)
{
    const auto count = span.count();
    return count % 1000 == 0 ? std::to_string(count / 1000) + " s" : std::to_string(count) + " ms";
}

[[noreturn]] void fail_answer(const std::string &what)
{
    throw ClientError(Kind::protocol, "mgmtd sent something that is not of the protocol: " + what);
}

Kind kind_of(const json &goodbye)
{
    if (goodbye == goodbye_code::replaced) {
        return Kind::replaced;
    }
    return goodbye == goodbye_code::stopping ? Kind::stopping : Kind::closed;
}

} // namespace

ControlClient::ControlClient(const std::string &path, Milliseconds patience)
    : patience_(patience), input_(longest_answer)
{
    connect(path);
}

ControlClient::~ControlClient() = default;

void ControlClient::connect(const std::string &path)
{
    const sockaddr_un address = socket_address(path);
    const auto deadline = steady_clock::now() + patience_;
    fd_ = new_socket();
    while (::connect(fd_.get(), reinterpret_cast<const sockaddr *>(&address), sizeof(address)) !=
           0) {
        // The queue of new connections is full: a busy daemon empties it.
        if (errno != EAGAIN || steady_clock::now() >= deadline) {
            fail_to_connect(path, errno);
        }
        std::this_thread::sleep_for(Milliseconds(10));
    }
}

json ControlClient::call(const std::string &command)
{
    return call(command, json::object());
}

json ControlClient::call(const std::string &command, const json &arguments)
{
    json request = arguments;
    request["id"] = ++last_id_;
    request["command"] = command;
    std::string line = to_line(request);
    line.pop_back();
    try {
        send_line(line);
    } catch (const ClientError &error) {
        // The daemon may have said why it closed before all was sent: that answer is read below.
        if (error.kind() != Kind::closed) {
            throw;
        }
    }
    return await_answer(command, last_id_);
}

json ControlClient::await_answer(const std::string &command, long id)
{
    const auto deadline = steady_clock::now() + patience_;
    for (;;) {
        const auto line = read_line_until(deadline);
        if (!line) {
            throw ClientError(Kind::timeout, "mgmtd did not answer \"" + command + "\" within " +
                                                 in_seconds(patience_) +
                                                 "; it may still be at work on it");
        }
        const auto answer = take_message(*line);
        if (!answer) {
            continue;
        }
        // An id of null: the request was so broken that its id could not be read.
        const json answered = answer->value("id", json());
        if (!answered.is_null() && answered != id) {
            fail_answer("an answer to request " + answered.dump() + ", request " +
                        std::to_string(id) + " is waiting");
        }
        if (answer->value("ok", false)) {
            return answer->at("result");
        }
        throw error_from_json(answer->at("error"));
    }
}

std::optional<json> ControlClient::read_event(Milliseconds timeout)
{
    const auto deadline = steady_clock::now() + timeout;
    while (events_.empty()) {
        const auto line = read_line_until(deadline);
        if (!line) {
            return std::nullopt;
        }
        if (take_message(*line)) {
            fail_answer("an answer to a request that was not made");
        }
    }
    json event = std::move(events_.front());
    events_.pop_front();
    return event;
}

/// Keeps events and goodbyes; what is returned is an answer.
std::optional<json> ControlClient::take_message(const std::string &line)
try {
    json message = parse_line(line);
    if (message.contains("event")) {
        events_.push_back(std::move(message["event"]));
        return std::nullopt;
    }
    if (message.contains("goodbye")) {
        const json &goodbye = message["goodbye"];
        goodbye_ =
            ClientError(kind_of(goodbye.at("code")),
                        "mgmtd closed the connection: " + goodbye.at("message").get<std::string>());
        return std::nullopt;
    }
    const json &verdict = message.at("ok");
    if (!verdict.is_boolean() || !message.at(verdict ? "result" : "error").is_object()) {
        fail_answer("an answer that lacks its \"result\" or \"error\"");
    }
    if (!verdict) {
        static_cast<void>(error_from_json(message["error"]));
    }
    return message;
} catch (const RequestError &fault) {
    fail_answer(fault.what());
} catch (const json::exception &fault) {
    fail_answer(fault.what());
}

std::optional<std::string> ControlClient::read_line(Milliseconds timeout)
{
    return read_line_until(steady_clock::now() + timeout);
}

std::optional<std::string> ControlClient::read_line_until(Deadline deadline)
{
    for (;;) {
        if (const auto line = input_.next()) {
            return std::string(*line);
        }
        if (input_.too_long()) {
            fail_answer("a line longer than " + std::to_string(longest_answer) + " bytes");
        }
        std::array<pollfd, 2> watched{{{.fd = fd_.get(), .events = POLLIN, .revents = 0},
                                       // poll() passes over a negative descriptor.
                                       {.fd = wake_fd_, .events = POLLIN, .revents = 0}}};
        const int ready = ::poll(watched.data(), watched.size(), patience_of_poll(deadline));
        if (watched[1].revents != 0 || (ready == 0 && steady_clock::now() >= deadline)) {
            return std::nullopt;
        }
        tell_progress(told_.sent, told_.total);
        if (ready > 0) {
            receive_piece();
        } else if (ready < 0 && errno != EINTR) {
            throw ClientError(Kind::closed,
                              std::string("cannot wait for mgmtd: ") + std::strerror(errno));
        }
    }
}

void ControlClient::receive_piece()
{
    std::array<char, 65536> piece;
    const ssize_t got = ::recv(fd_.get(), piece.data(), piece.size(), 0);
    if (got > 0) {
        input_.feed({piece.data(), static_cast<std::size_t>(got)});
        return;
    }
    if (got < 0 && (errno == EAGAIN || errno == EINTR)) {
        return;
    }
    if (goodbye_) {
        throw ClientError(*goodbye_);
    }
    throw ClientError(Kind::closed, "mgmtd closed the connection");
}

void ControlClient::send_line(std::string_view text)
{
    std::string line(text);
    line += '\n';
    const auto deadline = steady_clock::now() + patience_;
    std::size_t sent = 0;
    while (sent < line.size()) {
        const ssize_t taken =
            ::send(fd_.get(), line.data() + sent, line.size() - sent, MSG_NOSIGNAL);
        if (taken >= 0) {
            sent += static_cast<std::size_t>(taken);
            continue;
        }
        if (errno != EAGAIN && errno != EINTR) {
            throw ClientError(Kind::closed,
                              std::string("mgmtd closed the connection: ") + std::strerror(errno));
        }
        tell_progress(sent, line.size());
        pollfd watched{.fd = fd_.get(), .events = POLLOUT, .revents = 0};
        if (::poll(&watched, 1, patience_of_poll(deadline)) == 0 &&
            steady_clock::now() >= deadline) {
            throw ClientError(Kind::timeout,
                              "mgmtd did not take the request within " + in_seconds(patience_));
        }
    }
    tell_progress(line.size(), line.size());
}

void ControlClient::tell_progress(std::size_t sent, std::size_t total)
{
    told_ = {.sent = sent, .total = total};
    if (progress_) {
        progress_(told_);
    }
}

bool ControlClient::is_woken() const
{
    pollfd watched{.fd = wake_fd_, .events = POLLIN, .revents = 0};
    return ::poll(&watched, 1, 0) > 0;
}

/// Short waits when there is somebody to tell.
int ControlClient::patience_of_poll(Deadline deadline) const
{
    constexpr int between_two_tellings = 100;
    const int left = milliseconds_left(deadline);
    return progress_ ? std::min(left, between_two_tellings) : left;
}

void ControlClient::shut_down_writing()
{
    ::shutdown(fd_.get(), SHUT_WR);
}

} // namespace ovhost
