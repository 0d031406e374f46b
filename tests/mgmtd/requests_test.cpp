#include "host/mgmtd/requests.h"

#include "host/control/server.h"
#include "host/framework/appliance_config.h"
#include "tests/mgmtd/fixture.h"

#include <nlohmann/json.hpp>
#include <unistd.h>

#include <chrono>

namespace
{

using namespace ovhost;
using namespace mgmtd_test;
using nlohmann::json;

class RequestsTest : public DaemonTest
{
  protected:
    RequestsTest() { configuration_.start(); }

    /// The answer as a line of JSON; of a refusal "CODE: MESSAGE", with " [DETAIL]" for each
    /// detail.
    std::string ask(const std::string &request)
    {
        try {
            return requests_.handle(json::parse(request), {}).dump();
        } catch (const RequestError &error) {
            std::string text = error.code() + ": " + error.what();
            for (const ErrorDetail &detail : error.details()) {
                text += " [" + detail.node + "|" + detail.message + "|" + detail.module + "|" +
                        std::to_string(detail.line) + "]";
            }
            return text;
        }
    }

    std::string set(const std::string &name, const std::string &type, const std::string &value)
    {
        return ask(
            json{{"command", "set"}, {"name", name}, {"type", type}, {"value", value}}.dump());
    }

    std::string get(const std::string &name, const std::string &from = "running")
    {
        return ask(json{{"command", "get"}, {"name", name}, {"from", from}}.dump());
    }

    const std::chrono::steady_clock::time_point began_ = std::chrono::steady_clock::now();
    Configuration configuration_{state_.path()};
    std::vector<PeerStatus> peers_;
    int events_announced_ = 0;
    Requests requests_{configuration_,
                       {[this] { return peers_; }, [this] { ++events_announced_; }}};
};

TEST_F(RequestsTest, NeedAKnownCommand)
{
    EXPECT_EQ(ask(R"({"command":"frobnicate"})"),
              "unknown-command: unknown command \"frobnicate\"");
    EXPECT_EQ(ask(R"({"command":""})"), "unknown-command: unknown command \"\"");
    EXPECT_EQ(ask(R"({"command":"Get"})"), "unknown-command: unknown command \"Get\"");
}

TEST_F(RequestsTest, NeedTheirArguments)
{
    struct Row {
        const char *request;
        const char *answer;
    };
    const Row rows[] = {
        {R"({"command":"get"})", R"(command "get": "name" must be given, as a string)"},
        {R"({"command":"get","name":5})", R"(command "get": "name" must be given, as a string)"},
        {R"({"command":"get","name":"/a","subtree":"yes"})",
         R"(command "get": "subtree" must be true or false)"},
        {R"({"command":"get","name":"/a","from":1})", R"(command "get": "from" must be a string)"},
        {R"({"command":"get","name":"/a","from":"disk"})",
         R"(get: "from" must be "running" or "candidate")"},
        {R"({"command":"set","type":"bool","value":"true"})",
         R"(command "set": "name" must be given, as a string)"},
        {R"({"command":"set","name":"/a","value":"true"})",
         R"(command "set": "type" must be given, as a string)"},
        {R"({"command":"set","name":"/a","type":"bool"})",
         R"(command "set": "value" must be given, as a string)"},
        {R"({"command":"set","name":"/a","type":"bool","value":true})",
         R"(command "set": "value" must be given, as a string)"},
        {R"({"command":"delete"})", R"(command "delete": "name" must be given, as a string)"},
        {R"({"command":"load"})", R"(command "load": "text" must be given, as a string)"},
        {R"({"command":"load","text":"","source":[]})",
         R"(command "load": "source" must be a string)"},
        {R"({"command":"commit","comment":1})", R"(command "commit": "comment" must be a string)"},
        {R"({"command":"show"})", R"(command "show": "what" must be given, as a string)"},
    };
    for (const Row &row : rows) {
        EXPECT_EQ(ask(row.request), std::string("bad-request: ") + row.answer) << row.request;
    }
}

TEST_F(RequestsTest, GetAnswersOneNode)
{
    EXPECT_EQ(get("/ov/tunneld/system/config/mode"),
              R"({"nodes":[{"name":"/ov/tunneld/system/config/mode","type":"string",)"
              R"("value":"bridge"}]})");
    EXPECT_EQ(get("/ov/tunneld/system"), R"({"nodes":[]})") << "holds no value";
    EXPECT_EQ(get("/"), R"({"nodes":[]})");
}

TEST_F(RequestsTest, GetAnswersASubtreeParentsFirst)
{
    set("/x/a/b", "uint8", "2");
    set("/x/a", "string", "1");
    set("/x/c", "bool", "true");
    EXPECT_EQ(ask(R"({"command":"get","name":"/x","subtree":true,"from":"candidate"})"),
              R"({"nodes":[{"name":"/x/a","type":"string","value":"1"},)"
              R"({"name":"/x/a/b","type":"uint8","value":"2"},)"
              R"({"name":"/x/c","type":"bool","value":"true"}]})");
    EXPECT_EQ(json::parse(ask(R"({"command":"get","name":"/","subtree":true})"))["nodes"].size(),
              11U);
}

TEST_F(RequestsTest, GetTellsWhereANodeIsMissing)
{
    EXPECT_EQ(get("/x"), "not-found: no node /x in the running configuration");
    set("/x", "string", "1");
    EXPECT_EQ(get("/x"), "not-found: no node /x in the running configuration");
    EXPECT_EQ(get("/x", "candidate"), R"({"nodes":[{"name":"/x","type":"string","value":"1"}]})");
    EXPECT_EQ(get("/y", "candidate"), "not-found: no node /y in the candidate configuration");
    EXPECT_EQ(get("x"), R"(bad-value: "x" is not a node name: write it as /part/part)");
    EXPECT_EQ(get(""), R"(bad-value: "" is not a node name: write it as /part/part)");
    EXPECT_EQ(get("/x/"), R"(bad-value: "/x/" is not a node name: write it as /part/part)");
}

TEST_F(RequestsTest, SetWritesTheCandidateAlone)
{
    EXPECT_EQ(set("/x", "uint32", "5"), "{}");
    EXPECT_EQ(get("/x"), "not-found: no node /x in the running configuration");
    EXPECT_EQ(set("/x", "string", ""), "{}") << "type and value are replaced";
    EXPECT_EQ(get("/x", "candidate"), R"({"nodes":[{"name":"/x","type":"string","value":""}]})");
}

TEST_F(RequestsTest, SetRefusesWhatCannotBe)
{
    EXPECT_EQ(set("/x", "nosuchtype", "5"), R"(bad-value: /x: unknown type "nosuchtype")");
    EXPECT_EQ(set("/x", "", "5"), R"(bad-value: /x: unknown type "")");
    // A name does not end at a NUL byte.
    EXPECT_THAT(set("/x", std::string("uint32\0", 7), "5"),
                testing::StartsWith("bad-value: /x: unknown type \"uint32"));
    EXPECT_EQ(set("/x", "uint32", "lots"),
              "bad-value: /x: \"lots\" is not a uint32: must be a decimal number from 0 to "
              "4294967295");
    EXPECT_EQ(set("/x", "string", std::string("a\0b", 3)),
              "bad-value: /x: \"a\\x00b\" is not a string: must not hold a NUL byte");
    for (const char *name : {"x", "", "/", "//x", "/x/", "/x\\y"}) {
        EXPECT_EQ(set(name, "string", "5"),
                  "bad-value: \"" + std::string(name) +
                      "\" is not the name of a node: a name is /PART/PART, with \"\\/\" for a "
                      "slash inside a part");
    }
    EXPECT_EQ(ask(R"({"command":"discard"})"), R"({"changes":0})");
}

TEST_F(RequestsTest, DeleteCountsTheValuesItRemoves)
{
    set("/x/a", "string", "1");
    set("/x/a/b", "string", "2");
    set("/x/c/d", "string", "3");
    EXPECT_EQ(ask(R"({"command":"delete","name":"/x/a/b"})"), R"({"removed":1})");
    EXPECT_EQ(ask(R"({"command":"delete","name":"/x"})"), R"({"removed":2})");
    EXPECT_EQ(ask(R"({"command":"delete","name":"/x"})"),
              "not-found: there is no node /x to delete");
}

TEST_F(RequestsTest, DeleteRefusesWhatIsNoNode)
{
    EXPECT_EQ(ask(R"({"command":"delete","name":"x"})"),
              R"(bad-value: "x" is not a node name: write it as /part/part)");
    EXPECT_EQ(ask(R"({"command":"delete","name":"/"})"),
              R"(bad-value: "/" cannot be deleted: it is the root of all nodes)");
    EXPECT_EQ(ask(R"({"command":"discard"})"), R"({"changes":0})");
}

TEST_F(RequestsTest, LoadAppliesAllLinesOrNone)
{
    EXPECT_EQ(ask(R"({"command":"load","text":"/x/a,string,1\n/x/b,bool,true\n-/x/b\n"})"),
              R"({"removed":1,"set":2})");
    EXPECT_EQ(get("/x/a", "candidate"),
              R"({"nodes":[{"name":"/x/a","type":"string","value":"1"}]})");
    EXPECT_EQ(ask(R"({"command":"load","text":"/x/a,string,2\n/x/b\n","source":"my.db"})"),
              "bad-lines: my.db: 1 bad line; nothing was loaded [/x/b|a value line needs a name "
              "and a type: NAME,TYPE,VALUE||2]");
    EXPECT_EQ(ask(R"({"command":"load","text":"/x/a,uint8,300\n\n-\n"})"),
              "bad-lines: text: 2 bad lines; nothing was loaded [/x/a|\"300\" is not a uint8: must "
              "be a decimal number from 0 to 255||1] [|a removal line needs a name: -NAME||3]");
    EXPECT_EQ(get("/x/a", "candidate"),
              R"({"nodes":[{"name":"/x/a","type":"string","value":"1"}]})");
}

TEST_F(RequestsTest, LoadLogsItsSource)
{
    G_daemon_log_level = ov_log_info;
    (void)ask(R"({"command":"load","text":"","source":"my.db"})");
    ASSERT_FALSE(log_.lines.empty());
    EXPECT_EQ(log_.lines.back().text, "loaded my.db");
    EXPECT_EQ(log_.lines.back().level, ov_log_info);
}

TEST_F(RequestsTest, DiffListsChangesInTheOrderOfNames)
{
    EXPECT_EQ(ask(R"({"command":"diff"})"), R"({"changes":[]})");
    set("/x", "uint8", "1");
    set("/ov/tunneld/system/config/mode", "string", "router");
    (void)ask(R"({"command":"delete","name":"/ov/tunneld/system/config/bonding"})");
    EXPECT_EQ(
        ask(R"({"command":"diff"})"),
        R"({"changes":[{"change":"delete","name":"/ov/tunneld/system/config/bonding","new":null,)"
        R"("old":{"type":"bool","value":"false"}},)"
        R"({"change":"modify","name":"/ov/tunneld/system/config/mode",)"
        R"("new":{"type":"string","value":"router"},"old":{"type":"string","value":"bridge"}},)"
        R"({"change":"add","name":"/x","new":{"type":"uint8","value":"1"},"old":null}]})");
    EXPECT_EQ(ask(R"({"command":"discard"})"), R"({"changes":3})");
    EXPECT_EQ(ask(R"({"command":"diff"})"), R"({"changes":[]})");
}

TEST_F(RequestsTest, CheckDoesNothingButAnswer)
{
    EXPECT_EQ(ask(R"({"command":"check"})"), R"({"changes":0,"warnings":[]})");
    set("/x", "uint8", "1");
    EXPECT_EQ(ask(R"({"command":"check"})"), R"({"changes":1,"warnings":[]})");
    EXPECT_EQ(get("/x"), "not-found: no node /x in the running configuration");
    set("/ov/tunneld/system/config/mode", "string", "brigde");
    set("/ov/tunneld/system/config/10g", "string", "yes");
    EXPECT_EQ(ask(R"({"command":"check"})"),
              "refused: the candidate would be refused "
              "[/ov/tunneld/system/config/10g|must be of type bool|schema|0] "
              "[/ov/tunneld/system/config/mode|must be bridge, router or server, not "
              "\"brigde\"|schema|0]");
}

TEST_F(RequestsTest, CommitTellsItsNumber)
{
    EXPECT_EQ(ask(R"({"command":"commit"})"), R"({"changes":0,"number":1,"warnings":[]})");
    set("/x", "uint8", "1");
    set("/y", "uint8", "1");
    EXPECT_EQ(ask(R"({"command":"commit","comment":"two nodes"})"),
              R"({"changes":2,"number":2,"warnings":[]})");
    EXPECT_EQ(get("/x"), R"({"nodes":[{"name":"/x","type":"uint8","value":"1"}]})");
    EXPECT_EQ(ask(R"({"command":"diff"})"), R"({"changes":[]})");
    EXPECT_EQ(ask(R"({"command":"commit"})"), R"({"changes":0,"number":2,"warnings":[]})");
    EXPECT_EQ(events_announced_, 3);
}

TEST_F(RequestsTest, CommitIsRefusedWithEveryMessageAndKeepsTheEdits)
{
    set("/ov/tunneld/system/config/mode", "string", "brigde");
    set("/ov/tunneld/system/config/10g", "string", "yes");
    EXPECT_EQ(ask(R"({"command":"commit"})"),
              "refused: the commit is refused "
              "[/ov/tunneld/system/config/10g|must be of type bool|schema|0] "
              "[/ov/tunneld/system/config/mode|must be bridge, router or server, not "
              "\"brigde\"|schema|0]");
    EXPECT_EQ(get("/ov/tunneld/system/config/10g"),
              R"({"nodes":[{"name":"/ov/tunneld/system/config/10g","type":"bool",)"
              R"("value":"false"}]})");
    EXPECT_EQ(ask(R"({"command":"discard"})"), R"({"changes":2})");
}

TEST_F(RequestsTest, StatusTellsOfTheDaemon)
{
    peers_.push_back({"jsond", 42, 0, 7, 9});
    set("/x", "uint8", "1");
    const json status = json::parse(ask(R"({"command":"status"})"));
    EXPECT_EQ(status["pid"], ::getpid());
    EXPECT_TRUE(status["model"].is_null());
    EXPECT_EQ(status["commit"], 1);
    EXPECT_EQ(status["nodes"].dump(), R"({"candidate":12,"running":11})");
    EXPECT_EQ(status["candidate_changes"], 1);
    EXPECT_EQ(status["peers"].dump(),
              R"([{"bytes_waiting":9,"events_sent":7,"name":"jsond","pid":42}])");
    const auto uptime = std::chrono::seconds(status["uptime_seconds"].get<int>());
    EXPECT_GE(uptime, std::chrono::seconds(0));
    EXPECT_LE(uptime, std::chrono::steady_clock::now() - began_);
    EXPECT_TRUE(status["version"].is_string());
    EXPECT_EQ(status.size(), 8U);
}

TEST_F(RequestsTest, StatusNamesTheModel)
{
    set_config_name("m1");
    EXPECT_EQ(json::parse(ask(R"({"command":"status"})"))["model"], "m1");
}

TEST_F(RequestsTest, StatusNamesTheModelOfTheConfiguration)
{
    set("/ov/model/config/name", "string", "from-configuration");
    (void)ask(R"({"command":"commit"})");
    // As at the next start.
    configuration_.start();
    EXPECT_EQ(json::parse(ask(R"({"command":"status"})"))["model"], "from-configuration");
}

TEST_F(RequestsTest, ShowModeAnswersForTheRunningConfiguration)
{
    const char *const bridge =
        R"({"bonding":false,"bridge":true,"inline_router":false,"mode":"bridge","router":false,)"
        R"("router_interfaces":0,"server":false,"submode":"normal","ten_gigabit":false})";
    EXPECT_EQ(ask(R"({"command":"show","what":"mode"})"), bridge);
    EXPECT_EQ(ask(json{{"command", "load"},
                       {"text", "/net/interface/config/eth0,string,eth0\n"
                                "/net/interface/config/eth1,string,eth1\n"
                                "/ov/tunneld/system/config/mode,string,router\n"
                                "/ov/tunneld/system/config/mode/router/1/ifname,string,eth0\n"
                                "/ov/tunneld/system/config/mode/router/2/ifname,string,eth1\n"
                                "/ov/tunneld/system/config/submode,string,special\n"
                                "/ov/tunneld/system/config/routing_inline,bool,true\n"
                                "/ov/tunneld/system/config/10g,bool,true\n"
                                "/ov/tunneld/system/config/bonding,bool,true\n"}}
                      .dump()),
              R"({"removed":0,"set":9})");
    EXPECT_EQ(ask(R"({"command":"show","what":"mode"})"), bridge) << "nothing is committed yet";
    (void)ask(R"({"command":"commit"})");
    EXPECT_EQ(
        ask(R"({"command":"show","what":"mode"})"),
        R"({"bonding":true,"bridge":false,"inline_router":true,"mode":"router","router":true,)"
        R"("router_interfaces":2,"server":false,"submode":"special","ten_gigabit":true})");
}

TEST_F(RequestsTest, ShowModeAnswersWithoutAnyNode)
{
    (void)ask(R"({"command":"delete","name":"/ov"})");
    (void)ask(R"({"command":"commit"})");
    EXPECT_EQ(ask(R"({"command":"show","what":"mode"})"),
              R"({"bonding":false,"bridge":false,"inline_router":false,"mode":null,"router":false,)"
              R"("router_interfaces":0,"server":false,"submode":"normal","ten_gigabit":false})");
}

TEST_F(RequestsTest, ShowKnowsNothingElse)
{
    EXPECT_EQ(ask(R"({"command":"show","what":"weather"})"),
              "unknown-command: show: there is no \"weather\" to show");
}

} // namespace
