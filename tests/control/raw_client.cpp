#include "tests/control/raw_client.h"

#include "host/control/socket_address.h"

#include <sys/socket.h>
#include <sys/time.h>

#include <array>
#include <cerrno>
#include <limits>
#include <stdexcept>
#include <system_error>

namespace ovhost::test
{

RawClient::RawClient(const std::string &path)
    : fd_(::socket(AF_UNIX, SOCK_STREAM | SOCK_CLOEXEC, 0)),
      input_(std::numeric_limits<std::size_t>::max())
{
    const sockaddr_un address = socket_address(path);
    const timeval patience{.tv_sec = 10, .tv_usec = 0};
    ::setsockopt(fd_.get(), SOL_SOCKET, SO_RCVTIMEO, &patience, sizeof(patience));
    if (::connect(fd_.get(), reinterpret_cast<const sockaddr *>(&address), sizeof(address)) != 0)
        throw std::system_error(errno, std::generic_category(), path);
}

bool RawClient::send(std::string_view bytes)
{
    while (!bytes.empty()) {
        const ssize_t sent = ::send(fd_.get(), bytes.data(), bytes.size(), MSG_NOSIGNAL);
        if (sent < 0)
            return false;
        bytes.remove_prefix(static_cast<std::size_t>(sent));
    }
    return true;
}

void RawClient::shut_down_writing()
{
    ::shutdown(fd_.get(), SHUT_WR);
}

std::size_t RawClient::skip(std::size_t most)
{
    std::string dropped(most, '\0');
    const ssize_t got = ::recv(fd_.get(), dropped.data(), dropped.size(), MSG_WAITALL);
    return got > 0 ? static_cast<std::size_t>(got) : 0;
}

std::optional<std::string> RawClient::read_line()
{
    for (;;) {
        if (const auto line = input_.next())
            return std::string(*line);
        std::array<char, 65536> piece;
        const ssize_t got = ::recv(fd_.get(), piece.data(), piece.size(), 0);
        if (got == 0 || (got < 0 && errno == ECONNRESET))
            return std::nullopt;
        if (got < 0)
            throw std::runtime_error("nothing to read within ten seconds");
        input_.feed({piece.data(), static_cast<std::size_t>(got)});
    }
}

} // namespace ovhost::test
