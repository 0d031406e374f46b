#pragma once
// Who may use the control socket: the daemon's own user, root, and one group. listen_socket.h sets
// the file's permissions by it, server.h asks it for each client that connects.

#include <sys/types.h>

#include <optional>
#include <vector>

namespace ovhost
{

/// Who is at the other end of a socket, as of when it connected. Users and groups that have no
/// number in this process's user namespace all have the kernel's overflow number, 65534.
struct PeerCredentials {
    pid_t pid = 0;
    uid_t uid = 0;
    gid_t gid = 0;
    std::vector<gid_t> groups; ///< supplementary ones
};

/// Throws std::system_error when the kernel does not tell.
[[nodiscard]] PeerCredentials credentials_of(int socket);

class AccessPolicy
{
  public:
    /// Root, this process's user, and the members of `group`.
    explicit AccessPolicy(std::optional<gid_t> group = std::nullopt);

    /// These users and the members of `group`, nobody else.
    AccessPolicy(std::vector<uid_t> users, std::optional<gid_t> group)
        : users_(std::move(users)), group_(group)
    {
    }

    [[nodiscard]] bool allows(const PeerCredentials &peer) const;

    [[nodiscard]] std::optional<gid_t> group() const { return group_; }

  private:
    std::vector<uid_t> users_;
    std::optional<gid_t> group_;
};

} // namespace ovhost
