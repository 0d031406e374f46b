// The interface operations of framework/appliance.h; appliance.cpp has those on the model.
#include "framework/appliance.h"

#include "framework/logging.h"
#include "host/framework/log_config.h"

#include <net/if.h>
#include <sys/socket.h>

#include <cerrno>
#include <cstring>
#include <memory>
#include <string>

namespace
{

constexpr const char *log_unit = "netif";

struct FreeNameIndex {
    void operator()(struct if_nameindex *interfaces) const { ::if_freenameindex(interfaces); }
};

void log_failure(const char *what)
{
    ovhost::log_host_line(ov_log_error, log_unit, std::string(what) + ": " + std::strerror(errno));
}

} // namespace

int g_ovif_skfd = -1;

int ovif_get_ifcount(void)
{
    const std::unique_ptr<struct if_nameindex, FreeNameIndex> interfaces(::if_nameindex());
    if (!interfaces) {
        log_failure("the kernel does not list its network interfaces");
        return 0;
    }
    int count = 0;
    while (interfaces.get()[count].if_index != 0) {
        ++count;
    }
    return count;
}

int ovif_network_init_sockets(void)
{
    if (g_ovif_skfd >= 0) {
        return lc_err_no_error;
    }
    g_ovif_skfd = ::socket(AF_INET, SOCK_DGRAM | SOCK_CLOEXEC, 0);
    if (g_ovif_skfd < 0) {
        log_failure("the interface-control socket cannot be opened");
        return lc_err_io_error;
    }
    return lc_err_no_error;
}
