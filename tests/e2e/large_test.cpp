// A configuration of very many nodes on its way through all parts.

#include "tests/control/raw_client.h"
#include "tests/e2e/harness.h"
#include "tests/support/sanitized.h"

#include <csignal>

namespace
{

using namespace e2e;
using testing::HasSubstr;

using Large = E2eTest;

TEST_F(Large, ConfigurationIsLoadedCommittedAndKept)
{
    constexpr unsigned number = ovtest::sanitized ? 20000 : 100000;
    const std::string count = std::to_string(number);
    const std::string last = "/big/" + std::to_string(number / 100) + "/0";
    std::string text;
    std::string nodes;
    for (unsigned i = 1; i <= number; ++i) {
        const std::string name = "/big/" + std::to_string(i / 100) + "/" + std::to_string(i % 100);
        text += name + ",uint32," + std::to_string(i) + "\n";
        nodes +=
            R"(,{"name":")" + name + R"(","type":"uint32","value":")" + std::to_string(i) + R"("})";
    }
    start_quietly("warning");
    ASSERT_EQ(ovctl({"load", "-"}, text), done("loaded " + count + " values and 0 removals\n"));
    EXPECT_EQ(ovctl({"check"}), done("a commit would make " + count + " changes\n"));
    ASSERT_EQ(ovctl({"commit"}), done("commit 2: " + count + " changes\n"));
    nodes.erase(0, 1);
    ovhost::test::RawClient client(socket_);
    ASSERT_TRUE(client.send(R"({"id":1,"command":"get","name":"/big","subtree":true})"
                            "\n"));
    EXPECT_TRUE(client.line() == R"({"id":1,"ok":true,"result":{"nodes":[)" + nodes + "]}}");

    // A small change of a large configuration.
    commit(last, "uint32", "7");
    ASSERT_EQ(stop(SIGKILL), 128 + SIGKILL);
    start_quietly("warning");
    EXPECT_EQ(ovctl({"get", last}), done(last + " uint32 7\n"));
    EXPECT_THAT(ovctl({"status"}).out,
                HasSubstr("running nodes       " + std::to_string(number + 11) + "\n"));
}

} // namespace
