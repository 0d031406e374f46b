#include "tests/support/private_network.h"

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

[[noreturn]] void fail(const std::string &what)
{
    throw std::runtime_error("cannot enter a private network: " + what + ": " +
                             std::generic_category().message(errno) +
                             "; run as root, or allow user namespaces (sysctl "
                             "user.max_user_namespaces above 0; a container must allow unshare)");
}

std::string map_to_itself(id_t id)
{
    return std::to_string(id) + " " + std::to_string(id) + " 1";
}

// A new user namespace comes with capabilities that would pass the permissions of files.
void drop_capabilities()
{
    __user_cap_header_struct header{_LINUX_CAPABILITY_VERSION_3, 0};
    const std::array<__user_cap_data_struct, _LINUX_CAPABILITY_U32S_3> none{};
    if (::syscall(SYS_capset, &header, none.data()) != 0) {
        fail("dropping capabilities");
    }
}

void unshare_as_user()
{
    const uid_t user = ::geteuid();
    const gid_t group = ::getegid();
    if (::unshare(CLONE_NEWUSER | CLONE_NEWNET) != 0) {
        fail("making a user and network namespace");
    }
    write_file("/proc/self/setgroups", "deny");
    write_file("/proc/self/uid_map", map_to_itself(user));
    write_file("/proc/self/gid_map", map_to_itself(group));
    drop_capabilities();
}

} // namespace

void enter_private_network()
{
    if (::unshare(CLONE_NEWNET) != 0) {
        unshare_as_user();
    }
}

} // namespace ovtest
