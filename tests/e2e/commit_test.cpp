// What a commit leaves behind, and what a refused one does not.

#include "tests/e2e/harness.h"

#include <csignal>

namespace
{

using namespace e2e;
using testing::HasSubstr;
using testing::Optional;

constexpr const char *flows = "/ov/tunneld/system/config/limits/total_flows";

class Commit : public E2eTest
{
  protected:
    Commit() { start(); }

    /// Everything the store consists of.
    std::string store() const
    {
        return read_file(state_ + "/config.db").value() +
               read_file(state_ + "/config.db-wal").value_or("");
    }
};

TEST_F(Commit, ThatIsRefusedTellsAllReasonsAndChangesNothing)
{
    const std::string configuration = ovctl({"get", "/", "--subtree"}).out;
    const std::string stored = store();
    write_file(limits_file(), "marker");
    auto jsond = start_jsond();
    ASSERT_EQ(ovctl({"set", "/ov/tunneld/system/config/mode", "string", "brigde"}), done());
    ASSERT_EQ(ovctl({"set", "/ov/tunneld/system/config/10g", "string", "yes"}), done());
    ASSERT_EQ(ovctl({"set", flows, "string", "many"}), done());
    ASSERT_EQ(ovctl({"set", "/x", "string", "fine"}), done());
    const std::string reasons =
        "  /ov/tunneld/system/config/10g: must be of type bool (schema)\n"
        "  /ov/tunneld/system/config/limits/total_flows: must be of type uint32 (schema)\n"
        "  /ov/tunneld/system/config/mode: must be bridge, router or server, not \"brigde\" "
        "(schema)\n";
    EXPECT_EQ(ovctl({"check"}), refused("mgmtd refused the candidate:\n" + reasons));
    EXPECT_EQ(ovctl({"commit"}), refused("mgmtd refused the commit:\n" + reasons));
    EXPECT_EQ(ovctl({"get", "/", "--subtree"}).out, configuration);
    EXPECT_EQ(store(), stored);
    EXPECT_EQ(read_file(limits_file()), "marker");
    EXPECT_THAT(ovctl({"status"}).out, HasSubstr("last commit         1\n"));
    EXPECT_THAT(ovctl({"status"}).out, HasSubstr("candidate changes   4\n")) << "edits are kept";

    // Mended, the same candidate is fine; the peer hears of that one only.
    ASSERT_EQ(ovctl({"set", "/ov/tunneld/system/config/mode", "string", "server"}), done());
    ASSERT_EQ(ovctl({"set", "/ov/tunneld/system/config/10g", "bool", "true"}), done());
    ASSERT_EQ(ovctl({"set", flows, "uint32", "7"}), done());
    EXPECT_EQ(ovctl({"commit"}), done("commit 2: 4 changes\n"));
    EXPECT_EQ(await_events(4).size(), 4U);
}

TEST_F(Commit, RefusalIsJsonForPrograms)
{
    ASSERT_EQ(ovctl({"set", "/ov/tunneld/system/config/bonding", "string", "x"}), done());
    EXPECT_EQ(ovctl({"commit", "--json"}),
              (Outcome{1,
                       R"({"error":{"code":"refused","details":[{"message":"must be of type bool",)"
                       R"("module":"schema","node":"/ov/tunneld/system/config/bonding"}],)"
                       R"("message":"the commit is refused"},"ok":false})"
                       "\n",
                       ""}));
}

TEST_F(Commit, WritesTheLimitsFileOnlyWhenItTouchesALimit)
{
    write_file(limits_file(), "marker");
    commit("/x", "string", "1");
    EXPECT_EQ(read_file(limits_file()), "marker");
    commit(flows, "uint32", "4294967295");
    EXPECT_EQ(read_file(limits_file()), "expected_mem 2048\n"
                                        "max_def_bw 10000\n"
                                        "max_loc_flows -1\n"
                                        "max_cifs_conns 500\n"
                                        "max_ssl_flows 500\n"
                                        "nm_ram_size 128\n");
    write_file(limits_file(), "marker");
    ASSERT_EQ(ovctl({"delete", flows}), done());
    ASSERT_EQ(ovctl({"commit"}).exit_code, 0);
    EXPECT_THAT(read_file(limits_file()), Optional(HasSubstr("max_loc_flows 0\n")));
}

TEST_F(Commit, OutlivesAKill)
{
    for (int round = 1; round <= 5; ++round) {
        const std::string value = std::to_string(round);
        commit("/x/" + value, "uint32", value);
        ASSERT_EQ(ovctl({"set", "/never/committed", "string", "x"}), done());
        ASSERT_EQ(stop(SIGKILL), 128 + SIGKILL);
        start();
        ASSERT_EQ(ovctl({"get", "/x/" + value}), done("/x/" + value + " uint32 " + value + "\n"));
        EXPECT_EQ(ovctl({"diff"}), done()) << "the candidate begins anew";
    }
    EXPECT_EQ(ovctl({"get", "/x", "--subtree"}), done("/x/1 uint32 1\n"
                                                      "/x/2 uint32 2\n"
                                                      "/x/3 uint32 3\n"
                                                      "/x/4 uint32 4\n"
                                                      "/x/5 uint32 5\n"));
    EXPECT_THAT(ovctl({"status"}).out, HasSubstr("last commit         6\n"));
}

TEST_F(Commit, OfAnEmptyConfigurationIsNotAFirstStart)
{
    ASSERT_EQ(ovctl({"delete", "/ov"}), done());
    ASSERT_EQ(ovctl({"commit"}), done("commit 2: 11 changes\n"));
    ASSERT_EQ(stop(SIGTERM), 0);
    start();
    EXPECT_EQ(ovctl({"get", "/", "--subtree"}), done());
    EXPECT_EQ(read_file(limits_file()), "expected_mem 0\n"
                                        "max_def_bw 0\n"
                                        "max_loc_flows 0\n"
                                        "max_cifs_conns 0\n"
                                        "max_ssl_flows 0\n"
                                        "nm_ram_size 0\n");
}

} // namespace
