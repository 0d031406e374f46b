// Namespaces of the kernel for a test's own use.
#pragma once

namespace ovtest
{

// unshare(2), for any user: one that may not do it does it in a user namespace, with its own IDs
// and every capability there. The process must have one thread. Throws std::runtime_error, which
// says what to do.
void unshare_as_any_user(int namespaces);

// A network namespace of the process: what the kernel says of its interfaces does then not depend
// on the machine. From here on this process and those it starts see one, "lo" (more only where the
// kernel adds tunnels to each namespace: sysctl net.core.fb_tunnels_only_for_init_net). It has the
// capabilities of before. host/mgmtd/private_root.h does the like for files.
void enter_private_network();

} // namespace ovtest
