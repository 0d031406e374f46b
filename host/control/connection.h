#pragma once
// One client of the control socket: takes its requests in order, one at a time, and keeps what it
// has not read yet. server.h owns the connections and answers the requests.

#include "host/control/event_loop.h"
#include "host/control/framing.h"
#include "host/control/output_queue.h"
#include "host/control/request_handler.h"
#include "host/support/unique_fd.h"

#include <chrono>
#include <cstddef>
#include <string>
#include <string_view>

namespace ovhost
{

struct ServerLimits {
    /// Longest request line, in bytes.
    std::size_t max_request = 16UL << 20;
    /// How many bytes may wait for one client. A client over it is served no further requests until
    /// it has read some answers.
    std::size_t max_waiting = 8UL << 20;
    /// How many bytes may wait for a peer before an event is added: one that would go past it
    /// disconnects the peer. Large enough that a peer which merely runs later than the daemon does
    /// not lose the events of a large commit.
    std::size_t max_events_waiting = 64UL << 20;
    /// How many bytes of change reports may wait for a watcher. Those that would go past it are
    /// left out, and the watcher is told how many.
    std::size_t max_watch_waiting = 1UL << 20;
    /// How many bytes of requests that are not served yet all clients together may leave here. Past
    /// it the client that has left most is turned away.
    std::size_t max_unserved = 256UL << 20;
    std::size_t max_clients = 512;
    /// How long one client is served before the others get their turn. A request that has begun is
    /// always finished.
    std::chrono::milliseconds turn{10};
    /// A client that has not taken one waiting byte for so long is disconnected, and one that has
    /// begun a request and has not ended it for so long: what is there of it is kept meanwhile.
    std::chrono::milliseconds stall_timeout{30000};
};

class Connection
{
  public:
    class Owner
    {
      public:
        virtual ~Owner() = default;
        /// The answer line to a request line.
        [[nodiscard]] virtual std::string answer(Connection &from, std::string_view line) = 0;
        /// Called once, when the connection is over; `fault` is empty for an ordinary end. The
        /// connection must outlive the call.
        virtual void ended(Connection &connection, const std::string &fault) = 0;
        /// The bytes of requests that the connection keeps have become `now`, from `before`. The
        /// owner may end the connection, or another one.
        virtual void keeps(Connection &connection, std::size_t before, std::size_t now) = 0;
    };

    Connection(EventLoop &loop, UniqueFd fd, ClientInfo client, const ServerLimits &limits,
               Owner &owner);
    Connection(const Connection &) = delete;
    Connection &operator=(const Connection &) = delete;

    /// Sends a line nobody asked for. False when the client has too much waiting or is gone; the
    /// connection is then over.
    bool send_event(std::string_view line);

    /// Sends a line nobody asked for, unless the client has too much waiting: then this line and
    /// all others are left out until it has read everything, and a line then tells it how many.
    void send_report(std::string_view line);

    /// Sends a last line and ends the connection once it is written. Requests that have not been
    /// answered yet are not.
    void finish_with(std::string_view line);

    [[nodiscard]] const ClientInfo &client() const { return client_; }
    void set_peer(const std::string &name) { client_.peer = name; }

    [[nodiscard]] std::size_t waiting() const { return output_.size(); }

    /// Bytes of requests that are not served yet.
    [[nodiscard]] std::size_t kept() const { return kept_; }

  private:
    static void on_readable(int fd, short what, void *connection);
    static void on_writable(int fd, short what, void *connection);
    static void on_overdue(int fd, short what, void *connection);
    static void on_next_turn(int fd, short what, void *connection);

    void guarded(void (Connection::*step)());
    void read_input();
    [[nodiscard]] bool receive_piece();
    void write_output();
    void check_stall();
    void check_request();
    void serve();
    [[nodiscard]] bool serve_lines();
    [[nodiscard]] bool turn_is_over(std::chrono::steady_clock::time_point began);
    void serve_end_of_input();
    void send(std::string_view line);
    void flush();
    void await_writable();
    void pause_reading();
    void resume_reading();
    void watch_request(bool begins_anew);
    void stop_request_timer();
    void tell_gap();
    void count_kept();
    void drop_input();
    void end(const std::string &fault);

    UniqueFd fd_;
    ClientInfo client_;
    const ServerLimits &limits_;
    Owner &owner_;
    EventPtr read_event_;
    EventPtr write_event_;
    EventPtr request_timer_;
    EventPtr turn_event_;
    LineSplitter input_;
    OutputQueue output_;
    std::size_t kept_ = 0;
    std::uint64_t left_out_ = 0;
    bool waits_for_turn_ = false;
    bool end_of_input_ = false;
    bool finishing_ = false;
    bool serving_ = false;
    bool over_ = false;
    bool progress_ = false;
    bool overdue_ = false;
};

} // namespace ovhost
