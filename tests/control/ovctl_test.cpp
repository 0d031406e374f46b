// The client as its users see it: command lines, texts to the byte, exit codes. host/ovctl/.

#include "tests/control/test_server.h"
#include "tests/support/files.h"
#include "tests/support/process.h"
#include "tests/support/scratch_dir.h"

#include <gtest/gtest.h>

#include <optional>
#include <string>
#include <vector>

namespace ovhost
{
namespace
{

using nlohmann::json;
using ovtest::Outcome;
using ovtest::Process;
using ovtest::ScratchDir;
using test::TestServer;

Outcome run(const std::vector<std::string> &words, const std::string &input = {},
            const std::vector<std::string> &environment = {})
{
    std::vector<std::string> argv{OVMD_OVCTL};
    argv.insert(argv.end(), words.begin(), words.end());
    return ovtest::run(argv, input, environment);
}

/// A daemon that gives one answer and keeps the request.
class OvctlTest : public testing::Test
{
  protected:
    Outcome ask(const std::vector<std::string> &words, const std::string &input = {})
    {
        std::vector<std::string> all{"--socket", server_.path()};
        all.insert(all.end(), words.begin(), words.end());
        return run(all, input);
    }

    /// The request as it arrived, without its id.
    json request()
    {
        json copy = request_;
        copy.erase("id");
        return copy;
    }

    void answer_with(json result) { result_ = std::move(result); }

    void refuse_with(const RequestError &error) { refusal_ = error; }

    std::string path() const { return server_.path(); }

  private:
    json handle(const json &request)
    {
        request_ = request;
        if (refusal_)
            throw RequestError(*refusal_);
        return result_;
    }

    json request_ = json::object();
    json result_ = json::object();
    std::optional<RequestError> refusal_;
    TestServer server_{
        [this](const json &request, const ClientInfo &) -> json { return handle(request); }};
};

TEST_F(OvctlTest, GetPrintsNodes)
{
    answer_with({{"nodes",
                  {{{"name", "/a"}, {"type", "uint32"}, {"value", "5"}},
                   {{"name", "/a/b\\/c"}, {"type", "string"}, {"value", "two words"}},
                   {{"name", "/a/d"}, {"type", "string"}, {"value", ""}}}}});
    EXPECT_EQ(ask({"get", "/a", "--subtree"}),
              (Outcome{0, "/a uint32 5\n/a/b\\/c string two words\n/a/d string \n", ""}));
    EXPECT_EQ(request(),
              (json{{"command", "get"}, {"name", "/a"}, {"subtree", true}, {"from", "running"}}));
    ask({"get", "/a", "--candidate"});
    EXPECT_EQ(
        request(),
        (json{{"command", "get"}, {"name", "/a"}, {"subtree", false}, {"from", "candidate"}}));
}

TEST_F(OvctlTest, AValueStaysOnItsLine)
{
    answer_with(
        {{"nodes", {{{"name", "/a"}, {"type", "string"}, {"value", "x\ny\t\x1b[31m\x7f\r"}}}}});
    EXPECT_EQ(ask({"get", "/a"}), (Outcome{0, "/a string x\\ny\\t\\x1b[31m\\x7f\\r\n", ""}));
}

TEST_F(OvctlTest, SetSendsNameTypeAndValue)
{
    EXPECT_EQ(ask({"set", "/a", "string", "v w"}), (Outcome{0, "", ""}));
    EXPECT_EQ(request(),
              (json{{"command", "set"}, {"name", "/a"}, {"type", "string"}, {"value", "v w"}}));
}

TEST_F(OvctlTest, ValuesOfAllKindsArriveAsTheyAre)
{
    for (const char *value : {"", "-5", "[a,b]", "{}", "\"quoted\"", "a=b", "%s", "caf\xc3\xa9"}) {
        EXPECT_EQ(ask({"set", "/a", "string", value}), (Outcome{0, "", ""})) << value;
        EXPECT_EQ(request().value("value", "none"), value);
    }
    EXPECT_EQ(ask({"set", "--", "/a", "string", "--json"}), (Outcome{0, "", ""}));
    EXPECT_EQ(request().value("value", "none"), "--json");
}

TEST_F(OvctlTest, AValueThatIsNotUtf8IsNotSent)
{
    EXPECT_EQ(ask({"set", "/a", "string", "caf\xe9"}),
              (Outcome{2, "", "ovctl: VALUE is not UTF-8 in line 1: convert it first\n"}));
    EXPECT_TRUE(request().empty());
}

TEST_F(OvctlTest, DeleteSendsTheName)
{
    answer_with({{"removed", 2}});
    EXPECT_EQ(ask({"delete", "/a"}), (Outcome{0, "", ""}));
    EXPECT_EQ(request(), (json{{"command", "delete"}, {"name", "/a"}}));
}

TEST_F(OvctlTest, LoadSendsAFile)
{
    const ScratchDir dir;
    const std::string text = "# comment\n/a,uint32,5\n-/b\n";
    ovtest::write_file(dir.path("site.db"), text);
    answer_with({{"set", 1}, {"removed", 2}});
    EXPECT_EQ(ask({"load", dir.path("site.db")}),
              (Outcome{0, "loaded 1 value and 2 removals\n", ""}));
    EXPECT_EQ(request(),
              (json{{"command", "load"}, {"text", text}, {"source", dir.path("site.db")}}));
}

TEST_F(OvctlTest, LoadReadsStandardInput)
{
    answer_with({{"set", 2}, {"removed", 1}});
    EXPECT_EQ(ask({"load", "-"}, "/a,uint32,5\n"),
              (Outcome{0, "loaded 2 values and 1 removal\n", ""}));
    EXPECT_EQ(request(),
              (json{{"command", "load"}, {"text", "/a,uint32,5\n"}, {"source", "standard input"}}));
}

TEST_F(OvctlTest, UpgradeSendsAFileAndPrintsTheChanges)
{
    const ScratchDir dir;
    const std::string text = "/a,string,x\n";
    ovtest::write_file(dir.path("legacy.db"), text);
    const json matchstr = {{"change", "add"},
                           {"name", "/m"},
                           {"old", nullptr},
                           {"new", {{"type", "string"}, {"value", "dscp:ef"}}}};
    answer_with({{"converted", 1},
                 {"by_acl", 2},
                 {"number", 5},
                 {"changes", json::array({matchstr})},
                 {"warnings", {"w"}}});
    EXPECT_EQ(ask({"upgrade", dir.path("legacy.db")}),
              (Outcome{0,
                       "+ /m string dscp:ef\n"
                       "warning: w\n"
                       "1 entry converted to match strings, 2 by ACL as before\n"
                       "commit 5: 1 change\n",
                       ""}));
    EXPECT_EQ(request(),
              (json{{"command", "upgrade"}, {"text", text}, {"source", dir.path("legacy.db")}}));
}

TEST_F(OvctlTest, UpgradeSaysThatNothingIsNew)
{
    answer_with({{"converted", 2},
                 {"by_acl", 0},
                 {"number", 5},
                 {"changes", json::array()},
                 {"warnings", json::array()}});
    EXPECT_EQ(ask({"upgrade", "-"}, "x"),
              (Outcome{0,
                       "2 entries converted to match strings, 0 by ACL as before\n"
                       "nothing to commit\n",
                       ""}));
}

TEST_F(OvctlTest, AFileThatCannotBeReadIsNamed)
{
    EXPECT_EQ(ask({"load", "/nowhere/site.db"}),
              (Outcome{2, "", "ovctl: cannot read /nowhere/site.db: No such file or directory\n"}));
    EXPECT_EQ(ask({"load", "/"}), (Outcome{2, "", "ovctl: cannot read /: Is a directory\n"}));
    EXPECT_TRUE(request().empty());
}

TEST_F(OvctlTest, AFileThatIsTooLongIsNotSent)
{
    const ScratchDir dir;
    const std::string file = dir.path("site.db");
    ovtest::write_file(file, std::string(16UL << 20, '#'));
    answer_with({{"set", 0}, {"removed", 0}});
    // With what else is in the request this one is too long for mgmtd, which says so.
    EXPECT_EQ(ask({"load", file}).exit_code, 1);
    ovtest::write_file(file, std::string((16UL << 20) + 1, '#'));
    EXPECT_EQ(
        ask({"load", file}),
        (Outcome{2, "", "ovctl: " + file + " is longer than 16 MiB: load it in smaller parts\n"}));
    EXPECT_EQ(
        ask({"load", "/dev/zero"}),
        (Outcome{2, "", "ovctl: /dev/zero is longer than 16 MiB: load it in smaller parts\n"}));
}

TEST_F(OvctlTest, ClosedStandardDescriptorsDoNotBecomeTheSocket)
{
    answer_with({{"removed", 2}});
    for (const char *closed : {"<&-", ">&-", "2>&-", "<&- >&- 2>&-"}) {
        Process process({"/bin/sh", "-c", std::string(R"(exec "$0" "$@" )") + closed, OVMD_OVCTL,
                         "--socket", path(), "--json", "delete", "/a"});
        EXPECT_EQ(process.wait(), 0) << closed << process.err();
    }
}

TEST_F(OvctlTest, CheckSaysWhatACommitWouldDo)
{
    answer_with({{"changes", 1}, {"warnings", {"mode changes"}}});
    EXPECT_EQ(ask({"check"}),
              (Outcome{0, "warning: mode changes\na commit would make 1 change\n", ""}));
    EXPECT_EQ(request(), (json{{"command", "check"}}));
}

TEST_F(OvctlTest, CommitSaysItsNumber)
{
    answer_with({{"number", 7}, {"changes", 2}, {"warnings", json::array()}});
    EXPECT_EQ(ask({"commit"}), (Outcome{0, "commit 7: 2 changes\n", ""}));
    EXPECT_EQ(request(), (json{{"command", "commit"}}));
    EXPECT_EQ(ask({"commit", "--comment", "new site"}).exit_code, 0);
    EXPECT_EQ(request(), (json{{"command", "commit"}, {"comment", "new site"}}));
}

TEST_F(OvctlTest, CommitOfNothing)
{
    answer_with({{"number", 7}, {"changes", 0}, {"warnings", json::array()}});
    EXPECT_EQ(ask({"commit"}), (Outcome{0, "nothing to commit\n", ""}));
}

TEST_F(OvctlTest, DiffPrintsAChangePerLine)
{
    const auto node = [](const char *type, const char *value) {
        return json{{"type", type}, {"value", value}};
    };
    answer_with(
        {{"changes",
          {{{"change", "add"}, {"name", "/a"}, {"old", nullptr}, {"new", node("uint32", "5")}},
           {{"change", "delete"}, {"name", "/b"}, {"old", node("bool", "true")}, {"new", nullptr}},
           {{"change", "modify"},
            {"name", "/c"},
            {"old", node("string", "x")},
            {"new", node("string", "y z")}},
           {{"change", "modify"},
            {"name", "/d"},
            {"old", node("string", "5")},
            {"new", node("uint32", "5")}}}}});
    EXPECT_EQ(ask({"diff"}), (Outcome{0,
                                      "+ /a uint32 5\n"
                                      "- /b bool true\n"
                                      "~ /c: x -> y z\n"
                                      "~ /d: string 5 -> uint32 5\n",
                                      ""}));
}

TEST_F(OvctlTest, DiffOfNothingIsEmpty)
{
    answer_with({{"changes", json::array()}});
    EXPECT_EQ(ask({"diff"}), (Outcome{0, "", ""}));
}

TEST_F(OvctlTest, DiscardSaysHowMuchIsGone)
{
    answer_with({{"changes", 3}});
    EXPECT_EQ(ask({"discard"}), (Outcome{0, "discarded 3 changes\n", ""}));
}

TEST_F(OvctlTest, StatusPrintsTheFacts)
{
    answer_with({{"version", "1.0.0"},
                 {"pid", 4711},
                 {"uptime_seconds", 93784},
                 {"model", "m1"},
                 {"commit", 7},
                 {"nodes", {{"running", 100}, {"candidate", 101}}},
                 {"candidate_changes", 1},
                 {"peers",
                  {{{"name", "jsond"}, {"pid", 12}, {"events_sent", 1}, {"bytes_waiting", 0}},
                   {{"name", "other"}, {"pid", 13}, {"events_sent", 2}, {"bytes_waiting", 600}}}}});
    EXPECT_EQ(ask({"status"}), (Outcome{0,
                                        "version             1.0.0\n"
                                        "pid                 4711\n"
                                        "uptime              1d 02:03:04\n"
                                        "model               m1\n"
                                        "last commit         7\n"
                                        "running nodes       100\n"
                                        "candidate nodes     101\n"
                                        "candidate changes   1\n"
                                        "peer                jsond (pid 12, 1 event sent)\n"
                                        "peer                other (pid 13, 2 events sent, 600 "
                                        "bytes waiting)\n",
                                        ""}));
}

TEST_F(OvctlTest, StatusOfADaemonWithLittle)
{
    answer_with({{"version", "1.0.0"},
                 {"pid", 1},
                 {"uptime_seconds", 59},
                 {"model", nullptr},
                 {"commit", 0},
                 {"nodes", {{"running", 0}, {"candidate", 0}}},
                 {"candidate_changes", 0},
                 {"peers", json::array()}});
    const Outcome outcome = ask({"status"});
    EXPECT_EQ(outcome.exit_code, 0);
    EXPECT_NE(outcome.out.find("uptime              00:00:59\n"
                               "model               none\n"),
              std::string::npos)
        << outcome.out;
    EXPECT_EQ(outcome.out.find("peer"), std::string::npos);
}

TEST_F(OvctlTest, ShowModePrintsTheAnswers)
{
    answer_with({{"mode", "router"},
                 {"submode", "normal"},
                 {"bridge", false},
                 {"router", true},
                 {"server", false},
                 {"inline_router", true},
                 {"router_interfaces", 2},
                 {"ten_gigabit", false},
                 {"bonding", true}});
    EXPECT_EQ(ask({"show", "mode"}), (Outcome{0,
                                              "mode                router\n"
                                              "submode             normal\n"
                                              "bridge              no\n"
                                              "router              yes\n"
                                              "server              no\n"
                                              "inline router       yes\n"
                                              "router interfaces   2\n"
                                              "10 gigabit          no\n"
                                              "bonding             yes\n",
                                              ""}));
    EXPECT_EQ(request(), (json{{"command", "show"}, {"what", "mode"}}));
}

json tunnel_json(const char *name, json id, const char *alias, bool ambiguous)
{
    return {{"name", name},          {"id", std::move(id)},
            {"alias", alias},        {"alias_is_ambiguous", ambiguous},
            {"remote", "192.0.2.1"}, {"bandwidth", nullptr}};
}

TEST_F(OvctlTest, ShowTunnelsPrintsAList)
{
    answer_with({{"tunnels", json::array()}});
    EXPECT_EQ(ask({"show", "tunnels"}), (Outcome{0, "no tunnels\n", ""}));
    EXPECT_EQ(request(), (json{{"command", "show"}, {"what", "tunnels"}}));
    answer_with(
        {{"tunnels",
          {tunnel_json("caf\xc3\xa9\n", 7, "hq", true),
           tunnel_json("longname", 10021, "x y", false), tunnel_json("o", nullptr, "o", false)}}});
    EXPECT_EQ(ask({"show", "tunnels"}), (Outcome{0,
                                                 "NAME         ID  ALIAS\n"
                                                 "caf\xc3\xa9\\n        7  hq (ambiguous)\n"
                                                 "longname  10021  x y\n"
                                                 "o          none  o\n",
                                                 ""}));
}

TEST_F(OvctlTest, ShowTunnelPrintsATunnel)
{
    answer_with({{"by", "name"},
                 {"value", "paris"},
                 {"ambiguous", false},
                 {"tunnels", {tunnel_json("paris", 3, "hq", true)}}});
    const Outcome paris{0,
                        "name                paris\n"
                        "id                  3\n"
                        "alias               hq (ambiguous)\n"
                        "remote              192.0.2.1\n"
                        "bandwidth           not set\n",
                        ""};
    EXPECT_EQ(ask({"show", "tunnel", "--name", "paris"}), paris);
    EXPECT_EQ(request(), (json{{"command", "show"}, {"what", "tunnel"}, {"name", "paris"}}));
    EXPECT_EQ(ask({"show", "tunnel", "--alias", ""}), paris);
    EXPECT_EQ(request(), (json{{"command", "show"}, {"what", "tunnel"}, {"alias", ""}}));
    EXPECT_EQ(ask({"show", "tunnel", "--id", "70000"}), paris);
    EXPECT_EQ(request(), (json{{"command", "show"}, {"what", "tunnel"}, {"tunnel_id", 70000}}));
}

TEST_F(OvctlTest, ShowTunnelPrintsWhoClaimsAnAmbiguousAlias)
{
    answer_with(
        {{"by", "alias"},
         {"value", "hq"},
         {"ambiguous", true},
         {"tunnels", {tunnel_json("oslo", 0, "hq", true), tunnel_json("paris", 12, "hq", true)}}});
    EXPECT_EQ(ask({"show", "tunnel", "--alias", "hq"}),
              (Outcome{0,
                       "the alias \"hq\" is ambiguous: 2 tunnels claim it\n"
                       "NAME      ID  ALIAS\n"
                       "oslo       0  hq (ambiguous)\n"
                       "paris     12  hq (ambiguous)\n",
                       ""}));
}

TEST_F(OvctlTest, ShowTunnelNeedsOneThingToFindItBy)
{
    const Outcome refusal{2, "", "ovctl: give one of --name, --alias and --id\n"};
    EXPECT_EQ(ask({"show", "tunnel"}), refusal);
    EXPECT_EQ(ask({"show", "tunnel", "--name", "a", "--id", "1"}), refusal);
    for (const char *id : {"", "-1", "x", "4294967296", "1.5"})
        EXPECT_EQ(ask({"show", "tunnel", "--id", id}),
                  (Outcome{2, "", "ovctl: the ID must be a whole number from 0 to 4294967295\n"}))
            << id;
    EXPECT_TRUE(request().empty());
}

TEST_F(OvctlTest, ShowTunnelTablesPrintsBothTablesAndTheIds)
{
    const auto table = [](int occupied, int marks, int holes, int probe) {
        return json{{"slots", 65536},
                    {"occupied", occupied},
                    {"collision_marks", marks},
                    {"holes", holes},
                    {"longest_probe", probe}};
    };
    json answer{{"names", table(10000, 0, 3, 120)},
                {"aliases", table(5, 2, 0, 1)},
                {"ids",
                 {{"allowed", 1024},
                  {"in_use", 7},
                  {"reserve", 20},
                  {"held_back", {{{"id", 3}, {"seconds", 1}}, {{"id", 9}, {"seconds", 42}}}}}}};
    const std::string tables = "table               names   aliases\n"
                               "slots               65536   65536\n"
                               "occupied            10000   5\n"
                               "collision marks     0       2\n"
                               "holes               3       0\n"
                               "longest probe       120     1\n"
                               "IDs allowed         1024\n"
                               "IDs in use          7\n"
                               "IDs in reserve      20\n";
    answer_with(answer);
    EXPECT_EQ(
        ask({"show", "tunnel-tables"}),
        (Outcome{0, tables + "IDs held back       2, the first (ID 3) for 1 second more\n", ""}));
    EXPECT_EQ(request(), (json{{"command", "show"}, {"what", "tunnel-tables"}}));
    answer["ids"]["held_back"] = json::array();
    answer_with(answer);
    EXPECT_EQ(ask({"show", "tunnel-tables"}), (Outcome{0, tables + "IDs held back       0\n", ""}));
}

TEST_F(OvctlTest, ARefusedCommitNamesEveryNodeAndModule)
{
    refuse_with({"refused",
                 "two checks refuse",
                 {{"/a/b", "at most 5 are possible", "limits", 0},
                  {"", "out of tunnels", "tunnels", 0},
                  {"/c", "no such mode", "", 0}}});
    EXPECT_EQ(ask({"commit"}), (Outcome{1, "",
                                        "mgmtd refused the commit:\n"
                                        "  /a/b: at most 5 are possible (limits)\n"
                                        "  out of tunnels (tunnels)\n"
                                        "  /c: no such mode\n"}));
}

TEST_F(OvctlTest, ShowMapsPrintsAnEntryPerLine)
{
    answer_with({{"maps",
                  {{{"kind", "route-map"},
                    {"name", "w\xc3\xa4n"},
                    {"entries",
                     {{{"priority", "10"}, {"acl", "a1"}, {"matchstr", nullptr}},
                      {{"priority", "20"}, {"acl", nullptr}, {"matchstr", "dst_port:80"}},
                      {{"priority", "30"}, {"acl", "a2"}, {"matchstr", "any"}},
                      {{"priority", "65535"}, {"acl", nullptr}, {"matchstr", nullptr}}}}},
                   {{"kind", "QoS-map"}, {"name", "empty"}, {"entries", json::array()}}}}});
    EXPECT_EQ(ask({"show", "maps"}), (Outcome{0,
                                              "KIND       MAP    PRIORITY  MATCH\n"
                                              "route-map  w\xc3\xa4n    10        acl a1\n"
                                              "route-map  w\xc3\xa4n    20        dst_port:80\n"
                                              "route-map  w\xc3\xa4n    30        acl a2, any\n"
                                              "route-map  w\xc3\xa4n    65535     -\n"
                                              "QoS-map    empty  -         -\n",
                                              ""}));
    EXPECT_EQ(request(), (json{{"command", "show"}, {"what", "maps"}}));
    answer_with({{"maps", json::array()}});
    EXPECT_EQ(ask({"show", "maps"}), (Outcome{0, "no maps\n", ""}));
}

TEST_F(OvctlTest, ShowAclPrintsItsEntriesAndUsers)
{
    answer_with({{"name", "a1"},
                 {"entries",
                  {{{"number", "10"},
                    {"fields",
                     {{{"name", "matchstr"}, {"value", "dst_port:80"}},
                      {{"name", "protocol"}, {"value", "tcp"}}}}},
                   {{"number", "20"}, {"fields", json::array()}}}},
                 {"references",
                  {{{"kind", "route-map"}, {"map", "m1"}, {"priority", "10"}},
                   {{"kind", "sec-map"}, {"map", "z1"}, {"priority", "5"}}}}});
    EXPECT_EQ(ask({"show", "acl", "a1"}), (Outcome{0,
                                                   "name                a1\n"
                                                   "entry 10            matchstr dst_port:80\n"
                                                   "                    protocol tcp\n"
                                                   "entry 20            nothing set\n"
                                                   "used by             route-map m1, entry 10\n"
                                                   "                    sec-map z1, entry 5\n",
                                                   ""}));
    EXPECT_EQ(request(), (json{{"command", "show"}, {"what", "acl"}, {"name", "a1"}}));
    answer_with({{"name", "a2"}, {"entries", json::array()}, {"references", json::array()}});
    EXPECT_EQ(ask({"show", "acl", "a2"}), (Outcome{0,
                                                   "name                a2\n"
                                                   "used by             no map\n",
                                                   ""}));
}

TEST_F(OvctlTest, ShowAclOfNoneIsRefused)
{
    refuse_with({"not-found", "there is no ACL \"a3\""});
    EXPECT_EQ(ask({"show", "acl", "a3"}),
              (Outcome{1, "", "mgmtd refused the query: there is no ACL \"a3\"\n"}));
}

TEST_F(OvctlTest, ShowReferencesPrintsAList)
{
    answer_with({{"references",
                  {{{"acl", "a1"}, {"kind", "route-map"}, {"map", "m1"}, {"priority", "10"}},
                   {{"acl", "a22"}, {"kind", "nat-map"}, {"map", "n1"}, {"priority", "5"}}}}});
    EXPECT_EQ(ask({"show", "references"}), (Outcome{0,
                                                    "ACL  KIND       MAP  PRIORITY\n"
                                                    "a1   route-map  m1   10\n"
                                                    "a22  nat-map    n1   5\n",
                                                    ""}));
    EXPECT_EQ(request(), (json{{"command", "show"}, {"what", "references"}, {"check", false}}));
    answer_with({{"references", json::array()}});
    EXPECT_EQ(ask({"show", "references"}), (Outcome{0, "no references\n", ""}));
}

TEST_F(OvctlTest, ShowReferencesFailsWhenACheckFindsSomething)
{
    answer_with({{"records", 1}, {"faults", json::array()}});
    EXPECT_EQ(ask({"show", "references", "--check"}),
              (Outcome{0, "1 record, 0 inconsistencies\n", ""}));
    EXPECT_EQ(request(), (json{{"command", "show"}, {"what", "references"}, {"check", true}}));
    answer_with({{"records", 2},
                 {"faults",
                  {{{"acl", "a1"},
                    {"kind", "route-map"},
                    {"map", "m1"},
                    {"priority", "10"},
                    {"message", "there is a record, but the entry names no ACL"}}}}});
    EXPECT_EQ(ask({"show", "references", "--check"}),
              (Outcome{1,
                       "route-map m1, entry 10, ACL a1: there is a record, but the entry names no "
                       "ACL\n2 records, 1 inconsistency\n",
                       ""}));
    EXPECT_EQ(ask({"--json", "show", "references", "--check"}),
              (Outcome{1,
                       R"({"ok":true,"result":{"faults":[{"acl":"a1","kind":"route-map",)"
                       R"("map":"m1","message":"there is a record, but the entry names no ACL",)"
                       R"("priority":"10"}],"records":2}})"
                       "\n",
                       ""}));
}

TEST_F(OvctlTest, ShowInterfacesPrintsAnInterfacePerLine)
{
    answer_with(
        {{"interfaces",
          {{{"name", "eth0"},
            {"kind", "interface"},
            {"enabled", true},
            {"users",
             {{{"node", "/ov/wccpd/wccp/srv_grp/config/10/interface"}, {"text", "wccp group 10"}},
              {{"node", "/ov/redd/net/interface/vrrp/config/v"}, {"text", "vrrp interface"}}}}},
           {{"name", "tun0"}, {"kind", "tunnel"}, {"enabled", false}, {"users", json::array()}},
           {{"name", "vlan7"},
            {"kind", "vlan"},
            {"enabled", nullptr},
            {"users", json::array()}}}}});
    EXPECT_EQ(ask({"show", "interfaces"}),
              (Outcome{0,
                       "NAME   KIND       ENABLED  USED BY\n"
                       "eth0   interface  yes      wccp group 10, vrrp interface\n"
                       "tun0   tunnel     no       -\n"
                       "vlan7  vlan       -        -\n",
                       ""}));
    EXPECT_EQ(request(), (json{{"command", "show"}, {"what", "interfaces"}}));
    answer_with({{"interfaces", json::array()}});
    EXPECT_EQ(ask({"show", "interfaces"}), (Outcome{0, "no interfaces\n", ""}));
}

TEST_F(OvctlTest, ShowBudgetPrintsTheFigures)
{
    answer_with({{"configured", 3},
                 {"allowed", 16},
                 {"in_kernel", 5},
                 {"index_budget", 128},
                 {"each_takes", 2},
                 {"left", 13}});
    EXPECT_EQ(ask({"show", "budget"}), (Outcome{0,
                                                "configured          3\n"
                                                "model's limit       16\n"
                                                "in the kernel       5\n"
                                                "index budget        128\n"
                                                "each takes          2\n"
                                                "left                13\n",
                                                ""}));
    EXPECT_EQ(request(), (json{{"command", "show"}, {"what", "budget"}}));
}

TEST_F(OvctlTest, EnableAndDisableSendTheInterface)
{
    answer_with(json::object());
    EXPECT_EQ(ask({"enable", "eth0"}), (Outcome{0, "", ""}));
    EXPECT_EQ(request(), (json{{"command", "enable"}, {"name", "eth0"}, {"enabled", true}}));
    EXPECT_EQ(ask({"disable", "eth0"}), (Outcome{0, "", ""}));
    EXPECT_EQ(request(), (json{{"command", "enable"}, {"name", "eth0"}, {"enabled", false}}));
}

TEST_F(OvctlTest, ClearSaysHowManyChildrenAreGone)
{
    answer_with({{"removed", 1}});
    EXPECT_EQ(ask({"clear", "/a"}), (Outcome{0, "removed 1 child\n", ""}));
    EXPECT_EQ(request(), (json{{"command", "clear"}, {"name", "/a"}}));
    answer_with({{"removed", 12}});
    EXPECT_EQ(ask({"clear", "/a"}), (Outcome{0, "removed 12 children\n", ""}));
}

TEST_F(OvctlTest, AlarmSendsItsText)
{
    answer_with(json::object());
    EXPECT_EQ(ask({"alarm", "restart the appliance"}), (Outcome{0, "", ""}));
    EXPECT_EQ(request(), (json{{"command", "alarm"}, {"text", "restart the appliance"}}));
    EXPECT_EQ(ask({"alarm"}).exit_code, 2);
}

TEST_F(OvctlTest, ARefusalOfSeveralLinesKeepsThem)
{
    refuse_with({"refused",
                 "one check refuses",
                 {{"/a/b", "Cannot delete it.\n  Please wait.\n  And\x1b[31m more.", "acl", 0},
                  {"/c", "Unknown protocol x.\n", "acl", 0},
                  {"/d", "", "acl", 0}}});
    EXPECT_EQ(ask({"commit"}), (Outcome{1, "",
                                        "mgmtd refused the commit:\n"
                                        "  /a/b: Cannot delete it. (acl)\n"
                                        "    Please wait.\n"
                                        "    And\\x1b[31m more.\n"
                                        "  /c: Unknown protocol x. (acl)\n"
                                        "  /d:  (acl)\n"}));
}

TEST_F(OvctlTest, ARefusedFileNamesItsLines)
{
    refuse_with({"bad-lines",
                 "2 lines are bad",
                 {{"", "no type", "", 3}, {"/a", "uint33 is no type", "", 12}}});
    EXPECT_EQ(ask({"load", "-"}, "x"), (Outcome{1, "",
                                                "mgmtd refused the file:\n"
                                                "  line 3: no type\n"
                                                "  line 12: /a: uint33 is no type\n"}));
}

TEST_F(OvctlTest, ARefusedFileIsNamedAsItWasGiven)
{
    const ScratchDir dir;
    ovtest::write_file(dir.path("site.db"), "x");
    refuse_with({"bad-lines", "1 line is bad", {{"", "no type", "", 1}}});
    EXPECT_EQ(ask({"load", dir.path("site.db")}),
              (Outcome{1, "",
                       "mgmtd refused the file " + dir.path("site.db") +
                           ":\n"
                           "  line 1: no type\n"}));
}

TEST_F(OvctlTest, ARefusalWithoutDetailsIsOneLine)
{
    refuse_with({"not-found", "no node /a in the running configuration"});
    EXPECT_EQ(
        ask({"get", "/a"}),
        (Outcome{1, "", "mgmtd refused the query: no node /a in the running configuration\n"}));
}

TEST_F(OvctlTest, AFailureOfTheDaemonIsCalledOne)
{
    refuse_with({"internal", "the disk is full"});
    EXPECT_EQ(ask({"commit"}), (Outcome{1, "", "mgmtd failed at the commit: the disk is full\n"}));
}

TEST_F(OvctlTest, JsonPrintsTheAnswerOnOneLine)
{
    answer_with({{"number", 7}, {"changes", 2}, {"warnings", json::array()}});
    EXPECT_EQ(ask({"--json", "commit"}),
              (Outcome{0,
                       R"({"ok":true,"result":{"changes":2,"number":7,"warnings":[]}})"
                       "\n",
                       ""}));
    refuse_with({"refused", "no", {{"/a", "too large", "limits", 0}}});
    EXPECT_EQ(ask({"commit", "--json"}),
              (Outcome{1,
                       R"({"error":{"code":"refused","details":[{"message":"too large",)"
                       R"("module":"limits","node":"/a"}],"message":"no"},"ok":false})"
                       "\n",
                       ""}));
}

TEST_F(OvctlTest, AnAnswerThatLacksSomethingIsAProtocolError)
{
    answer_with({{"changes", 2}});
    const Outcome outcome = ask({"commit"});
    EXPECT_EQ(outcome.exit_code, 4);
    EXPECT_NE(outcome.err.find("ovctl: mgmtd's answer lacks something: "), std::string::npos);
    EXPECT_NE(outcome.err.find("warnings"), std::string::npos);
}

TEST_F(OvctlTest, TheSocketMayComeFromTheEnvironment)
{
    answer_with({{"changes", json::array()}});
    EXPECT_EQ(run({"diff"}, {}, {"OVCTL_SOCKET=" + path()}), (Outcome{0, "", ""}));
    EXPECT_EQ(run({"--socket", path(), "diff"}, {}, {"OVCTL_SOCKET=/nowhere"}),
              (Outcome{0, "", ""}))
        << "the command line goes first";
    EXPECT_EQ(run({"diff", "--socket", path()}), (Outcome{0, "", ""}));
}

TEST(OvctlWithoutDaemonTest, SaysWhatToDo)
{
    const std::string reason = "cannot connect to /nowhere/socket: No such file or directory; is "
                               "mgmtd running, and is this its --socket?";
    EXPECT_EQ(run({"--socket", "/nowhere/socket", "status"}),
              (Outcome{3, "", "ovctl: " + reason + "\n"}));
    EXPECT_EQ(run({"--socket", "/nowhere/socket", "--json", "status"}),
              (Outcome{3,
                       R"({"error":{"code":"unreachable","details":[],"message":")" + reason +
                           "\"},\"ok\":false}\n",
                       ""}));
}

TEST(OvctlWithoutDaemonTest, ADaemonThatDoesNotAnswerIsNotWaitedForForEver)
{
    const ScratchDir dir;
    const ListenSocket silent(dir.path("socket"));
    EXPECT_EQ(run({"--socket", dir.path("socket"), "--timeout", "0.05", "status"}),
              (Outcome{3, "",
                       "ovctl: mgmtd did not answer \"status\" within 50 ms; it may still be at "
                       "work on it\n"}));
}

TEST(OvctlWithoutDaemonTest, AWrongCommandLineIsAUsageError)
{
    const std::string hint = "Run with --help for more information.\n";
    EXPECT_EQ(run({}), (Outcome{2, "", "A subcommand is required\n" + hint}));
    EXPECT_EQ(run({"show"}), (Outcome{2, "", "A subcommand is required\n" + hint}));
    EXPECT_EQ(run({"get"}), (Outcome{2, "", "name is required\n" + hint}));
    EXPECT_EQ(run({"fly"}), (Outcome{2, "", "there is no command \"fly\"\n" + hint}));
    EXPECT_EQ(run({"--json", "fly", "/a"}),
              (Outcome{2, "", "there is no command \"fly\"\n" + hint}));
    EXPECT_EQ(run({"show", "fly"}), (Outcome{2, "", "there is no command \"show fly\"\n" + hint}));
    EXPECT_EQ(
        run({"--timeout", "nan", "status"}),
        (Outcome{2, "", "--timeout: must be a number of seconds from 0.001 to 86400\n" + hint}));
    for (const std::vector<std::string> &words : {std::vector<std::string>{"fly"},
                                                  {"get", "/a", "--fast"},
                                                  {"get", "/a", "/b"},
                                                  {"--timeout", "0", "status"},
                                                  {"--timeout", "nan", "status"},
                                                  {"--timeout", "inf", "status"},
                                                  {"--timeout", "-1", "status"},
                                                  {"--timeout", "soon", "status"},
                                                  {"--socket", "", "status"}}) {
        const Outcome outcome = run(words);
        EXPECT_EQ(outcome.exit_code, 2) << words[0];
        EXPECT_EQ(outcome.out, "");
        EXPECT_TRUE(outcome.err.ends_with(hint)) << outcome.err;
    }
}

TEST(OvctlWithoutDaemonTest, TellsItsVersion)
{
    const Outcome version = run({"--version"});
    EXPECT_EQ(version.exit_code, 0);
    EXPECT_EQ(version.out, "1.0.0\n");
}

TEST(OvctlWithoutDaemonTest, HelpListsCommandsExamplesAndExitCodes)
{
    const Outcome all = run({"--help"});
    EXPECT_EQ(all.exit_code, 0);
    for (const char *word : {"get", "set", "delete", "load", "check", "commit", "diff", "discard",
                             "status", "show", "--socket", "--json", "OVCTL_SOCKET", "Exit codes:"})
        EXPECT_NE(all.out.find(word), std::string::npos) << word;
    const Outcome one = run({"commit", "--help"});
    EXPECT_EQ(one.exit_code, 0);
    EXPECT_NE(one.out.find("--comment TEXT"), std::string::npos) << one.out;
    EXPECT_NE(one.out.find("Example:\n  ovctl commit"), std::string::npos) << one.out;
}

} // namespace
} // namespace ovhost
