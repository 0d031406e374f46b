#pragma once
// The event loop of a daemon: an event_base with the signals and the wake-up every daemon needs.
// server.h hangs its sockets into it.

#include "host/support/unique_fd.h"

#include <functional>
#include <memory>
#include <mutex>
#include <vector>

struct event_base;
struct event;

namespace ovhost
{

struct EventDeleter {
    void operator()(event *watch) const;
};
using EventPtr = std::unique_ptr<event, EventDeleter>;

class EventLoop
{
  public:
    /// Also makes the process ignore SIGPIPE: a reader that went away is an error of one write.
    /// Throws std::runtime_error when the system refuses.
    EventLoop();
    ~EventLoop();
    EventLoop(const EventLoop &) = delete;
    EventLoop &operator=(const EventLoop &) = delete;

    /// From now on SIGTERM and SIGINT make run() return. Only one loop of a process can do this.
    void stop_on_signals();

    /// Runs until stop() or a signal. Returns the signal's number, 0 for stop().
    int run();

    /// Makes run() return soon, or at once when it is called next. Any thread may call it.
    void stop();

    /// Has `task` called by the thread in run(). Any thread may call it. A task must not throw.
    void post(std::function<void()> task);

    [[nodiscard]] event_base *base() const { return base_.get(); }

  private:
    struct BaseDeleter {
        void operator()(event_base *base) const;
    };

    static void on_signal(int number, short what, void *loop);
    static void on_wake(int fd, short what, void *loop);

    std::unique_ptr<event_base, BaseDeleter> base_;
    UniqueFd wake_fd_;
    EventPtr wake_event_;
    std::vector<EventPtr> signal_events_;
    std::mutex mutex_;
    std::vector<std::function<void()>> tasks_;
    int stop_signal_ = 0;
};

} // namespace ovhost
