// A configuration of 100,000 nodes on its way through all parts.

#include "tests/control/raw_client.h"
#include "tests/e2e/harness.h"

#include <csignal>

namespace
{

using namespace e2e;
using testing::HasSubstr;

using Large = E2eTest;

TEST_F(Large, ConfigurationIsLoadedCommittedAndKept)
{
    constexpr unsigned number = 100000;
    std::string text;
    std::string nodes;
    for (unsigned i = 1; i <= number; ++i) {
        const std::string name = "/big/" + std::to_string(i / 100) + "/" + std::to_string(i % 100);
        text += name + ",uint32," + std::to_string(i) + "\n";
        nodes +=
            R"(,{"name":")" + name + R"(","type":"uint32","value":")" + std::to_string(i) + R"("})";
    }
    start_quietly("warning");
    ASSERT_EQ(ovctl({"load", "-"}, text), done("loaded 100000 values and 0 removals\n"));
    EXPECT_EQ(ovctl({"check"}), done("a commit would make 100000 changes\n"));
    ASSERT_EQ(ovctl({"commit"}), done("commit 2: 100000 changes\n"));
    nodes.erase(0, 1);
    ovhost::test::RawClient client(socket_);
    ASSERT_TRUE(client.send(R"({"id":1,"command":"get","name":"/big","subtree":true})"
                            "\n"));
    EXPECT_TRUE(client.line() == R"({"id":1,"ok":true,"result":{"nodes":[)" + nodes + "]}}");

    // A small change of a large configuration.
    commit("/big/1000/0", "uint32", "7");
    ASSERT_EQ(stop(SIGKILL), 128 + SIGKILL);
    start_quietly("warning");
    EXPECT_EQ(ovctl({"get", "/big/1000/0"}), done("/big/1000/0 uint32 7\n"));
    EXPECT_THAT(ovctl({"status"}).out, HasSubstr("running nodes       100011\n"));
}

} // namespace
