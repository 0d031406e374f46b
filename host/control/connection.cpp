#include "host/control/connection.h"

#include "host/control/message.h"

#include <event2/event.h>
#include <nlohmann/json.hpp>
#include <sys/socket.h>

#include <array>
#include <cerrno>
#include <cstring>
#include <stdexcept>

namespace ovhost
{

namespace
{

constexpr std::size_t piece_size = 65536;

timeval to_timeval(std::chrono::milliseconds span)
{
    return {.tv_sec = static_cast<time_t>(span.count() / 1000),
            .tv_usec = static_cast<suseconds_t>(span.count() % 1000 * 1000)};
}

EventPtr new_event(EventLoop &loop, int fd, short what, event_callback_fn callback, void *context)
{
    EventPtr result(event_new(loop.base(), fd, what, callback, context));
    if (!result) {
        throw std::runtime_error("cannot add a client to the event loop");
    }
    return result;
}

} // namespace

Connection::Connection(EventLoop &loop, UniqueFd fd, ClientInfo client, const ServerLimits &limits,
                       Owner &owner)
    : fd_(std::move(fd)), client_(std::move(client)), limits_(limits), owner_(owner),
      read_event_(new_event(loop, fd_.get(), EV_READ | EV_PERSIST, on_readable, this)),
      write_event_(new_event(loop, fd_.get(), EV_WRITE, on_writable, this)),
      request_timer_(new_event(loop, -1, 0, on_overdue, this)),
      turn_event_(new_event(loop, -1, 0, on_next_turn, this)), input_(limits.max_request)
{
    resume_reading();
}

void Connection::on_readable(int, short, void *connection)
{
    static_cast<Connection *>(connection)->guarded(&Connection::read_input);
}

void Connection::on_writable(int, short what, void *connection)
{
    static_cast<Connection *>(connection)
        ->guarded((what & EV_WRITE) != 0 ? &Connection::write_output : &Connection::check_stall);
}

void Connection::on_overdue(int, short, void *connection)
{
    static_cast<Connection *>(connection)->guarded(&Connection::check_request);
}

void Connection::on_next_turn(int, short, void *connection)
{
    static_cast<Connection *>(connection)->guarded(&Connection::serve);
}

/// The event loop is C code: an exception ends the connection it came from, not the daemon.
void Connection::guarded(void (Connection::*step)())
{
    try {
        (this->*step)();
    } catch (const std::exception &fault) {
        end(fault.what());
    }
}

void Connection::read_input()
{
    if (receive_piece()) {
        serve();
    }
}

/// False when there was nothing to receive, or the connection is over.
bool Connection::receive_piece()
{
    std::array<char, piece_size> piece;
    const ssize_t got = ::recv(fd_.get(), piece.data(), piece.size(), MSG_DONTWAIT);
    if (got < 0) {
        if (errno != EAGAIN && errno != EINTR) {
            end(errno == ECONNRESET ? std::string() : std::strerror(errno));
        }
        return false;
    }
    if (got == 0) {
        end_of_input_ = true;
    } else {
        input_.feed({piece.data(), static_cast<std::size_t>(got)});
    }
    return true;
}

void Connection::write_output()
{
    flush();
    if (!over_) {
        serve();
    }
}

void Connection::check_stall()
{
    if (progress_) {
        await_writable();
    } else {
        end("does not read: " + std::to_string(waiting()) + " bytes waited for " +
            std::to_string(limits_.stall_timeout.count()) + " ms");
    }
}

/// The rest may have arrived while the daemon was busy, and then as much as the socket holds: that
/// is not held against the client, which could not send any faster.
void Connection::check_request()
{
    const std::size_t before = input_.rest().size();
    overdue_ = true;
    while (overdue_ && receive_piece()) {
        serve();
    }
    if (!overdue_) {
        return;
    }
    const std::size_t size = input_.rest().size();
    if (size - before >= piece_size) {
        overdue_ = false;
        watch_request(false);
        return;
    }
    end("has not ended its request: " + std::to_string(size) + " bytes of it came within " +
        std::to_string(limits_.stall_timeout.count()) + " ms");
}

/// Answers what has come in, as long as the client reads its answers.
void Connection::serve()
{
    // A handler that sends an event to its own client must not start a second round.
    if (serving_ || finishing_) {
        return;
    }
    serving_ = true;
    waits_for_turn_ = false;
    const bool any = serve_lines();
    serving_ = false;
    if (over_ || finishing_) {
        drop_input();
        return;
    }
    if (end_of_input_ || waits_for_turn_ || waiting() >= limits_.max_waiting) {
        pause_reading();
    } else {
        resume_reading();
    }
    if (!waits_for_turn_) {
        watch_request(any);
    }
    count_kept();
}

/// Whether there was a line.
bool Connection::serve_lines()
{
    bool any = false;
    const auto began = std::chrono::steady_clock::now();
    while (!over_ && !finishing_ && waiting() < limits_.max_waiting) {
        if (any && turn_is_over(began)) {
            break;
        }
        const auto line = input_.next();
        if (!line) {
            serve_end_of_input();
            break;
        }
        any = true;
        if (line->find_first_not_of(" \t\r") != std::string_view::npos) {
            send(owner_.answer(*this, *line));
        }
    }
    return any;
}

/// The others are served before what this client has sent besides. By a timer that is due at once:
/// an event made active from here would come before the loop looks at the other sockets.
bool Connection::turn_is_over(std::chrono::steady_clock::time_point began)
{
    if (std::chrono::steady_clock::now() - began < limits_.turn) {
        return false;
    }
    const timeval at_once{};
    event_add(turn_event_.get(), &at_once);
    waits_for_turn_ = true;
    return true;
}

/// Every whole line is answered: what is left to do when no more can come.
void Connection::serve_end_of_input()
{
    if (input_.too_long()) {
        const RequestError error(error_code::too_long, "the request is longer than " +
                                                           std::to_string(limits_.max_request) +
                                                           " bytes: send it in smaller parts");
        finish_with(error_line(nullptr, error));
        return;
    }
    if (!end_of_input_) {
        return;
    }
    const std::string last(input_.rest());
    finish_with(last.find_first_not_of(" \t\r") == std::string::npos ? std::string()
                                                                     : owner_.answer(*this, last));
}

void Connection::send(std::string_view line)
{
    if (over_) {
        return;
    }
    output_.append(line);
    flush();
}

bool Connection::send_event(std::string_view line)
{
    if (over_ || finishing_) {
        return false;
    }
    if (waiting() > 0) {
        flush();
    }
    if (!over_ && waiting() > 0 && waiting() + line.size() > limits_.max_events_waiting) {
        end("does not read: " + std::to_string(waiting()) + " bytes wait for it, " +
            std::to_string(limits_.max_events_waiting) + " may");
    }
    send(line);
    return !over_;
}

void Connection::send_report(std::string_view line)
{
    if (over_ || finishing_) {
        return;
    }
    if (waiting() > 0) {
        flush();
    }
    if (left_out_ > 0 || (waiting() > 0 && waiting() + line.size() > limits_.max_watch_waiting)) {
        ++left_out_;
    } else {
        send(line);
    }
}

void Connection::tell_gap()
{
    const std::string line = gap_line(left_out_);
    left_out_ = 0;
    send(line);
}

void Connection::finish_with(std::string_view line)
{
    if (over_) {
        return;
    }
    finishing_ = true;
    pause_reading();
    drop_input();
    send(line);
}

void Connection::flush()
{
    const std::size_t before = waiting();
    if (!output_.write_to(fd_.get())) {
        // The reader has gone: for a client that is an ordinary end.
        end({});
        return;
    }
    progress_ = progress_ || waiting() < before;
    if (waiting() > 0) {
        await_writable();
    } else if (finishing_) {
        end({});
    } else if (left_out_ > 0) {
        tell_gap();
    }
}

/// A wait that is already under way goes on: sending more to one that does not read must not put
/// off the end of its patience.
void Connection::await_writable()
{
    if (event_pending(write_event_.get(), EV_WRITE, nullptr) != 0) {
        return;
    }
    progress_ = false;
    // The loop's clock stands still while a request is handled: without this the patience would
    // begin before the answer was there.
    event_base_update_cache_time(event_get_base(write_event_.get()));
    const timeval patience = to_timeval(limits_.stall_timeout);
    event_add(write_event_.get(), &patience);
}

void Connection::pause_reading()
{
    event_del(read_event_.get());
    stop_request_timer();
}

void Connection::resume_reading()
{
    if (event_pending(read_event_.get(), EV_READ, nullptr) == 0) {
        event_add(read_event_.get(), nullptr);
    }
}

/// A request has its time from when it began, however often a piece of it comes.
void Connection::watch_request(bool begins_anew)
{
    const bool begun = !input_.rest().empty();
    if (begins_anew || !begun) {
        stop_request_timer();
    }
    if (!begun || overdue_ || event_pending(request_timer_.get(), EV_TIMEOUT, nullptr) != 0) {
        return;
    }
    event_base_update_cache_time(event_get_base(request_timer_.get()));
    const timeval patience = to_timeval(limits_.stall_timeout);
    event_add(request_timer_.get(), &patience);
}

void Connection::stop_request_timer()
{
    event_del(request_timer_.get());
    overdue_ = false;
}

/// Tells the owner how much memory of others this client takes up.
void Connection::count_kept()
{
    const std::size_t before = kept_;
    kept_ = input_.rest().size();
    if (kept_ != before) {
        owner_.keeps(*this, before, kept_);
    }
}

/// Not while a line is being served: it lies in the input.
void Connection::drop_input()
{
    if (serving_) {
        return;
    }
    input_.clear();
    count_kept();
}

void Connection::end(const std::string &fault)
{
    if (over_) {
        return;
    }
    over_ = true;
    pause_reading();
    drop_input();
    event_del(write_event_.get());
    event_del(turn_event_.get());
    ::shutdown(fd_.get(), SHUT_RDWR);
    owner_.ended(*this, fault);
}

} // namespace ovhost
