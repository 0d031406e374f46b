#pragma once
// The exit codes of ovctl. Scripts rely on them; the help text lists them too.

namespace ovhost
{

enum class ExitCode {
    ok = 0,
    refused = 1,     ///< mgmtd refused or failed, or a check has found something
    usage = 2,       ///< the command line, or a file named on it
    unreachable = 3, ///< no answer from mgmtd
    protocol = 4,    ///< an answer that cannot be understood
};

} // namespace ovhost
