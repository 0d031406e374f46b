#include "host/jsond/event_writer.h"

#include "host/control/message.h"

#include <fcntl.h>
#include <nlohmann/json.hpp>
#include <poll.h>

#include <algorithm>
#include <array>
#include <cerrno>
#include <climits>
#include <cstring>
#include <stdexcept>

namespace ovhost
{

EventWriter::EventWriter(const std::string &path, int stop_fd)
    : name_(path.empty() ? "standard output" : path), fd_(STDOUT_FILENO), stop_fd_(stop_fd)
{
    if (path.empty())
        return;
    file_ = UniqueFd(::open(path.c_str(), O_WRONLY | O_CREAT | O_APPEND | O_CLOEXEC, 0644));
    fd_ = file_.get();
    if (!file_)
        fail();
}

bool EventWriter::write(const nlohmann::json &event)
{
    const std::string text = to_line(event);
    std::string_view line = text;
    while (!line.empty()) {
        if (!wait_for_reader())
            return false;
        // A pipe that is ready takes this much without making the writer wait.
        const std::size_t piece = std::min<std::size_t>(line.size(), PIPE_BUF);
        const ssize_t taken = ::write(fd_, line.data(), piece);
        if (taken >= 0)
            line.remove_prefix(static_cast<std::size_t>(taken));
        else if (errno != EINTR && errno != EAGAIN)
            fail();
    }
    return true;
}

bool EventWriter::wait_for_reader() const
{
    std::array<pollfd, 2> watched{{{.fd = fd_, .events = POLLOUT, .revents = 0},
                                   {.fd = stop_fd_, .events = POLLIN, .revents = 0}}};
    while (::poll(watched.data(), watched.size(), -1) < 0)
        if (errno != EINTR)
            fail();
    // An event that can be written at once still is, so that a stop loses none that arrived.
    return watched[0].revents != 0;
}

void EventWriter::fail() const
{
    throw std::runtime_error("cannot write to " + name_ + ": " + std::strerror(errno));
}

} // namespace ovhost
