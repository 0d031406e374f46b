#include "tests/mgmtd/fixture.h"

#include <filesystem>

namespace
{

using namespace ovhost;
using namespace mgmtd_test;
using testing::ElementsAre;
using testing::IsEmpty;

constexpr const char *default_limits = "expected_mem 2048\n"
                                       "max_def_bw 10000\n"
                                       "max_loc_flows 10000\n"
                                       "max_cifs_conns 500\n"
                                       "max_ssl_flows 500\n"
                                       "nm_ram_size 128\n";

class Limits : public DaemonTest
{
  protected:
    Limits() { configuration_.start(); }

    CommitReport commit(const std::string &name, bn_type type, const std::string &text)
    {
        EXPECT_EQ(configuration_.candidate().set(name, type, text), std::nullopt);
        return configuration_.commit(daemon_note(""));
    }

    Configuration configuration_{state_.path()};
};

TEST_F(Limits, AreWrittenAtTheFirstStart)
{
    EXPECT_EQ(read_file(limits_file), default_limits);
}

TEST_F(Limits, FollowACommitThatTouchesOne)
{
    const CommitReport report =
        commit("/ov/tunneld/system/config/limits/total_flows", bt_uint32, "4294967295");
    EXPECT_TRUE(report.accepted());
    EXPECT_THAT(report.warnings, IsEmpty());
    EXPECT_EQ(read_file(limits_file), "expected_mem 2048\n"
                                      "max_def_bw 10000\n"
                                      "max_loc_flows -1\n"
                                      "max_cifs_conns 500\n"
                                      "max_ssl_flows 500\n"
                                      "nm_ram_size 128\n");
}

TEST_F(Limits, AreZeroWhereTheNodeIsGone)
{
    ASSERT_EQ(configuration_.candidate().erase("/ov/tunneld/system/config/limits"), std::nullopt);
    ASSERT_TRUE(configuration_.commit(daemon_note("")).accepted());
    EXPECT_EQ(read_file(limits_file), "expected_mem 0\n"
                                      "max_def_bw 0\n"
                                      "max_loc_flows 0\n"
                                      "max_cifs_conns 0\n"
                                      "max_ssl_flows 0\n"
                                      "nm_ram_size 0\n");
}

TEST_F(Limits, AreLeftAloneByOtherCommits)
{
    write_file(limits_file, "marker");
    ASSERT_TRUE(commit("/ov/tunneld/system/config/submode", bt_string, "x").accepted());
    EXPECT_EQ(read_file(limits_file), "marker");
}

TEST_F(Limits, AreLeftAloneByARefusedCommit)
{
    write_file(limits_file, "marker");
    EXPECT_EQ(commit("/ov/tunneld/system/config/limits/mem_size", bt_string, "x").outcome,
              CommitOutcome::refused);
    EXPECT_EQ(read_file(limits_file), "marker");
}

TEST_F(Limits, WarnWhenTheFileCannotBeWritten)
{
    std::filesystem::remove(limits_file);
    std::filesystem::create_directory(limits_file);
    const CommitReport report = commit("/ov/tunneld/system/config/limits/mem_size", bt_uint32, "1");
    EXPECT_EQ(report.outcome, CommitOutcome::committed);
    ASSERT_EQ(report.warnings.size(), 1U);
    EXPECT_EQ(report.warnings[0].message,
              "module limits failed to apply the commit with code 14001 (unexpected NULL); the "
              "commit stands");
    EXPECT_EQ(value_in(configuration_.running(), "/ov/tunneld/system/config/limits/mem_size"),
              "uint32 1");
}

} // namespace
