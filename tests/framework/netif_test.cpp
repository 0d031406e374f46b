// The interface operations of framework/appliance.h; appliance_test.cpp has those on the model.
#include "framework/appliance.h"

#include "tests/framework/log_capture.h"

#include <sys/resource.h>
#include <sys/socket.h>
#include <unistd.h>

#include <gtest/gtest.h>

#include <fstream>
#include <string>

namespace ovhost::test
{
namespace
{

/// The kernel's own list has two head lines and a line for each interface.
int count_kernel_interfaces()
{
    std::ifstream list("/proc/self/net/dev");
    int count = -2;
    for (std::string line; std::getline(list, line);) {
        ++count;
    }
    return count;
}

TEST(InterfaceCount, AgreesWithTheKernelsList)
{
    const int expected = count_kernel_interfaces();
    ASSERT_GE(expected, 1);
    EXPECT_EQ(ovif_get_ifcount(), expected);
}

TEST(InterfaceSocket, IsOpenedOnce)
{
    g_ovif_skfd = -1;
    ASSERT_EQ(ovif_network_init_sockets(), 0);
    const int opened = g_ovif_skfd;
    ASSERT_GE(opened, 0);
    int type = 0;
    socklen_t size = sizeof(type);
    ASSERT_EQ(::getsockopt(opened, SOL_SOCKET, SO_TYPE, &type, &size), 0);
    EXPECT_EQ(type, SOCK_DGRAM);
    ASSERT_EQ(ovif_network_init_sockets(), 0);
    EXPECT_EQ(g_ovif_skfd, opened);
    ::close(opened);
    g_ovif_skfd = -1;
}

/// While it lives, no further file descriptor can be opened.
class NoFileDescriptors
{
  public:
    NoFileDescriptors()
    {
        EXPECT_EQ(::getrlimit(RLIMIT_NOFILE, &former_), 0);
        const rlimit none = {0, former_.rlim_max};
        EXPECT_EQ(::setrlimit(RLIMIT_NOFILE, &none), 0);
    }
    NoFileDescriptors(const NoFileDescriptors &) = delete;
    NoFileDescriptors &operator=(const NoFileDescriptors &) = delete;
    ~NoFileDescriptors() { ::setrlimit(RLIMIT_NOFILE, &former_); }

  private:
    rlimit former_ = {};
};

TEST(InterfaceSocket, SaysWhenItCannotBeOpened)
{
    LogCapture log;
    g_ovif_skfd = -1;
    {
        const NoFileDescriptors limit;
        EXPECT_EQ(ovif_network_init_sockets(), 14014);
    }
    EXPECT_LT(g_ovif_skfd, 0);
    ASSERT_EQ(log.lines.size(), 1U);
    EXPECT_EQ(log.lines[0].text,
              "the interface-control socket cannot be opened: Too many open files");
}

TEST(InterfaceCount, IsNoneWithALogLineWhenTheKernelDoesNotSay)
{
    LogCapture log;
    {
        const NoFileDescriptors limit;
        EXPECT_EQ(ovif_get_ifcount(), 0);
    }
    ASSERT_EQ(log.lines.size(), 1U);
    EXPECT_EQ(log.lines[0].level, 3);
}

} // namespace
} // namespace ovhost::test
