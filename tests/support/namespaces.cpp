#include "tests/support/namespaces.h"

#include "tests/support/files.h"

#include <linux/capability.h>
#include <sched.h>
#include <sys/syscall.h>
#include <unistd.h>

#include <array>
#include <cerrno>
#include <stdexcept>
#include <string>
#include <system_error>

namespace ovtest
{
namespace
{

using Capabilities = std::array<__user_cap_data_struct, _LINUX_CAPABILITY_U32S_3>;

[[noreturn]] void fail(const std::string &what)
{
    throw std::runtime_error("cannot " + what + ": " + std::generic_category().message(errno) +
                             "; run as root, or allow user namespaces (sysctl "
                             "user.max_user_namespaces above 0; a container must allow unshare)");
}

std::string map_to_itself(id_t id)
{
    return std::to_string(id) + " " + std::to_string(id) + " 1";
}

} // namespace

void unshare_as_any_user(int namespaces)
{
    if (::unshare(namespaces) == 0) {
        return;
    }
    const uid_t user = ::geteuid();
    const gid_t group = ::getegid();
    if (::unshare(CLONE_NEWUSER | namespaces) != 0) {
        fail("make namespaces");
    }
    write_file("/proc/self/setgroups", "deny");
    write_file("/proc/self/uid_map", map_to_itself(user));
    write_file("/proc/self/gid_map", map_to_itself(group));
}

void enter_private_network()
{
    __user_cap_header_struct header{_LINUX_CAPABILITY_VERSION_3, 0};
    Capabilities before{};
    if (::syscall(SYS_capget, &header, before.data()) != 0) {
        fail("read capabilities");
    }
    unshare_as_any_user(CLONE_NEWNET);
    // Those of a user namespace would pass the permissions of files.
    if (::syscall(SYS_capset, &header, before.data()) != 0) {
        fail("drop capabilities");
    }
}

} // namespace ovtest
