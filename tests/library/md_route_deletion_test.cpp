// The removal of the routes behind a subnet: the part of md_tunneld_tunnel_common about routes.
//
// The library's buffer for escaped names is never cleared: what one test leaves in it, another
// would find. So each runs in a process of its own, in which no name has been escaped yet.
#include "orvale/md_tunneld_tunnel_common.h"

#include "tests/library/library_test.h"
#include "tests/library/map_changes.h"

#include <sys/wait.h>
#include <unistd.h>

#include <cstdio>
#include <cstdlib>
#include <functional>
#include <string>

using namespace ovtest;
using testing::ElementsAre;
using testing::IsEmpty;

namespace
{

constexpr char function[] = "md_tunneld_delete_dproutes";
constexpr char root[] = "/ov/tunneld/net/routes/config/ipv4/prefix/";
constexpr std::size_t root_length = 42;

std::string line_of(const std::string &text)
{
    return error_line("md_tunneld_tunnel_common", function, text);
}

std::string deleted_line(const std::string &node)
{
    return gated_line(6, "DPR/VLAN " + node + " deleted\n");
}

std::string list_call(const std::string &node)
{
    return "mdb_get_tstr_array(*, *, \"" + node + "\", 0, 0, 0, *)";
}

std::string binding_call(const std::string &node, const std::string &value)
{
    return "bn_binding_new_str(*, \"" + node + "\", 1, 101, 0, \"" + value + "\")";
}

class Routes : public LibraryTest
{
  protected:
    // Runs the test's body.
    void in_own_process(const std::function<void()> &body)
    {
        std::fflush(nullptr);
        const pid_t child = ::fork();
        ASSERT_GE(child, 0);
        if (child == 0) {
            host_.db()->writable = true;
            body();
            LibraryTest::TearDown();
            std::exit(HasFailure() ? 1 : 0);
        }
        int status = -1;
        ASSERT_EQ(::waitpid(child, &status, 0), child);
        EXPECT_EQ(status, 0) << "the failures are told above";
    }

    void add(const std::string &prefix, const std::string &nhop)
    {
        set(written(prefix) + "/nhop/" + nhop);
    }
    void set(const std::string &node) { set_node(*host_.db(), root + node, "x"); }

    // Status and count; the count was 7 before.
    std::string remove(const std::string &address = "192.0.2.9", int masklen = 24)
    {
        uint32 count = 7;
        const int status = in_library(md_tunneld_delete_dproutes, &host_.commit(), host_.db(),
                                      address.c_str(), static_cast<uint8>(masklen), &count);
        return std::to_string(status) + ' ' + std::to_string(count);
    }

    // The nodes that are left below the root, without it and their values.
    std::vector<std::string> left()
    {
        std::vector<std::string> names;
        for (const std::string &node : nodes(*host_.db(), std::string(root, root_length - 1))) {
            names.push_back(node.substr(root_length, node.find(' ') - root_length));
        }
        return names;
    }
};

TEST_F(Routes, ThatLeadIntoTheSubnetGo)
{
    in_own_process([this] {
        add("10.1.0.0/16", "192.0.2.1");
        add("10.1.0.0/16", "198.51.100.1");
        add("10.2.0.0/16", "198.51.100.1");
        add("10.3.0.0/16", "192.0.2.1");
        add("10.3.0.0/16", "192.0.2.254");
        EXPECT_EQ(remove(), "0 3");
        EXPECT_THAT(left(), ElementsAre("10.1.0.0\\/16/nhop/198.51.100.1",
                                        "10.2.0.0\\/16/nhop/198.51.100.1"));
        const std::string begin(root);
        EXPECT_THAT(log_lines(),
                    ElementsAre(deleted_line(begin + "10.1.0.0\\/16/nhop/192.0.2.1"),
                                deleted_line(begin + "10.3.0.0\\/16/nhop/192.0.2.1"),
                                deleted_line(begin + "10.3.0.0\\/16/nhop/192.0.2.254")));
    });
}

TEST_F(Routes, AreListedAndRemovedAsTheHostExpectsIt)
{
    in_own_process([this] {
        add("10.1.0.0/16", "192.0.2.1");
        EXPECT_EQ(remove(), "0 1");
        const std::string prefix_node = std::string(root) + "10.1.0.0\\/16";
        EXPECT_THAT(calls_of(Operation::mdb_get_tstr_array),
                    ElementsAre(list_call("/ov/tunneld/net/routes/config/ipv4/prefix"),
                                list_call(prefix_node + "/nhop")));
        EXPECT_THAT(calls_of(Operation::mgmt_is_same_subnet_using_masklen),
                    ElementsAre("mgmt_is_same_subnet_using_masklen(\"192.0.2.1\", \"192.0.2.9\", "
                                "24, 24)"));
        EXPECT_THAT(calls_of(Operation::bn_binding_new_str),
                    ElementsAre(binding_call(prefix_node + "/nhop/192.0.2.1", "192.0.2.1"),
                                binding_call(prefix_node, "10.1.0.0\\/16")));
        EXPECT_THAT(calls_of(Operation::mdb_set_node_binding),
                    ElementsAre("mdb_set_node_binding(*, *, 2, 0, *)",
                                "mdb_set_node_binding(*, *, 2, 0, *)"));
    });
}

TEST_F(Routes, GoWithoutACommitOrACount)
{
    in_own_process([this] {
        add("10.1.0.0/16", "192.0.2.1");
        EXPECT_EQ(in_library(md_tunneld_delete_dproutes, nullptr, host_.db(), "192.0.2.9",
                             uint8{24}, nullptr),
                  0);
        EXPECT_THAT(left(), IsEmpty());
        EXPECT_EQ(calls_of(Operation::mdb_get_tstr_array).front(),
                  "mdb_get_tstr_array(null, *, \"/ov/tunneld/net/routes/config/ipv4/prefix\", 0, "
                  "0, 0, *)");
        EXPECT_EQ(calls_of(Operation::mdb_set_node_binding).front(),
                  "mdb_set_node_binding(null, *, 2, 0, *)");
    });
}

TEST_F(Routes, AreThoseOfTheCallersCommitAndDatabase)
{
    in_own_process([this] {
        add("10.1.0.0/16", "192.0.2.1");
        name_object(static_cast<md_commit *>(&host_.commit()), "commit");
        name_object(host_.db(), "db");
        EXPECT_EQ(remove(), "0 1");
        const std::string list = "/ov/tunneld/net/routes/config/ipv4/prefix";
        EXPECT_THAT(calls_of(Operation::mdb_get_tstr_array),
                    ElementsAre("mdb_get_tstr_array(commit, db, \"" + list + "\", 0, 0, 0, *)",
                                "mdb_get_tstr_array(commit, db, \"" + list +
                                    "/10.1.0.0\\/16/nhop\", 0, 0, 0, *)"));
        EXPECT_THAT(calls_of(Operation::mdb_set_node_binding),
                    ElementsAre("mdb_set_node_binding(commit, db, 2, 0, *)",
                                "mdb_set_node_binding(commit, db, 2, 0, *)"));
    });
}

TEST_F(Routes, MayBeNone)
{
    in_own_process([this] {
        EXPECT_EQ(remove("192.0.2.9", 0), "0 0");
        EXPECT_EQ(num_calls(Operation::mdb_get_tstr_array), 1U);
        EXPECT_THAT(log_lines(), IsEmpty());
    });
}

TEST_F(Routes, GoInSilenceBelowTheThreshold)
{
    in_own_process([this] {
        add("10.1.0.0/16", "192.0.2.1");
        host_.set_log_level(5);
        EXPECT_EQ(remove(), "0 1");
        EXPECT_THAT(left(), IsEmpty());
        EXPECT_THAT(log_lines(), IsEmpty());
    });
}

TEST_F(Routes, AreToldByTheDaemonsThresholdBeforeTheGeneralOne)
{
    in_own_process([this] {
        add("10.1.0.0/16", "192.0.2.1");
        G_log_level = 7;
        G_daemon_log_level = 5;
        EXPECT_EQ(remove(), "0 1");
        EXPECT_THAT(log_lines(), IsEmpty());
        add("10.1.0.0/16", "192.0.2.1");
        G_log_level = 0;
        G_daemon_log_level = 6;
        EXPECT_EQ(remove(), "0 1");
        EXPECT_THAT(log_lines(),
                    ElementsAre(deleted_line(std::string(root) + "10.1.0.0\\/16/nhop/192.0.2.1")));
    });
}

struct Subnet {
    int masklen;
    std::string status_and_count;
    std::vector<std::string> left;
};

void PrintTo(const Subnet &subnet, std::ostream *out)
{
    *out << "mask length " << subnet.masklen;
}

// Of these next hops, which are not in the subnet of 10.1.2.3?
class RoutesOfSubnet : public Routes, public testing::WithParamInterface<Subnet>
{
};

TEST_P(RoutesOfSubnet, GoByMaskLength)
{
    in_own_process([this] {
        for (const char *nhop :
             {"10.1.2.3", "10.1.2.200", "10.1.3.3", "10.9.9.9", "11.0.0.1", "no-address", "::1"}) {
            add("default", nhop);
        }
        EXPECT_EQ(remove("10.1.2.3", GetParam().masklen), GetParam().status_and_count);
        std::vector<std::string> expected;
        for (const std::string &nhop : GetParam().left) {
            expected.push_back("default/nhop/" + nhop);
        }
        EXPECT_EQ(left(), expected);
    });
}

INSTANTIATE_TEST_SUITE_P(
    Lengths, RoutesOfSubnet,
    testing::Values(
        Subnet{0, "0 5", {"::1", "no-address"}},
        Subnet{8, "0 4", {"11.0.0.1", "::1", "no-address"}},
        Subnet{16, "0 3", {"10.9.9.9", "11.0.0.1", "::1", "no-address"}},
        Subnet{24, "0 2", {"10.1.3.3", "10.9.9.9", "11.0.0.1", "::1", "no-address"}},
        Subnet{25, "0 1", {"10.1.2.200", "10.1.3.3", "10.9.9.9", "11.0.0.1", "::1", "no-address"}},
        Subnet{32, "0 1", {"10.1.2.200", "10.1.3.3", "10.9.9.9", "11.0.0.1", "::1", "no-address"}},
        Subnet{33, "0 1", {"10.1.2.200", "10.1.3.3", "10.9.9.9", "11.0.0.1", "::1", "no-address"}},
        Subnet{
            255, "0 1", {"10.1.2.200", "10.1.3.3", "10.9.9.9", "11.0.0.1", "::1", "no-address"}}),
    [](const testing::TestParamInfo<Subnet> &about) {
        return "Length" + std::to_string(about.param.masklen);
    });

TEST_F(Routes, DoNotLeadToAMalformedAddress)
{
    in_own_process([this] {
        add("10.1.0.0/16", "192.0.2.1");
        EXPECT_EQ(remove("192.0.2", 0), "0 0");
        EXPECT_EQ(remove("", 0), "0 0");
        EXPECT_EQ(left().size(), 1U);
    });
}

TEST_F(Routes, WithNoNextHopLeftGoWithAllTheyHave)
{
    in_own_process([this] {
        set("10.1.0.0\\/16");
        set("10.1.0.0\\/16/metric");
        add("10.1.0.0/16", "192.0.2.1");
        add("10.1.0.0/16", "192.0.2.2/weight");
        set("10.2.0.0\\/16");
        set("10.2.0.0\\/16/metric");
        add("10.2.0.0/16", "192.0.2.1");
        add("10.2.0.0/16", "198.51.100.1");
        EXPECT_EQ(remove(), "0 3");
        EXPECT_THAT(left(), ElementsAre("10.2.0.0\\/16", "10.2.0.0\\/16/metric",
                                        "10.2.0.0\\/16/nhop/198.51.100.1"));
    });
}

TEST_F(Routes, WithoutNextHopsStay)
{
    in_own_process([this] {
        set("10.1.0.0\\/16");
        set("10.2.0.0\\/16/metric");
        set("10.3.0.0\\/16/nhop");
        EXPECT_EQ(remove("192.0.2.9", 0), "0 0");
        EXPECT_THAT(left(),
                    ElementsAre("10.1.0.0\\/16", "10.2.0.0\\/16/metric", "10.3.0.0\\/16/nhop"));
        EXPECT_EQ(num_calls(Operation::mdb_set_node_binding), 0U);
    });
}

// What the longer name has left stands behind the shorter one.
TEST_F(Routes, OfAShortPrefixBehindALongOneAreNotFound)
{
    in_own_process([this] {
        add("10.100.0.0/16", "192.0.2.1");
        add("10.2.0.0/16", "192.0.2.1");
        EXPECT_EQ(remove(), "0 1");
        EXPECT_THAT(left(), ElementsAre("10.2.0.0\\/16/nhop/192.0.2.1"));
        EXPECT_THAT(calls_of(Operation::mdb_get_tstr_array),
                    ElementsAre(list_call("/ov/tunneld/net/routes/config/ipv4/prefix"),
                                list_call(std::string(root) + "10.100.0.0\\/16/nhop"),
                                list_call(std::string(root) + "10.2.0.0\\/1616/nhop")));
    });
}

TEST_F(Routes, OfAShortPrefixAreNotFoundInALaterCallEither)
{
    in_own_process([this] {
        add("10.100.0.0/16", "192.0.2.1");
        add("10.2.0.0/16", "192.0.2.2");
        EXPECT_EQ(remove("192.0.2.1", 32), "0 1");
        EXPECT_THAT(left(), ElementsAre("10.2.0.0\\/16/nhop/192.0.2.2"));
        EXPECT_EQ(remove(), "0 0");
        EXPECT_THAT(left(), ElementsAre("10.2.0.0\\/16/nhop/192.0.2.2"));
    });
}

TEST_F(Routes, OfALongPrefixBehindAShortOneAreFound)
{
    in_own_process([this] {
        add("1.0.0.0/8", "192.0.2.1");
        add("10.0.0.0/8", "192.0.2.1");
        add("10.0.0.0/16", "192.0.2.1");
        add("100.100.100.0/24", "192.0.2.1");
        add("default", "192.0.2.1");
        // In the database's order "10.0.0.0/16" comes before "10.0.0.0/8".
        EXPECT_EQ(remove(), "0 3");
        EXPECT_THAT(left(), ElementsAre("10.0.0.0\\/8/nhop/192.0.2.1", "default/nhop/192.0.2.1"));
    });
}

TEST_F(Routes, OfAnotherPrefixGoWhereTheRestMakesItsName)
{
    in_own_process([this] {
        add("1.0.0.0/24", "198.51.100.1");
        add("2.0.0.0/2", "192.0.2.1");
        add("2.0.0.0/24", "192.0.2.1");
        EXPECT_EQ(remove(), "0 1");
        EXPECT_THAT(left(),
                    ElementsAre("1.0.0.0\\/24/nhop/198.51.100.1", "2.0.0.0\\/2/nhop/192.0.2.1"));
        // "2.0.0.0/2" was looked for as "2.0.0.0/24", and then "2.0.0.0/24" itself.
        const std::string list = list_call(std::string(root) + "2.0.0.0\\/24/nhop");
        EXPECT_EQ(calls_of(Operation::mdb_get_tstr_array)[2], list);
        EXPECT_EQ(calls_of(Operation::mdb_get_tstr_array)[3], list);
        EXPECT_EQ(calls_of(Operation::bn_binding_new_str).back(),
                  binding_call(std::string(root) + "2.0.0.0\\/24", "2.0.0.0\\/24"));
    });
}

TEST_F(Routes, OfPrefixesWithOtherCharactersAreNamedAsTheyAre)
{
    in_own_process([this] {
        // Only slashes are escaped: a backslash makes another name of it, or none.
        add("a*b", "192.0.2.1");
        EXPECT_EQ(remove(), "0 1");
        add("a\\b", "192.0.2.1");
        EXPECT_EQ(remove(), "14009 0");
        EXPECT_THAT(left(), ElementsAre("a\\\\b/nhop/192.0.2.1"));
        EXPECT_EQ(last_log_line(), line_of("Error code 14009 (invalid path name) returned"));
    });
}

// 42 characters of the root, 152 of the prefix, and "/nhop": 199.
TEST_F(Routes, OfAPrefixOf152CharactersAreFound)
{
    in_own_process([this] {
        const std::string prefix = std::string(148, 'p') + "/24"; // escaped: 152
        add(prefix, "192.0.2.1");
        EXPECT_EQ(remove(), "0 1");
        EXPECT_THAT(left(), IsEmpty());
        EXPECT_THAT(log_lines(), ElementsAre(deleted_line(root + std::string(148, 'p') +
                                                          "\\/24/nhop/192.0.2.1")));
    });
}

TEST_F(Routes, OfALongerPrefixAreLookedForWhereTheNameIsCut)
{
    in_own_process([this] {
        const std::string prefix(153, 'p');
        add(prefix, "192.0.2.1");
        set(prefix + "/nho/192.0.2.2");
        EXPECT_EQ(remove(), "0 1");
        EXPECT_EQ(calls_of(Operation::mdb_get_tstr_array)[1], list_call(root + prefix + "/nho"));
        // That was all there is where it was looked for, so the prefix goes.
        EXPECT_THAT(left(), IsEmpty());
        EXPECT_THAT(log_lines(), ElementsAre(deleted_line(root + prefix + "/nho/192.0.2.2")));
    });
}

TEST_F(Routes, OfACutNameThatIsNoneAreAnError)
{
    // Cut behind a slash, and behind a backslash.
    for (const std::string &prefix : {std::string(156, 'p'), std::string(156, 'p') + "/24"}) {
        in_own_process([&] {
            add(prefix, "192.0.2.1");
            EXPECT_EQ(remove(), "14009 0");
            EXPECT_EQ(left().size(), 1U);
            EXPECT_THAT(log_lines(),
                        ElementsAre(line_of("Error code 14009 (invalid path name) returned")));
        });
    }
}

TEST_F(Routes, OfAVeryLongPrefixAreItsOwnChildren)
{
    in_own_process([this] {
        const std::string prefix(157, 'p');
        add(prefix, "192.0.2.1");
        set(prefix + "/192.0.2.2");
        EXPECT_EQ(remove(), "0 1");
        EXPECT_EQ(calls_of(Operation::mdb_get_tstr_array)[1], list_call(root + prefix));
        EXPECT_THAT(left(), ElementsAre(prefix + "/nhop/192.0.2.1"));
        EXPECT_THAT(log_lines(), ElementsAre(deleted_line(root + prefix + "/192.0.2.2")));
    });
}

TEST_F(Routes, OfANextHopOfAnyLengthGo)
{
    in_own_process([this] {
        const std::string nhop(300, 'n');
        planted().one_subnet = true;
        add("10.1.0.0/16", nhop);
        // The next hop's name is cut at 255 characters, its value is not; there is no such node,
        // but it counts, and the prefix goes.
        EXPECT_EQ(remove(), "0 1");
        EXPECT_THAT(left(), IsEmpty());
        const std::string begin = std::string(root) + "10.1.0.0\\/16/nhop/";
        const std::string cut = begin + nhop.substr(0, 255 - begin.size());
        EXPECT_EQ(cut.size(), 255U);
        EXPECT_THAT(
            calls_of(Operation::bn_binding_new_str),
            ElementsAre(binding_call(cut, nhop),
                        binding_call(std::string(root) + "10.1.0.0\\/16", "10.1.0.0\\/16")));
        EXPECT_THAT(log_lines(), ElementsAre(deleted_line(cut)));
    });
}

// A next hop where the long prefix's list is looked for: below the one of 157 characters, whose own
// list does not come.
TEST_F(Routes, OfAPrefixWhoseNameIsCutLeaveThePrefixThere)
{
    in_own_process([this] {
        const std::string shorter(157, 'p');
        const std::string longer(220, 'p');
        set(shorter + "/192.0.2.1");
        add(longer, "198.51.100.1");
        arm({.operation = Operation::mdb_get_tstr_array,
             .call = 2,
             .way = FaultWay::without_object});
        EXPECT_EQ(remove(), "0 1");
        EXPECT_THAT(left(), ElementsAre(longer + "/nhop/198.51.100.1"));
        EXPECT_EQ(calls_of(Operation::bn_binding_new_str).back(),
                  binding_call(root + std::string(255 - root_length, 'p'), longer));
    });
}

TEST_F(Routes, OfAPrefixThatIsEscapedTo255CharactersAreLookedFor)
{
    for (const std::string &prefix :
         {std::string(255, 'p'), std::string(253, 'p') + '/', std::string(127, '/') + 'p'}) {
        in_own_process([&] {
            add(prefix, "192.0.2.1");
            // Names that are cut inside of "\/" are none.
            const bool is_name = prefix.front() != '/';
            EXPECT_EQ(remove(), is_name ? "0 0" : "14009 0");
            EXPECT_EQ(num_calls(Operation::mdb_get_tstr_array), 2U);
            EXPECT_EQ(left().size(), 1U);
        });
    }
}

TEST_F(Routes, OfAPrefixThatIsEscapedToMoreAreAnError)
{
    for (const std::string &prefix : {std::string(256, 'p'), std::string(254, 'p') + '/',
                                      std::string(128, '/'), std::string(10'000, 'p')}) {
        in_own_process([&] {
            add("10.1.0.0/16", "192.0.2.1");
            add(prefix, "192.0.2.1");
            const bool is_first = prefix.front() == '/';
            EXPECT_EQ(remove(), "14002 0");
            // What went before is gone.
            EXPECT_EQ(left().size(), is_first ? 2U : 1U);
            EXPECT_EQ(num_calls(Operation::mdb_get_tstr_array), is_first ? 1U : 2U);
            EXPECT_EQ(last_log_line(), line_of("Required condition was not met"));
            EXPECT_EQ(num_calls(Operation::bail_debug), 1U);
        });
    }
}

// The buffer's last byte stays a NUL: what stands behind the short name ends where the longest did.
TEST_F(Routes, BehindTheLongestPrefixEndWhereItEnds)
{
    in_own_process([this] {
        const std::string looked_for = 'b' + std::string(156, 'a'); // cut at 199 characters
        set(std::string(255, 'a'));
        set("b");
        set(looked_for + "/192.0.2.1");
        EXPECT_EQ(remove(), "0 1");
        EXPECT_EQ(calls_of(Operation::mdb_get_tstr_array)[2], list_call(root + looked_for));
        EXPECT_EQ(calls_of(Operation::bn_binding_new_str).back(),
                  binding_call(root + ('b' + std::string(255 - root_length - 1, 'a')),
                               'b' + std::string(254, 'a')));
    });
}

TEST_F(Routes, ThatAreGoneBeforeAFailureAreNotCounted)
{
    in_own_process([this] {
        add("10.1.0.0/16", "192.0.2.1");
        add("10.2.0.0/16", "192.0.2.1");
        arm({.operation = Operation::mdb_set_node_binding, .call = 3, .code = 14004});
        EXPECT_EQ(remove(), "14004 0");
        EXPECT_THAT(left(), ElementsAre("10.2.0.0\\/16/nhop/192.0.2.1"));
        EXPECT_EQ(last_log_line(), line_of("Error code 14004 (item not found) returned"));
        EXPECT_EQ(num_calls(Operation::bail_debug), 1U);
    });
}

TEST_F(Routes, StayQuietlyWhenTheOperationIsCancelled)
{
    in_own_process([this] {
        add("10.1.0.0/16", "192.0.2.1");
        arm({.operation = Operation::mdb_get_tstr_array, .call = 2, .code = 14120});
        EXPECT_EQ(remove(), "14120 0");
        EXPECT_EQ(left().size(), 1U);
        EXPECT_THAT(log_lines(), IsEmpty());
        EXPECT_EQ(num_calls(Operation::bail_quiet_debug), 1U);
    });
}

TEST_F(Routes, StayWhereNothingMayBeWritten)
{
    in_own_process([this] {
        add("10.1.0.0/16", "192.0.2.1");
        host_.db()->writable = false;
        EXPECT_EQ(remove(), "14002 0");
        EXPECT_THAT(log_lines(),
                    ElementsAre(line_of("Error code 14002 (assertion failed) returned")));
    });
}

TEST_F(Routes, WithoutABindingStay)
{
    for (const unsigned call : {1U, 2U}) {
        in_own_process([this, call] {
            add("10.1.0.0/16", "192.0.2.1");
            arm({.operation = Operation::bn_binding_new_str,
                 .call = call,
                 .way = FaultWay::without_object});
            EXPECT_EQ(remove(), "14001 0");
            EXPECT_EQ(last_log_line(), line_of("Unexpected NULL"));
            EXPECT_EQ(num_calls(Operation::mdb_set_node_binding), call - 1);
        });
    }
}

TEST_F(Routes, WithoutNameAreAnError)
{
    // The prefix's, and the next hop's.
    for (const unsigned call : {1U, 2U}) {
        in_own_process([this, call] {
            add("10.1.0.0/16", "192.0.2.1");
            planted().null_text_at_call = call;
            EXPECT_EQ(remove(), "14001 0");
            EXPECT_EQ(left().size(), 1U);
            EXPECT_THAT(log_lines(), ElementsAre(line_of("Unexpected NULL")));
        });
    }
}

TEST_F(Routes, OfNullAreAnError)
{
    in_own_process([this] {
        uint32 count = 7;
        EXPECT_EQ(in_library(md_tunneld_delete_dproutes, &host_.commit(), nullptr, "192.0.2.9",
                             uint8{24}, &count),
                  14001);
        EXPECT_EQ(count, 0U);
        count = 7;
        EXPECT_EQ(in_library(md_tunneld_delete_dproutes, &host_.commit(), host_.db(), nullptr,
                             uint8{24}, &count),
                  14001);
        EXPECT_EQ(count, 0U);
        EXPECT_EQ(
            in_library(md_tunneld_delete_dproutes, nullptr, nullptr, nullptr, uint8{24}, nullptr),
            14001);
        const std::string line = line_of("Unexpected NULL");
        EXPECT_THAT(log_lines(), ElementsAre(line, line, line));
        EXPECT_EQ(num_calls(Operation::bail_debug), 3U);
        EXPECT_EQ(num_calls(Operation::mdb_get_tstr_array), 0U);
    });
}

} // namespace
