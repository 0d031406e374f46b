#include "orvale/md_tunneld_tunnel_common.h"

#include "tests/library/library_test.h"

#include <ostream>
#include <string>

using namespace ovtest;
using testing::ElementsAre;
using testing::IsEmpty;

namespace
{

constexpr char mode_node[] = "/ov/tunneld/system/config/mode";
constexpr char submode_node[] = "/ov/tunneld/system/config/submode";
constexpr char inline_node[] = "/ov/tunneld/system/config/routing_inline";
constexpr char router_node[] = "/ov/tunneld/system/config/mode/router";

std::string line_of(const std::string &function, const std::string &text)
{
    return error_line("md_tunneld_tunnel_common", function, text);
}

// A text getter's status and text; the text that was there before is "old".
std::string answer(int (*getter)(const mdb_db *, char **), const mdb_db *db)
{
    char old[] = "old";
    char *text = old;
    const int status = in_library(getter, db, &text);
    return std::to_string(status) + ' ' + (text == old ? "old" : taken(text));
}

class SystemMode : public LibraryTest
{
  protected:
    std::string mode() { return answer(md_get_db_system_mode, host_.db()); }
    std::string submode() { return answer(md_get_db_bridge_submode, host_.db()); }
    void set_mode(const std::string &mode) { host_.set(mode_node, bt_string, mode); }

    // The answers to bridge, router, server.
    std::string modes()
    {
        std::string answers;
        for (const auto question : {md_is_db_system_bridge_mode, md_is_db_system_router_mode,
                                    md_is_db_system_server_mode}) {
            answers += in_library(question, host_.db()) ? 'y' : 'n';
        }
        return answers;
    }

    bool is_inline() { return in_library(md_is_db_system_inline_router_mode, host_.db()); }
};

TEST_F(SystemMode, TheModeIsTheNodesText)
{
    set_mode("router");
    EXPECT_EQ(mode(), "0 router");
    EXPECT_THAT(log_lines(), IsEmpty());
}

TEST_F(SystemMode, TheNodeIsReadAsTheHostExpectsIt)
{
    set_mode("router");
    EXPECT_EQ(mode(), "0 router");
    EXPECT_THAT(calls_of(Operation::mdb_get_node_binding),
                ElementsAre("mdb_get_node_binding(null, *, "
                            "\"/ov/tunneld/system/config/mode\", 0, *)"));
    EXPECT_THAT(calls_of(Operation::bn_binding_get_str),
                ElementsAre("bn_binding_get_str(*, 1, 101, 0, *)"));
    EXPECT_EQ(num_calls(Operation::bn_binding_free), 1U);
}

TEST_F(SystemMode, AnEmptyModeIsAText)
{
    set_mode("");
    EXPECT_EQ(mode(), "0 ");
    EXPECT_EQ(modes(), "nnn");
}

TEST_F(SystemMode, WithoutNodeThereIsNoMode)
{
    EXPECT_EQ(mode(), "0 null");
    EXPECT_EQ(modes(), "nnn");
    EXPECT_FALSE(is_inline());
    EXPECT_THAT(log_lines(), IsEmpty());
}

TEST_F(SystemMode, ANodeThatOnlyHasChildrenIsNoMode)
{
    host_.set("/ov/tunneld/system/config/mode/router/wan0", bt_bool, "true");
    EXPECT_EQ(mode(), "0 null");
}

TEST_F(SystemMode, ANullAddressIsRefused)
{
    EXPECT_EQ(in_library(md_get_db_system_mode, host_.db(), nullptr), 14001);
    EXPECT_THAT(log_lines(), ElementsAre(line_of("md_get_db_system_mode", "Unexpected NULL")));
    EXPECT_EQ(num_calls(Operation::bail_debug), 1U);
    EXPECT_EQ(num_calls(Operation::mdb_get_node_binding), 0U);
}

TEST_F(SystemMode, ANullDatabaseIsRefused)
{
    EXPECT_EQ(answer(md_get_db_system_mode, nullptr), "14001 null");
    EXPECT_EQ(answer(md_get_db_bridge_submode, nullptr), "14001 null");
    EXPECT_THAT(log_lines(), ElementsAre(line_of("md_get_db_system_mode", "Unexpected NULL"),
                                         line_of("md_get_db_bridge_submode", "Unexpected NULL")));
    EXPECT_EQ(num_calls(Operation::bail_debug), 2U);
    EXPECT_EQ(num_calls(Operation::mdb_get_node_binding), 0U);
}

TEST_F(SystemMode, ANullDatabaseHasNoMode)
{
    constexpr char null_error[] = "Error code 14001 (unexpected NULL) returned";
    EXPECT_FALSE(in_library(md_is_db_system_bridge_mode, nullptr));
    EXPECT_FALSE(in_library(md_is_db_system_inline_router_mode, nullptr));
    EXPECT_THAT(log_lines(), ElementsAre(line_of("md_get_db_system_mode", "Unexpected NULL"),
                                         line_of("md_is_db_system_bridge_mode", null_error),
                                         line_of("md_get_db_system_mode", "Unexpected NULL"),
                                         line_of("md_is_db_system_router_mode", null_error)));
}

TEST_F(SystemMode, ABindingWithoutTextIsAnError)
{
    set_mode("router");
    arm({.operation = Operation::bn_binding_get_str, .way = FaultWay::without_object});
    EXPECT_EQ(mode(), "14001 null");
    EXPECT_THAT(log_lines(), ElementsAre(line_of("md_get_db_system_mode", "Unexpected NULL")));
}

TEST_F(SystemMode, AModeOfAnotherTypePassesUpTheHostsCode)
{
    host_.set(mode_node, bt_uint32, "1");
    EXPECT_EQ(mode(), "14020 null");
    EXPECT_THAT(log_lines(),
                ElementsAre(line_of("md_get_db_system_mode",
                                    "Error code 14020 (type conversion failed) returned")));
}

TEST_F(SystemMode, TheThreeModes)
{
    set_mode("bridge");
    EXPECT_EQ(modes(), "ynn");
    set_mode("router");
    EXPECT_EQ(modes(), "nyn");
    set_mode("server");
    EXPECT_EQ(modes(), "nny");
    EXPECT_THAT(log_lines(), IsEmpty());
}

TEST_F(SystemMode, OnlySixCharactersCount)
{
    set_mode("routers");
    EXPECT_EQ(modes(), "nyn");
    set_mode("bridge-v2");
    EXPECT_EQ(modes(), "ynn");
    set_mode("server farm");
    EXPECT_EQ(modes(), "nny");
}

TEST_F(SystemMode, AShorterTextIsNoMode)
{
    for (const char *text : {"bridg", "route", "serve", "r"}) {
        set_mode(text);
        EXPECT_EQ(modes(), "nnn") << text;
    }
}

TEST_F(SystemMode, CaseAndPlaceCount)
{
    for (const char *text : {"Router", "Bridge", "Server", "routeR", " router", "xrouter"}) {
        set_mode(text);
        EXPECT_EQ(modes(), "nnn") << text;
    }
}

TEST_F(SystemMode, AFailureIsLoggedByGetterAndQuestion)
{
    set_mode("server");
    arm({.operation = Operation::mdb_get_node_binding, .code = 14004});
    EXPECT_FALSE(in_library(md_is_db_system_server_mode, host_.db()));
    EXPECT_THAT(log_lines(), ElementsAre(line_of("md_get_db_system_mode",
                                                 "Error code 14004 (item not found) returned"),
                                         line_of("md_is_db_system_server_mode",
                                                 "Error code 14004 (item not found) returned")));
    EXPECT_EQ(num_calls(Operation::bail_debug), 2U);
}

TEST_F(SystemMode, ACancelledQuestionIsSilent)
{
    set_mode("bridge");
    arm({.operation = Operation::mdb_get_node_binding, .code = 14120});
    EXPECT_FALSE(in_library(md_is_db_system_bridge_mode, host_.db()));
    EXPECT_THAT(log_lines(), IsEmpty());
    EXPECT_EQ(num_calls(Operation::bail_debug), 0U);
    EXPECT_EQ(num_calls(Operation::bail_quiet_debug), 2U);
}

TEST_F(SystemMode, WithoutThresholdErrorLinesAreWrittenAllTheSame)
{
    host_.set_log_level(0);
    EXPECT_EQ(in_library(md_get_db_system_mode, host_.db(), nullptr), 14001);
    EXPECT_THAT(log_lines(), ElementsAre(line_of("md_get_db_system_mode", "Unexpected NULL")));
}

TEST_F(SystemMode, TheSubmodeIsTheNodesText)
{
    host_.set(submode_node, bt_string, "fail-to-wire");
    EXPECT_EQ(submode(), "0 fail-to-wire");
    EXPECT_THAT(calls_of(Operation::mdb_get_node_binding),
                ElementsAre("mdb_get_node_binding(null, *, "
                            "\"/ov/tunneld/system/config/submode\", 0, *)"));
    EXPECT_THAT(calls_of(Operation::bn_binding_get_str),
                ElementsAre("bn_binding_get_str(*, 1, 101, 0, *)"));
}

TEST_F(SystemMode, WithoutNodeTheSubmodeIsNormal)
{
    set_mode("bridge");
    EXPECT_EQ(submode(), "0 normal");
    EXPECT_THAT(log_lines(), IsEmpty());
}

TEST_F(SystemMode, WithoutTextTheSubmodeIsNormal)
{
    host_.set(submode_node, bt_string, "fail-to-wire");
    arm({.operation = Operation::bn_binding_get_str, .way = FaultWay::without_object});
    EXPECT_EQ(submode(), "0 normal");
    EXPECT_THAT(log_lines(), IsEmpty());
}

TEST_F(SystemMode, AnEmptySubmodeIsAText)
{
    host_.set(submode_node, bt_string, "");
    EXPECT_EQ(submode(), "0 ");
}

TEST_F(SystemMode, TheSubmodeDoesNotNeedAMode)
{
    set_mode("router");
    host_.set(submode_node, bt_string, "odd");
    EXPECT_EQ(submode(), "0 odd");
}

TEST_F(SystemMode, ASubmodesNullAddressIsRefused)
{
    EXPECT_EQ(in_library(md_get_db_bridge_submode, host_.db(), nullptr), 14001);
    EXPECT_THAT(log_lines(), ElementsAre(line_of("md_get_db_bridge_submode", "Unexpected NULL")));
    EXPECT_EQ(num_calls(Operation::bail_debug), 1U);
}

TEST_F(SystemMode, InlineNeedsRouterModeAndItsFlag)
{
    set_mode("router");
    EXPECT_FALSE(is_inline());
    host_.set(inline_node, bt_bool, "false");
    EXPECT_FALSE(is_inline());
    host_.set(inline_node, bt_bool, "true");
    EXPECT_TRUE(is_inline());
    set_mode("bridge");
    EXPECT_FALSE(is_inline());
    EXPECT_THAT(log_lines(), IsEmpty());
}

TEST_F(SystemMode, OutsideRouterModeTheInlineFlagIsNotRead)
{
    set_mode("bridge");
    EXPECT_FALSE(is_inline());
    EXPECT_EQ(num_calls(Operation::mdb_get_node_binding), 1U);
}

TEST_F(SystemMode, TheInlineFlagIsReadAsABool)
{
    set_mode("routers");
    host_.set(inline_node, bt_bool, "true");
    EXPECT_TRUE(is_inline());
    EXPECT_THAT(calls_of(Operation::mdb_get_node_binding),
                ElementsAre("mdb_get_node_binding(null, *, "
                            "\"/ov/tunneld/system/config/mode\", 0, *)",
                            "mdb_get_node_binding(null, *, "
                            "\"/ov/tunneld/system/config/routing_inline\", 0, *)"));
    EXPECT_THAT(calls_of(Operation::bn_binding_get_tbool),
                ElementsAre("bn_binding_get_tbool(*, 1, 0, *)"));
}

TEST_F(SystemMode, AnInlineFlagOfAnotherTypeIsLoggedAndFalse)
{
    set_mode("router");
    host_.set(inline_node, bt_string, "true");
    EXPECT_FALSE(is_inline());
    EXPECT_THAT(log_lines(),
                ElementsAre(line_of("md_is_db_system_inline_router_mode",
                                    "Error code 14020 (type conversion failed) returned")));
}

TEST_F(SystemMode, AnInlineFlagWithoutValueIsFalse)
{
    set_mode("router");
    host_.set(inline_node, bt_bool, "true");
    arm({.operation = Operation::bn_binding_get_tbool, .code = 14004});
    EXPECT_FALSE(is_inline());
    EXPECT_THAT(log_lines(), ElementsAre(line_of("md_is_db_system_inline_router_mode",
                                                 "Error code 14004 (item not found) returned")));
}

// A flag node and the question about it.
struct Flag {
    const char *function;
    tbool (*question)(const mdb_db *);
    const char *node;
};

void PrintTo(const Flag &flag, std::ostream *out)
{
    *out << flag.function;
}

class HardwareFlag : public LibraryTest, public testing::WithParamInterface<Flag>
{
  protected:
    bool is_set() { return in_library(GetParam().question, host_.db()); }
};

TEST_P(HardwareFlag, IsTheNodesValue)
{
    EXPECT_FALSE(is_set());
    host_.set(GetParam().node, bt_bool, "false");
    EXPECT_FALSE(is_set());
    host_.set(GetParam().node, bt_bool, "true");
    EXPECT_TRUE(is_set());
    EXPECT_THAT(log_lines(), IsEmpty());
}

TEST_P(HardwareFlag, IsReadAsTheHostExpectsIt)
{
    host_.set(GetParam().node, bt_bool, "true");
    EXPECT_TRUE(is_set());
    EXPECT_THAT(calls_of(Operation::mdb_get_node_binding),
                ElementsAre("mdb_get_node_binding(null, *, \"" + std::string(GetParam().node) +
                            "\", 0, *)"));
    EXPECT_THAT(calls_of(Operation::bn_binding_get_tbool),
                ElementsAre("bn_binding_get_tbool(*, 1, 0, *)"));
    EXPECT_EQ(num_calls(Operation::bn_binding_free), 1U);
}

TEST_P(HardwareFlag, OfAnotherTypeIsLoggedAndFalse)
{
    host_.set(GetParam().node, bt_uint8, "1");
    EXPECT_FALSE(is_set());
    EXPECT_THAT(log_lines(),
                ElementsAre(line_of(GetParam().function,
                                    "Error code 14020 (type conversion failed) returned")));
    EXPECT_EQ(num_calls(Operation::bail_debug), 1U);
}

TEST_P(HardwareFlag, OfNoDatabaseIsLoggedAndFalse)
{
    EXPECT_FALSE(in_library(GetParam().question, nullptr));
    EXPECT_THAT(log_lines(), ElementsAre(line_of(GetParam().function, "Unexpected NULL")));
    EXPECT_EQ(num_calls(Operation::mdb_get_node_binding), 0U);
}

INSTANTIATE_TEST_SUITE_P(All, HardwareFlag,
                         testing::Values(Flag{"md_is_10g_enabled", md_is_10g_enabled,
                                              "/ov/tunneld/system/config/10g"},
                                         Flag{"md_is_bonding_enabled", md_is_bonding_enabled,
                                              "/ov/tunneld/system/config/bonding"}),
                         [](const auto &about) { return std::string(about.param.function); });

class RouterInterfaces : public LibraryTest
{
  protected:
    // Status and number; the number that was there before is -7.
    std::string count(const mdb_db *db)
    {
        int number = -7;
        const int status = in_library(md_get_number_router_mode_interfaces, db, &number);
        return std::to_string(status) + ' ' + std::to_string(number);
    }
};

TEST_F(RouterInterfaces, NoneIsZero)
{
    EXPECT_EQ(count(host_.db()), "0 0");
    host_.set(router_node, bt_string, "a value, and no children");
    EXPECT_EQ(count(host_.db()), "0 0");
    EXPECT_THAT(log_lines(), IsEmpty());
}

TEST_F(RouterInterfaces, AreTheDirectChildren)
{
    for (const char *interface : {"/wan0", "/lan0", "/lan1"}) {
        host_.set(std::string(router_node) + interface + "/addr", bt_string, "x");
        host_.set(std::string(router_node) + interface + "/mask", bt_string, "x");
    }
    EXPECT_EQ(count(host_.db()), "0 3");
    EXPECT_THAT(calls_of(Operation::mdb_get_tstr_array),
                ElementsAre("mdb_get_tstr_array(null, *, "
                            "\"/ov/tunneld/system/config/mode/router\", 0, 0, 0, *)"));
    EXPECT_EQ(num_calls(Operation::tstr_array_free), 1U);
}

TEST_F(RouterInterfaces, ANullDatabaseIsRefused)
{
    EXPECT_EQ(count(nullptr), "14001 -7");
    EXPECT_THAT(log_lines(),
                ElementsAre(line_of("md_get_number_router_mode_interfaces", "Unexpected NULL")));
    EXPECT_EQ(num_calls(Operation::mdb_get_tstr_array), 0U);
    EXPECT_EQ(num_calls(Operation::bail_debug), 1U);
}

TEST_F(RouterInterfaces, ANullAddressIsRefused)
{
    EXPECT_EQ(in_library(md_get_number_router_mode_interfaces, host_.db(), nullptr), 14001);
    EXPECT_THAT(log_lines(),
                ElementsAre(line_of("md_get_number_router_mode_interfaces", "Unexpected NULL")));
    EXPECT_EQ(num_calls(Operation::mdb_get_tstr_array), 0U);
}

TEST_F(RouterInterfaces, ANullListIsRefused)
{
    arm({.operation = Operation::mdb_get_tstr_array, .way = FaultWay::without_object});
    EXPECT_EQ(count(host_.db()), "14001 -7");
    EXPECT_THAT(log_lines(),
                ElementsAre(line_of("md_get_number_router_mode_interfaces", "Unexpected NULL")));
}

} // namespace
