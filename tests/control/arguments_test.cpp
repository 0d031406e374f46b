// Arguments of requests: host/control/arguments.h.

#include "host/control/arguments.h"

#include "host/control/request_error.h"

#include <gtest/gtest.h>
#include <nlohmann/json.hpp>

#include <functional>
#include <string>

namespace ovhost
{
namespace
{

using nlohmann::json;

const json request = {
    {"command", "get"}, {"name", "/a"}, {"subtree", true}, {"count", 5}, {"from", nullptr}};

std::string fault_of(const std::function<void()> &read)
{
    try {
        read();
    } catch (const RequestError &error) {
        EXPECT_EQ(error.code(), "bad-request");
        return error.what();
    }
    return "none";
}

TEST(ArgumentsTest, GivesWhatIsThere)
{
    EXPECT_EQ(required_text(request, "name"), "/a");
    EXPECT_EQ(optional_text(request, "name", "other"), "/a");
    EXPECT_TRUE(optional_flag(request, "subtree"));
    EXPECT_EQ(optional_number(request, "count"), 5U);
    EXPECT_EQ(optional_number({{"n", 4294967295}}, "n"), 4294967295U);
}

TEST(ArgumentsTest, WhatIsOptionalMayBeLeftOutOrNull)
{
    EXPECT_EQ(optional_text(request, "comment"), "");
    EXPECT_EQ(optional_text(request, "from", "running"), "running");
    EXPECT_FALSE(optional_flag(request, "from"));
    EXPECT_EQ(optional_number(request, "from"), std::nullopt);
    EXPECT_EQ(optional_number(request, "number"), std::nullopt);
    EXPECT_TRUE(optional_flag(request, "all", true));
}

TEST(ArgumentsTest, FaultsNameCommandAndArgument)
{
    EXPECT_EQ(fault_of([] { static_cast<void>(required_text(request, "value")); }),
              "command \"get\": \"value\" must be given, as a string");
    EXPECT_EQ(fault_of([] { static_cast<void>(required_text(request, "count")); }),
              "command \"get\": \"count\" must be given, as a string");
    EXPECT_EQ(fault_of([] { static_cast<void>(optional_text(request, "count")); }),
              "command \"get\": \"count\" must be a string");
    EXPECT_EQ(fault_of([] { static_cast<void>(optional_flag(request, "count")); }),
              "command \"get\": \"count\" must be true or false");
    for (const json &wrong : {json("5"), json(-1), json(0.5), json(true), json(4294967296)}) {
        EXPECT_EQ(fault_of([&wrong] {
                      static_cast<void>(optional_number({{"count", wrong}}, "count"));
                  }),
                  "command \"\": \"count\" must be a whole number from 0 to 4294967295");
    }
}

} // namespace
} // namespace ovhost
