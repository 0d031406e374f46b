// Who may use the control socket: host/control/access.h, and what the server does about it.

#include "host/control/access.h"

#include "host/support/unique_fd.h"
#include "host/support/user_name.h"
#include "tests/control/raw_client.h"
#include "tests/control/test_server.h"
#include "tests/support/eventually.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <sys/socket.h>
#include <unistd.h>

#include <vector>

namespace ovhost
{
namespace
{

using ovtest::eventually;
using test::RawClient;
using test::TestServer;
using testing::UnorderedElementsAreArray;

constexpr const char *request = "{\"id\":1,\"command\":\"echo\",\"text\":\"x\"}\n";
constexpr const char *answer = R"({"id":1,"ok":true,"result":{"text":"x"}})";

/// A user that this process is not.
uid_t somebody_else()
{
    return ::geteuid() + 1;
}

PeerCredentials peer_with(uid_t uid, gid_t gid, std::vector<gid_t> groups)
{
    return {.pid = 1, .uid = uid, .gid = gid, .groups = std::move(groups)};
}

TEST(AccessTest, CredentialsAreThoseOfTheOtherEnd)
{
    int ends[2];
    ASSERT_EQ(::socketpair(AF_UNIX, SOCK_STREAM, 0, ends), 0);
    const UniqueFd one(ends[0]);
    const UniqueFd other(ends[1]);
    const PeerCredentials peer = credentials_of(one.get());
    EXPECT_EQ(peer.pid, ::getpid());
    EXPECT_EQ(peer.uid, ::geteuid());
    EXPECT_EQ(peer.gid, ::getegid());
    std::vector<gid_t> groups(65536);
    const int count = ::getgroups(static_cast<int>(groups.size()), groups.data());
    ASSERT_GE(count, 0);
    groups.resize(static_cast<std::size_t>(count));
    EXPECT_THAT(peer.groups, UnorderedElementsAreArray(groups));
}

TEST(AccessTest, WhatIsNoSocketHasNoCredentials)
{
    EXPECT_THROW(static_cast<void>(credentials_of(STDIN_FILENO)), std::system_error);
}

TEST(AccessTest, WithoutAGroupOnlyRootAndTheOwnUserAreAllowed)
{
    const AccessPolicy policy;
    EXPECT_TRUE(policy.allows(peer_with(0, 5, {})));
    EXPECT_TRUE(policy.allows(peer_with(::geteuid(), 5, {})));
    EXPECT_FALSE(policy.allows(peer_with(somebody_else(), ::getegid(), {::getegid()})));
    EXPECT_FALSE(policy.group());
}

TEST(AccessTest, TheMembersOfTheGroupAreAllowedByEitherKindOfMembership)
{
    const AccessPolicy policy({7}, 50);
    EXPECT_TRUE(policy.allows(peer_with(7, 1, {})));
    EXPECT_TRUE(policy.allows(peer_with(8, 50, {})));
    EXPECT_TRUE(policy.allows(peer_with(8, 1, {2, 50, 3})));
    EXPECT_FALSE(policy.allows(peer_with(8, 1, {2, 51, 3})));
    EXPECT_FALSE(policy.allows(peer_with(8, 7, {})));
    EXPECT_FALSE(policy.allows(peer_with(0, 0, {}))) << "root is one of the users, or it is not";
}

TEST(AccessTest, SomebodyElseIsTurnedAwayWithAReason)
{
    TestServer server({}, {}, {}, AccessPolicy({somebody_else()}, std::nullopt));
    for (int i = 0; i < 3; ++i) {
        RawClient client(server.path());
        const std::string refusal = client.line();
        EXPECT_EQ(refusal, R"({"error":{"code":"not-allowed","details":[],"message":"user )" +
                               user_name(::geteuid()) +
                               R"( may not use this socket: be mgmtd's user, root, or a member )"
                               R"(of the group that mgmtd --group names"},"id":null,"ok":false})");
        client.send(request);
        EXPECT_EQ(client.line(), "<end>") << "a request was served";
    }
    EXPECT_TRUE(eventually([&] { return server.client_count() == 0; }));
    EXPECT_EQ(server.logged("may not use this socket").size(), 3U);
}

TEST(AccessTest, AMemberOfTheGroupIsServed)
{
    TestServer server({}, {}, {}, AccessPolicy({somebody_else()}, ::getegid()));
    RawClient client(server.path());
    client.send(request);
    EXPECT_EQ(client.line(), answer);
}

} // namespace
} // namespace ovhost
