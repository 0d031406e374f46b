// How the daemon starts, ends, and refuses to start.

#include "tests/e2e/harness.h"

#include <sys/stat.h>
#include <unistd.h>

#include <csignal>
#include <filesystem>

namespace
{

using namespace e2e;
using testing::HasSubstr;
using testing::MatchesRegex;
using testing::Optional;
using testing::StartsWith;

namespace fs = std::filesystem;

class Lifecycle : public E2eTest
{
  protected:
    std::string database() const { return state_ + "/config.db"; }

    /// A daemon that finds this in place of its database says so and leaves it alone.
    void expect_refused_database(const std::string &content, const std::string &message) const
    {
        write_file(database(), content);
        const Outcome outcome = run_daemon();
        EXPECT_EQ(outcome.exit_code, 1);
        EXPECT_EQ(outcome.err, "mgmtd: " + message + "\n");
        EXPECT_EQ(read_file(database()), content);
        EXPECT_FALSE(exists(socket_));
    }
};

TEST_F(Lifecycle, EndsCleanlyOnASignal)
{
    for (const int signal : {SIGTERM, SIGINT}) {
        start();
        EXPECT_TRUE(exists(socket_));
        EXPECT_EQ(stop(signal), 0);
        EXPECT_FALSE(exists(socket_));
        EXPECT_EQ(log_lines(log()).back(),
                  "notice mgmtd -: stopping on signal " + std::to_string(signal));
    }
}

TEST_F(Lifecycle, KeepsItsSocketToItsUser)
{
    start();
    struct stat status {
    };
    ASSERT_EQ(::stat(socket_.c_str(), &status), 0);
    EXPECT_EQ(status.st_mode & 07777U, 0600U);
}

TEST_F(Lifecycle, TakesOverTheSocketOfADaemonThatWasKilled)
{
    start();
    ASSERT_EQ(stop(SIGKILL), 128 + SIGKILL);
    EXPECT_TRUE(exists(socket_));
    start();
    EXPECT_EQ(ovctl({"diff"}), done());
}

TEST_F(Lifecycle, DoesNotShareItsStore)
{
    start();
    Words second = daemon_words();
    second.back() = (dir_ / "other.sock").string();
    const Outcome outcome = run(second);
    EXPECT_EQ(outcome.exit_code, 1);
    EXPECT_THAT(outcome.err, MatchesRegex("mgmtd: the state directory " + state_ +
                                          " is held by another daemon \\(process [0-9]+\\); end "
                                          "that daemon, or choose another state directory\n"));
    EXPECT_FALSE(exists(second.back()));
    commit("/x", "string", "undisturbed");
}

TEST_F(Lifecycle, DoesNotShareItsSocket)
{
    start();
    const Outcome outcome = run({E2E_MGMTD, "--root", root_, "--state-dir",
                                 (dir_ / "other-state").string(), "--socket", socket_});
    EXPECT_EQ(outcome.exit_code, 1);
    EXPECT_EQ(outcome.err, "mgmtd: socket in use by another mgmtd (" + socket_ +
                               "): stop it or choose another --socket\n");
    commit("/x", "string", "undisturbed");
}

TEST_F(Lifecycle, DoesNotReplaceAFileThatIsNoSocket)
{
    write_file(socket_, "precious");
    const Outcome outcome = run_daemon();
    EXPECT_EQ(outcome.exit_code, 1);
    EXPECT_EQ(outcome.err, "mgmtd: cannot create socket " + socket_ +
                               ": something else than a socket stands there: remove it or choose "
                               "another --socket\n");
    EXPECT_EQ(read_file(socket_), "precious");
}

TEST_F(Lifecycle, LeavesAForeignDatabaseAlone)
{
    expect_refused_database("not a database at all\n",
                            database() +
                                " is not a configuration database of this program (it does not "
                                "begin like an SQLite database); the file was left as it was: move "
                                "it away, or choose another state directory");
}

TEST_F(Lifecycle, LeavesAnEmptiedDatabaseAlone)
{
    expect_refused_database("", "the configuration database " + database() +
                                    " is damaged (it is empty); the file was left as it was: put a "
                                    "good copy in its place, or move it and its -wal file away to "
                                    "begin with an empty store");
}

TEST_F(Lifecycle, LeavesADamagedDatabaseAlone)
{
    start();
    commit("/x", "string", "1");
    ASSERT_EQ(stop(SIGTERM), 0);
    std::string damaged = read_file(database()).value();
    ASSERT_GT(damaged.size(), 8192U);
    // Past the header page: the tables themselves.
    damaged.replace(4096, 4096, 4096, '\xa5');
    write_file(database(), damaged);
    const Outcome outcome = run_daemon();
    EXPECT_EQ(outcome.exit_code, 1);
    EXPECT_THAT(outcome.err,
                StartsWith("mgmtd: the configuration database " + database() + " is damaged ("));
    EXPECT_THAT(outcome.err,
                HasSubstr("the file was left as it was: put a good copy in its place, or move it "
                          "and its -wal file away to begin with an empty store\n"));
    EXPECT_EQ(read_file(database()), damaged);
}

TEST_F(Lifecycle, NeedsAParentOfItsStateDirectory)
{
    const std::string state = (dir_ / "no" / "such").string();
    EXPECT_EQ(run({E2E_MGMTD, "--root", root_, "--state-dir", state, "--socket", socket_}),
              (Outcome{1, "",
                       "mgmtd: cannot make the state directory " + state +
                           ": No such file or directory; make its parent directory first\n"}));
}

TEST_F(Lifecycle, NeedsTheDirectoryOfItsSocket)
{
    const std::string socket = (dir_ / "none" / "control.sock").string();
    EXPECT_EQ(run({E2E_MGMTD, "--root", root_, "--state-dir", state_, "--socket", socket}),
              (Outcome{1, "",
                       "mgmtd: cannot create socket " + socket + ": directory " +
                           (dir_ / "none").string() +
                           ": No such file or directory: make it, or choose another --socket\n"}));
}

TEST_F(Lifecycle, NeedsARootThatIsThere)
{
    fs::remove(root_);
    EXPECT_EQ(run_daemon(), (Outcome{1, "",
                                     "mgmtd: cannot enter a private root: opening " + root_ +
                                         " failed: No such file or directory; make the directory "
                                         "first\n"}));
    EXPECT_FALSE(exists(state_));
}

TEST_F(Lifecycle, RunsInAPrivateRootWithoutPrivileges)
{
    constexpr uid_t nobody = 65534;
    Words words;
    if (::geteuid() == 0) {
        // The build tree may be closed to that user.
        for (const char *file : {E2E_MGMTD, E2E_LIBOVMD}) {
            fs::copy(file, dir_ / fs::path(file).filename().string());
        }
        fs::create_symlink(fs::path(E2E_LIBOVMD).filename(), dir_ / "libovmd.so.1");
        for (const std::string &dir : {dir_.path().string(), root_}) {
            ASSERT_EQ(::chown(dir.c_str(), nobody, nobody), 0);
        }
        words = {"/usr/bin/setpriv", "--reuid=65534",   "--regid=65534",
                 "--clear-groups",   "--inh-caps=-all", "--"};
    }
    Words daemon = daemon_words();
    if (!words.empty()) {
        daemon[0] = (dir_ / "mgmtd").string();
    }
    words.insert(words.end(), daemon.begin(), daemon.end());
    Process process(words, "", {"LD_LIBRARY_PATH=" + dir_.path().string()});
    const std::string advice = "run as root, or allow user namespaces";
    ASSERT_TRUE(eventually([&] {
        return process.err().find(": ready on ") != std::string::npos ||
               process.err().find(advice) != std::string::npos;
    })) << process.err();
    if (process.err().find(advice) != std::string::npos) {
        EXPECT_THAT(process.err(), StartsWith("mgmtd: cannot enter a private root: "));
        EXPECT_EQ(process.wait(), 1);
        return;
    }
    EXPECT_EQ(ovctl({"get", "/ov/tunneld/system/config/mode"}),
              done("/ov/tunneld/system/config/mode string bridge\n"));
    EXPECT_THAT(read_file(limits_file()), Optional(StartsWith("expected_mem 2048\n")));
    process.signal(SIGTERM);
    EXPECT_EQ(process.wait(), 0);
}

TEST_F(Lifecycle, KnowsItsOptions)
{
    for (const Words &words :
         {Words{"--no-such-option"}, Words{"stray"}, Words{"--log-level", "loud"},
          Words{"--module-log-level", "9"}, Words{"--socket"}}) {
        Words all{E2E_MGMTD};
        all.insert(all.end(), words.begin(), words.end());
        const Outcome outcome = run(all);
        EXPECT_EQ(outcome.exit_code, 2) << words[0];
        EXPECT_THAT(outcome.err, HasSubstr(words[0]));
        EXPECT_EQ(outcome.out, "");
    }
    EXPECT_EQ(run({E2E_MGMTD, "--help"}).exit_code, 0);
    EXPECT_EQ(run({E2E_MGMTD, "--version"}).exit_code, 0);
}

TEST_F(Lifecycle, LogsAsMuchAsItIsTold)
{
    start({"--log-level", "info"});
    ASSERT_EQ(ovctl({"load", "-"}, "# nothing\n").exit_code, 0);
    EXPECT_EQ(log_lines(log()).back(), "info mgmtd -: loaded standard input");
    EXPECT_EQ(stop(SIGTERM), 0);
}

TEST_F(Lifecycle, LogsNothingButErrorsWhenToldSo)
{
    start_quietly("error");
    commit("/x", "string", "1");
    EXPECT_EQ(stop(SIGTERM), 0);
    EXPECT_EQ(log(), "");
}

} // namespace
