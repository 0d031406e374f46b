// Tunnels through the real daemon: their IDs, the questions about them, and what a restart keeps.

#include "tests/e2e/harness.h"
#include "tests/support/sanitized.h"

#include <csignal>

#include <filesystem>
#include <string>

namespace
{

using namespace e2e;
using testing::AllOf;
using testing::HasSubstr;
using testing::StartsWith;

class Tunnels : public E2eTest
{
  protected:
    Outcome add(const std::string &name, const std::string &alias)
    {
        return ovctl({"load", "-"}, "/ov/tunneld/tunnel/config/" + name + ",string," + name + "\n" +
                                        "/ov/tunneld/tunnel/config/" + name + "/alias,string," +
                                        alias + "\n");
    }
};

TEST_F(Tunnels, AreFoundByNameAliasAndId)
{
    start();
    ASSERT_EQ(add("paris", "branch").exit_code, 0);
    ASSERT_EQ(add("berlin", "hq").exit_code, 0);
    ASSERT_EQ(ovctl({"commit"}), done("commit 2: 6 changes\n"));
    EXPECT_EQ(ovctl({"show", "tunnels"}), done("NAME       ID  ALIAS\n"
                                               "berlin      0  hq\n"
                                               "paris       1  branch\n"));
    const Outcome berlin = ovctl({"show", "tunnel", "--name", "berlin"});
    EXPECT_THAT(berlin.out, StartsWith("name                berlin\n"
                                       "id                  0\n"
                                       "alias               hq\n"));
    EXPECT_EQ(ovctl({"show", "tunnel", "--alias", "hq"}), berlin);
    EXPECT_EQ(ovctl({"show", "tunnel", "--id", "0"}), berlin);
    EXPECT_EQ(ovctl({"show", "tunnel", "--id", "7"}).exit_code, 1);
}

TEST_F(Tunnels, ThatShareAnAliasAreShownAsAmbiguous)
{
    start();
    ASSERT_EQ(add("paris", "hq").exit_code, 0);
    ASSERT_EQ(add("berlin", "hq").exit_code, 0);
    ASSERT_EQ(ovctl({"commit"}).exit_code, 0);
    EXPECT_EQ(ovctl({"show", "tunnel", "--alias", "hq"}).out,
              "the alias \"hq\" is ambiguous: 2 tunnels claim it\n"
              "NAME       ID  ALIAS\n"
              "berlin      0  hq (ambiguous)\n"
              "paris       1  hq (ambiguous)\n");
    EXPECT_THAT(ovctl({"show", "tunnel-tables"}).out, HasSubstr("collision marks     0       1\n"));
}

TEST_F(Tunnels, LeaveTheirIdsHeldBack)
{
    start();
    ASSERT_EQ(add("paris", "a").exit_code, 0);
    ASSERT_EQ(ovctl({"commit"}).exit_code, 0);
    ASSERT_EQ(ovctl({"delete", "/ov/tunneld/tunnel/config/paris"}).exit_code, 0);
    ASSERT_EQ(add("rome", "b").exit_code, 0);
    ASSERT_EQ(ovctl({"commit"}).exit_code, 0);
    EXPECT_EQ(ovctl({"get", "/ov/tunneld/tunnel/config/rome/id"}),
              done("/ov/tunneld/tunnel/config/rome/id uint16 1\n"));
    EXPECT_THAT(ovctl({"show", "tunnel-tables"}).out, HasSubstr("IDs held back       1, "));
}

TEST_F(Tunnels, KeepTheirIdsOverACrashThousandsOfThem)
{
    constexpr int number = ovtest::sanitized ? 2500 : 10000;
    const std::string last = "t" + std::to_string(number - 1);
    std::filesystem::create_directories(root_ + "/opt/orvale");
    write_file(root_ + "/opt/orvale/defdb.conf.big", "/ov/model/limits/max_tunnels,uint32,20000\n");
    std::filesystem::permissions(root_ + "/opt/orvale/defdb.conf.big",
                                 std::filesystem::perms(0644));
    start_quietly("warning", {"--model", "big"});
    std::string text;
    for (int i = 0; i < number; ++i) {
        const std::string name = "t" + std::to_string(i);
        text += "/ov/tunneld/tunnel/config/" + name + ",string," + name + "\n";
    }
    text += "/ov/tunneld/tunnel/config/" + last + "/alias,string,hq\n";
    ASSERT_EQ(ovctl({"load", "-"}, text).exit_code, 0);
    ASSERT_EQ(ovctl({"commit"}), done("commit 2: " + std::to_string(3 * number) + " changes\n"));
    const Outcome before = ovctl({"show", "tunnels"});
    const Outcome last_before = ovctl({"show", "tunnel", "--name", last});
    EXPECT_THAT(last_before.out, AllOf(StartsWith("name                " + last + "\nid "),
                                       HasSubstr("\nalias               hq\n")));
    (void)stop(SIGKILL);
    start_quietly("warning", {"--model", "big"});
    EXPECT_TRUE(ovctl({"show", "tunnels"}) == before);
    EXPECT_EQ(ovctl({"show", "tunnel", "--name", last}), last_before);
    EXPECT_EQ(ovctl({"show", "tunnel", "--alias", "hq"}), last_before);
    EXPECT_EQ(ovctl({"show", "tunnel", "--alias", last}).exit_code, 1) << "its name is no alias";
    EXPECT_THAT(ovctl({"show", "tunnel-tables"}).out,
                HasSubstr("IDs in use          " + std::to_string(number) + "\n"));
}

} // namespace
