#pragma once
// The address of a Unix-domain socket. Used by listen_socket.h and client.h.

#include <sys/un.h>

#include <string>

namespace ovhost
{

/// Throws std::runtime_error when the path is empty or longer than an address holds.
[[nodiscard]] sockaddr_un socket_address(const std::string &path);

/// A new stream socket, non-blocking and closed on exec; throws std::system_error.
[[nodiscard]] class UniqueFd new_socket();

} // namespace ovhost
