// The answers about maps, ACLs and references: host/mgmtd/show_maps.h.

#include "host/mgmtd/show_maps.h"

#include "host/control/request_error.h"
#include "host/mgmtd/show.h"
#include "tests/mgmtd/map_fixture.h"

#include <nlohmann/json.hpp>

namespace
{

using namespace ovhost;
using namespace mgmtd_test;
using nlohmann::json;

class ShowMaps : public MapTest
{
  protected:
    /// The answer; of a refusal "CODE: MESSAGE".
    std::string ask(const json &request)
    {
        try {
            return answer_show(*configuration_, request).dump();
        } catch (const RequestError &error) {
            return error.code() + ": " + error.what();
        }
    }

    std::string ask_for_acl(const std::string &name)
    {
        return ask({{"what", "acl"}, {"name", name}});
    }
};

TEST_F(ShowMaps, ListsTheEntriesOfAllKinds)
{
    G_daemon_log_level = 2; // the DNS proxy's kind is unknown to most checks, which they log
    EXPECT_EQ(ask({{"what", "maps"}}), R"({"maps":[]})");
    add_acl("a1");
    add_entry("m1", "10", "a1");
    set(rmap("m1/prio/9/match/0/matchstr"), "any");
    set(rmap("m2"), "m2");
    set(matched(*find_map_kind("secmap"), "z1", "5", "acl"), "a1");
    set(matched(*find_map_kind("secmap"), "z1", "5", "matchstr"), "dst_port:80");
    ASSERT_EQ(commit(), "committed");
    put_in_store("/ov/dnsproxy/config/0/map/d1/prio/7", bt_uint16, "7");
    EXPECT_EQ(ask({{"what", "maps"}}),
              R"({"maps":[{"entries":[{"acl":null,"matchstr":"any","priority":"9"},)"
              R"({"acl":"a1","matchstr":null,"priority":"10"}],"kind":"route-map","name":"m1"},)"
              R"({"entries":[],"kind":"route-map","name":"m2"},)"
              R"({"entries":[{"acl":"a1","matchstr":"dst_port:80","priority":"5"}],)"
              R"("kind":"sec-map","name":"z1"},)"
              R"({"entries":[{"acl":null,"matchstr":null,"priority":"7"}],)"
              R"("kind":"dns-proxy-map","name":"d1"}]})");
}

TEST_F(ShowMaps, TellsAnAclAndWhoRefersToIt)
{
    set(acl("a1/entry/20/protocol"), "tcp");
    set(acl("a1/entry/20/matchstr"), "dst_port:80");
    set(acl("a1/entry/9"), bt_uint16, "9");
    add_acl("a2");
    add_entry("m1", "10", "a1");
    set(matched(*find_map_kind("qmap"), "q1", "30", "acl"), "a1");
    ASSERT_EQ(commit(), "committed");
    EXPECT_EQ(ask_for_acl("a1"),
              R"({"entries":[{"fields":[],"number":"9"},{"fields":[)"
              R"({"name":"matchstr","value":"dst_port:80"},{"name":"protocol","value":"tcp"}],)"
              R"("number":"20"}],"name":"a1","references":[)"
              R"({"kind":"route-map","map":"m1","priority":"10"},)"
              R"({"kind":"QoS-map","map":"q1","priority":"30"}]})");
    EXPECT_EQ(ask_for_acl("a2"), R"({"entries":[],"name":"a2","references":[]})");
}

TEST_F(ShowMaps, KnowsNoAclThatIsNotThere)
{
    add_acl("a1");
    ASSERT_EQ(commit(), "committed");
    EXPECT_EQ(ask_for_acl("a"), "not-found: there is no ACL \"a\"");
    EXPECT_EQ(ask_for_acl(""), "not-found: there is no ACL \"\"");
    EXPECT_EQ(ask_for_acl("*"), "not-found: there is no ACL \"*\"");
    EXPECT_EQ(ask_for_acl("a1/x"), "not-found: there is no ACL \"a1/x\"");
    const std::string name_600(600, 'n');
    EXPECT_EQ(ask_for_acl(name_600), "not-found: there is no ACL \"" + name_600 + "\"");
    // A name does not end at a NUL byte.
    EXPECT_THAT(ask_for_acl(std::string("a1\0", 3)), testing::StartsWith("not-found: "));
    EXPECT_EQ(ask({{"command", "show"}, {"what", "acl"}}),
              "bad-request: command \"show\": \"name\" must be given, as a string");
}

TEST_F(ShowMaps, ListsAndChecksReferences)
{
    EXPECT_EQ(ask({{"what", "references"}}), R"({"references":[]})");
    const json check = {{"what", "references"}, {"check", true}};
    EXPECT_EQ(ask(check), R"({"faults":[],"records":0})");
    add_acl("a1");
    add_entry("m1", "10", "a1");
    add_entry("m1", "20", "a1");
    ASSERT_EQ(commit(), "committed");
    EXPECT_EQ(ask({{"what", "references"}, {"check", false}}),
              R"({"references":[{"acl":"a1","kind":"route-map","map":"m1","priority":"10"},)"
              R"({"acl":"a1","kind":"route-map","map":"m1","priority":"20"}]})");
    EXPECT_EQ(ask(check), R"({"faults":[],"records":2})");
    erase(rmap("m1/prio/10/match/0/acl"));
    ASSERT_EQ(commit(), "committed");
    EXPECT_EQ(ask(check), R"({"faults":[],"records":1})");
    EXPECT_EQ(ask({{"command", "show"}, {"what", "references"}, {"check", "yes"}}),
              "bad-request: command \"show\": \"check\" must be true or false");
}

TEST_F(ShowMaps, SaysHowAStaleRecordIsMended)
{
    add_acl("a1");
    add_entry("m1", "20", "a1");
    ASSERT_EQ(commit(), "committed");
    put_in_store(acl("a1/rmap/m1/prio/10"), bt_uint32, "10");
    const json check = {{"what", "references"}, {"check", true}};
    EXPECT_EQ(ask(check),
              R"({"faults":[{"acl":"a1","kind":"route-map","map":"m1",)"
              R"("message":"there is a record, but the entry names no ACL; delete )"
              R"(/ov/tunneld/acl/config/a1/rmap/m1/prio/10","priority":"10"}],"records":2})");
    erase(acl("a1/rmap/m1/prio/10"));
    EXPECT_EQ(commit(), "committed");
    EXPECT_EQ(ask(check), R"({"faults":[],"records":1})");
}

TEST_F(ShowMaps, SaysHowARecordThatIsMissingOrWrongIsMended)
{
    add_acl("a1");
    add_entry("m1", "10", "a1");
    add_entry("m1", "20", "a1");
    ASSERT_EQ(commit(), "committed");
    const std::string node = rmap("m1/prio/10/match/0/acl");
    const json check = {{"what", "references"}, {"check", true}};
    for (const std::optional<std::string> &value :
         {std::optional<std::string>(), std::optional<std::string>("11")}) {
        put_in_store(acl("a1/rmap/m1/prio/10"), bt_uint32, value);
        EXPECT_THAT(ask(check),
                    testing::HasSubstr("; delete " + node + ", commit, and set it again"));
        erase(node);
        EXPECT_EQ(commit(), "committed");
        set(node, "a1");
        EXPECT_EQ(commit(), "committed");
        EXPECT_EQ(ask(check), R"({"faults":[],"records":2})");
    }
}

} // namespace
