#include "host/mgmtd/undo_timer.h"

#include <event2/event.h>

#include <stdexcept>
#include <utility>

namespace ovhost
{

UndoTimer::UndoTimer(EventLoop &loop, TimeLeft time_left, std::function<void()> undo)
    : time_left_(std::move(time_left)), undo_(std::move(undo)),
      event_(evtimer_new(loop.base(), on_time, this))
{
    if (!event_) {
        throw std::runtime_error("cannot add a timer to the event loop");
    }
}

void UndoTimer::set()
{
    evtimer_del(event_.get());
    const std::optional<std::chrono::milliseconds> left = time_left_();
    if (!left) {
        return;
    }
    // The loop's clock stands still while a request is handled.
    event_base_update_cache_time(event_get_base(event_.get()));
    const timeval span{.tv_sec = static_cast<time_t>(left->count() / 1000),
                       .tv_usec = static_cast<suseconds_t>(left->count() % 1000 * 1000)};
    evtimer_add(event_.get(), &span);
}

void UndoTimer::on_time(int, short, void *timer)
{
    auto *const self = static_cast<UndoTimer *>(timer);
    self->undo_();
    self->set();
}

} // namespace ovhost
