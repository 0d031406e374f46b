// ACLs in a commit: host/modules/acls.h.

#include "host/modules/acls.h"

#include "tests/mgmtd/map_fixture.h"

namespace
{

using namespace ovhost;
using namespace mgmtd_test;
using testing::ElementsAre;
using testing::IsEmpty;

const std::string kept = ": references to ACLs are kept by the daemon: ";

class Acls : public MapTest
{
};

TEST_F(Acls, AreCompletedByTheCommitThatAddsThem)
{
    set(acl("a1/entry/10/protocol"), "tcp");
    set(acl("a2"), "a2");
    ASSERT_EQ(commit(), "committed");
    EXPECT_EQ(value(acl("a1")), "string a1");
    EXPECT_EQ(value(acl("a1/entry/10")), "uint16 10");
    EXPECT_EQ(value(acl("a2")), "string a2");
}

TEST_F(Acls, ComeBackWhenTheyAreReplaced)
{
    set(acl("a1/entry/10/protocol"), "tcp");
    ASSERT_EQ(commit(), "committed");
    erase(acl("a1"));
    set(acl("a1/entry/10/protocol"), "udp");
    set(acl("a1/entry/20/protocol"), "udp");
    ASSERT_EQ(commit(), "committed");
    EXPECT_EQ(value(acl("a1")), "string a1");
    EXPECT_EQ(value(acl("a1/entry/10")), "uint16 10");
    EXPECT_EQ(value(acl("a1/entry/20")), "uint16 20");
}

TEST_F(Acls, HavePlainNames)
{
    const std::string longest(255, 'a');
    set(acl(longest), longest);
    EXPECT_EQ(commit(), "committed");
    set(acl(longest + "a/entry/10/protocol"), "tcp");
    EXPECT_EQ(commit_in_vain(), acl(longest + "a/entry/10/protocol") +
                                    ": an ACL's name is 1 to 255 bytes long, not 256 (acl)\n");
    const std::string very_long(600, 'a');
    set(acl(very_long), very_long);
    EXPECT_EQ(commit_in_vain(),
              acl(very_long) + ": an ACL's name is 1 to 255 bytes long, not 600 (acl)\n");
    set(acl("a\\/b"), "a/b");
    EXPECT_EQ(commit_in_vain(), acl("a\\/b") + ": an ACL's name must not hold \"/\": choose "
                                               "another name (acl)\n");
    set(acl("a\\\\b"), "a\\b");
    EXPECT_EQ(commit_in_vain(), acl("a\\\\b") + ": an ACL's name must not hold \"\\\": choose "
                                                "another name (acl)\n");
    set(acl("a\nb"), "a\nb");
    EXPECT_EQ(commit_in_vain(), acl("a\nb") + ": an ACL's name must not hold control characters, "
                                              "as \"a\\nb\" does: choose another name (acl)\n");
    set(acl("\\*"), "*");
    EXPECT_EQ(commit_in_vain(), acl("\\*") + ": an ACL's name must not hold \"*\": choose another "
                                             "name (acl)\n");
}

TEST_F(Acls, HoldTheirNames)
{
    set(acl("a1"), "a2");
    set(acl("a1/entry/10"), bt_uint16, "20");
    EXPECT_EQ(commit_in_vain(), acl("a1") + ": must hold the ACL's name, \"a1\" (acl)\n" +
                                    acl("a1/entry/10") +
                                    ": must hold the entry's number, \"10\" (acl)\n");
}

TEST_F(Acls, HaveEntriesFrom1To65535)
{
    set(acl("a1/entry/1/protocol"), "tcp");
    set(acl("a1/entry/65535/protocol"), "tcp");
    EXPECT_EQ(commit(), "committed");
    for (const char *number : {"0", "65536", "01", "x"}) {
        set(acl("a1/entry/") + number + "/protocol", "tcp");
        EXPECT_EQ(commit_in_vain(),
                  acl("a1/entry/") + number +
                      "/protocol: an ACL entry's number is a decimal number from 1 to 65535, not "
                      "\"" +
                      number + "\" (acl)\n");
    }
}

TEST_F(Acls, TakeProtocolsByNumberAndName)
{
    for (const char *protocol :
         {"6", "255", "tcp", "raw", "ipproto-198", "17abc", " 6", "4294967302"}) {
        set(acl("a1/entry/10/protocol"), protocol);
        EXPECT_EQ(commit(), "committed") << protocol;
    }
    struct Row {
        const char *protocol;
        const char *message;
    };
    const Row rows[] = {
        {"256", "Invalid protocol number 256.\n"},
        {"-1", "Invalid protocol number -1.\n"},
        {"-5", "Invalid protocol number -5.\n"},
        {"ipproto-199", "Unknown protocol ipproto-199.\n"},
        {"", "Unknown protocol .\n"},
    };
    for (const auto &[protocol, message] : rows) {
        set(acl("a1/entry/10/protocol"), protocol);
        EXPECT_EQ(commit_in_vain(), acl("a1/entry/10/protocol") + ": " + message + " (acl)\n");
    }
}

TEST_F(Acls, TakeMatchStrings)
{
    set(acl("a1/entry/10/matchstr"), "src_ip:10.1.0.0/16,dst_port:443");
    EXPECT_EQ(commit(), "committed");
    set(acl("a1/entry/10/matchstr"), "src_ip:10.1.0.0");
    EXPECT_EQ(commit_in_vain(),
              acl("a1/entry/10/matchstr") +
                  ": Invalid match string src_ip:10.1.0.0 - pair \"src_ip:10.1.0.0\": the value "
                  "must be an address and a mask length, such as 10.1.0.0/16\n (acl)\n");
    set(acl("a1/entry/10/matchstr"), "VLAN:vlan4095");
    EXPECT_EQ(commit_in_vain(), acl("a1/entry/10/matchstr") +
                                    ": the VLAN of \"VLAN:vlan4095\" is neither an interface label "
                                    "nor a name that a VLAN can have (acl)\n");
}

TEST_F(Acls, StayWhileAnEntryNamesThem)
{
    add_acl("a1");
    add_entry("m1", "10", "a1");
    ASSERT_EQ(commit(), "committed");
    erase(acl("a1"));
    EXPECT_EQ(commit_in_vain(), acl("a1") + ": Cannot delete an ACL when used by a route-map.\n"
                                            "  Please remove ACL from associated route-map first.\n"
                                            "  Used by route-map m1, entry 10. (acl)\n");
    EXPECT_THAT(records(), ElementsAre("a1/rmap/m1/10"));
    erase(acl("a1"));
    erase(rmap("m1/prio/10"));
    EXPECT_EQ(commit(), "committed") << "together with the entry";
    EXPECT_EQ(value(acl("a1")), "none");
    EXPECT_THAT(records(), IsEmpty());
}

TEST_F(Acls, GoWhenTheirEntriesNameAnother)
{
    add_acl("a1");
    add_acl("a2");
    add_entry("m1", "10", "a1");
    ASSERT_EQ(commit(), "committed");
    erase(acl("a1"));
    add_entry("m1", "10", "a2");
    EXPECT_EQ(commit(), "committed");
    EXPECT_THAT(records(), ElementsAre("a2/rmap/m1/10"));
}

class UsedAcls : public EveryMapKind
{
};

INSTANTIATE_TEST_SUITE_P(Kinds, UsedAcls, testing::ValuesIn(map_kinds), key_of);

TEST_P(UsedAcls, AreRefusedInTheWordsOfTheKind)
{
    const std::string name = kind().name;
    add_acl("a1");
    set(match("m1", "10", "acl"), "a1");
    ASSERT_EQ(commit(), "committed");
    erase(acl("a1"));
    EXPECT_EQ(commit_in_vain(), acl("a1") + ": Cannot delete an ACL when used by a " + name +
                                    ".\n  Please remove ACL from associated " + name +
                                    " first.\n  Used by " + name + " m1, entry 10. (acl)\n");
}

TEST_F(Acls, TellTheFirstTenOfTheirUsers)
{
    const MapKind &nat = *find_map_kind("nmap");
    add_acl("a1");
    set(matched(nat, "n1", "5", "acl"), "a1");
    for (unsigned i = 1; i <= 9; ++i) {
        add_entry("m1", std::to_string(i), "a1");
    }
    ASSERT_EQ(commit(), "committed");
    std::string expected = acl("a1") + ": Cannot delete an ACL when used by a route-map.\n"
                                       "  Please remove ACL from associated route-map first.";
    for (unsigned i = 1; i <= 9; ++i) {
        expected += "\n  Used by route-map m1, entry " + std::to_string(i) + ".";
    }
    erase(acl("a1"));
    EXPECT_EQ(commit_in_vain(), expected + "\n  Used by nat-map n1, entry 5. (acl)\n");

    for (unsigned i = 10; i <= 12; ++i) {
        add_entry("m1", std::to_string(i), "a1");
    }
    ASSERT_EQ(commit(), "committed");
    erase(acl("a1"));
    EXPECT_EQ(commit_in_vain(),
              expected + "\n  Used by route-map m1, entry 10.\n  And 3 more. (acl)\n");
}

TEST_F(Acls, DoNotCountAmongTheirUsersWhoLetGoOfThem)
{
    add_acl("a1");
    add_entry("m1", "10", "a1");
    add_entry("m1", "20", "a1");
    ASSERT_EQ(commit(), "committed");
    erase(acl("a1"));
    erase(rmap("m1/prio/10/match/0/acl"));
    EXPECT_EQ(commit_in_vain(), acl("a1") + ": Cannot delete an ACL when used by a route-map.\n"
                                            "  Please remove ACL from associated route-map first.\n"
                                            "  Used by route-map m1, entry 20. (acl)\n");
}

TEST_F(Acls, GoThoughADefaultEntryNamesThem)
{
    add_acl("a1");
    add_entry("m1", "65535", "a1");
    ASSERT_EQ(commit(), "committed");
    erase(acl("a1"));
    EXPECT_EQ(commit(), "committed");
}

TEST_F(Acls, AreCheckedAtAnyDepth)
{
    set(acl("a1/b/c/d/e/f/g/h/i/j/k/l/m/n"), "x");
    EXPECT_EQ(commit(), "committed");
    EXPECT_EQ(value(acl("a1")), "string a1");
    set(acl("a1/rmap/m1/prio/99/a/b/c/d/e/f"), "x");
    EXPECT_EQ(commit_in_vain(), acl("a1/rmap/m1/prio/99/a/b/c/d/e/f") +
                                    ": references to ACLs are kept by the daemon: set the ACL of "
                                    "a map's entry (acl)\n");
    set(acl("\\*/b/c/d/e/f/g/h/i/j"), "x");
    EXPECT_EQ(commit_in_vain(), acl("\\*/b/c/d/e/f/g/h/i/j") +
                                    ": an ACL's name must not hold \"*\": choose another name "
                                    "(acl)\n");
}

TEST_F(Acls, HaveNoReferencesThatUsersWrite)
{
    add_acl("a1");
    add_acl("a2");
    add_entry("m1", "10", "a1");
    ASSERT_EQ(commit(), "committed");
    struct Row {
        std::string node;
        const char *advice;
    };
    const Row rows[] = {
        {acl("a1/rmap/m1/prio/20"), "set the ACL of route-map m1, entry 20"},
        {acl("a2/rmap/m1/prio/10"), "set the ACL of route-map m1, entry 10"},
        {acl("a1/rmap/m1/prio/65535"), "set the ACL of route-map m1, entry 65535"},
    };
    for (const auto &[node, advice] : rows) {
        set(node, bt_uint32, node.substr(node.rfind('/') + 1));
        EXPECT_EQ(commit_in_vain(), node + kept + advice + " (acl)\n");
    }
    set(acl("a1/rmap/m1/prio/10"), bt_uint32, "11");
    EXPECT_EQ(commit_in_vain(),
              acl("a1/rmap/m1/prio/10") + kept + "set the ACL of route-map m1, entry 10 (acl)\n");
    for (const char *node : {"a1/rmap", "a1/omap/m1", "a1/smap/m1/prio", "a1/secmap/m1/prio/10/x",
                             "a1/nmap/m1/other/10"}) {
        set(acl(node), "x");
        EXPECT_EQ(commit_in_vain(), acl(node) + kept + "set the ACL of a map's entry (acl)\n");
    }
    EXPECT_THAT(records(), ElementsAre("a1/rmap/m1/10"));
}

TEST_F(Acls, HaveNoReferenceToADefaultEntryFromUsers)
{
    add_acl("a1");
    add_entry("m1", "65535", "a1");
    set(acl("a1/rmap/m1/prio/65535"), bt_uint32, "65535");
    EXPECT_EQ(commit_in_vain(), acl("a1/rmap/m1/prio/65535") + kept +
                                    "set the ACL of route-map m1, entry 65535 (acl)\n");
}

TEST_F(Acls, KeepTheReferencesThatCount)
{
    add_acl("a1");
    add_entry("m1", "10", "a1");
    add_entry("m1", "20", "a1");
    ASSERT_EQ(commit(), "committed");
    erase(acl("a1/rmap"));
    const std::string advice =
        " names this ACL; to replace the ACL, delete its entries and not itself (acl)\n";
    EXPECT_EQ(commit_in_vain(), acl("a1/rmap/m1/prio/10") + kept + "route-map m1, entry 10" +
                                    advice + acl("a1/rmap/m1/prio/20") + kept +
                                    "route-map m1, entry 20" + advice);
    erase(rmap("m1/prio/10/match/0/acl"));
    erase(acl("a1/rmap/m1/prio/10"));
    EXPECT_EQ(commit(), "committed") << "it does not count any more";
    EXPECT_THAT(records(), ElementsAre("a1/rmap/m1/20"));
}

} // namespace
