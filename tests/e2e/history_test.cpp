// The history of commits, the ways back in it, and commits that undo themselves.

#include "tests/e2e/harness.h"

#include <sys/stat.h>
#include <unistd.h>

#include <chrono>
#include <csignal>
#include <filesystem>
#include <string>
#include <thread>

namespace
{

using namespace e2e;
using namespace std::chrono_literals;
using std::chrono::floor;
using std::chrono::seconds;
using std::chrono::system_clock;
using testing::AllOf;
using testing::ElementsAre;
using testing::EndsWith;
using testing::HasSubstr;
using testing::MatchesRegex;
using testing::Not;
using testing::StartsWith;

const std::string paris = "/ov/tunneld/tunnel/config/paris";

class History : public E2eTest
{
  protected:
    void set(const std::string &node, const std::string &value)
    {
        ASSERT_EQ(ovctl({"set", node, "string", value}), done());
    }

    /// Commits 2 and 3, after the first one of the daemon.
    void make_history()
    {
        set("/x", "1");
        ASSERT_EQ(ovctl({"commit", "--comment", "a first x"}), done("commit 2: 1 change\n"));
        set("/x", "2");
        set("/y", "1");
        ASSERT_EQ(ovctl({"commit"}), done("commit 3: 2 changes\n"));
    }

    std::string value(const std::string &node) { return ovctl({"get", node}).out; }

    /// The last column of the history, newest first.
    std::vector<std::string> remarks(const Words &options = {})
    {
        Words words{"history"};
        words.insert(words.end(), options.begin(), options.end());
        std::vector<std::string> lines = lines_of(ovctl(words).out);
        const std::size_t column = lines.at(0).find("COMMENT");
        lines.erase(lines.begin());
        for (std::string &line : lines) {
            line = line.substr(0, 1) + ": " + line.substr(std::min(column, line.size()));
        }
        return lines;
    }

    /// Waits for the daemon's own commit.
    void await(const std::string &words)
    {
        ASSERT_TRUE(eventually([&] { return log().find(words) != std::string::npos; })) << log();
    }
};

TEST_F(History, ListsCommitsTheNewestFirst)
{
    start();
    make_history();
    EXPECT_THAT(remarks(), ElementsAre("3: -", "2: a first x", "1: initial configuration"));
    EXPECT_THAT(remarks({"--limit", "1"}), ElementsAre("3: -"));
    EXPECT_EQ(ovctl({"history", "--limit", "x"}).exit_code, 2);
}

TEST_F(History, KnowsWhoMadeACommit)
{
    start();
    make_history();
    std::string user = run({"/usr/bin/id", "-un"}).out;
    user.pop_back();
    const std::string uid = std::to_string(::geteuid());
    EXPECT_THAT(ovctl({"--json", "show", "commit", "2"}).out,
                AllOf(HasSubstr(R"("author":{"uid":)" + uid + R"(,"user":")" + user + R"("})"),
                      HasSubstr(R"("comment":"a first x")")));
    EXPECT_THAT(ovctl({"--json", "show", "commit", "1"}).out,
                HasSubstr(R"("author":{"uid":null,"user":"mgmtd"})"));
}

TEST_F(History, ShowsWhatACommitChanged)
{
    start();
    make_history();
    const Outcome shown = ovctl({"show", "commit", "3"});
    EXPECT_THAT(shown.out, StartsWith("commit              3\ntime                "));
    EXPECT_THAT(shown.out, EndsWith("changes             2\n~ /x: 1 -> 2\n+ /y string 1\n"));
    EXPECT_EQ(ovctl({"show", "commit", "4"}),
              refused("mgmtd refused the query: there is no commit 4 in the history: it goes from "
                      "commit 1 to commit 3\n"));
}

TEST_F(History, ComparesCommits)
{
    start();
    make_history();
    EXPECT_EQ(ovctl({"diff", "2", "3"}), done("~ /x: 1 -> 2\n+ /y string 1\n"));
    EXPECT_EQ(ovctl({"diff", "3", "2"}), done("~ /x: 2 -> 1\n- /y string 1\n"));
    EXPECT_EQ(ovctl({"diff", "1", "3"}), done("+ /x string 2\n+ /y string 1\n"));
    EXPECT_EQ(ovctl({"diff", "1"}), ovctl({"diff", "1", "3"}));
    EXPECT_EQ(ovctl({"diff", "3", "3"}), done());
    EXPECT_EQ(ovctl({"diff"}), done()) << "the candidate's edits";
    EXPECT_EQ(ovctl({"diff", "0", "3"}).exit_code, 1);
    EXPECT_EQ(ovctl({"diff", "2", "4"}).exit_code, 1);
}

TEST_F(History, IsKeptOverARestart)
{
    start();
    make_history();
    const Outcome before = ovctl({"history"});
    ASSERT_EQ(stop(SIGKILL), 128 + SIGKILL);
    start();
    EXPECT_EQ(ovctl({"history"}), before);
    EXPECT_EQ(ovctl({"diff", "2", "3"}), done("~ /x: 1 -> 2\n+ /y string 1\n"));
}

TEST_F(History, IsAsLongAsItIsTold)
{
    start({"--history", "2"});
    make_history();
    EXPECT_THAT(remarks(), ElementsAre("3: -", "2: a first x"));
    EXPECT_EQ(ovctl({"diff", "1", "2"}), done("+ /x string 1\n"))
        << "commit 2 tells what was before it";
    set("/x", "3");
    ASSERT_EQ(ovctl({"commit"}).exit_code, 0);
    EXPECT_EQ(ovctl({"rollback", "1"}).exit_code, 1);
    EXPECT_EQ(run_daemon({"--history", "0"}).exit_code, 2);
}

TEST_F(History, IsGoneBackIn)
{
    start();
    make_history();
    set("/mine", "kept");
    EXPECT_EQ(ovctl({"rollback", "2"}), done("commit 4: 2 changes\n"));
    EXPECT_EQ(value("/x"), "/x string 1\n");
    EXPECT_EQ(ovctl({"get", "/y"}).exit_code, 1);
    EXPECT_EQ(ovctl({"diff"}), done("+ /mine string kept\n")) << "edits stay";
    EXPECT_EQ(ovctl({"rollback", "3", "--comment", "forth"}), done("commit 5: 2 changes\n"));
    EXPECT_EQ(ovctl({"rollback", "5"}), done("nothing to commit\n"));
    EXPECT_THAT(remarks({"--limit", "2"}), ElementsAre("5: forth", "4: rollback to commit 2"));
    EXPECT_THAT(ovctl({"show", "commit", "4"}).out, HasSubstr("back to commit      2\n"));
}

TEST_F(History, KnowsNoOtherCommits)
{
    start();
    for (const char *number : {"0", "2", "4294967295"}) {
        EXPECT_EQ(ovctl({"rollback", number}),
                  refused("mgmtd refused the rollback: there is no commit " + std::string(number) +
                          " in the history: it holds only commit 1\n"));
    }
    for (const char *text : {"x", "-1", "4294967296", ""}) {
        EXPECT_EQ(ovctl({"rollback", "--", text}).exit_code, 2) << text;
    }
}

TEST_F(History, BringsTunnelsBackWithTheirIds)
{
    start();
    set(paris, "paris");
    set("/ov/tunneld/tunnel/config/berlin", "berlin");
    ASSERT_EQ(ovctl({"commit"}).exit_code, 0);
    const Outcome before = ovctl({"show", "tunnels"});
    ASSERT_EQ(ovctl({"delete", paris}), done());
    ASSERT_EQ(ovctl({"commit"}).exit_code, 0);
    const Outcome held = ovctl({"rollback", "2"});
    EXPECT_EQ(held.exit_code, 1);
    EXPECT_THAT(held.err,
                MatchesRegex("mgmtd refused the rollback:\n  " + paris +
                             "/id: ID 1 was freed a short time ago and is held back: it is free "
                             "again in [0-9]+ s \\(tunnels\\)\n"));
    // A daemon that starts holds none back.
    ASSERT_EQ(stop(SIGTERM), 0);
    start();
    EXPECT_EQ(ovctl({"rollback", "2"}), done("commit 4: 3 changes\n"));
    EXPECT_EQ(ovctl({"show", "tunnels"}), before);
}

TEST_F(History, BringsReferencesBack)
{
    start();
    const std::string entry = "/ov/tunneld/route_map/config/map/wan/prio/";
    ASSERT_EQ(ovctl({"load", "-"}, "/ov/tunneld/acl/config/a,string,a\n"
                                   "/ov/tunneld/acl/config/b,string,b\n" +
                                       entry + "10/match/0/acl,string,a\n" + entry +
                                       "20/match/0/acl,string,a\n")
                  .exit_code,
              0);
    ASSERT_EQ(ovctl({"commit"}).exit_code, 0);
    ASSERT_EQ(ovctl({"delete", entry + "10"}), done());
    set(entry + "30/match/0/acl", "b");
    ASSERT_EQ(ovctl({"commit"}).exit_code, 0);
    for (const char *number : {"2", "3", "1", "3", "2"}) {
        const Outcome outcome = ovctl({"rollback", number});
        EXPECT_EQ(outcome.exit_code, 0) << outcome.err;
        EXPECT_EQ(ovctl({"diff", number}), done());
        EXPECT_THAT(ovctl({"show", "references", "--check"}).out, HasSubstr(", 0 inconsistencies"));
    }
}

TEST_F(History, UndoesWhatIsNotConfirmed)
{
    start();
    make_history();
    set("/x", "trial");
    EXPECT_EQ(ovctl({"commit", "--confirm", "2"}),
              done("commit 4: 1 change\n"
                   "commit 4 is undone in 2 seconds unless confirmed: run ovctl confirm\n"));
    EXPECT_EQ(value("/x"), "/x string trial\n");
    set("/mine", "kept");
    await("commit 4 was not confirmed in time");
    EXPECT_EQ(value("/x"), "/x string 2\n");
    EXPECT_EQ(ovctl({"diff"}), done("+ /mine string kept\n"));
    EXPECT_THAT(remarks({"--limit", "2"}),
                ElementsAre("5: undo of commit 4, not confirmed in time", "4: [undone by 5]"));
    EXPECT_EQ(ovctl({"confirm"}),
              refused("mgmtd refused the confirmation: no commit waits to be confirmed\n"));
}

TEST_F(History, NamesAllThatWaitTogether)
{
    start();
    set("/x", "1");
    ASSERT_EQ(ovctl({"commit", "--confirm", "60"}).exit_code, 0);
    set("/x", "2");
    EXPECT_EQ(
        ovctl({"commit", "--confirm", "90"}),
        done("commit 3: 1 change\n"
             "commits 2 to 3 are undone in 90 seconds unless confirmed: run ovctl confirm\n"));
    EXPECT_EQ(ovctl({"commit", "--confirm", "600"}),
              done("nothing to commit\ncommits 2 to 3 are undone in 600 seconds unless confirmed: "
                   "run ovctl confirm\n"));
    EXPECT_EQ(ovctl({"confirm"}), done("commits 2 to 3 are confirmed\n"));
}

TEST_F(History, AnUpgradeWaitsAndConfirmsLikeACommit)
{
    start();
    const std::string entry = "/ov/tunneld/route_map/config/map/wan/prio/10/match/0/";
    const std::string text = entry + "ipver,string,any\n" + entry + "protocol,string,tcp\n";
    set("/x", "1");
    ASSERT_EQ(ovctl({"commit", "--confirm", "60"}).exit_code, 0);
    EXPECT_THAT(ovctl({"upgrade", "-", "--confirm", "600", "--comment", "taken over"}, text).out,
                EndsWith("commits 2 to 3 are undone in 600 seconds unless confirmed: "
                         "run ovctl confirm\n"));
    EXPECT_THAT(ovctl({"history", "--limit", "1"}).out, HasSubstr("  [waiting] taken over\n"));
    ASSERT_EQ(ovctl({"delete", "/ov/tunneld/route_map"}).exit_code, 0);
    ASSERT_EQ(ovctl({"commit", "--confirm", "60"}).exit_code, 0);
    EXPECT_THAT(ovctl({"upgrade", "-"}, text).out, EndsWith("commits 2 to 4 are confirmed\n"));
}

TEST_F(History, KeepsWhatIsConfirmed)
{
    start();
    set("/x", "trial");
    ASSERT_EQ(ovctl({"commit", "--confirm", "2"}).exit_code, 0);
    EXPECT_THAT(ovctl({"status"}).out, HasSubstr("commit 2 is undone in "));
    EXPECT_EQ(ovctl({"confirm"}), done("commit 2 is confirmed\n"));
    EXPECT_THAT(ovctl({"status"}).out, Not(HasSubstr("undone")));
    // The time of a later commit is over after that of the confirmed one.
    set("/y", "trial");
    ASSERT_EQ(ovctl({"commit", "--confirm", "2"}).exit_code, 0);
    await("commit 3 was not confirmed in time");
    EXPECT_EQ(value("/x"), "/x string trial\n");
    EXPECT_THAT(remarks({"--limit", "3"}), ElementsAre("4: undo of commit 3, not confirmed in time",
                                                       "3: [undone by 4]", "2: [confirmed]"));
}

TEST_F(History, IsConfirmedByTheNextCommit)
{
    start();
    set("/x", "trial");
    ASSERT_EQ(ovctl({"commit", "--confirm", "3600"}).exit_code, 0);
    set("/ov/tunneld/system/config/mode", "nonsense");
    ASSERT_EQ(ovctl({"commit"}).exit_code, 1) << "a refused one confirms nothing";
    EXPECT_THAT(remarks({"--limit", "1"}).at(0), StartsWith("2: [waiting]"));
    ASSERT_EQ(ovctl({"discard"}).exit_code, 0);
    set("/y", "1");
    EXPECT_EQ(ovctl({"commit"}), done("commit 3: 1 change\ncommit 2 is confirmed\n"));
    set("/y", "2");
    ASSERT_EQ(ovctl({"commit", "--confirm", "3600"}).exit_code, 0);
    EXPECT_EQ(ovctl({"commit"}), done("nothing to commit\ncommit 4 is confirmed\n"));
    EXPECT_THAT(remarks({"--limit", "3"}),
                ElementsAre("4: [confirmed]", "3: -", "2: [confirmed by 3]"));
}

TEST_F(History, WaitsOnOverARestart)
{
    start();
    set("/x", "trial");
    ASSERT_EQ(ovctl({"commit", "--confirm", "4"}).exit_code, 0);
    ASSERT_EQ(stop(SIGKILL), 128 + SIGKILL);
    start();
    EXPECT_EQ(value("/x"), "/x string trial\n");
    await("commit 2 was not confirmed in time");
    EXPECT_EQ(ovctl({"get", "/x"}).exit_code, 1);
}

TEST_F(History, UndoesAtTheStartWhatWasNotConfirmedInTime)
{
    start();
    set("/x", "1");
    ASSERT_EQ(ovctl({"commit", "--confirm", "60"}).exit_code, 0);
    set("/x", "2");
    ASSERT_EQ(ovctl({"commit", "--confirm", "2"}).exit_code, 0);
    // What is kept of the deadline is a second of the clock.
    const auto deadline = floor<seconds>(system_clock::now()) + 2s;
    ASSERT_EQ(stop(SIGKILL), 128 + SIGKILL);
    std::this_thread::sleep_until(deadline);
    start();
    const std::string text = log();
    EXPECT_LT(text.find("commits 2 to 3 were not confirmed in time"), text.find(": ready on "));
    EXPECT_EQ(ovctl({"get", "/x"}).exit_code, 1);
    EXPECT_THAT(remarks({"--limit", "3"}),
                ElementsAre("4: undo of commits 2 to 3, not confirmed in time", "3: [undone by 4]",
                            "2: [undone by 4]"));
}

TEST_F(History, TellsWhyAnUndoIsRefused)
{
    start();
    set(paris, "paris");
    ASSERT_EQ(ovctl({"commit"}).exit_code, 0);
    ASSERT_EQ(ovctl({"delete", paris}), done());
    ASSERT_EQ(ovctl({"commit", "--confirm", "1"}).exit_code, 0);
    await("commit 3 cannot be undone: " + paris + "/id: ID 0 was freed a short time ago");
    EXPECT_THAT(ovctl({"history"}).out,
                HasSubstr("the last try to undo failed: " + paris + "/id: ID 0 "));
    EXPECT_THAT(ovctl({"show", "commit", "3"}).out,
                AllOf(HasSubstr("confirmation        waiting\n"),
                      HasSubstr("the last try to undo failed: " + paris + "/id: ID 0 ")));
    // The next try is made at the start, when no IDs are held back.
    ASSERT_EQ(stop(SIGTERM), 0);
    start();
    EXPECT_EQ(value(paris + "/id"), paris + "/id uint16 0\n");
    EXPECT_THAT(remarks({"--limit", "2"}).at(1), StartsWith("3: [undone by 4]"));
}

TEST_F(History, KeepsItsFilesToItsUser)
{
    const ::mode_t umask_before = ::umask(0);
    start();
    ::umask(umask_before);
    make_history();
    struct stat about {
    };
    ASSERT_EQ(::stat(state_.c_str(), &about), 0);
    EXPECT_EQ(about.st_mode & 07777U, 0700U);
    for (const auto &file : std::filesystem::directory_iterator(state_)) {
        ASSERT_EQ(::stat(file.path().c_str(), &about), 0);
        EXPECT_EQ(about.st_mode & 07777U, 0600U) << file.path();
    }
}

/// The daemon with its state in a file system of its own that has little room.
class LittleRoom : public History
{
  protected:
    void start_with_room(const std::string &kilobytes)
    {
        std::filesystem::create_directory(state_);
        std::filesystem::permissions(state_, std::filesystem::perms(0700));
        Words words{"/usr/bin/unshare",
                    ::geteuid() == 0 ? "-m" : "-rm",
                    "--",
                    "/bin/sh",
                    "-c",
                    "mount -t tmpfs -o mode=0700,size=" + kilobytes +
                        "k tmpfs \"$0\" && exec \"$@\"",
                    state_};
        const Words daemon = daemon_words();
        words.insert(words.end(), daemon.begin(), daemon.end());
        daemon_ = std::make_unique<Process>(words);
        await(": ready on ");
    }
};

TEST_F(LittleRoom, RefusesWhatDoesNotFitAndLosesNothing)
{
    start_with_room("400");
    make_history();
    const std::string big(300000, 'b');
    ASSERT_EQ(ovctl({"load", "-"}, "/big,string," + big + "\n-/y\n").exit_code, 0);
    const Outcome outcome = ovctl({"commit", "--confirm", "60"});
    EXPECT_EQ(outcome.exit_code, 1);
    EXPECT_THAT(outcome.err,
                StartsWith("mgmtd failed at the commit: cannot store the commit in " + state_));
    EXPECT_THAT(outcome.err, HasSubstr("check the free space"));
    EXPECT_EQ(ovctl({"get", "/big"}).exit_code, 1);
    EXPECT_EQ(value("/y"), "/y string 1\n");
    EXPECT_EQ(lines_of(ovctl({"diff"}).out).size(), 2U) << "the edits stay";
    EXPECT_THAT(remarks({"--limit", "1"}), ElementsAre("3: -"));
    // Smaller ones fit, until they do not.
    ASSERT_EQ(ovctl({"discard"}).exit_code, 0);
    set("/x", "3");
    EXPECT_EQ(ovctl({"commit"}), done("commit 4: 1 change\n"));
    EXPECT_EQ(ovctl({"rollback", "3"}), done("commit 5: 1 change\n"));
}

TEST_F(History, RefusesACommitWhoseFileMayNotGrow)
{
    Words words{"/bin/sh", "-c", "ulimit -f 200 && exec \"$@\"", "sh"};
    const Words daemon = daemon_words();
    words.insert(words.end(), daemon.begin(), daemon.end());
    daemon_ = std::make_unique<Process>(words);
    await(": ready on ");
    make_history();
    const std::string big(600000, 'b');
    ASSERT_EQ(ovctl({"load", "-"}, "/big,string," + big + "\n").exit_code, 0);
    EXPECT_THAT(ovctl({"commit"}).err, HasSubstr("File too large"));
    ASSERT_EQ(ovctl({"discard"}).exit_code, 0);
    commit("/x", "string", "3");
    ASSERT_EQ(stop(SIGKILL), 128 + SIGKILL);
    start();
    EXPECT_EQ(value("/x"), "/x string 3\n");
    EXPECT_EQ(ovctl({"diff", "3", "4"}), done("~ /x: 2 -> 3\n"));
}

} // namespace
