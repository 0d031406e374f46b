#include "host/control/socket_address.h"

#include "host/support/unique_fd.h"

#include <sys/socket.h>

#include <cerrno>
#include <stdexcept>
#include <system_error>

namespace ovhost
{

sockaddr_un socket_address(const std::string &path)
{
    sockaddr_un address{};
    constexpr std::size_t longest = sizeof(address.sun_path) - 1;
    if (path.empty()) {
        throw std::runtime_error("the socket path is empty: give one with --socket");
    }
    if (path.size() > longest) {
        throw std::runtime_error("socket path " + path + " is " + std::to_string(path.size()) +
                                 " bytes long, at most " + std::to_string(longest) +
                                 " are possible: choose a shorter --socket");
    }
    address.sun_family = AF_UNIX;
    path.copy(address.sun_path, longest);
    return address;
}

UniqueFd new_socket()
{
    UniqueFd fd(::socket(AF_UNIX, SOCK_STREAM | SOCK_NONBLOCK | SOCK_CLOEXEC, 0));
    if (!fd) {
        throw std::system_error(errno, std::generic_category(), "cannot create a socket");
    }
    return fd;
}

} // namespace ovhost
