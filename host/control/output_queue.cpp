#include "host/control/output_queue.h"

#include <sys/socket.h>

#include <cerrno>

namespace ovhost
{

void OutputQueue::append(std::string_view bytes)
{
    // Moving the rest only when half is written keeps the copying linear in what passes through.
    if (written_ > bytes_.size() / 2) {
        bytes_.erase(0, written_);
        written_ = 0;
    }
    bytes_.append(bytes);
}

bool OutputQueue::write_to(int fd)
{
    while (size() > 0) {
        const ssize_t taken =
            ::send(fd, bytes_.data() + written_, size(), MSG_NOSIGNAL | MSG_DONTWAIT);
        if (taken >= 0) {
            written_ += static_cast<std::size_t>(taken);
        } else if (errno == EAGAIN) {
            return true;
        } else if (errno != EINTR) {
            return false;
        }
    }
    bytes_ = {};
    written_ = 0;
    return true;
}

} // namespace ovhost
