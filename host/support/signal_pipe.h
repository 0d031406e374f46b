#pragma once
// Turns SIGTERM and SIGINT into a readable descriptor, so that every wait of a program can end by
// them.

#include "host/support/unique_fd.h"

namespace ovhost
{

class SignalPipe
{
  public:
    /// From now on the two signals only make fd() readable. One at a time can exist in a process.
    SignalPipe();
    ~SignalPipe();
    SignalPipe(const SignalPipe &) = delete;
    SignalPipe &operator=(const SignalPipe &) = delete;

    [[nodiscard]] int fd() const { return read_end_.get(); }

  private:
    UniqueFd read_end_;
    UniqueFd write_end_;
};

} // namespace ovhost
