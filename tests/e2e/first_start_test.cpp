// What a daemon makes of an empty store and the files it finds, and that it does so once.

#include "tests/e2e/harness.h"

#include <sys/stat.h>

#include <csignal>
#include <filesystem>

namespace
{

using namespace e2e;
using testing::Contains;
using testing::ElementsAre;
using testing::HasSubstr;
using testing::Not;

namespace fs = std::filesystem;

constexpr const char *sample_configuration =
    "/net/interface/config/eth0 string eth0\n"
    "/net/interface/config/eth0/enable bool true\n"
    "/net/interface/config/eth1 string eth1\n"
    "/net/interface/config/eth1/enable bool true\n"
    "/ov/model/config/name string branch-100\n"
    "/ov/model/limits/max_dns_proxy_map_entries uint32 20\n"
    "/ov/model/limits/max_interfaces uint32 16\n"
    "/ov/model/limits/max_nmap_entries uint32 50\n"
    "/ov/model/limits/max_omap_entries uint32 50\n"
    "/ov/model/limits/max_qmap_entries uint32 50\n"
    "/ov/model/limits/max_rmap_entries uint32 50\n"
    "/ov/model/limits/max_smap_entries uint32 50\n"
    "/ov/model/limits/max_tunnels uint32 100\n"
    "/ov/tunneld/system/config/10g bool false\n"
    "/ov/tunneld/system/config/hostname hostname branch-7\n"
    "/ov/tunneld/system/config/limits/cifs_flows uint32 1000\n"
    "/ov/tunneld/system/config/limits/mem_size uint32 4096\n"
    "/ov/tunneld/system/config/limits/nm_ram_size uint32 256\n"
    "/ov/tunneld/system/config/limits/ssl_flows uint32 2000\n"
    "/ov/tunneld/system/config/limits/system_bw uint32 50000\n"
    "/ov/tunneld/system/config/limits/total_flows uint32 500\n"
    "/ov/tunneld/system/config/mode string router\n"
    "/ov/tunneld/system/config/mode/router/1/ifname string eth0\n"
    "/ov/tunneld/system/config/mode/router/2/ifname string eth1\n"
    "/ov/tunneld/system/config/routing_inline bool true\n";

constexpr const char *sample_limits = "expected_mem 4096\n"
                                      "max_def_bw 50000\n"
                                      "max_loc_flows 500\n"
                                      "max_cifs_conns 1000\n"
                                      "max_ssl_flows 2000\n"
                                      "nm_ram_size 256\n";

class FirstStart : public E2eTest
{
  protected:
    std::string model_file() const { return root_ + "/opt/orvale/defdb.conf.branch-100"; }

    std::string mode() const { return ovctl({"get", "/ov/tunneld/system/config/mode"}).out; }

    /// The daemon does not start with the model and says why; without it, it does.
    void expect_unusable_model(const std::string &reason)
    {
        const Outcome outcome = run_daemon({"--model", "branch-100"});
        EXPECT_EQ(outcome.exit_code, 1);
        EXPECT_THAT(outcome.err, HasSubstr("mgmtd: the model's default file /opt/orvale/"
                                           "defdb.conf.branch-100 cannot be used: " +
                                           reason + "; mend it or name another --model\n"));
        start({});
        EXPECT_EQ(mode(), "/ov/tunneld/system/config/mode string bridge\n");
    }
};

TEST_F(FirstStart, BuildsTheConfigurationFromTheSampleFiles)
{
    install_samples();
    start({"--model", "branch-100"});
    EXPECT_EQ(ovctl({"get", "/", "--subtree"}), done(sample_configuration));
    EXPECT_EQ(read_file(limits_file()), sample_limits);
    const auto lines = log_lines(log());
    EXPECT_THAT(lines, Contains("notice mgmtd -: compiled-in defaults: 11 set, 0 removed"));
    EXPECT_THAT(lines, Contains("notice mgmtd -: model defaults: 23 set, 1 removed"));
    EXPECT_THAT(lines, Contains("notice mgmtd -: debugging defaults: 2 set, 0 removed"));
    EXPECT_THAT(lines, Contains("notice mgmtd -: preserved values: 2 set, 1 removed"));
    EXPECT_THAT(lines, Contains("notice mgmtd -: first configuration stored: 25 nodes"));
    EXPECT_FALSE(exists(root_ + "/var/opt/tms/.preserved_db"));
    EXPECT_TRUE(exists(root_ + "/var/opt/tms/.preserved_db.read"));
}

TEST_F(FirstStart, IsFollowedByStartsThatKeepTheConfiguration)
{
    install_samples();
    start({"--model", "branch-100"});
    ASSERT_EQ(stop(SIGTERM), 0);
    fs::remove(limits_file());
    // Read at the first start alone.
    write_file(root_ + "/var/opt/tms/.debug_default_db", "/x,string,late\n");
    start();
    EXPECT_EQ(ovctl({"get", "/", "--subtree"}), done(sample_configuration));
    EXPECT_EQ(read_file(limits_file()), sample_limits) << "a lost file comes back";
    EXPECT_THAT(log(), Not(HasSubstr("defaults")));
    EXPECT_THAT(lines_of(ovctl({"status"}).out), Contains("model               branch-100"));
    EXPECT_THAT(lines_of(ovctl({"status"}).out), Contains("last commit         1"));
}

TEST_F(FirstStart, NeedsNoFiles)
{
    start();
    EXPECT_EQ(ovctl({"get", "/", "--subtree"}),
              done("/ov/tunneld/system/config/10g bool false\n"
                   "/ov/tunneld/system/config/bonding bool false\n"
                   "/ov/tunneld/system/config/limits/cifs_flows uint32 500\n"
                   "/ov/tunneld/system/config/limits/mem_size uint32 2048\n"
                   "/ov/tunneld/system/config/limits/nm_ram_size uint32 128\n"
                   "/ov/tunneld/system/config/limits/ssl_flows uint32 500\n"
                   "/ov/tunneld/system/config/limits/system_bw uint32 10000\n"
                   "/ov/tunneld/system/config/limits/total_flows uint32 10000\n"
                   "/ov/tunneld/system/config/mode string bridge\n"
                   "/ov/tunneld/system/config/routing_inline bool false\n"
                   "/ov/tunneld/system/config/submode string normal\n"));
    EXPECT_THAT(lines_of(ovctl({"status"}).out), Contains("model               none"));
}

TEST_F(FirstStart, EndsOnAMissingModelFile)
{
    expect_unusable_model("it cannot be opened: No such file or directory");
}

TEST_F(FirstStart, DoesNotReadADirectoryForAModelFile)
{
    fs::create_directories(model_file());
    expect_unusable_model("it is not a regular file");
}

TEST_F(FirstStart, DoesNotTrustAModelFileThatEverybodyMayWrite)
{
    install_samples();
    ASSERT_EQ(::chmod(model_file().c_str(), 0666), 0);
    expect_unusable_model("everybody may write to it; take that right away with chmod o-w");
}

TEST_F(FirstStart, EndsOnABadModelFileAndStoresNothing)
{
    install_samples();
    write_file(model_file(), "/ov/model/config/name,string,branch-100\n"
                             "/x/a,nosuchtype,1\n"
                             "/x/b,uint8,300\n"
                             "/x/c,string,fine\n");
    const Outcome outcome = run_daemon({"--model", "branch-100"});
    EXPECT_EQ(outcome.exit_code, 1);
    EXPECT_THAT(
        outcome.err,
        HasSubstr("\nmgmtd: /opt/orvale/defdb.conf.branch-100 has faults; mend it and start again\n"
                  "  line 2: /x/a: unknown type \"nosuchtype\"\n"
                  "  line 3: /x/b: \"300\" is not a uint8: must be a decimal number from 0 to "
                  "255\n"));
    EXPECT_FALSE(exists(socket_));
    EXPECT_FALSE(exists(limits_file()));
    EXPECT_TRUE(exists(root_ + "/var/opt/tms/.preserved_db"));

    write_file(model_file(), "/x/c,string,mended\n");
    start({"--model", "branch-100"});
    EXPECT_EQ(ovctl({"get", "/x/c"}), done("/x/c string mended\n"));
    EXPECT_EQ(ovctl({"get", "/ov/tunneld/system/config/hostname"}),
              done("/ov/tunneld/system/config/hostname hostname branch-7\n"));
}

TEST_F(FirstStart, EndsOnValuesThatAModuleRefuses)
{
    write_file(model_file(), "/ov/tunneld/system/config/mode,string,brigde\n"
                             "/ov/model/limits/max_tunnels,string,many\n");
    const Outcome outcome = run_daemon({"--model", "branch-100"});
    EXPECT_EQ(outcome.exit_code, 1);
    EXPECT_THAT(
        outcome.err,
        HasSubstr("mgmtd: /opt/orvale/defdb.conf.branch-100 has faults; mend it and start again\n"
                  "  line 1: /ov/tunneld/system/config/mode: must be bridge, router or server, not "
                  "\"brigde\"\n"
                  "  line 2: /ov/model/limits/max_tunnels: must be of type uint32\n"));
    EXPECT_FALSE(exists(socket_));
}

TEST_F(FirstStart, EndsOnAPipeInTheDebugFilesPlace)
{
    const std::string path = root_ + "/var/opt/tms/.debug_default_db";
    fs::create_directories(fs::path(path).parent_path());
    ASSERT_EQ(::mkfifo(path.c_str(), 0600), 0);
    const Outcome outcome = run_daemon();
    EXPECT_EQ(outcome.exit_code, 1);
    EXPECT_THAT(outcome.err,
                HasSubstr("mgmtd: /var/opt/tms/.debug_default_db cannot be read: it is "
                          "not a regular file; "));
}

TEST_F(FirstStart, KeepsItsLogOutOfItsFilesWhenStandardErrorIsClosed)
{
    Words words{"/bin/sh", "-c", R"(exec "$0" "$@" 2>&-)"};
    const Words daemon = daemon_words();
    words.insert(words.end(), daemon.begin(), daemon.end());
    daemon_ = std::make_unique<Process>(words);
    ASSERT_TRUE(eventually([this] { return ovctl({"status"}).exit_code == 0; }));
    EXPECT_THAT(read_file(state_ + "/lock"), testing::Optional(testing::MatchesRegex("[0-9]+\n")));
    EXPECT_EQ(stop(SIGTERM), 0);
    start();
    EXPECT_EQ(mode(), "/ov/tunneld/system/config/mode string bridge\n");
}

TEST_F(FirstStart, LeavesOutBadLinesOfTheOtherFiles)
{
    write_file(root_ + "/var/opt/tms/.debug_default_db", "/x/a,string,1\n/x/b\n/x/c,string,3\n");
    start();
    EXPECT_EQ(ovctl({"get", "/x", "--subtree"}), done("/x/a string 1\n/x/c string 3\n"));
    EXPECT_THAT(log_lines(log()),
                Contains("warning mgmtd -: /var/opt/tms/.debug_default_db, line 2: /x/b: a value "
                         "line needs a name and a type: NAME,TYPE,VALUE; left out"));
}

} // namespace
