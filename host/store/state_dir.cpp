#include "host/store/state_dir.h"

#include "host/store/store_error.h"

#include <fcntl.h>
#include <sys/file.h>
#include <sys/stat.h>
#include <unistd.h>

#include <array>
#include <cerrno>
#include <string>

namespace ovhost
{
namespace
{

void make_directory(const std::filesystem::path &dir)
{
    if (::mkdir(dir.c_str(), 0700) == 0 || errno == EEXIST) {
        return;
    }
    const int cause = errno;
    const std::string what =
        "cannot make the state directory " + dir.string() + ": " + system_message(cause);
    if (cause == ENOENT) {
        throw StoreError(what + "; make its parent directory first");
    }
    throw StoreError(what + advice_for(cause, "; make it, or choose another state directory"));
}

void check_directory(const std::filesystem::path &dir)
{
    struct stat about {
    };
    if (::stat(dir.c_str(), &about) == 0 && !S_ISDIR(about.st_mode)) {
        throw StoreError("the state directory " + dir.string() +
                         " is not a directory; move it away, or choose another state directory");
    }
    if (::faccessat(AT_FDCWD, dir.c_str(), R_OK | W_OK | X_OK, AT_EACCESS) == 0) {
        return;
    }
    throw StoreError("the state directory " + dir.string() +
                     " cannot be written: " + system_message(errno) +
                     "; give this user write permission, or choose another state directory");
}

// Whether the directory is this store's alone, or empty: then its mode is the store's to set.
bool holds_only_state(const std::filesystem::path &dir)
{
    std::error_code fault;
    std::filesystem::directory_iterator entries(dir, fault);
    for (; !fault && entries != std::filesystem::directory_iterator(); entries.increment(fault)) {
        const std::string name = entries->path().filename().string();
        if (name != "lock" && !name.starts_with("config.db")) {
            return false;
        }
    }
    return !fault;
}

// The files are their user's alone, but who owns or may write the directory can put others in their
// place.
void close_to_others(const std::filesystem::path &dir)
{
    struct stat about {
    };
    if (::stat(dir.c_str(), &about) != 0) {
        return;
    }
    if (about.st_uid != ::geteuid() && about.st_uid != 0) {
        throw StoreError("the state directory " + dir.string() + " belongs to another user (uid " +
                         std::to_string(about.st_uid) +
                         "); make it this user's, or choose another state directory");
    }
    if ((about.st_mode & 077U) == 0) {
        return;
    }
    if (holds_only_state(dir) && ::chmod(dir.c_str(), 0700) == 0) {
        return;
    }
    if ((about.st_mode & 022U) == 0) {
        return;
    }
    throw StoreError("other users can write the state directory " + dir.string() +
                     "; give it mode 0700, or choose another state directory");
}

UniqueFd open_lock(const std::filesystem::path &file)
{
    UniqueFd lock(
        ::open(file.c_str(), O_RDWR | O_CREAT | O_CLOEXEC | O_NOFOLLOW | O_NONBLOCK, 0600));
    if (lock) {
        return lock;
    }
    const int cause = errno;
    throw StoreError(
        "cannot open the lock file " + file.string() + ": " + system_message(cause) +
        advice_for(cause, "; move it away, or give this user read and write permission"));
}

// "" when there is anything else than a number and a line end: the file may have been written to
// by others, and its text is going to be taken for a process to end.
std::string read_holder(int lock)
{
    std::array<char, 24> digits{};
    const ssize_t size = ::pread(lock, digits.data(), digits.size(), 0);
    if (size <= 0) {
        return {};
    }
    const std::string text(digits.data(), static_cast<std::size_t>(size));
    const std::size_t end = text.find_first_not_of("0123456789");
    return end != std::string::npos && text.substr(end) == "\n" ? text.substr(0, end) : "";
}

// Only for the message of the next one who tries: the lock holds without it, on a full disk too.
void write_holder(int lock)
{
    const std::string text = std::to_string(::getpid()) + "\n";
    if (::ftruncate(lock, 0) != 0) {
        return;
    }
    [[maybe_unused]] const ssize_t written = ::pwrite(lock, text.data(), text.size(), 0);
}

[[noreturn]] void throw_lock_failure(const std::filesystem::path &dir, int lock, int cause)
{
    if (cause != EWOULDBLOCK) {
        throw StoreError("cannot lock " + (dir / "lock").string() + ": " + system_message(cause) +
                         "; choose a state directory on a file system with file locks");
    }
    const std::string holder = read_holder(lock);
    throw StoreError("the state directory " + dir.string() + " is held by another daemon" +
                     (holder.empty() ? "" : " (process " + holder + ")") +
                     "; end that daemon, or choose another state directory");
}

} // namespace

StateDir::StateDir(std::filesystem::path dir) : path_(std::move(dir))
{
    make_directory(path_);
    check_directory(path_);
    close_to_others(path_);
    lock_ = open_lock(path_ / "lock");
    // flock and not fcntl: it also keeps out a second store of the same process, and does not
    // end when another descriptor of the file is closed.
    if (::flock(lock_.get(), LOCK_EX | LOCK_NB) != 0) {
        throw_lock_failure(path_, lock_.get(), errno);
    }
    write_holder(lock_.get());
}

} // namespace ovhost
