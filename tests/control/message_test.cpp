// The lines of the protocol: host/control/message.h.

#include "host/control/message.h"

#include <gtest/gtest.h>
#include <nlohmann/json.hpp>

#include <optional>
#include <string>
#include <vector>

namespace ovhost
{
namespace
{

using nlohmann::json;

struct Fault {
    std::string code;
    std::string message;
    json id;
};

/// What a request line is refused with.
Fault fault_of(const std::string &line)
{
    json id;
    try {
        static_cast<void>(parse_request(line, id));
    } catch (const RequestError &error) {
        return {error.code(), error.what(), id};
    }
    return {"none", "", id};
}

TEST(MessageTest, ReadsARequestAndItsId)
{
    json id;
    const json request = parse_request(R"({"id":7,"command":"get","name":"/a"})", id);
    EXPECT_EQ(id, 7);
    EXPECT_EQ(request.at("name"), "/a");
}

TEST(MessageTest, ARequestMayGoWithoutAnId)
{
    json id;
    static_cast<void>(parse_request(R"({"command":"check"})", id));
    EXPECT_TRUE(id.is_null());
    EXPECT_EQ(parse_request(R"({"id":null,"command":"check"})", id).at("command"), "check");
    EXPECT_TRUE(id.is_null());
}

TEST(MessageTest, ANulByteIsAFaultWhereverItStands)
{
    const std::string request = R"({"id":1,"command":"x"})";
    for (const std::size_t at : {std::size_t{0}, std::size_t{5}, request.size()}) {
        std::string line = request;
        line.insert(at, 1, '\0');
        const Fault fault = fault_of(line);
        EXPECT_EQ(fault.code, "bad-json");
        EXPECT_EQ(fault.message, "not valid JSON: a NUL byte at column " + std::to_string(at + 1));
    }
    json id;
    EXPECT_EQ(parse_request(R"({"command":"a\u0000b"})", id).at("command"), std::string("a\0b", 3))
        << "an escaped one is a character of the text";
}

TEST(MessageTest, TheMessageOfAnErrorIsOneLineAndADetailMayHaveSeveral)
{
    const json error =
        error_to_json(RequestError(error_code::refused, std::string("no\n\0\x1b[31m\xc2\x9b!", 12),
                                   {{"/a", "b\n  c", "m", 0}}));
    EXPECT_EQ(error.at("message"), "no\\n\\x00\\x1b[31m\\u009b!");
    EXPECT_EQ(error.at("details").at(0).at("message"), "b\n  c");
}

TEST(MessageTest, ATextOfAnErrorThatIsTooLongIsCutBetweenCharacters)
{
    const std::string most(4096, 'x');
    EXPECT_EQ(error_to_json(RequestError("c", most)).at("message"), most);
    const std::string cut(4095, 'x');
    // The last character that fits begins at byte 4095 and would end behind the limit.
    EXPECT_EQ(
        error_to_json(RequestError("c", cut + "\xc3\xa9yz", {{"/n", cut + "\xc3\xa9", "m", 0}})),
        (json{{"code", "c"},
              {"message", cut + "... (4 bytes more)"},
              {"details",
               {{{"node", "/n"}, {"message", cut + "... (2 bytes more)"}, {"module", "m"}}}}}));
}

TEST(MessageTest, ManyDetailsAreSummedUp)
{
    const std::vector<ErrorDetail> most(200, {"/a", "bad", "m", 1});
    EXPECT_EQ(error_to_json(RequestError("c", "m", most)).at("details").size(), 200U);
    const std::vector<ErrorDetail> more(201, {"/a", "bad", "m", 1});
    const json details = error_to_json(RequestError("c", "m", more)).at("details");
    ASSERT_EQ(details.size(), 200U);
    EXPECT_EQ(details.at(198).at("message"), "bad");
    EXPECT_EQ(details.at(199), (json{{"node", ""}, {"message", "and 2 more"}, {"module", ""}}));
}

TEST(MessageTest, MalformedJsonIsNamedWithItsPlace)
{
    const Fault fault = fault_of(R"({"id":1,"command":})");
    EXPECT_EQ(fault.code, "bad-json");
    EXPECT_EQ(fault.message, "not valid JSON: parse error at line 1, column 19: syntax error while "
                             "parsing value - unexpected '}'; expected '[', '{', or a literal");
    EXPECT_TRUE(fault.id.is_null());
}

TEST(MessageTest, AFaultyTokenIsNotRepeatedAtLength)
{
    const Fault fault = fault_of("{\"command\":\"" + std::string(1000000, 'x'));
    EXPECT_EQ(fault.code, "bad-json");
    EXPECT_LT(fault.message.size(), 350U);
}

TEST(MessageTest, BytesThatAreNotUtf8AreMalformed)
{
    EXPECT_EQ(fault_of("{\"command\":\"\xe9\"}").code, "bad-json");
}

TEST(MessageTest, ANumberThatFitsNowhereIsMalformed)
{
    EXPECT_EQ(fault_of(R"({"command":"get","x":1e999})").code, "bad-json");
}

TEST(MessageTest, NestingHasALimit)
{
    const auto nested = [](int depth) {
        const auto count = static_cast<std::size_t>(depth);
        // The request object itself is one level.
        return R"({"command":"get","x":)" + std::string(count - 1, '[') +
               std::string(count - 1, ']') + "}";
    };
    EXPECT_EQ(fault_of(nested(64)).code, "none");
    const Fault fault = fault_of(nested(65));
    EXPECT_EQ(fault.code, "bad-json");
    EXPECT_EQ(fault.message, "not valid here: values are nested deeper than 64");
    EXPECT_EQ(fault_of(nested(5000000)).code, "bad-json");
}

TEST(MessageTest, ARequestIsAnObject)
{
    const Fault fault = fault_of("[1,2]");
    EXPECT_EQ(fault.code, "bad-request");
    EXPECT_EQ(fault.message, "a request is a JSON object, this is of type array");
}

TEST(MessageTest, AnIdIsAWholeNumber)
{
    const Fault fault = fault_of(R"({"id":"one","command":"get"})");
    EXPECT_EQ(fault.code, "bad-request");
    EXPECT_EQ(fault.message, "\"id\" is a whole number, this is of type string");
    EXPECT_TRUE(fault.id.is_null());
}

TEST(MessageTest, ARequestNeedsACommand)
{
    for (const char *line : {R"({"id":3})", R"({"id":3,"command":5})"}) {
        const Fault fault = fault_of(line);
        EXPECT_EQ(fault.code, "bad-request");
        EXPECT_EQ(fault.message, "a request needs a \"command\" of type string");
        EXPECT_EQ(fault.id, 3) << "the id was readable";
    }
}

TEST(MessageTest, AnswersAreOneLine)
{
    EXPECT_EQ(result_line(4, {{"text", "a\nb"}}),
              "{\"id\":4,\"ok\":true,\"result\":{\"text\":\"a\\nb\"}}\n");
    const RequestError error("refused", "two checks refuse",
                             {{"/a", "too large", "limits", 0}, {"", "no comma", "", 12}});
    EXPECT_EQ(error_line(nullptr, error),
              "{\"error\":{\"code\":\"refused\",\"details\":["
              "{\"message\":\"too large\",\"module\":\"limits\",\"node\":\"/a\"},"
              "{\"line\":12,\"message\":\"no comma\",\"module\":\"\",\"node\":\"\"}],"
              "\"message\":\"two checks refuse\"},\"id\":null,\"ok\":false}\n");
    EXPECT_EQ(event_line("x"), "{\"event\":\"x\"}\n");
    EXPECT_EQ(goodbye_line("stopping", "bye"),
              "{\"goodbye\":{\"code\":\"stopping\",\"message\":\"bye\"}}\n");
}

TEST(MessageTest, TextThatIsNotUtf8IsSentWithReplacements)
{
    EXPECT_EQ(event_line("caf\xe9!"), "{\"event\":\"caf\xef\xbf\xbd!\"}\n");
}

TEST(MessageTest, ErrorsSurviveTheWay)
{
    const RequestError sent("refused", "no",
                            {{"/a", "too large", "limits", 0}, {"", "no comma", "", 12}});
    const RequestError received = error_from_json(error_to_json(sent));
    EXPECT_EQ(received.code(), "refused");
    EXPECT_STREQ(received.what(), "no");
    EXPECT_EQ(received.details(), sent.details());
}

TEST(MessageTest, AnErrorObjectMayLackDetails)
{
    const RequestError error = error_from_json({{"code", "x"}, {"message", "y"}});
    EXPECT_TRUE(error.details().empty());
    EXPECT_THROW(static_cast<void>(error_from_json({{"code", "x"}})), json::exception);
}

} // namespace
} // namespace ovhost
