#include "framework/files.h"

#include "framework/logging.h"
#include "host/framework/c_boundary.h"
#include "host/framework/log_config.h"
#include "host/framework/objects.h"

#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

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
    OpenFile(const char *path, int flags) : fd_(::open(path, flags | O_RDONLY | O_CLOEXEC)) {}
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

/// Lines out of a file that arrives in blocks, each line copied once.
class LineCollector
{
  public:
    void add_block(std::string_view block)
    {
        for (std::size_t end = block.find('\n'); end != std::string_view::npos;
             end = block.find('\n')) {
            begun_.append(block.substr(0, end));
            lines_.push_back(std::move(begun_));
            begun_.clear();
            block.remove_prefix(end + 1);
        }
        begun_.append(block);
    }

    /// All lines; a last one without a line end counts when it is not empty.
    std::vector<std::string> finish() &&
    {
        if (!begun_.empty()) {
            lines_.push_back(std::move(begun_));
        }
        return std::move(lines_);
    }

  private:
    std::vector<std::string> lines_;
    std::string begun_;
};

/// All lines of an open file; nothing when it cannot be read.
std::optional<std::vector<std::string>> read_lines(int fd)
{
    constexpr std::size_t block_size = std::size_t{256} * 1024;
    const auto block = std::make_unique_for_overwrite<char[]>(block_size);
    LineCollector collector;
    for (;;) {
        const ssize_t count = ::read(fd, block.get(), block_size);
        if (count == 0) {
            return std::move(collector).finish();
        }
        if (count > 0) {
            collector.add_block({block.get(), static_cast<std::size_t>(count)});
        } else if (errno != EINTR) {
            return std::nullopt;
        }
    }
}

/// Why a configuration file may not be used; nothing when it may.
std::optional<std::string> refusal(const char *path)
{
    // Without O_NONBLOCK a pipe in the file's place would hold the daemon until somebody writes.
    const OpenFile file(path, O_NONBLOCK);
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

} // namespace

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
    const OpenFile file(path, 0);
    if (!file.is_open()) {
        return says_absent(errno) ? lc_err_file_not_found : lc_err_io_error;
    }
    return at_c_boundary([&]() -> int {
        std::optional<std::vector<std::string>> lines = read_lines(file.fd());
        return lines ? ovhost::hand_out(ret, tstr_array{*std::move(lines)}) : lc_err_io_error;
    });
}

tbool conf_file_okay(const char *path)
{
    if (path == nullptr) {
        return false;
    }
    return at_c_boundary(
        [path] {
            const std::optional<std::string> reason = refusal(path);
            if (reason) {
                ovhost::log_host_line(ov_log_notice, "files",
                                      std::string("configuration file ") + path +
                                          " is not used: " + *reason);
            }
            return !reason;
        },
        false);
}
