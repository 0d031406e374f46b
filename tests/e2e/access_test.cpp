// Who may use the socket of the real daemon. Another user connects where the tests run as root;
// elsewhere nobody can become another one, and the file's mode is what is left to look at.

#include "host/control/client.h"
#include "host/support/user_name.h"
#include "tests/control/raw_client.h"
#include "tests/e2e/harness.h"

#include <grp.h>
#include <sys/stat.h>
#include <unistd.h>

#include <cerrno>
#include <optional>
#include <system_error>

namespace
{

using namespace e2e;
using ovhost::ClientError;
using ovhost::ControlClient;
using ovhost::test::RawClient;
using testing::HasSubstr;
using testing::Not;

constexpr uid_t nobody = 65534;
constexpr const char *request = "{\"id\":1,\"command\":\"discard\"}\n";
constexpr const char *answer = R"({"id":1,"ok":true,"result":{"changes":0}})";

/// While it lives, this process connects as a user without rights who is in these groups.
class OtherUser
{
  public:
    explicit OtherUser(const std::vector<gid_t> &groups) : groups_(groups_of_this_process())
    {
        check(::setgroups(groups.size(), groups.data()));
        check(::setegid(nobody));
        check(::seteuid(nobody));
    }
    OtherUser(const OtherUser &) = delete;
    OtherUser &operator=(const OtherUser &) = delete;
    ~OtherUser()
    {
        EXPECT_EQ(::seteuid(0), 0);
        EXPECT_EQ(::setegid(group_), 0);
        EXPECT_EQ(::setgroups(groups_.size(), groups_.data()), 0);
    }

  private:
    static void check(int result)
    {
        if (result != 0) {
            throw std::system_error(errno, std::generic_category(), "cannot become another user");
        }
    }

    static std::vector<gid_t> groups_of_this_process()
    {
        std::vector<gid_t> groups(65536);
        const int count = ::getgroups(static_cast<int>(groups.size()), groups.data());
        check(count < 0 ? -1 : 0);
        groups.resize(static_cast<std::size_t>(count));
        return groups;
    }

    std::vector<gid_t> groups_;
    gid_t group_ = ::getegid();
};

class Access : public E2eTest
{
  protected:
    [[nodiscard]] mode_t mode() const
    {
        struct stat status {
        };
        EXPECT_EQ(::stat(socket_.c_str(), &status), 0);
        return status.st_mode & 0777U;
    }

    void let_everybody_at_the_file() const { ASSERT_EQ(::chmod(socket_.c_str(), 0666), 0); }

    [[nodiscard]] RawClient connect_as_other_user(const std::vector<gid_t> &groups) const
    {
        const OtherUser user(groups);
        return RawClient(socket_);
    }

    /// Why ovctl could not connect as another user; empty when it could.
    [[nodiscard]] std::string obstacle_of_other_user() const
    {
        const OtherUser user({});
        try {
            const ControlClient client(socket_);
        } catch (const ClientError &error) {
            return error.what();
        }
        return {};
    }

    void expect_stopped_by_the_file() const
    {
        EXPECT_EQ(obstacle_of_other_user(),
                  "cannot connect to " + socket_ +
                      ": Permission denied; run this as the user that mgmtd runs as, as root, or "
                      "as a member of mgmtd's --group");
        EXPECT_THAT(log(), Not(HasSubstr("turned away"))) << "the daemon never saw it";
    }

    void expect_turned_away() const
    {
        RawClient client = connect_as_other_user({});
        const std::string reason = "user " + ovhost::user_name(nobody) + " may not use this socket";
        (void)client.send(request);
        EXPECT_EQ(client.line(), R"({"error":{"code":"not-allowed","details":[],"message":")" +
                                     reason +
                                     ": be mgmtd's user, root, or a member of the group that mgmtd "
                                     R"(--group names"},"id":null,"ok":false})");
        EXPECT_EQ(client.line(), "<end>") << "a request was served";
        EXPECT_THAT(log(), HasSubstr(", uid 65534) turned away: " + reason));
    }

    void expect_served(RawClient client) const
    {
        ASSERT_TRUE(client.send(request));
        EXPECT_EQ(client.line(), answer);
    }
};

TEST_F(Access, IsForTheDaemonsUserAlone)
{
    start();
    EXPECT_EQ(mode(), 0600U);
    expect_served(RawClient(socket_));
    if (::geteuid() != 0) {
        return;
    }
    expect_stopped_by_the_file();
    let_everybody_at_the_file();
    expect_turned_away();
    expect_served(RawClient(socket_));
}

TEST_F(Access, IsForTheMembersOfTheGroupToo)
{
    std::string group = run({"/usr/bin/env", "id", "-gn"}).out;
    group.pop_back();
    start({"--group", group});
    EXPECT_EQ(mode(), 0660U);
    expect_served(RawClient(socket_));
    if (::geteuid() != 0) {
        return;
    }
    expect_stopped_by_the_file();
    expect_served(connect_as_other_user({::getegid()}));
    let_everybody_at_the_file();
    expect_turned_away();
    expect_served(connect_as_other_user({::getegid()}));
}

} // namespace
