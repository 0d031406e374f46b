#pragma once
// Wakes the daemon up when a commit that was not confirmed is to be undone (confirmations.h).

#include "host/control/event_loop.h"

#include <chrono>
#include <functional>
#include <optional>

namespace ovhost
{

class UndoTimer
{
  public:
    using TimeLeft = std::function<std::optional<std::chrono::milliseconds>()>;

    /// `undo` is called in the loop when no time is left. The loop outlives the timer. Throws
    /// std::runtime_error.
    UndoTimer(EventLoop &loop, TimeLeft time_left, std::function<void()> undo);

    /// Looks at the time that is left. To be called whenever it may be another one.
    void set();

  private:
    static void on_time(int fd, short what, void *timer);

    TimeLeft time_left_;
    std::function<void()> undo_;
    EventPtr event_;
};

} // namespace ovhost
