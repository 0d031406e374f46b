#include "host/control/server.h"

#include "host/control/arguments.h"
#include "host/control/message.h"
#include "host/support/user_name.h"

#include <event2/event.h>
#include <event2/listener.h>
#include <nlohmann/json.hpp>

#include <algorithm>
#include <cerrno>
#include <cstring>
#include <stdexcept>

namespace ovhost
{

using nlohmann::json;

namespace
{

std::string describe(const ClientInfo &client)
{
    std::string text = "client " + std::to_string(client.number) + " (pid " +
                       std::to_string(client.pid) + ", uid " + std::to_string(client.uid);
    if (!client.peer.empty()) {
        text += ", peer " + client.peer;
    }
    return text + ")";
}

ClientInfo describe(const PeerCredentials &peer, std::uint64_t number)
{
    return {.number = number,
            .pid = peer.pid,
            .uid = peer.uid,
            .gid = peer.gid,
            .user = user_name(peer.uid),
            .peer = {}};
}

void check_peer_name(const std::string &name)
{
    constexpr std::size_t longest = 64;
    constexpr const char *allowed =
        "abcdefghijklmnopqrstuvwxyzABCDEFGHIJKLMNOPQRSTUVWXYZ0123456789._-";
    if (name.empty() || name.size() > longest ||
        name.find_first_not_of(allowed) != std::string::npos) {
        throw RequestError(error_code::bad_request,
                           "command \"hello\": \"peer\" must be 1 to 64 letters, digits, dots, "
                           "hyphens or underscores");
    }
}

} // namespace

void ControlServer::ListenerDeleter::operator()(evconnlistener *listener) const
{
    evconnlistener_free(listener);
}

ControlServer::ControlServer(EventLoop &loop, const std::string &socket_path,
                             const ServerLimits &limits, RequestHandler &handler, ControlLog log,
                             AccessPolicy access)
    : loop_(loop), limits_(limits), handler_(handler), log_(std::move(log)),
      access_(std::move(access)), socket_(socket_path, access_.group()),
      reap_event_(event_new(loop.base(), -1, 0, on_reap, this)),
      retry_accept_event_(evtimer_new(loop.base(), on_retry_accept, this)),
      // Backlog 0: the socket listens already.
      listener_(
          evconnlistener_new(loop.base(), on_accept, this, LEV_OPT_CLOSE_ON_EXEC, 0, socket_.fd()))
{
    if (!reap_event_ || !retry_accept_event_ || !listener_) {
        throw std::runtime_error("cannot add socket " + socket_path + " to the event loop");
    }
    evconnlistener_set_error_cb(listener_.get(), on_accept_error);
}

ControlServer::~ControlServer()
{
    listener_.reset();
    const std::string line = goodbye_line(goodbye_code::stopping, "mgmtd is stopping");
    // finish_with() may end a peer and take it out of the map.
    const auto peers = peers_;
    for (const auto &[name, peer] : peers) {
        peer.connection->finish_with(line);
    }
    const auto watchers = watchers_;
    for (const auto &[number, watcher] : watchers) {
        watcher->finish_with(line);
    }
}

void ControlServer::on_accept(evconnlistener *, int fd, sockaddr *, int, void *server)
{
    auto *self = static_cast<ControlServer *>(server);
    try {
        self->accept(UniqueFd(fd));
    } catch (const std::exception &fault) {
        self->log_(ControlLogLevel::error,
                   std::string("a client was turned away: ") + fault.what());
    }
}

/// Out of descriptors, most likely. The waiting client would make the listener readable again at
/// once, so that it is left alone for a while.
void ControlServer::on_accept_error(evconnlistener *listener, void *server)
{
    auto *self = static_cast<ControlServer *>(server);
    self->log_(ControlLogLevel::error, std::string("cannot accept a client: ") +
                                           std::strerror(errno) + "; trying again in 1 s");
    evconnlistener_disable(listener);
    const timeval pause{.tv_sec = 1, .tv_usec = 0};
    evtimer_add(self->retry_accept_event_.get(), &pause);
}

void ControlServer::on_retry_accept(int, short, void *server)
{
    evconnlistener_enable(static_cast<ControlServer *>(server)->listener_.get());
}

void ControlServer::on_reap(int, short, void *server)
{
    static_cast<ControlServer *>(server)->over_.clear();
}

void ControlServer::accept(UniqueFd fd)
{
    const std::uint64_t number = next_number_++;
    const PeerCredentials peer = credentials_of(fd.get());
    Connection::Owner &owner = *this;
    auto connection =
        std::make_unique<Connection>(loop_, std::move(fd), describe(peer, number), limits_, owner);
    Connection &added = *connection;
    const bool full = connections_.size() >= limits_.max_clients;
    connections_.emplace(number, std::move(connection));
    log_(ControlLogLevel::debug, describe(added.client()) + " connected");
    if (!access_.allows(peer)) {
        turn_away(added, error_code::not_allowed,
                  "user " + added.client().user + " may not use this socket",
                  "be mgmtd's user, root, or a member of the group that mgmtd --group names");
    } else if (full) {
        turn_away(added, error_code::busy,
                  std::to_string(limits_.max_clients) + " clients are connected, no more are taken",
                  "try again later");
    }
}

void ControlServer::turn_away(Connection &connection, const char *code, const std::string &reason,
                              const char *advice)
{
    log_(ControlLogLevel::warning, describe(connection.client()) + " turned away: " + reason);
    connection.finish_with(error_line(nullptr, RequestError(code, reason + ": " + advice)));
}

void ControlServer::keeps(Connection &, std::size_t before, std::size_t now)
{
    unserved_ = unserved_ - before + now;
    if (now > before && unserved_ > limits_.max_unserved) {
        turn_away_largest();
    }
}

/// The one that has left most, since the others have the better claim to what there is.
void ControlServer::turn_away_largest()
{
    const auto largest = std::ranges::max_element(
        connections_, {}, [](const auto &entry) { return entry.second->kept(); });
    turn_away(*largest->second, error_code::busy,
              "requests that are not complete take up " + std::to_string(unserved_) +
                  " bytes, no more than " + std::to_string(limits_.max_unserved) + " may",
              "try again later");
}

std::string ControlServer::answer(Connection &from, std::string_view line)
{
    json id;
    try {
        const json request = parse_request(line, id);
        return result_line(id, dispatch(from, request));
    } catch (const RequestError &error) {
        return error_line(id, error);
    } catch (const std::exception &fault) {
        log_(ControlLogLevel::error,
             "a request of " + describe(from.client()) + " failed: " + fault.what());
        return error_line(id, RequestError(error_code::internal, fault.what()));
    }
}

json ControlServer::dispatch(Connection &from, const json &request)
{
    if (request.at("command") == "hello") {
        return hello(from, request);
    }
    if (request.at("command") == "watch") {
        watchers_[from.client().number] = &from;
        return json::object();
    }
    return handler_.handle(request, from.client());
}

json ControlServer::hello(Connection &from, const json &request)
{
    const std::string name = required_text(request, "peer");
    check_peer_name(name);
    const std::string &registered = from.client().peer;
    if (!registered.empty() && registered != name) {
        throw RequestError(error_code::bad_request, "this connection is registered as peer " +
                                                        registered +
                                                        " already: use another connection");
    }
    json result = {{"peer", name}, {"protocol", control_protocol_version}};
    if (!registered.empty()) {
        return result;
    }

    // The newest wins: a peer that was started again must not be kept out by the connection its
    // predecessor left behind.
    if (const auto old = peers_.find(name); old != peers_.end()) {
        Connection &replaced = *old->second.connection;
        peers_.erase(old);
        log_(ControlLogLevel::info,
             describe(replaced.client()) + " replaced by " + describe(from.client()));
        replaced.finish_with(
            goodbye_line(goodbye_code::replaced, "another peer registered as " + name));
    }
    from.set_peer(name);
    peers_[name].connection = &from;
    log_(ControlLogLevel::info, "peer " + name + " is here: " + describe(from.client()));
    return result;
}

void ControlServer::ended(Connection &connection, const std::string &fault)
{
    const ClientInfo &client = connection.client();
    watchers_.erase(client.number);
    if (const auto peer = peers_.find(client.peer);
        peer != peers_.end() && peer->second.connection == &connection) {
        peers_.erase(peer);
        log_(ControlLogLevel::info, "peer " + client.peer + " is gone");
    }
    if (fault.empty()) {
        log_(ControlLogLevel::debug, describe(client) + " disconnected");
    } else {
        log_(ControlLogLevel::warning, describe(client) + " was disconnected: " + fault);
    }

    // It is still at work: the loop lets go of it once it has returned.
    const auto owned = connections_.find(client.number);
    over_.push_back(std::move(owned->second));
    connections_.erase(owned);
    event_active(reap_event_.get(), 0, 0);
}

bool ControlServer::send_to_peer(const std::string &name, const json &event)
{
    const auto peer = peers_.find(name);
    if (peer == peers_.end()) {
        return false;
    }
    // Counted before: when sending ends the peer, its entry is gone afterwards.
    ++peer->second.events_sent;
    return peer->second.connection->send_event(event_line(event));
}

void ControlServer::report(const json &event)
{
    const std::string line = event_line(event);
    // Sending may end a watcher and take it out of the map.
    const auto watchers = watchers_;
    for (const auto &[number, watcher] : watchers) {
        watcher->send_report(line);
    }
}

std::vector<PeerStatus> ControlServer::peers() const
{
    std::vector<PeerStatus> result;
    for (const auto &[name, peer] : peers_) {
        const ClientInfo &client = peer.connection->client();
        result.push_back({.name = name,
                          .pid = client.pid,
                          .uid = client.uid,
                          .events_sent = peer.events_sent,
                          .bytes_waiting = peer.connection->waiting()});
    }
    return result;
}

} // namespace ovhost
