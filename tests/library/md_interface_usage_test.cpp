// Who uses an interface, the VLAN interfaces and the enable flag: the part of
// md_tunneld_tunnel_common about interfaces.
#include "orvale/md_tunneld_tunnel_common.h"

#include "tests/library/library_test.h"
#include "tests/library/map_changes.h"

#include <memory>
#include <new>
#include <string>

using namespace ovtest;
using testing::ElementsAre;
using testing::IsEmpty;

namespace
{

constexpr char check[] = "md_interface_usage_check";
constexpr char to_usertext[] = "md_interface_usage_to_usertext";
constexpr char check_usertext[] = "md_interface_usage_check_usertext";
constexpr char null_error[] = "Error code 14001 (unexpected NULL) returned";

constexpr char group_root[] = "/ov/wccpd/wccp/srv_grp/config";
constexpr char vrrp_root[] = "/ov/redd/net/interface/vrrp/config";
constexpr char vlan_root[] = "/ov/tunneld/net/interface/tunnel/vlan/config";
constexpr char interface_root[] = "/net/interface/config/";

std::string line_of(const std::string &function, const std::string &text)
{
    return error_line("md_tunneld_tunnel_common", function, text);
}

std::string group_node(const std::string &group)
{
    return std::string(group_root) + '/' + group + "/interface";
}

std::string vrrp_node(const std::string &entry)
{
    return std::string(vrrp_root) + '/' + entry;
}

std::string children_call(const std::string &parent)
{
    return "mdb_get_tstr_array(null, *, \"" + parent + "\", 0, 0, 0, *)";
}

std::string value_call(const std::string &node)
{
    return "mdb_get_node_value_tstr(null, *, \"" + node + "\", 0, null, *)";
}

struct ArrayFree {
    void operator()(tstr_array *array) const { tstr_array_free(&array); }
};

// An array of the test's own, for outputs that must not keep what they held.
std::unique_ptr<tstr_array, ArrayFree> other_array()
{
    tstr_array *array = nullptr;
    if (tstr_array_new(&array, nullptr) != 0) {
        throw std::bad_alloc();
    }
    return std::unique_ptr<tstr_array, ArrayFree>(array);
}

class InterfaceUsage : public LibraryTest
{
  protected:
    void set(const std::string &node, const std::string &value) { set_node(db(), node, value); }
    mdb_db &db() { return *host_.db(); }

    // Status and answer of either check.
    std::string answer(int (*function)(const mdb_db *, char *, tstr_array **),
                       std::string ifname = "wan0")
    {
        tstr_array *array = other_.get();
        const int status = in_library(function, &db(), ifname.data(), &array);
        return std::to_string(status) + ' ' + (array == other_.get() ? "old" : taken(array));
    }
    std::string usages(const std::string &ifname = "wan0")
    {
        return answer(md_interface_usage_check, ifname);
    }
    std::string usertexts(const std::string &ifname = "wan0")
    {
        return answer(md_interface_usage_check_usertext, ifname);
    }
    static std::string usertext(const std::string &usage)
    {
        tstring *text = nullptr;
        const int status = in_library(md_interface_usage_to_usertext, usage.c_str(), &text);
        return std::to_string(status) + ' ' + taken(text);
    }

    std::unique_ptr<tstr_array, ArrayFree> other_ = other_array();
};

TEST_F(InterfaceUsage, OfNobodyIsAnEmptyArray)
{
    EXPECT_EQ(usages(), "0 []");
    EXPECT_EQ(usertexts(), "0 []");
    EXPECT_THAT(log_lines(), IsEmpty());
}

TEST_F(InterfaceUsage, IsFoundInGroupsBeforeVrrp)
{
    set(vrrp_node("vr1"), "wan0");
    set(group_node("10"), "wan0");
    EXPECT_EQ(usages(), "0 [/ov/wccpd/wccp/srv_grp/config/10/interface, "
                        "/ov/redd/net/interface/vrrp/config/vr1]");
    EXPECT_EQ(usertexts(), "0 [wccp group 10, vrrp interface]");
    EXPECT_THAT(log_lines(), IsEmpty());
}

TEST_F(InterfaceUsage, IsInTheOrderOfTheDatabase)
{
    for (const char *group : {"web", "10", "9"}) {
        set(group_node(group), "wan0");
    }
    set(group_node("8"), "wan1");
    for (const char *entry : {"vr2", "vr1", "3"}) {
        set(vrrp_node(entry), "wan0");
    }
    set(vrrp_node("vr0"), "wan1");
    EXPECT_EQ(usages(), "0 [" + group_node("9") + ", " + group_node("10") + ", " +
                            group_node("web") + ", " + vrrp_node("3") + ", " + vrrp_node("vr1") +
                            ", " + vrrp_node("vr2") + "]");
    EXPECT_EQ(usertexts(), "0 [wccp group 9, wccp group 10, wccp group web, vrrp interface, "
                           "vrrp interface, vrrp interface]");
}

TEST_F(InterfaceUsage, IsReadAsTheHostExpectsIt)
{
    set(group_node("10"), "wan0");
    set(vrrp_node("vr1"), "wan1");
    EXPECT_EQ(usages(), "0 [" + group_node("10") + "]");
    EXPECT_THAT(calls_of(Operation::mdb_get_tstr_array),
                ElementsAre(children_call(group_root), children_call(vrrp_root)));
    EXPECT_THAT(calls_of(Operation::mdb_get_node_value_tstr),
                ElementsAre(value_call(group_node("10")), value_call(vrrp_node("vr1"))));
    EXPECT_THAT(calls_of(Operation::ts_equal_str),
                ElementsAre("ts_equal_str(*, \"wan0\", 1)", "ts_equal_str(*, \"wan0\", 1)"));
}

TEST_F(InterfaceUsage, IsByTheWholeNameWithCase)
{
    for (const char *interface : {"wan", "wan00", "WAN0", "wan0 ", ""}) {
        set(group_node("10"), interface);
        set(vrrp_node("vr1"), interface);
        EXPECT_EQ(usages(), "0 []") << interface;
    }
    EXPECT_EQ(usages(""), "0 [" + group_node("10") + ", " + vrrp_node("vr1") + "]");
}

TEST_F(InterfaceUsage, IsByTheNodesThatNameIt)
{
    set(std::string(group_root) + "/10", "wan0");
    set(std::string(group_root) + "/10/interfaces", "wan0");
    set(group_node("10") + "/0", "wan0");
    set(vrrp_node("vr1") + "/interface", "wan0");
    set("/ov/tunneld/system/config/mode/router/2/ifname", "wan0");
    EXPECT_EQ(usages(), "0 []");
    EXPECT_EQ(num_calls(Operation::ts_equal_str), 0U);
}

TEST_F(InterfaceUsage, IsNotFoundBehindANameWithASlash)
{
    set(group_node("a\\/b"), "wan0");
    EXPECT_EQ(usages(), "0 []");
    // A child's name goes into the node's as it is listed.
    set(group_node("a/b"), "wan0");
    EXPECT_EQ(usages(), "0 [" + group_node("a/b") + "]");
}

TEST_F(InterfaceUsage, IsFoundBehindLongNames)
{
    const std::string group(600, 'g');
    set(group_node(group), "wan0");
    set(vrrp_node(group), "wan0");
    EXPECT_EQ(usages(), "0 [" + group_node(group) + ", " + vrrp_node(group) + "]");
    EXPECT_EQ(usertexts(), "0 [wccp group " + group + ", vrrp interface]");
}

TEST_F(InterfaceUsage, EndsAtTheFirstFailedRead)
{
    set(group_node("10"), "wan0");
    set(group_node("20"), "wan0");
    set(vrrp_node("vr1"), "wan0");
    arm({.operation = Operation::mdb_get_node_value_tstr, .call = 2, .code = 14004});
    EXPECT_EQ(usages(), "14004 null");
    EXPECT_EQ(num_calls(Operation::mdb_get_node_value_tstr), 2U);
    EXPECT_EQ(num_calls(Operation::mdb_get_tstr_array), 1U);
    EXPECT_THAT(log_lines(),
                ElementsAre(line_of(check, "Error code 14004 (item not found) returned")));
    EXPECT_EQ(num_calls(Operation::bail_debug), 1U);
}

TEST_F(InterfaceUsage, TellsOfAFailureInBothFunctions)
{
    arm({.operation = Operation::mdb_get_tstr_array, .call = 2, .code = 13999});
    EXPECT_EQ(usertexts(), "13999 null");
    EXPECT_THAT(log_lines(), ElementsAre(line_of(check, "Error code 13999 returned"),
                                         line_of(check_usertext, "Error code 13999 returned")));
    EXPECT_EQ(num_calls(Operation::bail_debug), 2U);
}

TEST_F(InterfaceUsage, IsCancelledQuietly)
{
    set(group_node("10"), "wan0");
    arm({.operation = Operation::tstr_array_append_str, .code = 14120});
    EXPECT_EQ(usertexts(), "14120 null");
    EXPECT_THAT(log_lines(), IsEmpty());
    EXPECT_EQ(num_calls(Operation::bail_quiet_debug), 2U);
}

TEST_F(InterfaceUsage, WithoutAnArrayIsAnError)
{
    arm({.operation = Operation::tstr_array_new, .way = FaultWay::without_object});
    EXPECT_EQ(usages(), "14001 null");
    EXPECT_THAT(log_lines(), ElementsAre(line_of(check, "Unexpected NULL")));
    EXPECT_EQ(num_calls(Operation::mdb_get_tstr_array), 0U);

    forget_calls();
    arm({.operation = Operation::tstr_array_new, .way = FaultWay::without_object});
    EXPECT_EQ(usertexts(), "14001 null");
    EXPECT_THAT(log_lines(), ElementsAre(line_of(check_usertext, "Unexpected NULL")));
}

TEST_F(InterfaceUsage, BehindAChildWithoutNameIsAnError)
{
    set(group_node("10"), "wan0");
    planted().null_text_at_call = 1;
    EXPECT_EQ(usages(), "14001 null");
    EXPECT_THAT(log_lines(), ElementsAre(line_of(check, "Unexpected NULL")));
}

TEST_F(InterfaceUsage, WithoutNameHasNoText)
{
    set(group_node("10"), "wan0");
    planted().null_text_at_call = 2; // the first is the group's name
    EXPECT_EQ(usertexts(), "14001 null");
    EXPECT_THAT(log_lines(), ElementsAre(line_of(to_usertext, "Unexpected NULL"),
                                         line_of(check_usertext, null_error)));
}

TEST_F(InterfaceUsage, OfNullIsAnError)
{
    struct Check {
        int (*function)(const mdb_db *, char *, tstr_array **);
        const char *name;
    };
    char ifname[] = "wan0";
    for (const auto &[function, name] :
         {Check{md_interface_usage_check, check},
          Check{md_interface_usage_check_usertext, check_usertext}}) {
        forget_calls();
        tstr_array *array = other_.get();
        EXPECT_EQ(in_library(function, nullptr, ifname, &array), 14001);
        EXPECT_EQ(array, nullptr);
        array = other_.get();
        EXPECT_EQ(in_library(function, &db(), nullptr, &array), 14001);
        EXPECT_EQ(array, nullptr);
        EXPECT_EQ(in_library(function, &db(), ifname, nullptr), 14001);
        const std::string line = line_of(name, "Unexpected NULL");
        EXPECT_THAT(log_lines(), ElementsAre(line, line, line));
        EXPECT_EQ(num_calls(Operation::bail_debug), 3U);
        EXPECT_EQ(num_calls(Operation::tstr_array_new), 0U);
    }
}

using Usertext = InterfaceUsage;

TEST_F(Usertext, IsByTheKindOfUsage)
{
    EXPECT_EQ(usertext("/ov/tunneld/system/config/mode/router/2/ifname"), "0 router interface");
    EXPECT_EQ(usertext("/ov/wccpd/wccp/srv_grp/config/10/interface"), "0 wccp group 10");
    EXPECT_EQ(usertext("/ov/redd/net/interface/vrrp/config/vr1"), "0 vrrp interface");
    EXPECT_THAT(log_lines(), IsEmpty());
}

TEST_F(Usertext, OfAnythingElseIsNull)
{
    for (const char *name :
         {"/ov/tunneld/system/config/mode/router/2", "/ov/wccpd/wccp/srv_grp/config/10",
          "/ov/wccpd/wccp/srv_grp/config/10/interface/0",
          "/ov/wccpd/wccp/srv_grp/config/10/Interface", "/ov/redd/net/interface/vrrp/config",
          "/ov/redd/net/interface/vrrp/config/vr1/vip", "/net/interface/config/wan0", "/", "",
          "no name"}) {
        EXPECT_EQ(usertext(name), "0 null") << name;
    }
    EXPECT_THAT(log_lines(), IsEmpty());
}

TEST_F(Usertext, TriesTheKindsInOrder)
{
    EXPECT_EQ(usertext(vrrp_node("vr1")), "0 vrrp interface");
    const std::string call = "bn_binding_name_pattern_match(\"" + vrrp_node("vr1") + "\", \"";
    EXPECT_THAT(calls_of(Operation::bn_binding_name_pattern_match),
                ElementsAre(call + "/ov/tunneld/system/config/mode/router/*/ifname\")",
                            call + "/ov/wccpd/wccp/srv_grp/config/*/interface\")",
                            call + "/ov/redd/net/interface/vrrp/config/*\")"));
    forget_calls();
    EXPECT_EQ(usertext(group_node("10")), "0 wccp group 10");
    EXPECT_EQ(num_calls(Operation::bn_binding_name_pattern_match), 2U);
}

TEST_F(Usertext, TakesTheGroupsNameAsItIs)
{
    EXPECT_EQ(usertext(group_node("a\\/b")), "0 wccp group a/b");
    EXPECT_EQ(usertext(group_node("%s%n")), "0 wccp group %s%n");
    EXPECT_EQ(usertext(group_node("my group")), "0 wccp group my group");
}

TEST_F(Usertext, OfAGroupWithoutNameIsAnError)
{
    arm({.operation = Operation::bn_binding_name_to_parts, .way = FaultWay::without_object});
    EXPECT_EQ(usertext(group_node("10")), "14001 null");
    disarm();
    planted().null_text_at_call = 1;
    forget_calls();
    EXPECT_EQ(usertext(group_node("10")), "14001 null");
    EXPECT_THAT(log_lines(), ElementsAre(line_of(to_usertext, "Unexpected NULL")));
}

TEST_F(Usertext, OfNullIsAnError)
{
    tstring *text = nullptr;
    ASSERT_EQ(ts_new_str(&text, "old"), 0);
    tstring *const old = text;
    EXPECT_EQ(in_library(md_interface_usage_to_usertext, nullptr, &text), 14001);
    EXPECT_EQ(text, nullptr);
    EXPECT_EQ(in_library(md_interface_usage_to_usertext, vrrp_node("vr1").c_str(), nullptr), 14001);
    const std::string line = line_of(to_usertext, "Unexpected NULL");
    EXPECT_THAT(log_lines(), ElementsAre(line, line));
    EXPECT_EQ(taken(old), "old");
}

TEST_F(Usertext, ThatIsMissingIsLeftOut)
{
    set(group_node("10"), "wan0");
    set(vrrp_node("vr1"), "wan0");
    // The group's usage is not recognised by its pattern, nor by the last.
    arm({.operation = Operation::bn_binding_name_pattern_match, .call = 2});
    EXPECT_EQ(usertexts(), "0 [vrrp interface]");
    EXPECT_THAT(log_lines(), IsEmpty());
}

class VlanInterfaces : public LibraryTest
{
  protected:
    static constexpr char function[] = "md_get_vlan_interfaces";

    void set(const std::string &node)
    {
        set_node(*host_.db(), std::string(vlan_root) + '/' + node, "x");
    }
    std::string names()
    {
        tstr_array *array = other_.get();
        const int status = in_library(md_get_vlan_interfaces, host_.db(), &array);
        return std::to_string(status) + ' ' + (array == other_.get() ? "old" : taken(array));
    }

    std::unique_ptr<tstr_array, ArrayFree> other_ = other_array();
};

TEST_F(VlanInterfaces, AreListedInTheOrderOfTheDatabase)
{
    for (const char *node : {"vlan9", "vlan10", "7", "10", "9", "only/below", "a\\/b"}) {
        set(node);
    }
    EXPECT_EQ(names(), "0 [7, 9, 10, a/b, only, vlan10, vlan9]");
    EXPECT_THAT(calls_of(Operation::mdb_get_matching_tstr_array),
                ElementsAre("mdb_get_matching_tstr_array(null, *, "
                            "\"/ov/tunneld/net/interface/tunnel/vlan/config/*\", 512, *)"));
    EXPECT_THAT(log_lines(), IsEmpty());
}

TEST_F(VlanInterfaces, MayBeNone)
{
    EXPECT_EQ(names(), "0 []");
    set_node(*host_.db(), vlan_root, "x");
    EXPECT_EQ(names(), "0 []");
}

TEST_F(VlanInterfaces, AreNullWithoutAList)
{
    set("vlan10");
    arm({.operation = Operation::mdb_get_matching_tstr_array, .way = FaultWay::without_object});
    EXPECT_EQ(names(), "0 null");
    EXPECT_THAT(log_lines(), IsEmpty());
    EXPECT_EQ(num_calls(Operation::tstr_array_new), 1U);
    EXPECT_EQ(num_calls(Operation::tstr_array_free), 1U);
}

TEST_F(VlanInterfaces, AreMovedOutOfTheirNodesNames)
{
    set("vlan10");
    EXPECT_EQ(names(), "0 [vlan10]");
    EXPECT_THAT(calls_of(Operation::tstr_array_remove), ElementsAre("tstr_array_remove(*, 7, *)"));
    EXPECT_EQ(num_calls(Operation::tstr_array_append_takeover), 1U);
    EXPECT_EQ(num_calls(Operation::tstr_array_duplicate), 1U);
    EXPECT_EQ(num_calls(Operation::tstr_array_append_str), 0U);
}

TEST_F(VlanInterfaces, WithoutNameAreAnError)
{
    set("vlan10");
    set("vlan20");
    planted().null_text_at_call = 2;
    EXPECT_EQ(names(), "14001 null");
    EXPECT_THAT(log_lines(), ElementsAre(line_of(function, "Unexpected NULL")));
    EXPECT_EQ(num_calls(Operation::bail_debug), 1U);
}

TEST_F(VlanInterfaces, WhoseNamesCannotBeTakenAreAnError)
{
    set("vlan10");
    for (const Operation operation :
         {Operation::tstr_array_new, Operation::bn_binding_name_to_parts,
          Operation::tstr_array_remove}) {
        forget_calls();
        arm({.operation = operation, .way = FaultWay::without_object});
        EXPECT_EQ(names(), "14001 null") << row_of(operation).name;
        EXPECT_THAT(log_lines(), ElementsAre(line_of(function, "Unexpected NULL")));
    }
}

TEST_F(VlanInterfaces, OfNullAreAnError)
{
    tstr_array *array = other_.get();
    EXPECT_EQ(in_library(md_get_vlan_interfaces, nullptr, &array), 14001);
    EXPECT_EQ(array, nullptr);
    EXPECT_EQ(in_library(md_get_vlan_interfaces, host_.db(), nullptr), 14001);
    const std::string line = line_of(function, "Unexpected NULL");
    EXPECT_THAT(log_lines(), ElementsAre(line, line));
    EXPECT_EQ(num_calls(Operation::mdb_get_matching_tstr_array), 0U);
}

class EnableFlag : public LibraryTest
{
  protected:
    static constexpr char function[] = "md_set_if_enable";

    void SetUp() override { host_.db()->writable = true; }

    void set(const std::string &node) { set_node(*host_.db(), interface_root + node, "x"); }
    int enable(const std::string &ifname, tbool is_enabled = true)
    {
        return in_library(md_set_if_enable, host_.db(), ifname.c_str(), is_enabled);
    }
    std::vector<std::string> left() { return nodes(*host_.db(), "/"); }
};

TEST_F(EnableFlag, IsSetAndCleared)
{
    set("wan0");
    set("wan1");
    EXPECT_EQ(enable("wan0"), 0);
    EXPECT_THAT(left(), ElementsAre("/net/interface/config/wan0 string x",
                                    "/net/interface/config/wan0/enable bool true",
                                    "/net/interface/config/wan1 string x"));
    EXPECT_EQ(enable("wan0", false), 0);
    EXPECT_EQ(left()[1], "/net/interface/config/wan0/enable bool false");
    EXPECT_EQ(enable("wan0", false), 0);
    EXPECT_EQ(left().size(), 3U);
    EXPECT_THAT(log_lines(), IsEmpty());
}

TEST_F(EnableFlag, IsWrittenAsTheHostExpectsIt)
{
    set("wan0");
    EXPECT_EQ(enable("wan0"), 0);
    EXPECT_THAT(calls_of(Operation::mdb_get_node_binding),
                ElementsAre("mdb_get_node_binding(null, *, \"/net/interface/config/wan0\", 0, *)"));
    EXPECT_THAT(calls_of(Operation::bn_binding_new_str),
                ElementsAre("bn_binding_new_str(*, \"/net/interface/config/wan0/enable\", 1, 9, 0, "
                            "\"true\")"));
    EXPECT_THAT(calls_of(Operation::mdb_set_node_binding),
                ElementsAre("mdb_set_node_binding(null, *, 4, 0, *)"));
}

TEST_F(EnableFlag, CreatesNoInterface)
{
    set("wan1");
    set("only/below");
    EXPECT_EQ(enable("wan0"), 0);
    EXPECT_EQ(enable("only"), 0);
    EXPECT_EQ(enable("wan1/below"), 0);
    EXPECT_THAT(left(), ElementsAre("/net/interface/config/only/below string x",
                                    "/net/interface/config/wan1 string x"));
    EXPECT_EQ(num_calls(Operation::bn_binding_new_str), 0U);
    EXPECT_EQ(num_calls(Operation::mdb_set_node_binding), 0U);
    EXPECT_THAT(log_lines(), IsEmpty());
}

// "/net/interface/config/" has 22 characters, "/enable" has 7.
TEST_F(EnableFlag, StandsInNamesOf255Characters)
{
    const std::string longest(255 - 22 - 7, 'i');
    set(longest);
    EXPECT_EQ(enable(longest), 0);
    EXPECT_THAT(left(), ElementsAre(interface_root + longest + " string x",
                                    interface_root + longest + "/enable bool true"));
}

TEST_F(EnableFlag, IsCutOffBehindLongerNames)
{
    const std::string one_more(255 - 22 - 7 + 1, 'i');
    set(one_more);
    EXPECT_EQ(enable(one_more), 0);
    EXPECT_THAT(left(), ElementsAre(interface_root + one_more + " string x",
                                    interface_root + one_more + "/enabl bool true"));
}

TEST_F(EnableFlag, TakesTheInterfacesPlaceWhenNothingIsLeftOfIt)
{
    const std::string cut(255 - 22, 'i');
    set(cut);
    EXPECT_EQ(enable(cut + "xyz", false), 0);
    EXPECT_THAT(left(), ElementsAre(interface_root + cut + " bool false"));
    EXPECT_EQ(enable(std::string(600, 'i')), 0);
    EXPECT_THAT(left(), ElementsAre(interface_root + cut + " bool true"));
}

TEST_F(EnableFlag, OfAnInterfaceWithoutNameIsAnError)
{
    EXPECT_EQ(enable(""), 14009);
    EXPECT_THAT(log_lines(),
                ElementsAre(line_of(function, "Error code 14009 (invalid path name) returned")));
}

TEST_F(EnableFlag, ThatMayNotBeWrittenPassesUpTheCode)
{
    set("wan0");
    host_.db()->writable = false;
    EXPECT_EQ(enable("wan0"), 14002);
    EXPECT_THAT(left(), ElementsAre("/net/interface/config/wan0 string x"));
    EXPECT_THAT(log_lines(),
                ElementsAre(line_of(function, "Error code 14002 (assertion failed) returned")));
    EXPECT_EQ(num_calls(Operation::bail_debug), 1U);
}

TEST_F(EnableFlag, WithoutABindingIsAnError)
{
    set("wan0");
    arm({.operation = Operation::bn_binding_new_str, .way = FaultWay::without_object});
    EXPECT_EQ(enable("wan0"), 14001);
    EXPECT_THAT(log_lines(), ElementsAre(line_of(function, "Unexpected NULL")));
    EXPECT_EQ(num_calls(Operation::bail_debug), 1U);
    EXPECT_EQ(num_calls(Operation::mdb_set_node_binding), 0U);
    EXPECT_THAT(left(), ElementsAre("/net/interface/config/wan0 string x"));
}

TEST_F(EnableFlag, OfNullIsAnError)
{
    EXPECT_EQ(in_library(md_set_if_enable, nullptr, "wan0", true), 14001);
    EXPECT_EQ(in_library(md_set_if_enable, host_.db(), nullptr, true), 14001);
    const std::string line = line_of(function, "Unexpected NULL");
    EXPECT_THAT(log_lines(), ElementsAre(line, line));
    EXPECT_EQ(num_calls(Operation::bail_debug), 2U);
    EXPECT_EQ(num_calls(Operation::mdb_get_node_binding), 0U);
}

} // namespace
