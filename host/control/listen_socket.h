#pragma once
// The listening socket of the daemon and the file it is bound to. server.h accepts from it.

#include "host/support/unique_fd.h"

#include <sys/types.h>

#include <optional>
#include <string>

namespace ovhost
{

class ListenSocket
{
  public:
    /// Binds and listens; the file is readable and writable by its owner alone, and by `group` when
    /// there is one: never by more than these, not even for a moment. A socket file nobody listens
    /// behind is replaced. Throws std::runtime_error when another daemon listens there, when the
    /// path is something other than a socket, or when it cannot be created or given to the group.
    explicit ListenSocket(std::string path, std::optional<gid_t> group = std::nullopt);

    /// Removes the socket file, unless another one stands there by now.
    ~ListenSocket();

    ListenSocket(const ListenSocket &) = delete;
    ListenSocket &operator=(const ListenSocket &) = delete;

    [[nodiscard]] int fd() const { return fd_.get(); }

  private:
    std::string path_;
    UniqueFd fd_;
    dev_t device_ = 0;
    ino_t inode_ = 0;
};

} // namespace ovhost
