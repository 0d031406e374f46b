// Policy maps and ACLs through the real daemon: what refuses a commit, the references from ACLs,
// and the upgrade of a legacy configuration.

#include "tests/e2e/harness.h"

#include <csignal>

#include <algorithm>
#include <string>

namespace
{

using namespace e2e;
using testing::AllOf;
using testing::Contains;
using testing::ElementsAre;
using testing::HasSubstr;
using testing::StartsWith;

const std::string acls = "/ov/tunneld/acl/config";
const std::string route_maps = "/ov/tunneld/route_map/config/map";
const std::string sample = E2E_SAMPLES "/legacy.db";

std::string entry_match(const std::string &map, const std::string &priority)
{
    return route_maps + "/" + map + "/prio/" + priority + "/match/0";
}

class Maps : public E2eTest
{
  protected:
    void load_and_commit(const std::string &text)
    {
        ASSERT_EQ(ovctl({"load", "-"}, text).exit_code, 0);
        const Outcome outcome = ovctl({"commit"});
        ASSERT_EQ(outcome.exit_code, 0) << outcome.err;
    }

    /// Route map "wan" with an entry that matches by the ACL "servers" and one by a match string.
    void add_route_map()
    {
        load_and_commit(acls + "/servers,string,servers\n" + entry_match("wan", "10") +
                        "/acl,string,servers\n" + entry_match("wan", "20") +
                        "/matchstr,string,protocol:tcp\n");
    }

    /// Values of the nodes below a name, "NAME TYPE VALUE".
    std::vector<std::string> nodes(const std::string &below)
    {
        return lines_of(ovctl({"get", below, "--subtree"}).out);
    }

    std::string match_string(const std::string &kind, const std::string &entry)
    {
        const std::string node =
            "/ov/tunneld/" + kind + "/config/map/" + entry + "/match/0/matchstr";
        const std::string out = ovctl({"get", node}).out;
        const std::string before = node + " string ";
        return out.starts_with(before) ? out.substr(before.size()) : out;
    }
};

TEST_F(Maps, RecordTheEntryThatNamesAnAcl)
{
    start();
    add_route_map();
    EXPECT_THAT(nodes(acls + "/servers"), Contains(acls + "/servers/rmap/wan/prio/10 uint32 10"));
}

TEST_F(Maps, KeepTheirAclFromBeingDeleted)
{
    start();
    add_route_map();
    ASSERT_EQ(ovctl({"delete", acls + "/servers"}).exit_code, 0);
    const Outcome outcome = ovctl({"commit"});
    EXPECT_EQ(outcome.exit_code, 1);
    EXPECT_THAT(outcome.err, AllOf(StartsWith("mgmtd refused the commit:\n"),
                                   HasSubstr("Cannot delete an ACL when used by a route-map."),
                                   HasSubstr("Please remove ACL from associated route-map first."),
                                   HasSubstr("Used by route-map wan, entry 10.")));
    ASSERT_EQ(ovctl({"discard"}).exit_code, 0);
    ASSERT_EQ(ovctl({"delete", route_maps + "/wan/prio/10"}).exit_code, 0);
    ASSERT_EQ(ovctl({"delete", acls + "/servers"}).exit_code, 0);
    EXPECT_EQ(ovctl({"commit"}).exit_code, 0);
    EXPECT_EQ(ovctl({"get", acls + "/servers"}).exit_code, 1);
}

TEST_F(Maps, AreTenOfAKind)
{
    start();
    std::string text;
    for (int i = 1; i <= 10; ++i) {
        text += entry_match("m" + std::to_string(i), "10") + "/matchstr,string,any\n";
    }
    load_and_commit(text);
    ASSERT_EQ(ovctl({"set", entry_match("m11", "10") + "/matchstr", "string", "any"}).exit_code, 0);
    const Outcome outcome = ovctl({"commit"});
    EXPECT_EQ(outcome.exit_code, 1);
    EXPECT_THAT(outcome.err, HasSubstr("Cannot add map because maximum reached."));
    EXPECT_EQ(ovctl({"get", route_maps + "/m11"}).exit_code, 1);
}

TEST_F(Maps, TakeNoBadMatchString)
{
    start();
    const std::string node = entry_match("wan", "10") + "/matchstr";
    ASSERT_EQ(ovctl({"set", node, "string", "protocol:tcp,dst_port:99999"}).exit_code, 0);
    EXPECT_EQ(ovctl({"commit"}),
              refused("mgmtd refused the commit:\n  " + node +
                      ": Invalid match string protocol:tcp,dst_port:99999 - pair "
                      "\"dst_port:99999\": the value must be a port from 0 to 65535 or a range "
                      "such as 8000-8080 (route-map)\n"));
}

TEST_F(Maps, OfALegacyConfigurationAreUpgraded)
{
    install_samples();
    start({"--model", "branch-100"});
    const std::string before = read_file(sample).value();
    const Outcome outcome = ovctl({"upgrade", sample});
    ASSERT_EQ(outcome.exit_code, 0) << outcome.err;
    EXPECT_EQ(read_file(sample), before);
    const std::vector<std::string> lines = lines_of(outcome.out);
    EXPECT_EQ(
        std::ranges::count_if(
            lines, [](const std::string &line) { return line.find("/matchstr ") != line.npos; }),
        65);
    ASSERT_GE(lines.size(), 2U);
    EXPECT_EQ(lines[lines.size() - 2], "65 entries converted to match strings, 8 by ACL as before");
    EXPECT_THAT(lines.back(), StartsWith("commit 2: "));

    EXPECT_EQ(match_string("route_map", "branches/prio/20"),
              "src_ip:10.0.0.0/8,dst_ip:172.16.0.0/12\n");
    EXPECT_EQ(match_string("route_map", "branches/prio/60"),
              "src_ip:2001:db8:1::/48,dst_ip:2001:db8:2::/48,src_port:1024-65535,dst_port:22,"
              "protocol:tcp\n");
    EXPECT_EQ(match_string("route_map", "branches/prio/70"),
              "application:voice,vlan:wan0,dscp:ef\n");
    EXPECT_EQ(match_string("route_map", "branches/prio/80"), "protocol:icmp\n");
    EXPECT_EQ(match_string("opt_map", "files/prio/20"),
              "src_ip:0.0.0.0/0,dst_ip:10.20.0.0/14,dst_port:139,protocol:tcp\n");
    EXPECT_EQ(match_string("qos_map", "guests/prio/40"), "src_ip:::/0,dst_ip:::/0,dscp:0\n");
    EXPECT_EQ(match_string("stats_map", "ports/prio/30"), "dst_port:161-162,protocol:udp\n");
    EXPECT_EQ(match_string("nat_map", "inside/prio/30"),
              "src_ip:0.0.0.0/0,dst_ip:203.0.113.9/32\n");
    EXPECT_EQ(match_string("nat_map", "outside/prio/65535"), "any\n");
    // Matched by ACL: no match string.
    EXPECT_EQ(ovctl({"get", entry_match("branches", "10") + "/matchstr"}).exit_code, 1);
}

TEST_F(Maps, OfALegacyConfigurationGetTheirReferences)
{
    install_samples();
    start({"--model", "branch-100"});
    ASSERT_EQ(ovctl({"upgrade", sample}).exit_code, 0);
    (void)stop(SIGKILL);
    start({"--model", "branch-100"});
    std::vector<std::string> references;
    for (const std::string &line : nodes(acls)) {
        if (line.find("/prio/") != std::string::npos) {
            references.push_back(line.substr(acls.size() + 1));
        }
    }
    EXPECT_THAT(
        references,
        ElementsAre(
            "branches/qmap/classes/prio/90 uint32 90", "branches/rmap/branches/prio/10 uint32 10",
            "guests/nmap/inside/prio/50 uint32 50", "guests/omap/web/prio/60 uint32 60",
            "guests/qmap/guests/prio/10 uint32 10", "servers/omap/files/prio/40 uint32 40",
            "servers/rmap/datacentre/prio/10 uint32 10", "servers/smap/ports/prio/100 uint32 100"));
    EXPECT_EQ(ovctl({"show", "references", "--check"}).exit_code, 0);
}

TEST_F(Maps, ThatCannotBeUpgradedLeaveEverythingAsItIs)
{
    start();
    const std::string text =
        "/a,string,x\n" + entry_match("wan", "10") + "/ipver,string,ipv4\n" +
        entry_match("wan", "10") + "/source/addr/ipv4/static/ipaddr,ipv4addr,10.0.0.0\n" +
        entry_match("wan", "10") + "/source/addr/ipv4/static/mask_len,string,255.0.255.0\n";
    write_file(dir_ / "legacy.db", text);
    const std::string file = (dir_ / "legacy.db").string();
    EXPECT_EQ(ovctl({"upgrade", file}),
              refused("mgmtd refused the file " + file + ":\n  " + entry_match("wan", "10") +
                      ": an IPv4 address needs a mask such as 255.255.0.0 or a length such as 16, "
                      "and source/addr/ipv4/static/mask_len is \"255.0.255.0\" (error code 14020, "
                      "type conversion failed)\n"));
    EXPECT_EQ(read_file(file), text);
    EXPECT_EQ(ovctl({"diff"}), done());
    EXPECT_EQ(ovctl({"get", "/a"}).exit_code, 1);
    EXPECT_EQ(ovctl({"upgrade", file + ".missing"}).exit_code, 2);
}

} // namespace
