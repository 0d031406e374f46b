// Requests straight on the socket that no client of ours would send.

#include "tests/control/raw_client.h"
#include "tests/e2e/harness.h"

namespace
{

using namespace e2e;
using ovhost::test::RawClient;
using testing::HasSubstr;

std::string error(const std::string &code, const std::string &message,
                  const std::string &id = "null")
{
    return R"({"error":{"code":")" + code + R"(","details":[],"message":")" + message +
           R"("},"id":)" + id + R"(,"ok":false})";
}

class Socket : public E2eTest
{
  protected:
    Socket() { start(); }

    void expect_alive() const { EXPECT_EQ(ovctl({"diff"}), done()); }
};

TEST_F(Socket, AnswersAndGoesOnAfterBadRequests)
{
    struct Row {
        const char *request;
        std::string answer;
    };
    const Row rows[] = {
        {"[1,2]", error("bad-request", "a request is a JSON object, this is of type array")},
        {"7", error("bad-request", "a request is a JSON object, this is of type number")},
        {"{}", error("bad-request", R"(a request needs a \"command\" of type string)")},
        {R"({"id":3,"command":null})",
         error("bad-request", R"(a request needs a \"command\" of type string)", "3")},
        {R"({"id":"x","command":"diff"})",
         error("bad-request", R"(\"id\" is a whole number, this is of type string)")},
        {R"({"id":4,"command":"reboot"})",
         error("unknown-command", R"(unknown command \"reboot\")", "4")},
        {R"({"id":5,"command":"show","what":"weather"})",
         error("unknown-command", R"(show: there is no \"weather\" to show)", "5")},
        {R"({"id":6,"command":"set","name":"/x","type":"number","value":"1"})",
         error("bad-value", R"(/x: unknown type \"number\")", "6")},
        {R"({"id":7,"command":"set","name":"/x","type":"bool","value":"maybe"})",
         error("bad-value", R"(/x: \"maybe\" is not a bool: must be true or false)", "7")},
        {R"({"id":8,"command":"set","name":"/x","type":"bool"})",
         error("bad-request", R"(command \"set\": \"value\" must be given, as a string)", "8")},
        {R"({"id":9,"command":"get","name":"/x"})",
         error("not-found", "no node /x in the running configuration", "9")},
        {R"({"id":10,"command":"diff"})", R"({"id":10,"ok":true,"result":{"changes":[]}})"},
    };
    RawClient client(socket_);
    for (const Row &row : rows) {
        ASSERT_TRUE(client.send(std::string(row.request) + "\n"));
        EXPECT_EQ(client.line(), row.answer) << row.request;
    }
}

TEST_F(Socket, NamesWhereTheJsonIsWrong)
{
    RawClient client(socket_);
    for (const std::string &request :
         {std::string("hello"), std::string(R"({"command":"diff")"), std::string("\xff\xfe"),
          std::string("{\"command\":\"di\0ff\"}", 19)}) {
        ASSERT_TRUE(client.send(request + "\n"));
        const std::string answer = client.line();
        EXPECT_THAT(answer, HasSubstr(R"("code":"bad-json")"));
        EXPECT_THAT(answer, HasSubstr("not valid JSON: "));
        EXPECT_THAT(answer, HasSubstr("column "));
    }
    ASSERT_TRUE(client.send(std::string(100000, '[') + "\n"));
    EXPECT_EQ(client.line(), error("bad-json", "not valid here: values are nested deeper than 64"));
    expect_alive();
}

TEST_F(Socket, TakesAnyLineEndAndBlankLines)
{
    RawClient client(socket_);
    ASSERT_TRUE(client.send("\n\r\n  \n{\"id\":1,\"command\":\"discard\"}\r\n"));
    EXPECT_EQ(client.line(), R"({"id":1,"ok":true,"result":{"changes":0}})");
}

TEST_F(Socket, AnswersInTheOrderOfTheRequests)
{
    RawClient client(socket_);
    std::string requests;
    for (int i = 1; i <= 200; ++i) {
        requests += R"({"id":)" + std::to_string(i) + R"(,"command":"discard"})" + "\n";
    }
    ASSERT_TRUE(client.send(requests));
    for (int i = 1; i <= 200; ++i) {
        ASSERT_EQ(client.line(),
                  R"({"id":)" + std::to_string(i) + R"(,"ok":true,"result":{"changes":0}})");
    }
}

TEST_F(Socket, EndsARequestThatIsTooLong)
{
    RawClient client(socket_);
    (void)client.send(std::string((16U << 20) + 1, 'x'));
    EXPECT_EQ(
        client.line(),
        error("too-long", "the request is longer than 16777216 bytes: send it in smaller parts"));
    EXPECT_EQ(client.line(), "<end>");
    expect_alive();
}

TEST_F(Socket, AnswersAClientThatHasShutDownItsWritingSide)
{
    RawClient client(socket_);
    // The last line needs no end.
    ASSERT_TRUE(
        client.send("{\"id\":1,\"command\":\"discard\"}\n{\"id\":2,\"command\":\"discard\"}"));
    client.shut_down_writing();
    EXPECT_EQ(client.line(), R"({"id":1,"ok":true,"result":{"changes":0}})");
    EXPECT_EQ(client.line(), R"({"id":2,"ok":true,"result":{"changes":0}})");
    EXPECT_EQ(client.line(), "<end>");
}

TEST_F(Socket, ForgetsAClientThatLeavesInTheMiddle)
{
    {
        RawClient client(socket_);
        ASSERT_TRUE(
            client.send("{\"id\":1,\"command\":\"set\",\"name\":\"/x\",\"type\":\"bool\","));
    }
    {
        RawClient client(socket_);
        ASSERT_TRUE(client.send("{\"command\":\"get\",\"name\":\"/\",\"subtree\":true}\n"));
    }
    expect_alive();
}

TEST_F(Socket, DoesNotWaitForAClientThatDoesNotRead)
{
    RawClient silent(socket_);
    std::string requests;
    for (int i = 0; i < 500; ++i) {
        requests += "{\"command\":\"get\",\"name\":\"/\",\"subtree\":true}\n";
    }
    ASSERT_TRUE(silent.send(requests));
    expect_alive();
    commit("/x", "string", "1");
}

} // namespace
