#include "tests/support/process.h"

#include <fcntl.h>
#include <sys/wait.h>
#include <unistd.h>

#include <cerrno>
#include <csignal>
#include <cstdlib>
#include <system_error>

namespace ovtest
{

namespace
{

void redirect(const std::string &path, int flags, int target)
{
    const int fd = ::open(path.c_str(), flags, 0600);
    if (fd < 0 || ::dup2(fd, target) < 0) {
        ::_exit(126);
    }
    ::close(fd);
}

} // namespace

Process::Process(const std::vector<std::string> &argv, const std::string &input,
                 const std::vector<std::string> &environment)
{
    write_file(dir_ / "in", input);
    pid_ = ::fork();
    if (pid_ < 0) {
        throw std::system_error(errno, std::generic_category(), "fork");
    }
    if (pid_ > 0) {
        return;
    }

    redirect(dir_.path("in"), O_RDONLY, STDIN_FILENO);
    redirect(dir_.path("out"), O_WRONLY | O_CREAT | O_TRUNC, STDOUT_FILENO);
    redirect(dir_.path("err"), O_WRONLY | O_CREAT | O_TRUNC, STDERR_FILENO);
    for (const std::string &setting : environment) {
        ::putenv(const_cast<char *>(setting.c_str()));
    }
    std::vector<char *> words;
    for (const std::string &word : argv) {
        words.push_back(const_cast<char *>(word.c_str()));
    }
    words.push_back(nullptr);
    ::execv(words[0], words.data());
    ::_exit(127);
}

Process::~Process()
{
    if (pid_ <= 0) {
        return;
    }
    signal(SIGKILL);
    static_cast<void>(wait());
}

void Process::signal(int number) const
{
    ::kill(pid_, number);
}

int Process::wait()
{
    int status = 0;
    if (::waitpid(pid_, &status, 0) != pid_) {
        throw std::system_error(errno, std::generic_category(), "waitpid");
    }
    pid_ = -1;
    return WIFEXITED(status) ? WEXITSTATUS(status) : 128 + WTERMSIG(status);
}

void PrintTo(const Outcome &outcome, std::ostream *stream)
{
    *stream << "exit code " << outcome.exit_code << "\n--- out\n"
            << outcome.out << "--- err\n"
            << outcome.err << "---";
}

Outcome run(const std::vector<std::string> &argv, const std::string &input,
            const std::vector<std::string> &environment)
{
    Process process(argv, input, environment);
    const int exit_code = process.wait();
    return {exit_code, process.out(), process.err()};
}

} // namespace ovtest
