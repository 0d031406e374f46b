#pragma once
// Runs the calling process with the library's fixed paths, /opt/orvale and /var/opt/tms, in a
// directory of the caller's choice: in a mount namespace of its own, which ends with the process.
// The machine's file system outside that directory is not touched.

#include <filesystem>

namespace ovhost
{

/// From here on /opt/orvale and /var/opt/tms are DIR/opt/orvale and DIR/var/opt/tms for this
/// process and for those it starts. They are made when they are missing, with
/// DIR/var/opt/tms/output; DIR itself must be there. Where the machine has no /opt/orvale or no
/// /var/opt/tms, its /opt or /var/opt keeps its entries but cannot be written.
///
/// The process must have one thread. It needs no privilege where user namespaces are allowed, and
/// ends with the capabilities it had. Throws std::runtime_error, which says what failed and what
/// to do; the process should then end, since it may be in half a namespace.
void enter_private_root(const std::filesystem::path &dir);

} // namespace ovhost
