#include "host/control/event_loop.h"

#include <event2/event.h>
#include <sys/eventfd.h>

#include <cerrno>
#include <csignal>
#include <cstdint>
#include <stdexcept>
#include <system_error>

namespace ovhost
{

void EventDeleter::operator()(event *watch) const
{
    event_free(watch);
}

void EventLoop::BaseDeleter::operator()(event_base *base) const
{
    event_base_free(base);
}

namespace
{

EventPtr watch(event_base *base, int fd, short what, event_callback_fn callback, void *context)
{
    EventPtr result(event_new(base, fd, what, callback, context));
    if (!result || event_add(result.get(), nullptr) != 0) {
        throw std::runtime_error("cannot add an event to the event loop");
    }
    return result;
}

} // namespace

EventLoop::EventLoop() : base_(event_base_new()), wake_fd_(::eventfd(0, EFD_NONBLOCK | EFD_CLOEXEC))
{
    if (!base_) {
        throw std::runtime_error("cannot create the event loop");
    }
    if (!wake_fd_) {
        throw std::system_error(errno, std::generic_category(), "cannot create an eventfd");
    }
    std::signal(SIGPIPE, SIG_IGN);
    wake_event_ = watch(base_.get(), wake_fd_.get(), EV_READ | EV_PERSIST, on_wake, this);
}

EventLoop::~EventLoop() = default;

void EventLoop::stop_on_signals()
{
    for (const int number : {SIGTERM, SIGINT}) {
        signal_events_.push_back(
            watch(base_.get(), number, EV_SIGNAL | EV_PERSIST, on_signal, this));
    }
}

int EventLoop::run()
{
    stop_signal_ = 0;
    event_base_dispatch(base_.get());
    return stop_signal_;
}

void EventLoop::stop()
{
    post([this] { event_base_loopbreak(base_.get()); });
}

void EventLoop::post(std::function<void()> task)
{
    {
        const std::lock_guard lock(mutex_);
        tasks_.push_back(std::move(task));
    }
    const std::uint64_t one = 1;
    // Fails only when the counter is full, and then the loop is already awake.
    static_cast<void>(!::write(wake_fd_.get(), &one, sizeof(one)));
}

void EventLoop::on_signal(int number, short, void *loop)
{
    auto *self = static_cast<EventLoop *>(loop);
    self->stop_signal_ = number;
    event_base_loopbreak(self->base());
}

void EventLoop::on_wake(int fd, short, void *loop)
{
    auto *self = static_cast<EventLoop *>(loop);
    std::uint64_t count = 0;
    static_cast<void>(!::read(fd, &count, sizeof(count)));
    std::vector<std::function<void()>> tasks;
    {
        const std::lock_guard lock(self->mutex_);
        tasks.swap(self->tasks_);
    }
    for (const auto &task : tasks) {
        task();
    }
}

} // namespace ovhost
