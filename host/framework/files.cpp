#include "framework/files.h"

#include "framework/logging.h"
#include "host/framework/c_boundary.h"
#include "host/framework/conf_file.h"
#include "host/framework/log_config.h"
#include "host/framework/objects.h"

#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

#include <algorithm>
#include <cerrno>
#include <cstring>
#include <memory>
#include <optional>
#include <string>
#include <string_view>
#include <vector>

namespace
{

using ovhost::at_c_boundary;

class OpenFile
{
  public:
    /// Without O_NONBLOCK a pipe in the file's place would hold the daemon until somebody writes.
    explicit OpenFile(const char *path) : fd_(::open(path, O_RDONLY | O_CLOEXEC | O_NONBLOCK)) {}
    OpenFile(const OpenFile &) = delete;
    OpenFile &operator=(const OpenFile &) = delete;
    ~OpenFile()
    {
        if (fd_ >= 0) {
            ::close(fd_);
        }
    }

    [[nodiscard]] bool is_open() const { return fd_ >= 0; }
    [[nodiscard]] int fd() const { return fd_; }

  private:
    int fd_;
};

/// Whether the failure of a system call says that there is nothing at the path.
bool says_absent(int error)
{
    return error == ENOENT || error == ENOTDIR;
}

constexpr std::size_t smallest_read = 65536;

/// Fills the buffer from the file, as far as either goes; nothing when the file cannot be read.
std::optional<std::size_t> read_up_to(int fd, char *buffer, std::size_t size)
{
    std::size_t filled = 0;
    while (filled < size) {
        const ssize_t count = ::read(fd, buffer + filled, size - filled);
        if (count == 0) {
            break;
        }
        if (count < 0 && errno != EINTR) {
            return std::nullopt;
        }
        filled += count > 0 ? static_cast<std::size_t>(count) : 0;
    }
    return filled;
}

/// Adds the lines of a text that the array already holds: each line end becomes the end of a text.
/// A last line without a line end counts when it is not empty.
void add_lines(tstr_array &lines, char *text, std::size_t size)
{
    text[size] = '\n';
    char *const end = text + size;
    lines.texts.reserve(lines.texts.size() + static_cast<std::size_t>(std::count(text, end, '\n')) +
                        1);
    while (text < end) {
        char *const line_end =
            static_cast<char *>(std::memchr(text, '\n', static_cast<std::size_t>(end - text) + 1));
        *line_end = '\0';
        lines.texts.push_back(text);
        text = line_end + 1;
    }
}

/// All lines of an open file; nothing when it is no regular one or cannot be read. It may grow
/// meanwhile, and those of /proc do not tell their size: then it takes further passes.
std::optional<tstr_array> read_lines(int fd)
{
    struct stat status = {};
    if (::fstat(fd, &status) != 0 || !S_ISREG(status.st_mode)) {
        return std::nullopt;
    }
    tstr_array lines;
    // With room for one byte more than there is, one pass sees the end.
    const std::size_t room = std::max(static_cast<std::size_t>(status.st_size), smallest_read) + 1;
    for (std::string unfinished;;) {
        char *const text = lines.claim(unfinished.size() + room + 1);
        std::ranges::copy(unfinished, text);
        const auto filled = read_up_to(fd, text + unfinished.size(), room);
        if (!filled) {
            return std::nullopt;
        }
        const std::size_t size = unfinished.size() + *filled;
        if (*filled < room) {
            add_lines(lines, text, size);
            return lines;
        }
        const char *const last = static_cast<const char *>(::memrchr(text, '\n', size));
        const std::size_t whole = last != nullptr ? static_cast<std::size_t>(last - text) + 1 : 0;
        unfinished.assign(text + whole, size - whole);
        add_lines(lines, text, whole);
    }
}

} // namespace

namespace ovhost
{

std::optional<std::string> conf_file_refusal(const char *path)
{
    const OpenFile file(path);
    if (!file.is_open()) {
        return std::string("it cannot be opened: ") + std::strerror(errno);
    }
    struct stat status = {};
    if (::fstat(file.fd(), &status) != 0) {
        return std::string("its status cannot be read: ") + std::strerror(errno);
    }
    if (!S_ISREG(status.st_mode)) {
        return "it is not a regular file";
    }
    if ((status.st_mode & S_IWOTH) != 0) {
        return "everybody may write to it; take that right away with chmod o-w";
    }
    return std::nullopt;
}

} // namespace ovhost

int lf_test_exists(const char *path, tbool *ret)
{
    if (path == nullptr || ret == nullptr) {
        return lc_err_unexpected_null;
    }
    struct stat status = {};
    const bool exists = ::stat(path, &status) == 0;
    if (!exists && !says_absent(errno)) {
        return lc_err_io_error;
    }
    *ret = exists;
    return lc_err_no_error;
}

int lf_read_file_lines(const char *path, tstr_array **ret)
{
    if (ret == nullptr) {
        return lc_err_unexpected_null;
    }
    *ret = nullptr;
    if (path == nullptr) {
        return lc_err_unexpected_null;
    }
    const OpenFile file(path);
    if (!file.is_open()) {
        return says_absent(errno) ? lc_err_file_not_found : lc_err_io_error;
    }
    return at_c_boundary([&]() -> int {
        std::optional<tstr_array> lines = read_lines(file.fd());
        return lines ? ovhost::hand_out(ret, *std::move(lines)) : lc_err_io_error;
    });
}

tbool conf_file_okay(const char *path)
{
    if (path == nullptr) {
        return false;
    }
    return at_c_boundary(
        [path] {
            const std::optional<std::string> reason = ovhost::conf_file_refusal(path);
            if (reason) {
                ovhost::log_host_line(ov_log_notice, "files",
                                      std::string("configuration file ") + path +
                                          " is not used: " + *reason);
            }
            return !reason;
        },
        false);
}
