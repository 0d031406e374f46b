// Requests that the library carries out: host/mgmtd/library_requests.h.

#include "host/mgmtd/library_requests.h"

#include "host/control/request_error.h"
#include "tests/mgmtd/interface_fixture.h"

#include <nlohmann/json.hpp>

namespace
{

using namespace ovhost;
using namespace mgmtd_test;
using nlohmann::json;

class LibraryRequests : public InterfaceTest
{
  protected:
    /// What an answer says; of an error "CODE: MESSAGE".
    template <typename Ask>
    static std::string told(Ask ask)
    {
        try {
            return ask().dump();
        } catch (const RequestError &error) {
            return error.code() + ": " + error.what();
        }
    }

    std::string enable(const std::string &name, bool enabled = true)
    {
        return told([&] {
            return answer_enable(*configuration_, {{"name", name}, {"enabled", enabled}});
        });
    }

    std::string clear(const std::string &name)
    {
        return told([&] { return answer_clear(*configuration_, {{"name", name}}); });
    }

    std::string in_candidate(const std::string &node)
    {
        return value_in(configuration_->candidate().tree(), node);
    }
};

TEST_F(LibraryRequests, EnableAndDisableInTheCandidate)
{
    add_interface("eth0");
    set("/x", "kept");
    EXPECT_EQ(enable("eth0"), "{}");
    EXPECT_EQ(in_candidate(record("eth0/enable")), "bool true");
    EXPECT_EQ(in_candidate("/x"), "string kept") << "another edit";
    EXPECT_EQ(value(record("eth0/enable")), "none") << "not in force yet";
    ASSERT_EQ(commit(), "committed");
    EXPECT_EQ(value(record("eth0/enable")), "bool true");
    EXPECT_EQ(enable("eth0", false), "{}");
    ASSERT_EQ(commit(), "committed");
    EXPECT_EQ(value(record("eth0/enable")), "bool false");
}

TEST_F(LibraryRequests, EnableKnowsNoInterfaceWithoutARecord)
{
    add_vlan("vlan7");
    for (const std::string name : {"eth9", "vlan7", ""}) {
        EXPECT_EQ(enable(name), "not-found: there is no interface \"" + name +
                                    "\" with a record /net/interface/config/" + name +
                                    " in the candidate configuration");
    }
    EXPECT_EQ(enable(std::string("eth\0x", 5)).substr(0, 9), "not-found");
    EXPECT_EQ(told([&] { return answer_enable(*configuration_, json::object()); }).substr(0, 11),
              "bad-request");
}

TEST_F(LibraryRequests, EnableDoesNotTouchANodeThatTheLibraryWouldNotFind)
{
    set(record("a\\/b"), "a/b");
    EXPECT_EQ(enable("a/b"), "bad-value: \"a/b\" is not a name that an interface can have: leave "
                             "out blanks and the characters / : % \\ *");
}

TEST_F(LibraryRequests, ClearRemovesTheChildrenAndKeepsTheNode)
{
    set("/a", "itself");
    set("/a/b", "1");
    set("/a/b/c", "2");
    set("/a/d/e", "3");
    set("/ab", "4");
    EXPECT_EQ(clear("/a"), R"({"removed":2})");
    EXPECT_EQ(in_candidate("/a"), "string itself");
    EXPECT_EQ(in_candidate("/a/b/c"), "none");
    EXPECT_EQ(in_candidate("/a/d/e"), "none");
    EXPECT_EQ(in_candidate("/ab"), "string 4");
    EXPECT_EQ(clear("/a"), R"({"removed":0})");
}

TEST_F(LibraryRequests, ClearRemovesChildrenOfEveryName)
{
    add_route("10.0.0.0/8", "192.0.2.1");
    add_route("11.0.0.0/8", "192.0.2.1");
    set("/p\\/q/a\\\\b", "1");
    set("/p\\/q/c", "2");
    EXPECT_EQ(clear("/ov/tunneld/net/routes/config/ipv4/prefix"), R"({"removed":2})");
    EXPECT_EQ(in_candidate(route("10.0.0.0/8")), "none");
    EXPECT_EQ(in_candidate(route("11.0.0.0/8", "192.0.2.1")), "none");
    EXPECT_EQ(clear("/p\\/q"), R"({"removed":2})");
    EXPECT_EQ(in_candidate("/p\\/q/a\\\\b"), "none");
}

TEST_F(LibraryRequests, ClearNeedsANode)
{
    EXPECT_EQ(clear("/none"), "not-found: no node /none in the candidate configuration");
    for (const std::string name : {"/", "none", ""}) {
        EXPECT_EQ(clear(name),
                  "bad-value: \"" + name + "\" is not the name of a node: write it as /part/part");
    }
}

TEST_F(LibraryRequests, AlarmsAreLinesOfAFile)
{
    const auto alarm = [](const std::string &text) {
        return told([&] { return answer_alarm({{"text", text}}); });
    };
    EXPECT_EQ(alarm("text"), "internal: /var/opt/tms/output/upgrade_alarms.txt cannot be opened "
                             "(error code 14010): see that its folder is there, and the rights of "
                             "both");
    EXPECT_EQ(alarm(""), "bad-value: an alarm needs a text");
    EXPECT_EQ(alarm("two\nlines"), "bad-value: an alarm is one line, without control characters");
}

} // namespace
