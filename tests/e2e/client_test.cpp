// Each command of the client against a real daemon: what it prints, and with which exit code.

#include "tests/e2e/harness.h"

#include <csignal>

namespace
{

using namespace e2e;
using testing::Contains;
using testing::HasSubstr;

constexpr const char *mode = "/ov/tunneld/system/config/mode";
constexpr const char *flows = "/ov/tunneld/system/config/limits/total_flows";

class Client : public E2eTest
{
  protected:
    Client() { start(); }
};

TEST_F(Client, GetsOneNode)
{
    EXPECT_EQ(ovctl({"get", mode}), done("/ov/tunneld/system/config/mode string bridge\n"));
    EXPECT_EQ(ovctl({"get", "/ov"}), done()) << "there, without a value";
    EXPECT_EQ(ovctl({"get", "/nothing"}),
              refused("mgmtd refused the query: no node /nothing in the running configuration\n"));
    EXPECT_EQ(ovctl({"get", "ov"}), refused("mgmtd refused the query: \"ov\" is not a node name: "
                                            "write it as /part/part\n"));
}

TEST_F(Client, GetsJson)
{
    EXPECT_EQ(ovctl({"get", mode, "--json"}),
              done(R"({"ok":true,"result":{"nodes":[{"name":"/ov/tunneld/system/config/mode",)"
                   R"("type":"string","value":"bridge"}]}})"
                   "\n"));
    EXPECT_EQ(
        ovctl({"--json", "get", "/nothing"}),
        (Outcome{1,
                 R"({"error":{"code":"not-found","details":[],"message":"no node /nothing in )"
                 R"(the running configuration"},"ok":false})"
                 "\n",
                 ""}));
}

TEST_F(Client, EditsTheCandidate)
{
    EXPECT_EQ(ovctl({"set", "/x/a", "uint8", "5"}), done());
    EXPECT_EQ(ovctl({"set", flows, "uint32", "20000"}), done());
    EXPECT_EQ(ovctl({"delete", "/ov/tunneld/system/config/bonding"}), done());
    EXPECT_EQ(ovctl({"get", "/x/a"}),
              refused("mgmtd refused the query: no node /x/a in the running configuration\n"));
    EXPECT_EQ(ovctl({"get", "--candidate", "/x/a"}), done("/x/a uint8 5\n"));
    EXPECT_EQ(ovctl({"diff"}),
              done("- /ov/tunneld/system/config/bonding bool false\n"
                   "~ /ov/tunneld/system/config/limits/total_flows: 10000 -> 20000\n"
                   "+ /x/a uint8 5\n"));
    EXPECT_EQ(ovctl({"check"}), done("a commit would make 3 changes\n"));
    EXPECT_EQ(ovctl({"commit", "--comment", "three changes"}), done("commit 2: 3 changes\n"));
    EXPECT_THAT(log_lines(log()),
                Contains("notice commit -: commit 2 is in force: 3 changes (three changes)"));
    EXPECT_EQ(ovctl({"get", "/x/a"}), done("/x/a uint8 5\n"));
    EXPECT_EQ(ovctl({"diff"}), done());
    EXPECT_EQ(ovctl({"commit"}), done("nothing to commit\n"));
    EXPECT_EQ(ovctl({"check"}), done("a commit would make 0 changes\n"));
}

TEST_F(Client, ShowsAChangeOfType)
{
    ASSERT_EQ(ovctl({"set", "/x", "string", "5"}), done());
    ASSERT_EQ(ovctl({"commit"}), done("commit 2: 1 change\n"));
    ASSERT_EQ(ovctl({"set", "/x", "uint8", "5"}), done());
    EXPECT_EQ(ovctl({"diff"}), done("~ /x: string 5 -> uint8 5\n"));
    EXPECT_EQ(ovctl({"diff", "--json"}),
              done(R"({"ok":true,"result":{"changes":[{"change":"modify","name":"/x",)"
                   R"("new":{"type":"uint8","value":"5"},"old":{"type":"string","value":"5"}}]}})"
                   "\n"));
}

TEST_F(Client, DiscardsEdits)
{
    ASSERT_EQ(ovctl({"set", "/x", "string", "5"}), done());
    EXPECT_EQ(ovctl({"discard"}), done("discarded 1 change\n"));
    EXPECT_EQ(ovctl({"discard"}), done("discarded 0 changes\n"));
    EXPECT_EQ(ovctl({"diff"}), done());
}

TEST_F(Client, IsToldWhatDoesNotFit)
{
    EXPECT_EQ(ovctl({"set", "/x", "uint8", "300"}),
              refused("mgmtd refused the change: /x: \"300\" is not a uint8: must be a decimal "
                      "number from 0 to 255\n"));
    EXPECT_EQ(ovctl({"set", "/x", "integer", "3"}),
              refused("mgmtd refused the change: /x: unknown type \"integer\"\n"));
    EXPECT_EQ(ovctl({"set", "x", "uint8", "3"}),
              refused("mgmtd refused the change: \"x\" is not the name of a node: a name is "
                      "/PART/PART, with \"\\/\" for a slash inside a part\n"));
    EXPECT_EQ(ovctl({"delete", "/x"}),
              refused("mgmtd refused the change: there is no node /x to delete\n"));
    EXPECT_EQ(ovctl({"delete", "/"}), refused("mgmtd refused the change: \"/\" cannot be deleted: "
                                              "it is the root of all nodes\n"));
}

TEST_F(Client, LoadsAFile)
{
    const std::string file = (dir_ / "site.db").string();
    write_file(file, "# the site\n/x/a,string,one\n/x/b,bool,true\n-/x/c\n");
    EXPECT_EQ(ovctl({"load", file}), done("loaded 2 values and 1 removal\n"));
    EXPECT_EQ(ovctl({"load", "-"}, "/x/d,uint8,4\n"), done("loaded 1 value and 0 removals\n"));
    EXPECT_EQ(ovctl({"diff"}), done("+ /x/a string one\n+ /x/b bool true\n+ /x/d uint8 4\n"));
}

TEST_F(Client, IsToldEveryBadLine)
{
    EXPECT_EQ(
        ovctl({"load", "-"}, "/x/a,string,1\n/x/b,uint8,300\n/x/c,what,3\n/x/d\n,string,5\n-\n"),
        refused("mgmtd refused the file:\n"
                "  line 2: /x/b: \"300\" is not a uint8: must be a decimal number from 0 to "
                "255\n"
                "  line 3: /x/c: unknown type \"what\"\n"
                "  line 4: /x/d: a value line needs a name and a type: NAME,TYPE,VALUE\n"
                "  line 5: a value line needs a name and a type: NAME,TYPE,VALUE\n"
                "  line 6: a removal line needs a name: -NAME\n"));
    EXPECT_EQ(ovctl({"diff"}), done()) << "all or nothing";
}

TEST_F(Client, NeedsAFileThatIsThere)
{
    const std::string file = (dir_ / "missing").string();
    EXPECT_EQ(ovctl({"load", file}),
              (Outcome{2, "", "ovctl: cannot read " + file + ": No such file or directory\n"}));
}

TEST_F(Client, ShowsTheStatus)
{
    ASSERT_EQ(ovctl({"set", "/x", "string", "5"}), done());
    const Outcome status = ovctl({"status"});
    EXPECT_EQ(status.exit_code, 0);
    const auto lines = lines_of(status.out);
    EXPECT_THAT(lines, Contains("last commit         1"));
    EXPECT_THAT(lines, Contains("model               none"));
    EXPECT_THAT(lines, Contains("running nodes       11"));
    EXPECT_THAT(lines, Contains("candidate nodes     12"));
    EXPECT_THAT(lines, Contains("candidate changes   1"));
    EXPECT_THAT(lines, Contains(testing::MatchesRegex("uptime +00:00:[0-9][0-9]")));
    const Outcome json = ovctl({"status", "--json"});
    EXPECT_THAT(json.out, testing::StartsWith(R"({"ok":true,"result":{"candidate_changes":1,)"));
    EXPECT_THAT(json.out, HasSubstr(R"("nodes":{"candidate":12,"running":11})"));
}

TEST_F(Client, ShowsTheMode)
{
    EXPECT_EQ(ovctl({"show", "mode"}), done("mode                bridge\n"
                                            "submode             normal\n"
                                            "bridge              yes\n"
                                            "router              no\n"
                                            "server              no\n"
                                            "inline router       no\n"
                                            "router interfaces   0\n"
                                            "10 gigabit          no\n"
                                            "bonding             no\n"));
    ASSERT_EQ(ovctl({"load", "-"}, "/net/interface/config/eth0,string,eth0\n"
                                   "/ov/tunneld/system/config/mode,string,router\n"
                                   "/ov/tunneld/system/config/mode/router/1/ifname,string,eth0\n"
                                   "/ov/tunneld/system/config/routing_inline,bool,true\n"
                                   "/ov/tunneld/system/config/10g,bool,true\n"
                                   "-/ov/tunneld/system/config/submode\n")
                  .exit_code,
              0);
    ASSERT_EQ(ovctl({"commit"}).exit_code, 0);
    EXPECT_EQ(ovctl({"show", "mode"}), done("mode                router\n"
                                            "submode             normal\n"
                                            "bridge              no\n"
                                            "router              yes\n"
                                            "server              no\n"
                                            "inline router       yes\n"
                                            "router interfaces   1\n"
                                            "10 gigabit          yes\n"
                                            "bonding             no\n"));
    ASSERT_EQ(ovctl({"delete", mode}), done());
    ASSERT_EQ(ovctl({"commit"}).exit_code, 0);
    EXPECT_THAT(lines_of(ovctl({"show", "mode"}).out), Contains("mode                not set"));
}

TEST_F(Client, FindsNoDaemon)
{
    ASSERT_EQ(stop(SIGTERM), 0);
    EXPECT_EQ(ovctl({"status"}),
              (Outcome{3, "",
                       "ovctl: cannot connect to " + socket_ +
                           ": No such file or directory; is mgmtd running, and is this its "
                           "--socket?\n"}));
}

TEST_F(Client, IsToldOfAWrongCommandLine)
{
    for (const Words &words : {Words{}, Words{"frobnicate"}, Words{"get"}, Words{"set", "/x"},
                               Words{"status", "--no-such-option"}, Words{"show", "weather"}}) {
        const Outcome outcome = ovctl(words);
        EXPECT_EQ(outcome.exit_code, 2);
        EXPECT_NE(outcome.err, "");
        EXPECT_EQ(outcome.out, "");
    }
}

TEST_F(Client, SharesOneCandidateWithOthers)
{
    ASSERT_EQ(ovctl({"set", "/x", "string", "1"}), done());
    ASSERT_EQ(ovctl({"set", "/y", "string", "2"}), done());
    EXPECT_EQ(ovctl({"commit"}), done("commit 2: 2 changes\n"));
}

TEST_F(Client, KeepsEscapedNamesAndAwkwardValues)
{
    const std::string node = "/x/10.0.0.0\\/8/\\*";
    commit(node, "string", "a,b \"c\"\n\t\x01 \xc3\xa9");
    EXPECT_EQ(ovctl({"get", node}),
              done("/x/10.0.0.0\\/8/\\* string a,b \"c\"\\n\\t\\x01 \xc3\xa9\n"));
    ASSERT_EQ(stop(SIGKILL), 128 + SIGKILL);
    start();
    EXPECT_EQ(ovctl({"get", node}),
              done("/x/10.0.0.0\\/8/\\* string a,b \"c\"\\n\\t\\x01 \xc3\xa9\n"));
}

} // namespace
