#include "host/support/signal_pipe.h"

#include <fcntl.h>

#include <atomic>
#include <cerrno>
#include <csignal>
#include <system_error>

namespace ovhost
{

namespace
{

std::atomic<int> pipe_of_handler{-1};

void on_signal(int)
{
    const int before = errno;
    const char byte = 0;
    // Fails only when the pipe is full, and then it is readable already.
    static_cast<void>(!::write(pipe_of_handler, &byte, 1));
    errno = before;
}

} // namespace

SignalPipe::SignalPipe()
{
    int ends[2];
    if (::pipe2(ends, O_CLOEXEC | O_NONBLOCK) != 0) {
        throw std::system_error(errno, std::generic_category(), "cannot create a pipe");
    }
    read_end_ = UniqueFd(ends[0]);
    write_end_ = UniqueFd(ends[1]);
    pipe_of_handler = ends[1];
    for (const int number : {SIGTERM, SIGINT}) {
        std::signal(number, on_signal);
    }
}

SignalPipe::~SignalPipe()
{
    for (const int number : {SIGTERM, SIGINT}) {
        std::signal(number, SIG_DFL);
    }
    pipe_of_handler = -1;
}

} // namespace ovhost
