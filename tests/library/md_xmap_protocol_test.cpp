// Protocols that users give by number or name, and the table of the names.
#include "orvale/md_xmap_common.h"
#include "orvale/opkt_proto.h"
#include "tests/library/library_test.h"
#include "tests/library/map_changes.h"

#include <iterator>
#include <string>
#include <vector>

using namespace ovtest;
using testing::ElementsAre;
using testing::IsEmpty;

namespace
{

// The names of 0 to 137.
constexpr const char *proper_names[] = {"ip",
                                        "icmp",
                                        "igmp",
                                        "ggp",
                                        "ipip4",
                                        "st",
                                        "tcp",
                                        "cbt",
                                        "egp",
                                        "igp",
                                        "bbn-rcc-mon",
                                        "nvp2",
                                        "pup",
                                        "argus",
                                        "emcon",
                                        "xnet",
                                        "chaos",
                                        "udp",
                                        "mux",
                                        "dcn-meas",
                                        "hmp",
                                        "prm",
                                        "xns-idp",
                                        "trunk-1",
                                        "trunk-2",
                                        "leaf-1",
                                        "leaf-2",
                                        "rdp",
                                        "irtp",
                                        "iso-tp4",
                                        "netblt",
                                        "mfe-nsp",
                                        "merit-inp",
                                        "sep",
                                        "third-pc",
                                        "idpr",
                                        "xtp",
                                        "ddp",
                                        "idpr-cmtp",
                                        "tp++",
                                        "il",
                                        "ip-v6",
                                        "sdrp",
                                        "ipv6-route",
                                        "ipv6-frag",
                                        "idrp",
                                        "rsvp",
                                        "gre",
                                        "mhrp",
                                        "bna",
                                        "esp",
                                        "ah",
                                        "i-nlsp",
                                        "swipe",
                                        "narp",
                                        "ip-mobility",
                                        "tlsp",
                                        "skip",
                                        "icmpv6",
                                        "ipv6-nonxt",
                                        "ipv6-opts",
                                        "priv-host",
                                        "cftp",
                                        "priv-net",
                                        "sat-expak",
                                        "kryptolan",
                                        "rvd",
                                        "ippc",
                                        "priv-distfile",
                                        "sat-mon",
                                        "visa",
                                        "ipcv",
                                        "cpnx",
                                        "cphb",
                                        "wsn",
                                        "pvp",
                                        "br-sat-mon",
                                        "sun-nd",
                                        "wb-mon",
                                        "wb-expak",
                                        "iso-ip",
                                        "vmtp",
                                        "secure-vmtp",
                                        "vines",
                                        "ttp",
                                        "nsfnet-igp",
                                        "dgp",
                                        "tcf",
                                        "eigrp",
                                        "ospf",
                                        "sprite-rpc",
                                        "larp",
                                        "mtp",
                                        "ax-25",
                                        "ipip",
                                        "micp",
                                        "scc-sp",
                                        "etherip",
                                        "encap",
                                        "priv-encrypt",
                                        "gmtp",
                                        "ifmp",
                                        "pnni",
                                        "pim",
                                        "aris",
                                        "scps",
                                        "qnx",
                                        "active-networks",
                                        "ip-comp",
                                        "snp",
                                        "compaq-peer",
                                        "ipx-in-ip",
                                        "vrrp",
                                        "pgm",
                                        "priv-0-hop",
                                        "l2tp",
                                        "ddx",
                                        "iatp",
                                        "schedule-transfer",
                                        "srp",
                                        "uti",
                                        "smp",
                                        "sm",
                                        "ptp",
                                        "isis",
                                        "fire",
                                        "crtp",
                                        "crudp",
                                        "sscopmce",
                                        "iplt",
                                        "sps",
                                        "pipe",
                                        "sctp",
                                        "fc",
                                        "rsvp-e2e-ignore",
                                        "mobility-header",
                                        "udplite",
                                        "mpls"};

std::string expected_name(unsigned number)
{
    if (number < std::size(proper_names)) {
        return proper_names[number];
    }
    if (number == 255) {
        return "raw";
    }
    return "ipproto-" + std::to_string(number == 199 ? 198 : number);
}

TEST(ProtocolTable, HasTheNumbersInOrderWithTheirNames)
{
    for (unsigned number = 0; number < 256; ++number) {
        EXPECT_EQ(opkt_proto_map[number].lesm_enum, number);
        EXPECT_EQ(opkt_proto_map[number].lesm_string, expected_name(number)) << number;
    }
}

TEST(ProtocolTable, EndsBehindThem)
{
    EXPECT_EQ(std::size(opkt_proto_map), 257U);
    EXPECT_EQ(opkt_proto_map[256].lesm_enum, 0U);
    EXPECT_EQ(opkt_proto_map[256].lesm_string, nullptr);
}

TEST(ProtocolTable, CallsNumber199ByTheNameOf198)
{
    EXPECT_STREQ(opkt_proto_map[197].lesm_string, "ipproto-197");
    EXPECT_STREQ(opkt_proto_map[198].lesm_string, "ipproto-198");
    EXPECT_STREQ(opkt_proto_map[199].lesm_string, "ipproto-198");
    EXPECT_STREQ(opkt_proto_map[200].lesm_string, "ipproto-200");
}

constexpr char function[] = "md_validate_proto";

class Protocol : public LibraryTest
{
  protected:
    // Status and flag, which was the opposite of what is answered most: "0 yes".
    std::string check(const char *proto)
    {
        commit_.commit.refusals.clear();
        tbool found = false;
        const int status = in_library(md_validate_proto, &commit_.dbinfo, proto, &found);
        return std::to_string(status) + (found ? " yes" : " no");
    }

    // The one refusal of the last check, without the code.
    std::string refusal()
    {
        const std::vector<std::string> &refusals = commit_.commit.refusals;
        return refusals.size() == 1 ? refusals.front() : std::to_string(refusals.size());
    }

    MapCommit commit_;
};

TEST_F(Protocol, NumbersFrom1To255AreAccepted)
{
    for (int number = 1; number < 256; ++number) {
        EXPECT_EQ(check(std::to_string(number).c_str()), "0 yes") << number;
    }
    EXPECT_EQ(num_calls(Operation::lc_string_to_enum), 0U);
    EXPECT_EQ(refusal(), "0");
    EXPECT_THAT(log_lines(), IsEmpty());
}

TEST_F(Protocol, AllNamesOfTheTableAreAccepted)
{
    for (unsigned number = 0; number < 256; ++number) {
        EXPECT_EQ(check(expected_name(number).c_str()), "0 yes") << number;
    }
    EXPECT_EQ(refusal(), "0");
    EXPECT_THAT(log_lines(), IsEmpty());
}

TEST_F(Protocol, OtherNumbersAreRefused)
{
    EXPECT_EQ(check("256"), "0 no");
    EXPECT_EQ(refusal(), "1 Invalid protocol number 256.\n");
    EXPECT_EQ(check("-1"), "0 no");
    EXPECT_EQ(refusal(), "1 Invalid protocol number -1.\n");
    EXPECT_EQ(check("-5"), "0 no");
    EXPECT_EQ(refusal(), "1 Invalid protocol number -5.\n");
    EXPECT_EQ(check("2147483647"), "0 no");
    EXPECT_EQ(refusal(), "1 Invalid protocol number 2147483647.\n");
    EXPECT_EQ(num_calls(Operation::lc_string_to_enum), 0U);
    EXPECT_THAT(log_lines(), IsEmpty());
}

TEST_F(Protocol, ZeroIsLookedUpAsAName)
{
    EXPECT_EQ(check("0"), "0 no");
    EXPECT_EQ(refusal(), "1 Unknown protocol 0.\n");
    EXPECT_THAT(calls_of(Operation::lc_string_to_enum),
                ElementsAre("lc_string_to_enum(*, \"0\", *)"));
    for (const char *text : {"00", "-0", "+0", "0x11", "0tcp"}) {
        EXPECT_EQ(check(text), "0 no");
        EXPECT_EQ(refusal(), "1 Unknown protocol " + std::string(text) + ".\n");
    }
}

TEST_F(Protocol, UnknownNamesAreRefused)
{
    for (const char *text : {"ipproto-199", "", "TCP", " tcp", "tcp ", "hopopt", "x6", "%s"}) {
        EXPECT_EQ(check(text), "0 no") << text;
        EXPECT_EQ(refusal(), "1 Unknown protocol " + std::string(text) + ".\n");
    }
    EXPECT_THAT(log_lines(), IsEmpty());
}

TEST_F(Protocol, BlanksAndASignMayStandBeforeANumber)
{
    for (const char *text : {" 6", "\t\n 6", "+6", "  +255"}) {
        EXPECT_EQ(check(text), "0 yes") << text;
    }
    EXPECT_EQ(check(" -5"), "0 no");
    EXPECT_EQ(refusal(), "1 Invalid protocol number -5.\n");
}

TEST_F(Protocol, WhatFollowsANumberDoesNotMatter)
{
    for (const char *text : {"17abc", "6 7", "1.5", "255tcp", "010"}) {
        EXPECT_EQ(check(text), "0 yes") << text;
    }
    EXPECT_EQ(check("256abc"), "0 no");
    EXPECT_EQ(refusal(), "1 Invalid protocol number 256.\n");
}

TEST_F(Protocol, OnlyTheLow32BitsOfANumberCount)
{
    EXPECT_EQ(check("4294967302"), "0 yes");  // 2^32 + 6
    EXPECT_EQ(check("-4294967290"), "0 yes"); // 6 - 2^32
    EXPECT_EQ(check("4294967295"), "0 no");
    EXPECT_EQ(refusal(), "1 Invalid protocol number -1.\n");
    EXPECT_EQ(check("2147483648"), "0 no");
    EXPECT_EQ(refusal(), "1 Invalid protocol number -2147483648.\n");
    EXPECT_EQ(check("4294967296"), "0 no");
    EXPECT_EQ(refusal(), "1 Unknown protocol 4294967296.\n");
}

// The largest number of 64 bits stands for all above it, and the smallest for all below.
TEST_F(Protocol, ANumberBeyond64BitsIsTheNearest)
{
    EXPECT_EQ(check("99999999999999999999"), "0 no");
    EXPECT_EQ(refusal(), "1 Invalid protocol number -1.\n");
    EXPECT_EQ(check("-99999999999999999999"), "0 no");
    EXPECT_EQ(refusal(), "1 Unknown protocol -99999999999999999999.\n");
}

TEST_F(Protocol, ALongTextIsReportedWhole)
{
    const std::string text(600, 'x');
    EXPECT_EQ(check(text.c_str()), "0 no");
    EXPECT_EQ(refusal(), "1 Unknown protocol " + text + ".\n");
}

TEST_F(Protocol, NullArgumentsAreRefused)
{
    tbool found = false;
    md_dbinfo without_commit = commit_.dbinfo;
    without_commit.commit = nullptr;
    EXPECT_EQ(in_library(md_validate_proto, nullptr, "6", &found), 14001);
    EXPECT_EQ(in_library(md_validate_proto, &without_commit, "6", &found), 14001);
    EXPECT_EQ(in_library(md_validate_proto, &commit_.dbinfo, "6", nullptr), 14001);
    EXPECT_FALSE(found);
    // The flag is set before the text is looked at.
    EXPECT_EQ(in_library(md_validate_proto, &commit_.dbinfo, nullptr, &found), 14001);
    EXPECT_TRUE(found);
    const std::string line = error_line("md_xmap_common", function, "Unexpected NULL");
    EXPECT_THAT(log_lines(), ElementsAre(line, line, line, line));
    EXPECT_EQ(num_calls(Operation::bail_debug), 4U);
    EXPECT_EQ(refusal(), "0");
}

TEST_F(Protocol, TheFlagStaysTrueWhenTheRefusalCannotBeReported)
{
    arm({.operation = Operation::md_commit_set_return_status_msg_fmt, .code = 14002});
    EXPECT_EQ(check("256"), "14002 yes");
    arm({.operation = Operation::md_commit_set_return_status_msg_fmt, .code = 13999});
    EXPECT_EQ(check("nothing"), "13999 yes");
    EXPECT_THAT(log_lines(),
                ElementsAre(error_line("md_xmap_common", function,
                                       "Error code 14002 (assertion failed) returned"),
                            error_line("md_xmap_common", function, "Error code 13999 returned")));
}

TEST_F(Protocol, ACancelledRefusalIsSilent)
{
    for (const char *text : {"256", "nothing"}) {
        arm({.operation = Operation::md_commit_set_return_status_msg_fmt, .code = 14120});
        EXPECT_EQ(check(text), "14120 yes");
        EXPECT_EQ(num_calls(Operation::bail_quiet_debug), 1U);
    }
    EXPECT_THAT(log_lines(), IsEmpty());
}

TEST_F(Protocol, AnotherFailureOfTheLookUpIsPassedUp)
{
    arm({.operation = Operation::lc_string_to_enum, .code = 14004});
    EXPECT_EQ(check("tcp"), "14004 yes");
    EXPECT_EQ(refusal(), "0");
    EXPECT_THAT(log_lines(), ElementsAre(error_line("md_xmap_common", function,
                                                    "Error code 14004 (item not found) returned")));
}

TEST_F(Protocol, AConversionThatFailsIsAnUnknownName)
{
    arm({.operation = Operation::lc_string_to_enum, .code = 14020});
    EXPECT_EQ(check("tcp"), "0 no");
    EXPECT_EQ(refusal(), "1 Unknown protocol tcp.\n");
    EXPECT_THAT(log_lines(), IsEmpty());
}

} // namespace
