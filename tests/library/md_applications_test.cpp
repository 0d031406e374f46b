// Who uses an application: the part of md_tunneld_tunnel_common about policies.
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

constexpr char acl_root[] = "/ov/tunneld/acl/config";
constexpr char route_root[] = "/ov/tunneld/route_map/config/map";
constexpr char opt_root[] = "/ov/tunneld/opt_map/config/map";
constexpr char qos_root[] = "/ov/tunneld/qos_map/config/map";
constexpr char app_root[] = "/ov/tunneld/app/config";

std::string line_of(const std::string &function, const std::string &text)
{
    return error_line("md_tunneld_tunnel_common", function, text);
}

std::string acl_node(const std::string &acl, const std::string &entry)
{
    return std::string(acl_root) + '/' + acl + "/entry/" + entry + "/application";
}

std::string map_node(const std::string &root, const std::string &map, const std::string &priority)
{
    return root + '/' + map + "/prio/" + priority + "/match/0/application";
}

std::string children_call(const std::string &parent)
{
    return "mdb_get_tstr_array(null, *, \"" + parent + "\", 0, 0, 0, *)";
}

std::string node_call(const std::string &node)
{
    return "mdb_get_node_binding(null, *, \"" + node + "\", 0, *)";
}

struct ArrayFree {
    void operator()(tstr_array *array) const { tstr_array_free(&array); }
};
using TestArray = std::unique_ptr<tstr_array, ArrayFree>;

TestArray new_array()
{
    tstr_array *array = nullptr;
    if (tstr_array_new(&array, nullptr) != 0) {
        throw std::bad_alloc();
    }
    return TestArray(array);
}

std::vector<std::string> texts(const tstr_array *array)
{
    std::vector<std::string> all;
    for (int32 i = 0; array != nullptr && i < tstr_array_length_quick(array); ++i) {
        all.emplace_back(tstr_array_get_str_quick(array, static_cast<uint32>(i)));
    }
    return all;
}

class Applications : public LibraryTest
{
  protected:
    void use(const std::string &node, const std::string &app = "web")
    {
        host_.set(node, bt_string, app);
    }

    // Status and answer.
    std::string in_acl(const char *app, tstr_array *bnames = nullptr)
    {
        tbool found = false;
        const int status = in_library(md_find_app_name_in_acl, app, host_.db(), &found, bnames);
        return std::to_string(status) + (found ? " yes" : " no");
    }
    std::string in_map(const char *app, const char *root, tstr_array *bnames = nullptr)
    {
        tbool found = false;
        const int status =
            in_library(md_find_app_name_in_xxxmap, app, host_.db(), root, &found, bnames);
        return std::to_string(status) + (found ? " yes" : " no");
    }
    // Status and message.
    std::string anywhere(const char *app)
    {
        char old[] = "old";
        char *message = old;
        const int status = in_library(md_find_appname_in_acl_or_xxxmap, app, host_.db(), &message,
                                      static_cast<tstr_array **>(nullptr));
        return std::to_string(status) + ' ' + taken(message);
    }
};

using AppInAcl = Applications;

TEST_F(AppInAcl, IsFoundAtTheFirstUse)
{
    use(acl_node("a", "10"), "mail");
    use(acl_node("a", "20"));
    use(acl_node("a", "30"));
    use(acl_node("b", "10"));
    EXPECT_EQ(in_acl("web"), "0 yes");
    EXPECT_THAT(
        calls_of(Operation::mdb_get_tstr_array),
        ElementsAre(children_call(acl_root), children_call("/ov/tunneld/acl/config/a/entry")));
    EXPECT_THAT(calls_of(Operation::mdb_get_node_binding),
                ElementsAre(node_call(acl_node("a", "10")), node_call(acl_node("a", "20"))));
    EXPECT_EQ(calls_of(Operation::bn_binding_get_str),
              std::vector<std::string>(2, "bn_binding_get_str(*, 1, 101, 0, *)"));
    EXPECT_THAT(log_lines(), ElementsAre(gated_line(
                                 6, "md_find_app_name_in_acl: find web in any 2 acl aclNames")));
}

TEST_F(AppInAcl, IsCollectedFromAllAcls)
{
    use(acl_node("a", "10"));
    use(acl_node("a", "20"), "mail");
    use(acl_node("a", "30"));
    use(acl_node("b", "10"));
    const TestArray bnames = new_array();
    ASSERT_EQ(tstr_array_append_str(bnames.get(), "before"), 0);
    EXPECT_EQ(in_acl("web", bnames.get()), "0 yes");
    EXPECT_THAT(texts(bnames.get()), ElementsAre("before", acl_node("a", "10"), acl_node("a", "30"),
                                                 acl_node("b", "10")));
}

TEST_F(AppInAcl, IsToldFromOthersByItsWholeNameWithCase)
{
    use(acl_node("a", "10"), "Web");
    const TestArray bnames = new_array();
    for (const char *app : {"web", "WEB", "We", "Web ", ""}) {
        EXPECT_EQ(in_acl(app), "0 no") << app;
        EXPECT_EQ(in_acl(app, bnames.get()), "0 no") << app;
    }
    EXPECT_THAT(texts(bnames.get()), IsEmpty());
    EXPECT_EQ(in_acl("Web"), "0 yes");
}

TEST_F(AppInAcl, IsNotFoundWithoutAcls)
{
    EXPECT_EQ(in_acl("web"), "0 no");
    EXPECT_THAT(log_lines(), ElementsAre(gated_line(
                                 6, "md_find_app_name_in_acl: find web in any 0 acl aclNames")));
}

TEST_F(AppInAcl, IsNotFoundInEntriesWithoutOne)
{
    host_.set("/ov/tunneld/acl/config/a/entry/10/dscp", bt_string, "web");
    host_.set("/ov/tunneld/acl/config/a/application", bt_string, "web");
    host_.set("/ov/tunneld/acl/config/b", bt_string, "web");
    EXPECT_EQ(in_acl("web"), "0 no");
    EXPECT_EQ(num_calls(Operation::mdb_get_node_binding), 1U);
}

TEST_F(AppInAcl, IsLookedForWhenNobodyAsksForTheAnswer)
{
    use(acl_node("a", "10"));
    const TestArray bnames = new_array();
    EXPECT_EQ(in_library(md_find_app_name_in_acl, "web", host_.db(), nullptr, bnames.get()), 0);
    EXPECT_THAT(texts(bnames.get()), ElementsAre(acl_node("a", "10")));
    EXPECT_EQ(in_library(md_find_app_name_in_acl, "web", host_.db(), nullptr, nullptr), 0);
}

TEST_F(AppInAcl, OfNoNameIsNotFound)
{
    use(acl_node("a", "10"), "");
    EXPECT_EQ(in_acl(nullptr), "0 no");
}

TEST_F(AppInAcl, OfAnotherTypePassesUpTheHostsCode)
{
    host_.set(acl_node("a", "10"), bt_uint32, "7");
    use(acl_node("a", "20"));
    EXPECT_EQ(in_acl("web"), "14020 no");
    EXPECT_EQ(log_lines().back(), line_of("md_find_app_name_in_acl",
                                          "Error code 14020 (type conversion failed) returned"));
}

// "/ov/tunneld/acl/config/" and "/entry" leave 482 characters of the list's path.
TEST_F(AppInAcl, IsListedByAPathThatIsCutAt511Characters)
{
    const std::string longest(482, 'a');
    use(acl_node(longest, "10"));
    EXPECT_EQ(in_acl("web"), "0 yes");

    const std::string too_long(488, 'b');
    use(acl_node(too_long, "10"), "mail");
    EXPECT_EQ(in_acl("mail"), "0 no");
    // The path ends before "/entry", so that "entry" itself is taken for an entry.
    use(std::string(acl_root) + '/' + too_long + "/entry/application", "mail");
    EXPECT_EQ(in_acl("mail"), "0 yes");
}

// 600 characters are cut to 488, and the path ends there.
TEST_F(AppInAcl, IsListedByAPathThatHasLongNamesWhole)
{
    use(acl_node(std::string(255, 'a'), "10"), "of 255");
    use(acl_node(std::string(256, 'a'), "10"), "of 256");
    use(acl_node(std::string(600, 'a'), "10"), "of 600");
    EXPECT_EQ(in_acl("of 255"), "0 yes");
    EXPECT_EQ(in_acl("of 256"), "0 yes");
    forget_calls();
    EXPECT_EQ(in_acl("of 600"), "0 no");
    EXPECT_EQ(calls_of(Operation::mdb_get_tstr_array).back(),
              children_call(std::string(acl_root) + '/' + std::string(488, 'a')));
}

TEST_F(AppInAcl, IsFoundInEntriesOfLongNames)
{
    for (const std::size_t size : {255U, 256U, 600U}) {
        const std::string app = "of " + std::to_string(size);
        use(acl_node("a", std::string(size, '1')), app);
        EXPECT_EQ(in_acl(app.c_str()), "0 yes");
    }
}

// Names go into paths as they are: a slash makes two levels of one name.
TEST_F(AppInAcl, IsLookedForTwoLevelsDeepWhereAnAclHasASlash)
{
    use(acl_node(written("a/b"), "10"));
    EXPECT_EQ(in_acl("web"), "0 no");
    EXPECT_THAT(
        calls_of(Operation::mdb_get_tstr_array),
        ElementsAre(children_call(acl_root), children_call("/ov/tunneld/acl/config/a/b/entry")));
    EXPECT_EQ(num_calls(Operation::mdb_get_node_binding), 0U);
    use(acl_node("a/b", "10"));
    EXPECT_EQ(in_acl("web"), "0 yes");
}

TEST_F(AppInAcl, IsReadTwoLevelsDeepWhereAnEntryHasASlash)
{
    use(acl_node("a", written("1/2")));
    EXPECT_EQ(in_acl("web"), "0 no");
    EXPECT_THAT(calls_of(Operation::mdb_get_node_binding),
                ElementsAre(node_call(acl_node("a", "1/2"))));
    use(acl_node("a", "1/2"));
    EXPECT_EQ(in_acl("web"), "0 yes");
}

// "/ov/tunneld/acl/config/a/entry/" and "/application" leave 980 characters of the node.
TEST_F(AppInAcl, IsReadAtANodeThatIsCutAt1023Characters)
{
    const std::string entries = std::string(acl_root) + "/a/entry/";
    const std::string longest(980, 'e');
    ASSERT_EQ((entries + longest + "/application").size(), 1023U);
    use(acl_node("a", longest));
    EXPECT_EQ(in_acl("web"), "0 yes");

    const std::string too_long(992, 'f');
    use(acl_node("a", too_long), "mail");
    EXPECT_EQ(in_acl("mail"), "0 no");
    use(entries + too_long, "mail");
    const TestArray bnames = new_array();
    EXPECT_EQ(in_acl("mail", bnames.get()), "0 yes");
    EXPECT_THAT(texts(bnames.get()), ElementsAre(entries + too_long));
}

TEST_F(AppInAcl, OfNoDatabaseIsAnError)
{
    tbool found = true;
    EXPECT_EQ(in_library(md_find_app_name_in_acl, "web", nullptr, &found, nullptr), 14001);
    EXPECT_TRUE(found);
    EXPECT_THAT(log_lines(), ElementsAre(line_of("md_find_app_name_in_acl", "Unexpected NULL")));
}

TEST_F(AppInAcl, EndsAtANameThatDoesNotCome)
{
    use(acl_node("a", "10"));
    for (const unsigned call : {1U, 2U}) {
        forget_calls();
        planted().null_text_at_call = call;
        EXPECT_EQ(in_acl("web"), "14001 no");
        EXPECT_EQ(log_lines().back(), line_of("md_find_app_name_in_acl", "Unexpected NULL"));
    }
}

TEST_F(AppInAcl, KeepsWhatWasCollectedBeforeAFailure)
{
    use(acl_node("a", "10"));
    use(acl_node("a", "20"));
    const TestArray bnames = new_array();
    arm({.operation = Operation::tstr_array_append_str, .call = 2, .code = 14000});
    EXPECT_EQ(in_acl("web", bnames.get()), "14000 no");
    EXPECT_THAT(texts(bnames.get()), ElementsAre(acl_node("a", "10")));
    EXPECT_EQ(log_lines().back(),
              line_of("md_find_app_name_in_acl", "Error code 14000 (generic error) returned"));
}

using AppInMap = Applications;

TEST_F(AppInMap, IsFoundAtTheFirstUse)
{
    use(map_node(route_root, "a", "10"), "mail");
    use(map_node(route_root, "a", "20"));
    use(map_node(route_root, "a", "30"));
    use(map_node(route_root, "b", "10"));
    EXPECT_EQ(in_map("web", route_root), "0 yes");
    EXPECT_THAT(
        calls_of(Operation::mdb_get_tstr_array),
        ElementsAre(children_call(route_root), children_call(std::string(route_root) + "/a/prio")));
    EXPECT_THAT(calls_of(Operation::mdb_get_node_binding),
                ElementsAre(node_call(map_node(route_root, "a", "10")),
                            node_call(map_node(route_root, "a", "20"))));
}

TEST_F(AppInMap, IsLookedForWithALineForEachMapThatHasEntries)
{
    use(map_node(qos_root, "a", "10"), "mail");
    use(map_node(qos_root, "a", "65535"), "mail");
    host_.set(std::string(qos_root) + "/b/note", bt_string, "no entries");
    EXPECT_EQ(in_map("web", qos_root), "0 no");
    EXPECT_THAT(
        log_lines(),
        ElementsAre(gated_line(6, "md_find_app_name_in_xxxmap: find web in any 2 map names"),
                    gated_line(6, "md_find_app_name_in_xxxmap: "
                                  "/ov/tunneld/qos_map/config/map map  a has 2 entries")));
}

TEST_F(AppInMap, IsCollectedFromAllMaps)
{
    use(map_node(opt_root, "a", "10"));
    use(map_node(opt_root, "b", "10"), "mail");
    use(map_node(opt_root, "b", "65535"));
    const TestArray bnames = new_array();
    EXPECT_EQ(in_map("web", opt_root, bnames.get()), "0 yes");
    EXPECT_THAT(texts(bnames.get()),
                ElementsAre(map_node(opt_root, "a", "10"), map_node(opt_root, "b", "65535")));
}

TEST_F(AppInMap, IsNotFoundInAMatchStringOrAnotherMatch)
{
    host_.set(std::string(route_root) + "/a/prio/10/match/0/matchstr", bt_string,
              "application:web");
    host_.set(std::string(route_root) + "/a/prio/10/match/1/application", bt_string, "web");
    EXPECT_EQ(in_map("web", route_root), "0 no");
}

TEST_F(AppInMap, IsToldFromOthersByCase)
{
    use(map_node(route_root, "a", "10"), "Web");
    EXPECT_EQ(in_map("web", route_root), "0 no");
    EXPECT_EQ(in_map("Web", route_root), "0 yes");
}

TEST_F(AppInMap, OfNoNameIsNotFound)
{
    use(map_node(route_root, "a", "10"), "");
    const TestArray bnames = new_array();
    EXPECT_EQ(in_map(nullptr, route_root), "0 no");
    EXPECT_EQ(in_map(nullptr, route_root, bnames.get()), "0 no");
    EXPECT_THAT(texts(bnames.get()), IsEmpty());
}

TEST_F(AppInMap, IsLookedForWhenNobodyAsksForTheAnswer)
{
    use(map_node(route_root, "a", "10"));
    EXPECT_EQ(
        in_library(md_find_app_name_in_xxxmap, "web", host_.db(), route_root, nullptr, nullptr), 0);
}

// "/ov/tunneld/route_map/config/map/" and "/prio" leave 473 characters of the list's path.
TEST_F(AppInMap, IsListedByAPathThatIsCutAt511Characters)
{
    use(map_node(route_root, std::string(473, 'a'), "10"));
    EXPECT_EQ(in_map("web", route_root), "0 yes");

    const std::string too_long(478, 'b');
    use(map_node(route_root, too_long, "10"), "mail");
    EXPECT_EQ(in_map("mail", route_root), "0 no");
    // The path ends before "/prio", so that "prio" itself is taken for an entry.
    use(std::string(route_root) + '/' + too_long + "/prio/match/0/application", "mail");
    EXPECT_EQ(in_map("mail", route_root), "0 yes");
}

// 600 characters are cut to 478, and the path ends there.
TEST_F(AppInMap, IsListedByAPathThatHasLongNamesWhole)
{
    use(map_node(route_root, std::string(255, 'a'), "10"), "of 255");
    use(map_node(route_root, std::string(256, 'a'), "10"), "of 256");
    use(map_node(route_root, std::string(600, 'a'), "10"), "of 600");
    EXPECT_EQ(in_map("of 255", route_root), "0 yes");
    EXPECT_EQ(in_map("of 256", route_root), "0 yes");
    forget_calls();
    EXPECT_EQ(in_map("of 600", route_root), "0 no");
    EXPECT_EQ(calls_of(Operation::mdb_get_tstr_array).back(),
              children_call(std::string(route_root) + '/' + std::string(478, 'a')));
}

TEST_F(AppInMap, IsFoundInEntriesOfLongNames)
{
    for (const std::size_t size : {255U, 256U, 600U}) {
        const std::string app = "of " + std::to_string(size);
        use(map_node(route_root, "a", std::string(size, '1')), app);
        EXPECT_EQ(in_map(app.c_str(), route_root), "0 yes");
    }
}

// "/ov/tunneld/route_map/config/map/a/prio/" and "/match/0/application" leave 963 characters of the
// node.
TEST_F(AppInMap, IsReadAtANodeThatIsCutAt1023Characters)
{
    const std::string longest(963, 'e');
    ASSERT_EQ(map_node(route_root, "a", longest).size(), 1023U);
    use(map_node(route_root, "a", longest));
    EXPECT_EQ(in_map("web", route_root), "0 yes");

    const std::string too_long(983, 'f');
    use(map_node(route_root, "a", too_long), "mail");
    EXPECT_EQ(in_map("mail", route_root), "0 no");
    const std::string entry = std::string(route_root) + "/a/prio/" + too_long;
    use(entry, "mail");
    const TestArray bnames = new_array();
    EXPECT_EQ(in_map("mail", route_root, bnames.get()), "0 yes");
    EXPECT_THAT(texts(bnames.get()), ElementsAre(entry));
}

TEST_F(AppInMap, IsLookedForTwoLevelsDeepWhereAMapHasASlash)
{
    use(map_node(route_root, written("m/n"), "10"));
    EXPECT_EQ(in_map("web", route_root), "0 no");
    EXPECT_THAT(calls_of(Operation::mdb_get_tstr_array),
                ElementsAre(children_call(route_root),
                            children_call("/ov/tunneld/route_map/config/map/m/n/prio")));
    EXPECT_EQ(num_calls(Operation::mdb_get_node_binding), 0U);
    use(map_node(route_root, "m/n", "10"));
    EXPECT_EQ(in_map("web", route_root), "0 yes");
}

TEST_F(AppInMap, IsReadTwoLevelsDeepWhereAnEntryHasASlash)
{
    use(map_node(route_root, "m", written("1/2")));
    EXPECT_EQ(in_map("web", route_root), "0 no");
    EXPECT_THAT(calls_of(Operation::mdb_get_node_binding),
                ElementsAre(node_call(map_node(route_root, "m", "1/2"))));
    use(map_node(route_root, "m", "1/2"));
    EXPECT_EQ(in_map("web", route_root), "0 yes");
}

TEST_F(AppInMap, OfNothingIsAnError)
{
    tbool found = true;
    EXPECT_EQ(in_library(md_find_app_name_in_xxxmap, "web", nullptr, route_root, &found, nullptr),
              14001);
    EXPECT_EQ(in_library(md_find_app_name_in_xxxmap, "web", host_.db(), nullptr, &found, nullptr),
              14001);
    EXPECT_TRUE(found);
    EXPECT_THAT(log_lines(), ElementsAre(line_of("md_find_app_name_in_xxxmap", "Unexpected NULL"),
                                         line_of("md_find_app_name_in_xxxmap", "Unexpected NULL")));
}

using AppAnywhere = Applications;

TEST_F(AppAnywhere, IsUsedByTheFirstKindThatUsesIt)
{
    EXPECT_EQ(anywhere("web"), "0 null");
    use(map_node(qos_root, "q", "10"));
    EXPECT_EQ(anywhere("web"), "0 Application name used by a QOS Map.");
    use(map_node(opt_root, "o", "10"));
    EXPECT_EQ(anywhere("web"), "0 Application name used by an Opt Map.");
    use(map_node(route_root, "r", "10"));
    EXPECT_EQ(anywhere("web"), "0 Application name used by a Route Map.");
    use(acl_node("a", "10"));
    EXPECT_EQ(anywhere("web"), "0 Application name used by an ACL.");
}

TEST_F(AppAnywhere, IsLookedForInItsOrderUpToTheFirstUse)
{
    EXPECT_EQ(anywhere("web"), "0 null");
    EXPECT_THAT(calls_of(Operation::mdb_get_tstr_array),
                ElementsAre(children_call(acl_root), children_call(route_root),
                            children_call(opt_root), children_call(qos_root)));
    use(acl_node("a", "10"));
    use(map_node(qos_root, "q", "10"));
    forget_calls();
    EXPECT_EQ(anywhere("web"), "0 Application name used by an ACL.");
    EXPECT_THAT(
        calls_of(Operation::mdb_get_tstr_array),
        ElementsAre(children_call(acl_root), children_call("/ov/tunneld/acl/config/a/entry")));
    EXPECT_THAT(log_lines(), ElementsAre(gated_line(
                                 6, "md_find_app_name_in_acl: find web in any 1 acl aclNames")));
}

TEST_F(AppAnywhere, IsCollectedFromAllKindsUnderTheFirstKindsMessage)
{
    use(map_node(qos_root, "q", "10"));
    use(acl_node("a", "10"));
    use(map_node(route_root, "r", "10"), "mail");
    char *message = nullptr;
    tstr_array *bnames = nullptr;
    EXPECT_EQ(in_library(md_find_appname_in_acl_or_xxxmap, "web", host_.db(), &message, &bnames),
              0);
    EXPECT_EQ(taken(message), "Application name used by an ACL.");
    EXPECT_THAT(texts(bnames), ElementsAre(acl_node("a", "10"), map_node(qos_root, "q", "10")));
    tstr_array_free(&bnames);
}

TEST_F(AppAnywhere, IsCollectedWithoutMessage)
{
    use(map_node(opt_root, "o", "10"));
    tstr_array *bnames = nullptr;
    EXPECT_EQ(in_library(md_find_appname_in_acl_or_xxxmap, "web", host_.db(), nullptr, &bnames), 0);
    EXPECT_THAT(texts(bnames), ElementsAre(map_node(opt_root, "o", "10")));
    tstr_array_free(&bnames);
}

TEST_F(AppAnywhere, UnusedIsCollectedInAnEmptyArray)
{
    char old[] = "old";
    char *message = old;
    tstr_array *bnames = nullptr;
    EXPECT_EQ(in_library(md_find_appname_in_acl_or_xxxmap, "web", host_.db(), &message, &bnames),
              0);
    EXPECT_EQ(message, nullptr);
    ASSERT_NE(bnames, nullptr);
    EXPECT_THAT(texts(bnames), IsEmpty());
    tstr_array_free(&bnames);
}

TEST_F(AppAnywhere, MayBeLookedForWithoutAnyAnswer)
{
    use(acl_node("a", "10"));
    EXPECT_EQ(in_library(md_find_appname_in_acl_or_xxxmap, "web", host_.db(), nullptr, nullptr), 0);
}

TEST_F(AppAnywhere, IsNotLookedForInOtherKindsOfMaps)
{
    use("/ov/tunneld/stats_map/config/map/m/prio/10/match/0/application");
    use("/ov/tunneld/nat_map/config/map/m/prio/10/match/0/application");
    use("/ov/tunneld/sec_map/config/map/map1/m/prio/10/match/0/application");
    use("/ov/dnsproxy/config/0/map/m/prio/10/match/0/application");
    EXPECT_EQ(anywhere("web"), "0 null");
}

TEST_F(AppAnywhere, OfNoNameIsUnused)
{
    use(acl_node("a", "10"));
    EXPECT_EQ(anywhere(nullptr), "0 null");
}

TEST_F(AppAnywhere, OfNoDatabaseIsAnErrorAndHandsNothingOut)
{
    char old[] = "old";
    char *message = old;
    const TestArray before = new_array();
    tstr_array *bnames = before.get();
    EXPECT_EQ(in_library(md_find_appname_in_acl_or_xxxmap, "web", nullptr, &message, &bnames),
              14001);
    EXPECT_EQ(message, nullptr);
    EXPECT_EQ(bnames, nullptr);
    EXPECT_THAT(log_lines(),
                ElementsAre(line_of("md_find_appname_in_acl_or_xxxmap", "Unexpected NULL")));
}

TEST_F(AppAnywhere, HandsNothingOutAfterAFailure)
{
    use(acl_node("a", "10"));
    char *message = nullptr;
    tstr_array *bnames = nullptr;
    // The third list is that of the route maps.
    arm({.operation = Operation::mdb_get_tstr_array, .call = 3, .code = 14014});
    EXPECT_EQ(in_library(md_find_appname_in_acl_or_xxxmap, "web", host_.db(), &message, &bnames),
              14014);
    EXPECT_EQ(message, nullptr);
    EXPECT_EQ(bnames, nullptr);
    EXPECT_THAT(
        log_lines(),
        ElementsAre(
            gated_line(6, "md_find_app_name_in_acl: find web in any 1 acl aclNames"),
            line_of("md_find_app_name_in_xxxmap", "Error code 14014 (generic IO error) returned"),
            line_of("md_find_appname_in_acl_or_xxxmap",
                    "Error code 14014 (generic IO error) returned")));
}

class AppRules : public LibraryTest
{
  protected:
    void add_rule(const std::string &rule, const std::string &name)
    {
        host_.set(std::string(app_root) + '/' + rule + "/name", bt_string, name);
    }
    // Status and number; the number that was there before is -7.
    std::string count(const char *name)
    {
        int number = -7;
        const int status = in_library(md_get_app_num_rules, host_.db(), name, &number);
        return std::to_string(status) + ' ' + std::to_string(number);
    }
    // Status and names; "untouched" when they are.
    std::string names()
    {
        const TestArray before = new_array();
        tstr_array *array = before.get();
        const int status = in_library(md_get_custom_app_names, host_.db(), &array);
        std::string answer = std::to_string(status);
        if (array == before.get()) {
            return answer + " untouched";
        }
        for (const std::string &name : texts(array)) {
            answer += ' ' + name;
        }
        tstr_array_free(&array);
        return answer;
    }
};

TEST_F(AppRules, AreCountedByName)
{
    add_rule("1", "a");
    add_rule("2", "b");
    add_rule("3", "a");
    EXPECT_EQ(count("a"), "0 2");
    EXPECT_EQ(count("b"), "0 1");
    EXPECT_EQ(count("A"), "0 0");
    EXPECT_EQ(count(""), "0 0");
    EXPECT_THAT(log_lines(), IsEmpty());
}

TEST_F(AppRules, AreReadAsTheHostExpectsIt)
{
    add_rule("1", "a");
    add_rule("2", "b");
    const auto name_call = [](const std::string &rule) {
        return "mdb_get_node_value_tstr(null, *, \"/ov/tunneld/app/config/" + rule +
               "/name\", 0, null, *)";
    };
    EXPECT_EQ(count("a"), "0 1");
    EXPECT_THAT(calls_of(Operation::mdb_get_tstr_array), ElementsAre(children_call(app_root)));
    EXPECT_THAT(calls_of(Operation::mdb_get_node_value_tstr),
                ElementsAre(name_call("1"), name_call("2")));
    forget_calls();
    EXPECT_EQ(names(), "0 a b");
    EXPECT_THAT(calls_of(Operation::mdb_get_tstr_array), ElementsAre(children_call(app_root)));
    EXPECT_THAT(calls_of(Operation::mdb_get_node_value_tstr),
                ElementsAre(name_call("1"), name_call("2")));
}

TEST_F(AppRules, AreNoneWithoutAny)
{
    EXPECT_EQ(count("a"), "0 0");
    EXPECT_EQ(names(), "0 untouched");
    EXPECT_THAT(log_lines(), IsEmpty());
}

TEST_F(AppRules, AreNoneWhenTheListDoesNotCome)
{
    add_rule("1", "a");
    arm({.operation = Operation::mdb_get_tstr_array,
         .and_later = true,
         .way = FaultWay::without_object});
    EXPECT_EQ(count("a"), "0 0");
    EXPECT_EQ(names(), "0 untouched");
    EXPECT_THAT(log_lines(), IsEmpty());
}

TEST_F(AppRules, GiveTheirNamesOnceAtTheLastPlace)
{
    add_rule("1", "a");
    add_rule("2", "b");
    add_rule("3", "a");
    EXPECT_EQ(names(), "0 b a");
    add_rule("4", "c");
    add_rule("5", "b");
    EXPECT_EQ(names(), "0 a c b");
}

TEST_F(AppRules, OfNamesThatDifferInCaseAreDifferent)
{
    add_rule("1", "Web");
    add_rule("2", "web");
    EXPECT_EQ(names(), "0 Web web");
}

TEST_F(AppRules, WithoutNameAreAnError)
{
    add_rule("1", "a");
    host_.set("/ov/tunneld/app/config/2/port", bt_string, "80");
    EXPECT_EQ(count("a"), "14001 0");
    EXPECT_EQ(names(), "14001 untouched");
    EXPECT_THAT(log_lines(), ElementsAre(line_of("md_get_app_num_rules", "Unexpected NULL"),
                                         line_of("md_get_custom_app_names", "Unexpected NULL")));
    EXPECT_EQ(num_calls(Operation::bail_debug), 2U);
}

TEST_F(AppRules, ThatDoNotComeAreAnError)
{
    add_rule("1", "a");
    planted().null_text_at_call = 1;
    EXPECT_EQ(count("a"), "14001 0");
    forget_calls();
    EXPECT_EQ(names(), "14001 untouched");
    EXPECT_THAT(log_lines(), ElementsAre(line_of("md_get_custom_app_names", "Unexpected NULL")));
}

TEST_F(AppRules, OfOtherTypesAreReadAsText)
{
    host_.set("/ov/tunneld/app/config/1/name", bt_uint32, "80");
    EXPECT_EQ(count("80"), "0 1");
    EXPECT_EQ(names(), "0 80");
}

// "/ov/tunneld/app/config/" and "/name" leave 227 characters of the node.
TEST_F(AppRules, HaveNodesThatAreCutAt255Characters)
{
    add_rule(std::string(227, 'r'), "a");
    EXPECT_EQ(count("a"), "0 1");
    EXPECT_EQ(names(), "0 a");

    const std::string too_long(232, 's');
    add_rule(too_long, "a");
    EXPECT_EQ(count("a"), "14001 0");
    host_.set(std::string(app_root) + '/' + too_long, bt_string, "b");
    EXPECT_EQ(count("b"), "0 1");
    EXPECT_EQ(names(), "0 a b");
}

// Whatever follows the 232nd character of such a name, the node ends there.
TEST_F(AppRules, OfLongNamesShareANode)
{
    for (const std::size_t size : {255U, 256U, 600U}) {
        add_rule(std::string(size, 'r'), "a");
        EXPECT_EQ(count("a"), "14001 0") << size;
        EXPECT_EQ(names(), "14001 untouched") << size;
    }
    // A rule of its own besides.
    host_.set(std::string(app_root) + '/' + std::string(232, 'r'), bt_string, "b");
    EXPECT_EQ(count("a"), "0 0");
    EXPECT_EQ(count("b"), "0 4");
    EXPECT_EQ(names(), "0 b");
}

TEST_F(AppRules, WithASlashInTheirNamesHaveNone)
{
    add_rule(written("1/2"), "a");
    EXPECT_EQ(count("a"), "14001 0");
    EXPECT_EQ(names(), "14001 untouched");
    EXPECT_THAT(calls_of(Operation::mdb_get_node_value_tstr),
                ElementsAre("mdb_get_node_value_tstr(null, *, "
                            "\"/ov/tunneld/app/config/1/2/name\", 0, null, *)",
                            "mdb_get_node_value_tstr(null, *, "
                            "\"/ov/tunneld/app/config/1/2/name\", 0, null, *)"));
}

TEST_F(AppRules, OfNothingAreAnError)
{
    int number = -7;
    EXPECT_EQ(in_library(md_get_app_num_rules, host_.db(), nullptr, &number), 14001);
    EXPECT_EQ(in_library(md_get_app_num_rules, nullptr, "a", &number), 14001);
    EXPECT_EQ(in_library(md_get_app_num_rules, host_.db(), "a", nullptr), 14001);
    EXPECT_EQ(number, -7);
    EXPECT_EQ(log_lines(),
              std::vector<std::string>(3, line_of("md_get_app_num_rules", "Unexpected NULL")));
    EXPECT_EQ(num_calls(Operation::mdb_get_tstr_array), 0U);
}

TEST_F(AppRules, GiveNoNamesForNothing)
{
    EXPECT_EQ(in_library(md_get_custom_app_names, host_.db(), nullptr), 14001);
    const TestArray before = new_array();
    tstr_array *array = before.get();
    EXPECT_EQ(in_library(md_get_custom_app_names, nullptr, &array), 14001);
    EXPECT_EQ(array, before.get());
    EXPECT_EQ(log_lines(),
              std::vector<std::string>(2, line_of("md_get_custom_app_names", "Unexpected NULL")));
    EXPECT_EQ(num_calls(Operation::tstr_array_new), 0U);
}

} // namespace
