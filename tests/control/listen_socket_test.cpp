// The socket file and who may have it: host/control/listen_socket.h.

#include "host/control/listen_socket.h"

#include "host/control/socket_address.h"
#include "tests/support/files.h"
#include "tests/support/scratch_dir.h"

#include <gtest/gtest.h>
#include <sys/socket.h>
#include <sys/stat.h>
#include <unistd.h>

#include <filesystem>
#include <string>

namespace ovhost
{
namespace
{

using ovtest::read_file;
using ovtest::ScratchDir;
using ovtest::write_file;

class ListenSocketTest : public testing::Test
{
  protected:
    /// What creating a socket there fails with, or "created".
    static std::string create(const std::string &path)
    {
        try {
            const ListenSocket socket(path);
            return "created";
        } catch (const std::exception &error) {
            return error.what();
        }
    }

    /// Leaves a socket file behind, as a daemon that was killed does.
    static void leave_stale_socket(const std::string &path)
    {
        const UniqueFd fd = new_socket();
        const sockaddr_un address = socket_address(path);
        ASSERT_EQ(::bind(fd.get(), reinterpret_cast<const sockaddr *>(&address), sizeof(address)),
                  0);
        ASSERT_EQ(::listen(fd.get(), 1), 0);
    }

    ScratchDir dir_;
    std::string path_ = dir_.path("socket");
};

TEST_F(ListenSocketTest, OnlyTheOwnerMayUseIt)
{
    const mode_t before = ::umask(0);
    {
        const ListenSocket socket(path_);
        struct stat status {
        };
        ASSERT_EQ(::stat(path_.c_str(), &status), 0);
        EXPECT_EQ(status.st_mode, static_cast<mode_t>(S_IFSOCK | 0600));
    }
    EXPECT_EQ(::umask(before), 0U) << "the umask was not put back";
}

TEST_F(ListenSocketTest, AGroupMayUseItToo)
{
    // Root can give it to any group, another user to its own.
    const gid_t group = ::geteuid() == 0 ? 65534 : ::getegid();
    const ListenSocket socket(path_, group);
    struct stat status {
    };
    ASSERT_EQ(::stat(path_.c_str(), &status), 0);
    EXPECT_EQ(status.st_mode, static_cast<mode_t>(S_IFSOCK | 0660));
    EXPECT_EQ(status.st_gid, group);
    EXPECT_EQ(status.st_uid, ::geteuid());
    const UniqueFd client = new_socket();
    const sockaddr_un address = socket_address(path_);
    EXPECT_EQ(
        ::connect(client.get(), reinterpret_cast<const sockaddr *>(&address), sizeof(address)), 0);
}

TEST_F(ListenSocketTest, TheFileGoesWithTheSocket)
{
    EXPECT_EQ(create(path_), "created");
    EXPECT_FALSE(std::filesystem::exists(path_));
}

TEST_F(ListenSocketTest, AFileThatIsNotItsOwnStays)
{
    {
        const ListenSocket socket(path_);
        std::filesystem::remove(path_);
        write_file(path_, "of someone else");
    }
    EXPECT_EQ(read_file(path_), "of someone else");
}

TEST_F(ListenSocketTest, AStaleSocketIsReplaced)
{
    leave_stale_socket(path_);
    ASSERT_TRUE(std::filesystem::exists(path_));
    EXPECT_EQ(create(path_), "created");
}

TEST_F(ListenSocketTest, ASocketInUseIsLeftAlone)
{
    const ListenSocket first(path_);
    EXPECT_EQ(create(path_),
              "socket in use by another mgmtd (" + path_ + "): stop it or choose another --socket");
    EXPECT_TRUE(std::filesystem::is_socket(path_));
}

TEST_F(ListenSocketTest, ASocketInUseWithAFullQueueIsLeftAlone)
{
    const UniqueFd busy = new_socket();
    const sockaddr_un address = socket_address(path_);
    ASSERT_EQ(::bind(busy.get(), reinterpret_cast<const sockaddr *>(&address), sizeof(address)), 0);
    ASSERT_EQ(::listen(busy.get(), 0), 0);
    std::vector<UniqueFd> waiting;
    do
        waiting.push_back(new_socket());
    while (::connect(waiting.back().get(), reinterpret_cast<const sockaddr *>(&address),
                     sizeof(address)) == 0);
    EXPECT_EQ(create(path_),
              "socket in use by another mgmtd (" + path_ + "): stop it or choose another --socket");
}

TEST_F(ListenSocketTest, WhatIsNotASocketIsNeverRemoved)
{
    write_file(path_, "precious");
    EXPECT_EQ(create(path_), "cannot create socket " + path_ +
                                 ": something else than a socket stands there: remove it or "
                                 "choose another --socket");
    EXPECT_EQ(read_file(path_), "precious");
}

TEST_F(ListenSocketTest, ALinkToASocketIsNotFollowed)
{
    const std::string target = dir_.path("target");
    leave_stale_socket(target);
    std::filesystem::create_symlink(target, path_);
    EXPECT_NE(create(path_), "created");
    EXPECT_TRUE(std::filesystem::exists(target));
    EXPECT_TRUE(std::filesystem::is_symlink(path_));
}

TEST_F(ListenSocketTest, AFolderThatIsNotThereIsNamed)
{
    const std::string folder = dir_.path("missing");
    EXPECT_EQ(create(folder + "/socket"), "cannot create socket " + folder + "/socket: directory " +
                                              folder +
                                              ": No such file or directory: make it, or choose "
                                              "another --socket");
}

TEST_F(ListenSocketTest, APathCanBeTooLong)
{
    const std::string name(107 - dir_.path("").size(), 'x');
    EXPECT_EQ(create(dir_.path(name)), "created") << "107 bytes are possible";
    const std::string longer = dir_.path(name + "x");
    ASSERT_EQ(longer.size(), 108U);
    EXPECT_EQ(create(longer), "socket path " + longer +
                                  " is 108 bytes long, at most 107 are possible: choose a shorter "
                                  "--socket");
}

TEST_F(ListenSocketTest, APathIsNeeded)
{
    EXPECT_EQ(create(""), "the socket path is empty: give one with --socket");
}

} // namespace
} // namespace ovhost
