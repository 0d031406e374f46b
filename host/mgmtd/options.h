#pragma once
// The command line of mgmtd.

#include "host/store/commit_record.h"

#include <filesystem>
#include <optional>
#include <string>

namespace ovhost
{

struct DaemonOptions {
    std::filesystem::path state_dir = "/var/lib/mgmtd";
    std::string socket = "/run/mgmtd/control.sock";
    std::string group;          ///< empty: nobody but this user and root
    std::string model;          ///< empty: the configuration's own
    std::filesystem::path root; ///< empty: the machine's own paths
    int log_level = 5;
    int module_log_level = 6;
    unsigned peer_buffer_mib = 64;
    HistoryBounds history;
};

/// Reads the command line. Nothing when the process is to end with `ret_exit_code`: help was asked
/// for and given, or the command line has a fault, which was told on standard error.
[[nodiscard]] std::optional<DaemonOptions> parse_options(int argc, char **argv, int &ret_exit_code);

} // namespace ovhost
