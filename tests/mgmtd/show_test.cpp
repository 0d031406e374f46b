// The answers about tunnels: host/mgmtd/show.h. requests_test.cpp has those about the mode.

#include "host/mgmtd/show.h"

#include "framework/sys_time.h"
#include "host/control/request_error.h"
#include "tests/mgmtd/tunnel_fixture.h"

#include <nlohmann/json.hpp>

namespace
{

using namespace ovhost;
using namespace mgmtd_test;
using nlohmann::json;

class Show : public TunnelTest
{
  protected:
    /// The answer; of a refusal "CODE: MESSAGE".
    std::string ask(json request)
    {
        try {
            return answer_show(*configuration_, request).dump();
        } catch (const RequestError &error) {
            return error.code() + ": " + error.what();
        }
    }

    std::string find(const char *by, json what)
    {
        return ask({{"command", "show"}, {"what", "tunnel"}, {by, std::move(what)}});
    }

    static std::string entry(const std::string &name, const std::string &id,
                             const std::string &alias, const std::string &ambiguous = "false")
    {
        return R"({"alias":")" + alias + R"(","alias_is_ambiguous":)" + ambiguous +
               R"(,"bandwidth":null,"id":)" + id + R"(,"name":")" + name + R"(","remote":null})";
    }
};

TEST_F(Show, ListsTunnelsInTheOrderOfTheirNames)
{
    EXPECT_EQ(ask({{"what", "tunnels"}}), R"({"tunnels":[]})");
    add("b", "hq");
    add("a", "hq");
    add("10");
    add("9");
    set(tunnel("9", "remote"), bt_ipaddr, "2001:db8::1");
    set(tunnel("9", "bandwidth"), bt_uint32, "4294967295");
    ASSERT_EQ(commit(), "committed");
    EXPECT_EQ(ask({{"what", "tunnels"}}),
              R"({"tunnels":[)" + entry("10", "0", "10") +
                  R"(,{"alias":"9","alias_is_ambiguous":false,"bandwidth":4294967295,"id":1,)"
                  R"("name":"9","remote":"2001:db8::1"},)" +
                  entry("a", "2", "hq", "true") + "," + entry("b", "3", "hq", "true") + "]}");
}

TEST_F(Show, FindsATunnelByNameAliasAndId)
{
    add("a", "x");
    add("b");
    ASSERT_EQ(commit(), "committed");
    const std::string a = R"(,"tunnels":[)" + entry("a", "0", "x") + R"(],"value":)";
    EXPECT_EQ(find("name", "a"), R"({"ambiguous":false,"by":"name")" + a + R"("a"})");
    EXPECT_EQ(find("alias", "x"), R"({"ambiguous":false,"by":"alias")" + a + R"("x"})");
    EXPECT_EQ(find("tunnel_id", 0), R"({"ambiguous":false,"by":"id")" + a + "0}");
    EXPECT_EQ(find("alias", "b"), R"({"ambiguous":false,"by":"alias","tunnels":[)" +
                                      entry("b", "1", "b") + R"(],"value":"b"})");
}

TEST_F(Show, FindsNothingWhereNothingIs)
{
    add("a", "x");
    ASSERT_EQ(commit(), "committed");
    EXPECT_EQ(find("name", "x"), "not-found: no tunnel has the name \"x\"");
    EXPECT_EQ(find("name", ""), "not-found: no tunnel has the name \"\"");
    EXPECT_EQ(find("alias", "a"), "not-found: no tunnel has the alias \"a\"");
    EXPECT_EQ(find("alias", ""), "not-found: no tunnel has the alias \"\"");
    for (const unsigned id : {1U, 1023U, 1024U, 10021U, 10022U, 65534U, 65535U, 4294967295U}) {
        EXPECT_EQ(find("tunnel_id", id), "not-found: no tunnel has the ID " + std::to_string(id));
    }
    const std::string name_300(300, 'n');
    EXPECT_EQ(find("name", name_300), "not-found: no tunnel has the name \"" + name_300 + "\"");
    // A name does not end at a NUL byte.
    EXPECT_THAT(find("name", std::string("a\0b", 3)), testing::StartsWith("not-found: "));
    EXPECT_THAT(find("alias", std::string("x\0y", 3)), testing::StartsWith("not-found: "));
    for (const test::LoggedLine &line : log_.lines) {
        EXPECT_GT(line.level, ov_log_error) << line.text;
    }
}

TEST_F(Show, TellsWhoClaimsAnAmbiguousAlias)
{
    add("b", "hq");
    add("a", "hq");
    add("hq");
    add("c", "x");
    ASSERT_EQ(commit(), "committed");
    EXPECT_EQ(find("alias", "hq"), R"({"ambiguous":true,"by":"alias","tunnels":[)" +
                                       entry("a", "0", "hq", "true") + "," +
                                       entry("b", "1", "hq", "true") + "," +
                                       entry("hq", "3", "hq", "true") + R"(],"value":"hq"})");
    EXPECT_EQ(find("name", "hq"), R"({"ambiguous":false,"by":"name","tunnels":[)" +
                                      entry("hq", "3", "hq", "true") + R"(],"value":"hq"})");
}

TEST_F(Show, FindsATunnelThatWasLeftOutWithoutAnId)
{
    configuration_.reset();
    Store::open(state_.path())
        .commit(std::vector<StoredChange>{{tunnel("a"), StoredValue{bt_string, "a"}},
                                          {tunnel("a", "id"), StoredValue{bt_uint16, "1024"}}});
    restart();
    EXPECT_EQ(find("name", "a"), R"({"ambiguous":false,"by":"name","tunnels":[)" +
                                     entry("a", "null", "a") + R"(],"value":"a"})");
    EXPECT_EQ(ask({{"what", "tunnels"}}), R"({"tunnels":[]})");
}

TEST_F(Show, NeedsOneThingToFindATunnelBy)
{
    const std::string refusal =
        "bad-request: show: give one of \"name\", \"alias\" and \"tunnel_id\"";
    EXPECT_EQ(ask({{"what", "tunnel"}}), refusal);
    EXPECT_EQ(ask({{"what", "tunnel"}, {"id", 1}}), refusal) << "that is the request's own";
    EXPECT_EQ(ask({{"what", "tunnel"}, {"name", "a"}, {"alias", "b"}}), refusal);
    EXPECT_EQ(ask({{"what", "tunnel"}, {"name", nullptr}}), refusal);
    EXPECT_EQ(find("name", 5), "bad-request: command \"show\": \"name\" must be given, as a "
                               "string");
    for (const json &id : {json("1"), json(-1), json(1.5), json(4294967296)}) {
        EXPECT_EQ(find("tunnel_id", id), "bad-request: command \"show\": \"tunnel_id\" must be a "
                                         "whole number from 0 to 4294967295");
    }
}

TEST_F(Show, MeasuresTheTables)
{
    add("a", "hq");
    add("b", "hq");
    ASSERT_EQ(commit(), "committed");
    add("c");
    ASSERT_EQ(commit(), "committed");
    remove("c");
    ASSERT_EQ(commit(), "committed");
    pass(20'000);
    const json answer = json::parse(ask({{"what", "tunnel-tables"}}));
    EXPECT_EQ(answer["ids"].dump(),
              R"({"allowed":1024,"held_back":[{"id":2,"seconds":41}],"in_use":2,"reserve":20})");
    EXPECT_EQ(answer["names"]["slots"], 65536);
    EXPECT_EQ(answer["names"]["occupied"], 2);
    EXPECT_EQ(answer["names"]["collision_marks"], 0);
    EXPECT_EQ(answer["aliases"].dump(), R"({"collision_marks":1,"holes":0,"longest_probe":1,)"
                                        R"("occupied":1,"slots":65536})");
    EXPECT_EQ(answer.size(), 3U);
}

} // namespace
