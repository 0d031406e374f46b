#include "host/support/patient_write.h"

#include <poll.h>
#include <unistd.h>

#include <algorithm>
#include <array>
#include <cerrno>
#include <climits>
#include <system_error>

namespace ovhost
{

namespace
{

[[noreturn]] void fail()
{
    throw std::system_error(errno, std::generic_category());
}

bool wait_for_reader(int fd, int stop_fd)
{
    std::array<pollfd, 2> watched{{{.fd = fd, .events = POLLOUT, .revents = 0},
                                   {.fd = stop_fd, .events = POLLIN, .revents = 0}}};
    while (::poll(watched.data(), watched.size(), -1) < 0) {
        if (errno != EINTR) {
            fail();
        }
    }
    // What can be written at once still is, so that a stop loses nothing that arrived before it.
    return watched[0].revents != 0;
}

} // namespace

bool write_unless_stopped(int fd, std::string_view text, int stop_fd)
{
    while (!text.empty()) {
        if (!wait_for_reader(fd, stop_fd)) {
            return false;
        }
        // A pipe that is ready takes this much without making the writer wait.
        const std::size_t piece = std::min<std::size_t>(text.size(), PIPE_BUF);
        const ssize_t taken = ::write(fd, text.data(), piece);
        if (taken >= 0) {
            text.remove_prefix(static_cast<std::size_t>(taken));
        } else if (errno != EINTR && errno != EAGAIN) {
            fail();
        }
    }
    return true;
}

} // namespace ovhost
