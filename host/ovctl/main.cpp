// ovctl: the client of mgmtd. options.h reads the command line, run.h does what it says.

#include "host/ovctl/run.h"
#include "host/ovctl/terminal.h"
#include "host/support/standard_fds.h"

#include <unistd.h>

#include <iostream>

int main(int argc, char **argv)
{
    ovhost::fill_standard_fds();
    ovhost::set_terminal(std::cout, ovhost::look_at_terminal(STDOUT_FILENO));
    ovhost::set_terminal(std::cerr, ovhost::look_at_terminal(STDERR_FILENO));
    int exit_code = 0;
    const auto invocation = ovhost::read_command_line(argc, argv, std::cout, std::cerr, exit_code);
    if (!invocation) {
        return exit_code;
    }
    const ovhost::ExitCode code = ovhost::run_command(*invocation, std::cout, std::cerr);
    if (!std::cout.flush()) {
        std::cerr << "ovctl: cannot write to standard output\n";
        return static_cast<int>(ovhost::ExitCode::usage);
    }
    return static_cast<int>(code);
}
