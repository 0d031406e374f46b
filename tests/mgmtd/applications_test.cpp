// Applications in a commit: host/modules/applications.h.

#include "host/modules/applications.h"

#include "tests/mgmtd/map_fixture.h"

namespace
{

using namespace ovhost;
using namespace mgmtd_test;

std::string rule(const std::string &below)
{
    return "/ov/tunneld/app/config/" + below;
}

class Applications : public MapTest
{
  protected:
    void add_rule(const std::string &number, const std::string &name)
    {
        set(rule(number + "/name"), name);
    }
};

struct User {
    const char *label;
    const char *node;
    const char *message;
};

class UsedApplications : public Applications, public testing::WithParamInterface<User>
{
};

INSTANTIATE_TEST_SUITE_P(
    By, UsedApplications,
    testing::Values(User{"acl", "/ov/tunneld/acl/config/a1/entry/10/application",
                         "Application name used by an ACL."},
                    User{"rmap", "/ov/tunneld/route_map/config/map/m1/prio/10/match/0/application",
                         "Application name used by a Route Map."},
                    User{"omap", "/ov/tunneld/opt_map/config/map/m1/prio/10/match/0/application",
                         "Application name used by an Opt Map."},
                    User{"qmap", "/ov/tunneld/qos_map/config/map/m1/prio/10/match/0/application",
                         "Application name used by a QOS Map."}),
    [](const auto &user) { return std::string(user.param.label); });

TEST_P(UsedApplications, StayAndKeepTheirNames)
{
    add_rule("1", "web");
    set(GetParam().node, "web");
    ASSERT_EQ(commit(), "committed");
    const std::string refusal = rule("1/name: ") + GetParam().message + " (application)\n";
    erase(rule("1"));
    EXPECT_EQ(commit_in_vain(), refusal);
    add_rule("1", "Web");
    EXPECT_EQ(commit_in_vain(), refusal) << "a new name";
    add_rule("1", "web2");
    add_rule("2", "web");
    EXPECT_EQ(commit(), "committed") << "another rule has taken the name over";
    erase(rule("2"));
    set(GetParam().node, "web2");
    EXPECT_EQ(commit(), "committed") << "what uses it goes along";
}

TEST_F(Applications, GoWhenMapsOfOtherKindsNameThem)
{
    add_rule("1", "web");
    set(matched(*find_map_kind("nmap"), "m1", "10", "application"), "web");
    set(matched(*find_map_kind("smap"), "m1", "10", "matchstr"), "application:web");
    ASSERT_EQ(commit(), "committed");
    erase(rule("1"));
    EXPECT_EQ(commit(), "committed");
}

TEST_F(Applications, HaveANameForEachRule)
{
    set(rule("1/port"), bt_uint16, "80");
    EXPECT_EQ(commit_in_vain(),
              ": application rule \"1\" has no name: set /ov/tunneld/app/config/1/name, or delete "
              "/ov/tunneld/app/config/1 (application)\n");
    add_rule("1", "web");
    set(rule("1/port"), bt_uint16, "80");
    ASSERT_EQ(commit(), "committed");
    erase(rule("1/name"));
    EXPECT_EQ(commit_in_vain(),
              ": application rule \"1\" has no name: set /ov/tunneld/app/config/1/name, or delete "
              "/ov/tunneld/app/config/1 (application)\n");
}

TEST_F(Applications, HavePlainNames)
{
    add_rule("1", "a/b");
    EXPECT_EQ(commit_in_vain(), rule("1/name") + ": an application's name must not hold \"/\": "
                                                 "choose another name (application)\n");
    add_rule("1", "");
    EXPECT_EQ(commit_in_vain(), rule("1/name") + ": an application's name is 1 to 255 bytes long, "
                                                 "not 0 (application)\n");
    add_rule("1", std::string(255, 'a'));
    EXPECT_EQ(commit(), "committed");
}

} // namespace
