#pragma once
// The daemon's side of the control socket (docs/control-protocol.md): accepts clients, hands their
// requests to a RequestHandler (request_handler.h) and keeps the named peers that take events and
// the watchers that take reports. connection.h is one client, access.h who may be one, event_loop.h
// what it all runs in.

#include "host/control/access.h"
#include "host/control/connection.h"
#include "host/control/listen_socket.h"
#include "host/control/log_sink.h"

#include <nlohmann/json_fwd.hpp>

#include <cstdint>
#include <map>
#include <memory>
#include <string>
#include <vector>

struct evconnlistener;
struct sockaddr;

namespace ovhost
{

struct PeerStatus {
    std::string name;
    pid_t pid = 0;
    uid_t uid = 0;
    std::uint64_t events_sent = 0;
    std::size_t bytes_waiting = 0;
};

/// All of it belongs to the thread that runs the loop; handlers are called there, one at a time.
class ControlServer : private Connection::Owner
{
  public:
    /// Listens from here on; throws std::runtime_error when it cannot (listen_socket.h). `loop` and
    /// `handler` must outlive the server.
    ControlServer(EventLoop &loop, const std::string &socket_path, const ServerLimits &limits,
                  RequestHandler &handler, ControlLog log, AccessPolicy access = AccessPolicy());

    /// Tells the peers and watchers that the daemon stops, writes what their sockets still take,
    /// and removes the socket file. Not to be called from within a handler.
    ~ControlServer() override;

    ControlServer(const ControlServer &) = delete;
    ControlServer &operator=(const ControlServer &) = delete;

    /// Sends `event` to the peer of that name as a line {"event": event}. Never waits: true means
    /// that it is on its way; false that there is no such peer, or none any more because it does
    /// not read.
    bool send_to_peer(const std::string &name, const nlohmann::json &event);

    [[nodiscard]] bool has_peer(const std::string &name) const { return peers_.contains(name); }

    /// Sends `event` to every watcher as a line {"event": event}. Never waits: a watcher that does
    /// not read loses it and is told so later.
    void report(const nlohmann::json &event);

    [[nodiscard]] bool has_watchers() const { return !watchers_.empty(); }

    /// The connected peers, by name.
    [[nodiscard]] std::vector<PeerStatus> peers() const;

    [[nodiscard]] std::size_t client_count() const { return connections_.size(); }

  private:
    struct Peer {
        Connection *connection = nullptr;
        std::uint64_t events_sent = 0;
    };
    struct ListenerDeleter {
        void operator()(evconnlistener *listener) const;
    };

    static void on_accept(evconnlistener *listener, int fd, sockaddr *address, int length,
                          void *server);
    static void on_accept_error(evconnlistener *listener, void *server);
    static void on_retry_accept(int fd, short what, void *server);
    static void on_reap(int fd, short what, void *server);

    std::string answer(Connection &from, std::string_view line) override;
    void ended(Connection &connection, const std::string &fault) override;
    void keeps(Connection &connection, std::size_t before, std::size_t now) override;

    void accept(UniqueFd fd);
    void turn_away(Connection &connection, const char *code, const std::string &reason,
                   const char *advice);
    void turn_away_largest();
    nlohmann::json dispatch(Connection &from, const nlohmann::json &request);
    nlohmann::json hello(Connection &from, const nlohmann::json &request);

    EventLoop &loop_;
    ServerLimits limits_;
    RequestHandler &handler_;
    ControlLog log_;
    AccessPolicy access_;
    ListenSocket socket_;
    std::map<std::uint64_t, std::unique_ptr<Connection>> connections_;
    // Connections that ended while one of their own functions was running.
    std::vector<std::unique_ptr<Connection>> over_;
    std::map<std::string, Peer> peers_;
    std::map<std::uint64_t, Connection *> watchers_;
    // Bytes of requests that all connections keep.
    std::size_t unserved_ = 0;
    std::uint64_t next_number_ = 1;
    EventPtr reap_event_;
    EventPtr retry_accept_event_;
    std::unique_ptr<evconnlistener, ListenerDeleter> listener_;
};

} // namespace ovhost
