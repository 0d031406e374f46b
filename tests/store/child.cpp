#include "tests/store/child.h"

#include <grp.h>
#include <sys/prctl.h>
#include <sys/wait.h>
#include <unistd.h>

#include <array>
#include <cstdlib>
#include <exception>
#include <stdexcept>

namespace ovtest
{
namespace
{

std::string answer_of(const std::function<std::string()> &run)
{
    try {
        return run();
    } catch (const std::exception &error) {
        return std::string("exception: ") + error.what();
    }
}

void write_all(int fd, const std::string &text)
{
    for (std::size_t done = 0; done < text.size();) {
        const ssize_t written = ::write(fd, text.data() + done, text.size() - done);
        if (written <= 0)
            return;
        done += static_cast<std::size_t>(written);
    }
}

std::string read_all(int fd)
{
    std::string text;
    std::array<char, 4096> piece{};
    for (;;) {
        const ssize_t got = ::read(fd, piece.data(), piece.size());
        if (got <= 0)
            return text;
        text.append(piece.data(), static_cast<std::size_t>(got));
    }
}

} // namespace

std::string in_child(const std::function<std::string()> &run)
{
    std::array<int, 2> ends{};
    if (::pipe(ends.data()) != 0)
        throw std::runtime_error("pipe");
    const pid_t child = ::fork();
    if (child == 0) {
        ::close(ends[0]);
        write_all(ends[1], answer_of(run));
        ::_exit(0);
    }
    ::close(ends[1]);
    const std::string answer = read_all(ends[0]);
    ::close(ends[0]);
    int status = 0;
    if (child < 0 || ::waitpid(child, &status, 0) != child)
        throw std::runtime_error("fork");
    return status == 0 ? answer : "died";
}

void become_unprivileged()
{
    if (::geteuid() != 0)
        return;
    if (::setgroups(0, nullptr) != 0 ||
        ::setresgid(kUnprivilegedUser, kUnprivilegedUser, kUnprivilegedUser) != 0 ||
        ::setresuid(kUnprivilegedUser, kUnprivilegedUser, kUnprivilegedUser) != 0) {
        throw std::runtime_error("cannot become an unprivileged user");
    }
    // A program started by that user has its own /proc/self; this one lost it with the change.
    ::prctl(PR_SET_DUMPABLE, 1);
}

} // namespace ovtest
