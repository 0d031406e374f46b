// A network namespace of the test program's own: what the kernel says of its interfaces does then
// not depend on the machine. host/mgmtd/private_root.h does the like for files.
#pragma once

namespace ovtest
{

// From here on this process and those it starts see one interface of the kernel, "lo" (more only
// where the kernel adds tunnels to each namespace: sysctl net.core.fb_tunnels_only_for_init_net).
//
// The process must have one thread. Throws std::runtime_error, which says what to do.
void enter_private_network();

} // namespace ovtest
