#include "host/support/standard_fds.h"

#include <fcntl.h>
#include <unistd.h>

namespace ovhost
{
namespace
{

/// Whether the descriptor was open. All lower ones are by now, so that open() gives this number.
bool fill(int fd) noexcept
{
    if (::fcntl(fd, F_GETFD) >= 0) {
        return true;
    }
    [[maybe_unused]] const int opened = ::open("/dev/null", O_RDWR);
    return false;
}

} // namespace

StandardFds fill_standard_fds() noexcept
{
    StandardFds were_open;
    were_open.input = fill(STDIN_FILENO);
    were_open.output = fill(STDOUT_FILENO);
    were_open.error = fill(STDERR_FILENO);
    return were_open;
}

} // namespace ovhost
