#include "host/support/read_file.h"

#include <unistd.h>

#include <algorithm>
#include <array>
#include <cerrno>
#include <system_error>

namespace ovhost
{

std::string read_to_end(int fd, std::size_t limit)
{
    std::string text;
    std::array<char, 65536> piece;
    while (text.size() <= limit) {
        const std::size_t wanted = std::min(piece.size(), limit - text.size() + 1);
        const ssize_t got = ::read(fd, piece.data(), wanted);
        if (got == 0) {
            break;
        }
        if (got < 0 && errno != EINTR) {
            throw std::system_error(errno, std::generic_category());
        }
        if (got > 0) {
            text.append(piece.data(), static_cast<std::size_t>(got));
        }
    }
    return text;
}

} // namespace ovhost
