#include "host/control/access.h"

#include <sys/socket.h>
#include <unistd.h>

#include <algorithm>
#include <cerrno>
#include <system_error>

namespace ovhost
{

namespace
{

[[noreturn]] void fail()
{
    throw std::system_error(errno, std::generic_category(), "cannot tell who connected");
}

std::vector<gid_t> groups_of(int socket)
{
    std::vector<gid_t> groups(64);
    auto size = static_cast<socklen_t>(groups.size() * sizeof(gid_t));
    int result = ::getsockopt(socket, SOL_SOCKET, SO_PEERGROUPS, groups.data(), &size);
    if (result != 0 && errno == ERANGE) {
        // `size` is now what is needed, and cannot change: the groups are those of the connect.
        groups.resize(size / sizeof(gid_t));
        result = ::getsockopt(socket, SOL_SOCKET, SO_PEERGROUPS, groups.data(), &size);
    }
    if (result != 0) {
        fail();
    }
    groups.resize(size / sizeof(gid_t));
    return groups;
}

} // namespace

PeerCredentials credentials_of(int socket)
{
    ucred credentials{};
    socklen_t size = sizeof(credentials);
    if (::getsockopt(socket, SOL_SOCKET, SO_PEERCRED, &credentials, &size) != 0) {
        fail();
    }
    return {.pid = credentials.pid,
            .uid = credentials.uid,
            .gid = credentials.gid,
            .groups = groups_of(socket)};
}

AccessPolicy::AccessPolicy(std::optional<gid_t> group) : users_{0, ::geteuid()}, group_(group) {}

bool AccessPolicy::allows(const PeerCredentials &peer) const
{
    if (std::ranges::find(users_, peer.uid) != users_.end()) {
        return true;
    }
    return group_ &&
           (peer.gid == *group_ || std::ranges::find(peer.groups, *group_) != peer.groups.end());
}

} // namespace ovhost
