#include "host/control/listen_socket.h"

#include "host/control/socket_address.h"

#include <fcntl.h>
#include <sys/file.h>
#include <sys/socket.h>
#include <sys/stat.h>
#include <unistd.h>

#include <cerrno>
#include <chrono>
#include <cstring>
#include <filesystem>
#include <stdexcept>
#include <thread>

namespace ovhost
{

namespace
{

[[noreturn]] void fail(const std::string &path, const std::string &reason)
{
    throw std::runtime_error("cannot create socket " + path + ": " + reason);
}

[[noreturn]] void fail_with_errno(const std::string &path, const std::string &what = {})
{
    const std::string reason = std::strerror(errno);
    fail(path, what + reason);
}

class ScopedUmask
{
  public:
    explicit ScopedUmask(mode_t mask) : before_(::umask(mask)) {}
    ~ScopedUmask() { ::umask(before_); }
    ScopedUmask(const ScopedUmask &) = delete;
    ScopedUmask &operator=(const ScopedUmask &) = delete;

  private:
    mode_t before_;
};

/// Two daemons that start at once must not each take the other's fresh socket for a stale one: who
/// holds the lock on the directory looks, removes and binds undisturbed.
UniqueFd lock_directory_of(const std::string &path)
{
    std::string directory = std::filesystem::path(path).parent_path().string();
    if (directory.empty()) {
        directory = '.'; // a text here makes GCC warn at -O2 of an overlap that cannot be
    }
    UniqueFd fd(::open(directory.c_str(), O_RDONLY | O_DIRECTORY | O_CLOEXEC));
    if (!fd) {
        fail(path, "directory " + directory + ": " + std::strerror(errno) +
                       ": make it, or choose another --socket");
    }

    constexpr int tries = 40;
    constexpr std::chrono::milliseconds pause(50);
    for (int i = 0; i < tries; ++i) {
        if (::flock(fd.get(), LOCK_EX | LOCK_NB) == 0) {
            return fd;
        }
        if (errno != EWOULDBLOCK && errno != EINTR) {
            fail_with_errno(path, "locking directory " + directory + ": ");
        }
        std::this_thread::sleep_for(pause);
    }
    fail(path, "another process keeps directory " + directory +
                   " locked: stop it or choose another --socket");
}

/// Whether a daemon listens behind an existing socket file.
bool is_live(const std::string &path)
{
    const sockaddr_un address = socket_address(path);
    const UniqueFd probe = new_socket();
    if (::connect(probe.get(), reinterpret_cast<const sockaddr *>(&address), sizeof(address)) ==
        0) {
        return true;
    }
    if (errno == ECONNREFUSED || errno == ENOENT) {
        return false;
    }
    // Its queue of new connections is full: there is a listener, if a slow one.
    if (errno == EAGAIN) {
        return true;
    }
    fail_with_errno(path, "the socket that stands there cannot be tried: ");
}

void remove_stale(const std::string &path)
{
    struct stat status {
    };
    if (::lstat(path.c_str(), &status) != 0) {
        if (errno == ENOENT) {
            return;
        }
        fail_with_errno(path);
    }
    if (!S_ISSOCK(status.st_mode)) {
        fail(path, "something else than a socket stands there: remove it or choose another "
                   "--socket");
    }
    if (is_live(path)) {
        throw std::runtime_error("socket in use by another mgmtd (" + path +
                                 "): stop it or choose another --socket");
    }
    if (::unlink(path.c_str()) != 0 && errno != ENOENT) {
        fail_with_errno(path, "removing the stale socket: ");
    }
}

void bind_private(int fd, const std::string &path)
{
    const sockaddr_un address = socket_address(path);
    const ScopedUmask only_owner(0177);
    if (::bind(fd, reinterpret_cast<const sockaddr *>(&address), sizeof(address)) != 0) {
        fail_with_errno(path);
    }
}

/// By a descriptor of the file itself: in a folder that others may write to, its name could lead
/// elsewhere by now.
void give_to_group(const std::string &path, gid_t group)
{
    const UniqueFd file(::open(path.c_str(), O_PATH | O_NOFOLLOW | O_CLOEXEC));
    struct stat status {
    };
    if (!file || ::fstat(file.get(), &status) != 0) {
        fail_with_errno(path);
    }
    if (!S_ISSOCK(status.st_mode) || status.st_uid != ::geteuid()) {
        fail(path, "somebody has put something else in its place: choose a folder for --socket "
                   "that only this user may write to");
    }
    // The group first: for a moment the other order would let in members of the old one.
    if (::fchownat(file.get(), "", static_cast<uid_t>(-1), group, AT_EMPTY_PATH) != 0) {
        fail(path, "it cannot be given to group " + std::to_string(group) + ": " +
                       std::strerror(errno) +
                       ": choose a --group that this user is a member of, or start as root");
    }
    if (::chmod(("/proc/self/fd/" + std::to_string(file.get())).c_str(), 0660) != 0) {
        fail_with_errno(path, "changing its permissions: ");
    }
}

} // namespace

ListenSocket::ListenSocket(std::string path, std::optional<gid_t> group) : path_(std::move(path))
{
    // Tells of a path that is too long before anything is touched.
    static_cast<void>(socket_address(path_));
    const UniqueFd lock = lock_directory_of(path_);
    remove_stale(path_);
    fd_ = new_socket();
    bind_private(fd_.get(), path_);
    if (group) {
        give_to_group(path_, *group);
    }
    struct stat status {
    };
    if (::lstat(path_.c_str(), &status) != 0 || ::listen(fd_.get(), SOMAXCONN) != 0) {
        fail_with_errno(path_);
    }
    device_ = status.st_dev;
    inode_ = status.st_ino;
}

ListenSocket::~ListenSocket()
{
    struct stat status {
    };
    if (::lstat(path_.c_str(), &status) == 0 && status.st_dev == device_ &&
        status.st_ino == inode_) {
        ::unlink(path_.c_str());
    }
}

} // namespace ovhost
