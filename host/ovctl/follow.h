#pragma once
// Prints what mgmtd reports until the user or mgmtd ends it. run.h carries out all commands that
// end by themselves.

#include "host/ovctl/exit_code.h"

#include <nlohmann/json_fwd.hpp>

#include <iosfwd>

namespace ovhost
{

class ControlClient;
struct Command;

/// Sends a command that follows, with its arguments. Each event is printed as `out` would show it,
/// but written to standard output at once and only as long as neither SIGINT nor SIGTERM comes,
/// however slowly it is read. Returns when one of them did, or when mgmtd says that it stops.
/// Throws ClientError when the connection ends otherwise, std::runtime_error when the output cannot
/// be written.
[[nodiscard]] ExitCode follow_events(ControlClient &client, const Command &command,
                                     const nlohmann::json &arguments, bool as_json,
                                     std::ostream &out);

} // namespace ovhost
