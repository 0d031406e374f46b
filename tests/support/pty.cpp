#include "tests/support/pty.h"

#include "tests/support/eventually.h"

#include <poll.h>
#include <pty.h>
#include <sys/ioctl.h>
#include <sys/wait.h>
#include <unistd.h>

#include <array>
#include <cerrno>
#include <chrono>
#include <csignal>
#include <cstdlib>
#include <system_error>

namespace ovtest
{
namespace
{

int exit_code_of(int status)
{
    return WIFEXITED(status) ? WEXITSTATUS(status) : 128 + WTERMSIG(status);
}

std::vector<char *> pointers_to(const std::vector<std::string> &texts)
{
    std::vector<char *> pointers;
    for (const std::string &text : texts)
        pointers.push_back(const_cast<char *>(text.c_str()));
    pointers.push_back(nullptr);
    return pointers;
}

} // namespace

PtyProcess::PtyProcess(const std::vector<std::string> &argv, unsigned short columns,
                       const std::vector<std::string> &environment)
{
    std::vector<std::string> variables = environment;
    for (const char *name : {"PATH", "HOME"})
        if (const char *value = std::getenv(name); value != nullptr)
            variables.push_back(std::string(name) + "=" + value);
    const std::vector<char *> words = pointers_to(argv);
    const std::vector<char *> settings = pointers_to(variables);
    winsize size{};
    size.ws_row = 24;
    size.ws_col = columns;
    pid_ = ::forkpty(&master_, nullptr, nullptr, &size);
    if (pid_ < 0)
        throw std::system_error(errno, std::generic_category(), "forkpty");
    if (pid_ > 0)
        return;
    ::execve(words[0], words.data(), settings.data());
    ::_exit(127);
}

PtyProcess::~PtyProcess()
{
    if (pid_ > 0) {
        ::kill(pid_, SIGKILL);
        ::waitpid(pid_, nullptr, 0);
    }
    ::close(master_);
}

void PtyProcess::type(const std::string &text) const
{
    if (::write(master_, text.data(), text.size()) != static_cast<ssize_t>(text.size()))
        throw std::system_error(errno, std::generic_category(), "typing");
}

void PtyProcess::signal(int number) const
{
    ::kill(pid_, number);
}

/// False when there is nothing to read in time, or no more at all.
bool PtyProcess::read_piece(int milliseconds)
{
    pollfd watched{.fd = master_, .events = POLLIN, .revents = 0};
    if (::poll(&watched, 1, milliseconds) <= 0)
        return false;
    std::array<char, 4096> piece;
    const ssize_t got = ::read(master_, piece.data(), piece.size());
    if (got > 0)
        bytes_.append(piece.data(), static_cast<std::size_t>(got));
    return got > 0;
}

bool PtyProcess::read_until(const std::string &text)
{
    const auto deadline = std::chrono::steady_clock::now() + std::chrono::seconds(10);
    while (bytes_.find(text) == std::string::npos) {
        if (std::chrono::steady_clock::now() > deadline)
            return false;
        static_cast<void>(read_piece(100));
    }
    return true;
}

int PtyProcess::read_to_end()
{
    while (read_piece(60000)) {
    }
    int status = 0;
    ::waitpid(pid_, &status, 0);
    pid_ = -1;
    return exit_code_of(status);
}

bool PtyProcess::fill_up() const
{
    using Clock = std::chrono::steady_clock;
    int before = 0;
    auto since = Clock::now();
    return eventually([&] {
        int waiting = 0;
        ::ioctl(master_, FIONREAD, &waiting);
        if (waiting != before) {
            before = waiting;
            since = Clock::now();
        }
        return waiting > 0 && Clock::now() - since > std::chrono::milliseconds(100);
    });
}

bool PtyProcess::wait_unread(int &exit_code)
{
    int status = 0;
    const bool ended = eventually([&] { return ::waitpid(pid_, &status, WNOHANG) == pid_; });
    if (ended)
        pid_ = -1;
    exit_code = exit_code_of(status);
    return ended;
}

std::string PtyProcess::shown() const
{
    std::string text;
    for (std::size_t i = 0; i < bytes_.size(); ++i)
        if (bytes_[i] != '\r' || i + 1 == bytes_.size() || bytes_[i + 1] != '\n')
            text += bytes_[i];
    return text;
}

} // namespace ovtest
