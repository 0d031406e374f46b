// What ovctl does at a terminal and nowhere else: host/ovctl/terminal.h, table.h, progress.h.

#include "host/ovctl/terminal.h"

#include "host/ovctl/progress.h"
#include "host/ovctl/table.h"
#include "host/ovctl/text_width.h"
#include "tests/control/test_server.h"
#include "tests/support/files.h"
#include "tests/support/process.h"
#include "tests/support/pty.h"
#include "tests/support/scratch_dir.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <chrono>
#include <sstream>
#include <string>
#include <thread>
#include <vector>

namespace ovhost
{
namespace
{

using nlohmann::json;
using ovtest::Process;
using ovtest::PtyProcess;
using ovtest::ScratchDir;
using std::chrono::milliseconds;
using test::TestServer;
using testing::HasSubstr;
using testing::Not;

constexpr const char *escape = "\x1b";

TEST(TextWidthTest, CountsColumnsNotBytes)
{
    EXPECT_EQ(width_of(""), 0U);
    EXPECT_EQ(width_of("plain"), 5U);
    EXPECT_EQ(width_of("caf\xc3\xa9"), 4U);
    EXPECT_EQ(width_of("e\xcc\x81"), 1U) << "an accent that joins the letter before it";
    EXPECT_EQ(width_of("\xe6\x9d\xb1\xe4\xba\xac"), 4U) << "two wide characters";
    EXPECT_EQ(width_of("a\xff"), 2U) << "a byte that is no character";
}

TEST(TextWidthTest, CutsWhatDoesNotFit)
{
    EXPECT_EQ(fitted("plain", 5), "plain");
    EXPECT_EQ(fitted("plain", 4), "pla…");
    EXPECT_EQ(fitted("plain", 1), "…");
    EXPECT_EQ(fitted("plain", 0), "");
    EXPECT_EQ(fitted("", 0), "");
    // Half a wide character cannot be shown.
    EXPECT_EQ(fitted("\xe6\x9d\xb1\xe4\xba\xac", 3), "\xe6\x9d\xb1…");
    EXPECT_EQ(fitted("\xe6\x9d\xb1\xe4\xba\xac", 2), "…");
    EXPECT_EQ(fitted("caf\xc3\xa9s", 5), "caf\xc3\xa9s");
}

std::string printed(const Table &table, const Terminal &terminal)
{
    std::ostringstream out;
    set_terminal(out, terminal);
    table.print(out);
    return out.str();
}

Table two_columns()
{
    Table table({{.heading = "NAME"}, {.heading = "N", .right = true}, {.heading = "REMARK"}});
    table.add({"a-long-name-of-20-cs", "7", "short"});
    table.add({"b", "1234", "a remark of 24 columns .."});
    return table;
}

TEST(TableTest, IsWholeWhereThereIsNoTerminal)
{
    EXPECT_EQ(printed(two_columns(), {}),
              "NAME                     N  REMARK\n"
              "a-long-name-of-20-cs     7  short\n"
              "b                     1234  a remark of 24 columns ..\n");
}

TEST(TableTest, TakesRoomFromTheWidestColumns)
{
    // 20 + 2 + 4 + 2 + 25 = 53 columns.
    EXPECT_EQ(printed(two_columns(), {.width = 53}), printed(two_columns(), {}));
    EXPECT_EQ(printed(two_columns(), {.width = 52}),
              "NAME                     N  REMARK\n"
              "a-long-name-of-20-cs     7  short\n"
              "b                     1234  a remark of 24 columns …\n");
    // 40 - 8 = 32 for both, 16 each.
    EXPECT_EQ(printed(two_columns(), {.width = 40}), "NAME                 N  REMARK\n"
                                                     "a-long-name-of-…     7  short\n"
                                                     "b                 1234  a remark of 24 …\n");
}

TEST(TableTest, LeavesEnoughToReadOnTheNarrowestTerminal)
{
    EXPECT_EQ(printed(two_columns(), {.width = 1}), "NAME         N  REMARK\n"
                                                    "a-long-…     7  short\n"
                                                    "b         1234  a remar…\n");
}

TEST(TableTest, HeadingsAreBoldWhereThereIsColour)
{
    Table table({{.heading = "A"}});
    table.add({"b"});
    EXPECT_EQ(printed(table, {.width = 80, .colour = true}), "\x1b[1mA\x1b[0m\nb\n");
    EXPECT_TRUE(Table({{.heading = "A"}}).empty());
}

class ProgressTest : public testing::Test
{
  protected:
    void SetUp() override { set_terminal(stream_, {.width = 40}); }

    ProgressLine::Clock::time_point after(int count) const { return began_ + milliseconds(count); }

    std::ostringstream stream_;
    ProgressLine::Clock::time_point began_ = ProgressLine::Clock::now();
};

TEST_F(ProgressTest, TellsWhatIsSentAndHowLongTheDaemonIsAtWork)
{
    {
        ProgressLine line(stream_, "site.db", began_);
        line.update({.sent = 1, .total = 3}, after(600));
        EXPECT_EQ(stream_.str(), "\rsending site.db: 33%");
        line.update({.sent = 3, .total = 3}, after(2999));
        line.update({.sent = 3, .total = 3}, after(2999));
        EXPECT_EQ(stream_.str(), "\rsending site.db: 33%\rmgmtd is at work on site.db: 2 s");
        stream_.str("");
    }
    EXPECT_EQ(stream_.str(), "\r" + std::string(32, ' ') + "\r") << "the line is taken away";
}

TEST_F(ProgressTest, SaysNothingOfWhatIsDoneAtOnce)
{
    {
        ProgressLine line(stream_, "site.db", began_);
        line.update({.sent = 1, .total = 3}, after(0));
        line.update({.sent = 3, .total = 3}, after(499));
    }
    EXPECT_EQ(stream_.str(), "");
}

TEST_F(ProgressTest, SaysNothingWhereThereIsNoTerminal)
{
    set_terminal(stream_, {});
    {
        ProgressLine line(stream_, "site.db", began_);
        line.update({.sent = 1, .total = 3}, after(5000));
    }
    EXPECT_EQ(stream_.str(), "");
}

TEST_F(ProgressTest, StaysWithinTheLine)
{
    ProgressLine line(stream_, std::string(100, 'x') + "\n", began_);
    line.update({.sent = 3, .total = 3}, after(1000));
    EXPECT_EQ(stream_.str(), "\rmgmtd is at work on " + std::string(18, 'x') + "…");
}

/// ovctl against a daemon that gives one answer.
class OvctlAtATerminalTest : public testing::Test
{
  protected:
    std::vector<std::string> command(const std::vector<std::string> &words) const
    {
        std::vector<std::string> all{OVMD_OVCTL, "--socket", server_.path()};
        all.insert(all.end(), words.begin(), words.end());
        return all;
    }

    std::string shown(const std::vector<std::string> &words, unsigned short columns,
                      const std::vector<std::string> &environment = {"TERM=xterm"})
    {
        PtyProcess process(command(words), columns, environment);
        exit_ = process.read_to_end();
        return process.shown();
    }

    json answer_ = {{"changes",
                     {{{"change", "add"},
                       {"name", "/a"},
                       {"old", nullptr},
                       {"new", {{"type", "uint32"}, {"value", "5"}}}}}}};
    milliseconds work_{0};
    int exit_ = -1;
    TestServer server_{[this](const json &request, const ClientInfo &) -> json {
        if (request.at("command") == "get")
            throw RequestError(error_code::not_found, "no node /a");
        std::this_thread::sleep_for(work_);
        return answer_;
    }};
};

TEST_F(OvctlAtATerminalTest, TablesFitTheTerminal)
{
    answer_ = {{"tunnels",
                {{{"name", "a-tunnel-with-a-long-name"},
                  {"id", 7},
                  {"alias", "its alias is not short either"},
                  {"alias_is_ambiguous", false},
                  {"remote", nullptr},
                  {"bandwidth", nullptr}}}}};
    const std::string whole = "NAME                          ID  ALIAS\n"
                              "a-tunnel-with-a-long-name      7  its alias is not short either\n";
    const std::vector<std::string> plain{"TERM=xterm", "NO_COLOR=1"};
    EXPECT_EQ(shown({"show", "tunnels"}, 100, plain), whole);
    // 30 - 9 = 21 for two columns; the first of two that are equally wide gives way first.
    const std::string cut = "NAME           ID  ALIAS\n"
                            "a-tunnel-…      7  its alias …\n";
    EXPECT_EQ(shown({"show", "tunnels"}, 30, plain), cut);
    EXPECT_EQ(shown({"show", "tunnels"}, 100, {"TERM=xterm", "NO_COLOR=1", "COLUMNS=30"}), cut);
    EXPECT_EQ(shown({"show", "tunnels"}, 30, {"TERM=xterm", "NO_COLOR=1", "COLUMNS=0"}), cut)
        << "no width at all";
    EXPECT_EQ(shown({"show", "tunnels"}, 30, {"TERM=xterm", "NO_COLOR=1", "COLUMNS=wide"}), cut);
    Process piped(command({"show", "tunnels"}), "", {"COLUMNS=30", "TERM=xterm"});
    EXPECT_EQ(piped.wait(), 0);
    EXPECT_EQ(piped.out(), whole);
}

TEST_F(OvctlAtATerminalTest, ColourIsForTerminalsThatShowItAndUsersWhoWantIt)
{
    const std::string green = "\x1b[32m+ /a uint32 5\x1b[0m\n";
    EXPECT_EQ(shown({"diff"}, 80), green);
    EXPECT_EQ(shown({"diff"}, 80, {"TERM=xterm", "NO_COLOR="}), green);
    for (const char *setting : {"NO_COLOR=1", "NO_COLOR=0", "NO_COLOR= "})
        EXPECT_EQ(shown({"diff"}, 80, {"TERM=xterm", setting}), "+ /a uint32 5\n") << setting;
    EXPECT_EQ(shown({"diff"}, 80, {"TERM=dumb"}), "+ /a uint32 5\n");
    EXPECT_EQ(shown({"diff"}, 80, {}), "+ /a uint32 5\n") << "no TERM at all";
    EXPECT_THAT(shown({"--json", "diff"}, 80), Not(HasSubstr(escape)));
    Process piped(command({"diff"}), "", {"TERM=xterm"});
    EXPECT_EQ(piped.wait(), 0);
    EXPECT_EQ(piped.out(), "+ /a uint32 5\n");
}

TEST_F(OvctlAtATerminalTest, EachStreamIsJudgedByItself)
{
    EXPECT_EQ(shown({"get", "/a"}, 80), "\x1b[31mmgmtd refused the query:\x1b[0m no node /a\n");
    EXPECT_EQ(exit_, 1);
    const ScratchDir dir;
    const std::string to_file = R"(exec "$@" >')" + dir.path("out") + "'";
    std::vector<std::string> words{"/bin/sh", "-c", to_file, "sh"};
    for (const std::string &word : command({"diff"}))
        words.push_back(word);
    PtyProcess process(words, 80);
    EXPECT_EQ(process.read_to_end(), 0);
    EXPECT_EQ(process.shown(), "");
    EXPECT_EQ(ovtest::read_file(dir.path("out")), "+ /a uint32 5\n");
}

TEST_F(OvctlAtATerminalTest, ALongLoadTellsHowFarItIs)
{
    const ScratchDir dir;
    ovtest::write_file(dir.path("site.db"), "/a,uint32,5\n");
    answer_ = {{"set", 1}, {"removed", 0}};
    work_ = milliseconds(1300);
    const std::string file = dir.path("site.db");
    const std::string working = "mgmtd is at work on " + file + ": ";
    const std::string text = shown({"load", file}, 200);
    EXPECT_THAT(text, HasSubstr("\r" + working + "0 s\r" + working + "1 s\r"));
    EXPECT_TRUE(text.ends_with("\rloaded 1 value and 0 removals\n")) << text;
    Process piped(command({"load", file}));
    EXPECT_EQ(piped.wait(), 0);
    EXPECT_EQ(piped.err(), "");
    EXPECT_EQ(piped.out(), "loaded 1 value and 0 removals\n");
}

TEST_F(OvctlAtATerminalTest, AShortLoadSaysOnlyItsResult)
{
    answer_ = {{"set", 0}, {"removed", 0}};
    EXPECT_EQ(shown({"load", "/dev/null"}, 80), "loaded 0 values and 0 removals\n");
}

} // namespace
} // namespace ovhost
