#pragma once
// Carries out one command of ovctl: build the request, ask mgmtd, print. options.h is what comes
// before.

#include "host/ovctl/exit_code.h"
#include "host/ovctl/options.h"

#include <iosfwd>

namespace ovhost
{

[[nodiscard]] ExitCode run_command(const Invocation &invocation, std::ostream &out,
                                   std::ostream &err);

} // namespace ovhost
