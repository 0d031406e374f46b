// The tunnels of a configuration and what the library's allocator and cache make of them:
// host/modules/tunnels.h and what stands behind it.

#include "host/modules/tunnels.h"

#include "framework/sys_time.h"
#include "host/modules/tunnel_lookup.h"
#include "orvale/md_tunbin_ht.h"
#include "orvale/md_tunneld_tunnel_common.h"
#include "tests/commit/support.h"
#include "tests/mgmtd/tunnel_fixture.h"

namespace
{

using namespace ovhost;
using namespace mgmtd_test;
using testing::ElementsAre;
using testing::IsEmpty;

constexpr uint32 none = 65535;

class Tunnels : public TunnelTest
{
  protected:
    /// Adds so many tunnels, "p0" and so on, in one commit.
    void add_many(unsigned first, unsigned count)
    {
        for (unsigned i = first; i < first + count; ++i) {
            add("p" + std::to_string(i));
        }
    }

    void remove_many(unsigned first, unsigned count)
    {
        for (unsigned i = first; i < first + count; ++i) {
            remove("p" + std::to_string(i));
        }
    }

    /// Lines of the module, "LEVEL TEXT".
    std::vector<std::string> module_log() const
    {
        std::vector<std::string> texts;
        for (const test::LoggedLine &line : log_.lines) {
            if (line.unit == "tunnels") {
                texts.push_back(log_level_word(line.level) + " " + line.text);
            }
        }
        return texts;
    }
};

TEST_F(Tunnels, GetIdsInTheOrderOfTheirNames)
{
    add("b");
    add("a", "x");
    add("10");
    add("9");
    ASSERT_EQ(commit(), "committed");
    EXPECT_EQ(stored("10"), "uint16 0, string 10");
    EXPECT_EQ(stored("9"), "uint16 1, string 9");
    EXPECT_EQ(stored("a"), "uint16 2, string x");
    EXPECT_EQ(stored("b"), "uint16 3, string b");
    EXPECT_THAT(bound(), ElementsAre("10 0", "9 1", "a 2", "b 3"));
    EXPECT_STREQ(md_tunbin_ht_get_name_by_id(2), "a");
    EXPECT_EQ(md_tunbin_ht_get_id_by_name("a"), 2U);
    EXPECT_EQ(md_tunbin_ht_get_id_by_alias("x"), 2U);
    EXPECT_EQ(md_tunbin_ht_get_id_by_alias("a"), none);
    EXPECT_EQ(md_tunbin_ht_get_id_by_alias("b"), 3U) << "the name stands in for an alias";
}

TEST_F(Tunnels, AreCompletedByTheCommitThatAddsThem)
{
    add("a");
    set(tunnel("a", "remote"), bt_ipaddr, "192.0.2.1");
    const CommitReport report = configuration_->commit(daemon_note(""));
    EXPECT_EQ(report.changes.size(), 4U) << "the tunnel, its remote, and what the module adds";
    EXPECT_THAT(configuration_->candidate().pending(configuration_->running()), IsEmpty());
}

TEST_F(Tunnels, GetNoIdFromARefusedCommit)
{
    add("a");
    set("/ov/tunneld/system/config/mode", bt_string, "brigde");
    EXPECT_EQ(commit_in_vain(), "/ov/tunneld/system/config/mode: must be bridge, router or server, "
                                "not \"brigde\" (schema)\n");
    EXPECT_EQ(md_get_total_tunnels(), 0);
    EXPECT_FALSE(md_tunbin_ht_id_has_tunnel(0));
    EXPECT_EQ(md_tunbin_ht_get_id_by_name("a"), none);
    EXPECT_EQ(stored("a"), "none, none");
    add("b");
    ASSERT_EQ(commit(), "committed");
    EXPECT_THAT(bound(), ElementsAre("b 0"));
}

TEST_F(Tunnels, GetNoIdFromADryRun)
{
    add("a");
    const CheckReport report = configuration_->check();
    EXPECT_TRUE(report.accepted());
    EXPECT_EQ(report.changes.size(), 3U);
    EXPECT_EQ(md_get_total_tunnels(), 0);
    EXPECT_FALSE(md_tunbin_ht_id_has_tunnel(0));
}

TEST_F(Tunnels, GetNoIdWhenTheStoreFails)
{
    TunnelsModule module;
    commit_test::Bench bench({&module});
    bench.engine.start_modules();
    bench.store.failure = "the disk is full";
    Candidate candidate = bench.candidate({{tunnel("a"), "a"}});
    EXPECT_EQ(bench.engine.commit(candidate, {}).outcome, CommitOutcome::not_stored);
    EXPECT_EQ(md_get_total_tunnels(), 0);
    EXPECT_FALSE(md_tunbin_ht_id_has_tunnel(0));
    bench.store.failure.reset();
    EXPECT_EQ(bench.engine.commit(candidate, {}).outcome, CommitOutcome::committed);
    EXPECT_THAT(bound(), ElementsAre("a 0"));
}

TEST_F(Tunnels, AreRefusedUnderANameThatCannotBe)
{
    const std::string name_64(64, 'n');
    const std::string name_65(65, 'n');
    const std::string name_300(300, 'n');
    for (const std::string &name : {name_64, name_65, name_300, std::string("default")}) {
        add(name);
    }
    set(tunnel("x"), bt_string, "y");
    EXPECT_EQ(commit_in_vain(),
              tunnel("default") +
                  ": \"default\" is reserved and never holds an ID: choose another name "
                  "(tunnels)\n" +
                  tunnel(name_65) + ": a tunnel's name is 1 to 64 bytes long, not 65 (tunnels)\n" +
                  tunnel(name_300) +
                  ": a tunnel's name is 1 to 64 bytes long, not 300 (tunnels)\n" + tunnel("x") +
                  ": must hold the tunnel's name, \"x\" (tunnels)\n");
    add(name_64);
    add("default2");
    add("a/b \xff");
    ASSERT_EQ(commit(), "committed");
    EXPECT_EQ(md_tunbin_ht_get_id_by_name(name_64.c_str()), 2U);
    EXPECT_EQ(md_tunbin_ht_get_id_by_name("a/b \xff"), 0U);
    EXPECT_EQ(value(tunnel(name_64)), "string " + name_64);
}

TEST_F(Tunnels, AreRefusedWithAnAliasThatCannotBe)
{
    add("a", std::string(256, 'x'));
    add("b", std::string(300, 'x'));
    add("c");
    set(tunnel("c", "alias"), bt_string, "");
    EXPECT_EQ(commit_in_vain(),
              tunnel("a", "alias") + ": must be 1 to 255 bytes long, not 256 (tunnels)\n" +
                  tunnel("b", "alias") + ": must be 1 to 255 bytes long, not 300 (tunnels)\n" +
                  tunnel("c", "alias") + ": must be 1 to 255 bytes long, not 0 (tunnels)\n");
    add("a", std::string(255, 'x'));
    ASSERT_EQ(commit(), "committed");
    EXPECT_EQ(md_tunbin_ht_get_id_by_alias(std::string(255, 'x').c_str()), 0U);
}

TEST_F(Tunnels, HaveFieldsOfTheirTypes)
{
    set(tunnel("a"), bt_hostname, "a");
    set(tunnel("a", "alias"), bt_uint8, "5");
    set(tunnel("a", "bandwidth"), bt_uint16, "5");
    set(tunnel("a", "id"), bt_uint32, "5");
    set(tunnel("a", "remote"), bt_string, "192.0.2.1");
    EXPECT_EQ(commit_in_vain(), tunnel("a") + ": must be of type string (schema)\n" +
                                    tunnel("a", "alias") + ": must be of type string (schema)\n" +
                                    tunnel("a", "bandwidth") +
                                    ": must be of type uint32 (schema)\n" + tunnel("a", "id") +
                                    ": must be of type uint16 (schema)\n" + tunnel("a", "remote") +
                                    ": must be of type ipaddr (schema)\n");
    set(tunnel("a", "id"), bt_string, "five");
    add("a");
    EXPECT_EQ(commit_in_vain(), tunnel("a", "id") + ": must be of type uint16 (schema)\n");
    EXPECT_EQ(md_get_total_tunnels(), 0);
}

TEST_F(Tunnels, ComeAndGoWithTheirFields)
{
    set(tunnel("a", "bandwidth"), bt_uint32, "5");
    set(tunnel("b", "colour"), bt_string, "red");
    EXPECT_EQ(commit_in_vain(),
              tunnel("a", "bandwidth") +
                  ": there is no tunnel \"a\": set /ov/tunneld/tunnel/config/a to its name first "
                  "(tunnels)\n" +
                  tunnel("b", "colour") +
                  ": there is no tunnel \"b\": set /ov/tunneld/tunnel/config/b to its name first "
                  "(tunnels)\n");
    add("a");
    ASSERT_EQ(commit(), "committed");
    remove("a");
    set(tunnel("a", "alias"), bt_string, "a");
    EXPECT_EQ(commit_in_vain(), tunnel("a") + ": the tunnel is deleted but its alias is not: "
                                              "delete them together, or keep both (tunnels)\n");
    EXPECT_THAT(bound(), ElementsAre("a 0"));
}

TEST_F(Tunnels, MayBringAnIdThatIsFree)
{
    add("a");
    add("b");
    set_id("b", 0);
    add("c");
    set_id("c", 1023);
    ASSERT_EQ(commit(), "committed");
    EXPECT_THAT(bound(), ElementsAre("a 1", "b 0", "c 1023")) << "nobody else is given b's";
}

TEST_F(Tunnels, MayNotBringAnIdThatCannotBe)
{
    add("a");
    ASSERT_EQ(commit(), "committed");
    add("b");
    set_id("b", 0);
    add("c");
    set_id("c", 1024);
    add("d");
    set_id("d", 65535);
    EXPECT_EQ(commit_in_vain(),
              tunnel("b", "id") + ": ID 0 belongs to tunnel \"a\" (tunnels)\n" + tunnel("c", "id") +
                  ": ID 1024 is out of range: tunnels have IDs from 0 to 1023 (tunnels)\n" +
                  tunnel("d", "id") +
                  ": ID 65535 is out of range: tunnels have IDs from 0 to 1023 (tunnels)\n");
    add("b");
    set_id("b", 7);
    add("c");
    set_id("c", 7);
    EXPECT_EQ(commit_in_vain(), ": tunnels \"b\" and \"c\" ask for one ID, 7 (tunnels)\n");
    EXPECT_THAT(bound(), ElementsAre("a 0"));
}

TEST_F(Tunnels, KeepTheirIds)
{
    add("a");
    ASSERT_EQ(commit(), "committed");
    set_id("a", 5);
    EXPECT_EQ(commit_in_vain(),
              tunnel("a", "id") +
                  ": must stay 0: a tunnel keeps its ID as long as it is there (tunnels)\n");
    erase(tunnel("a", "id"));
    EXPECT_EQ(commit(), "unchanged");
    remove("a");
    add("a");
    EXPECT_EQ(commit(), "unchanged") << "added again by the commit that deletes it";
    remove("a");
    add("a", "x");
    EXPECT_EQ(commit(), "committed");
    EXPECT_EQ(stored("a"), "uint16 0, string x");
    EXPECT_EQ(md_tunbin_ht_get_id_by_alias("x"), 0U);
    EXPECT_EQ(md_tunbin_ht_get_id_by_alias("a"), none);
}

TEST_F(Tunnels, AreRenamedWithTheirIds)
{
    add("a", "x");
    add("b");
    ASSERT_EQ(commit(), "committed");
    remove("a");
    add("z", "x");
    set_id("z", 0);
    ASSERT_EQ(commit(), "committed");
    EXPECT_THAT(bound(), ElementsAre("b 1", "z 0"));
    EXPECT_STREQ(md_tunbin_ht_get_name_by_id(0), "z");
    EXPECT_EQ(md_tunbin_ht_get_id_by_name("a"), none);
    EXPECT_EQ(md_tunbin_ht_get_id_by_name("z"), 0U);
    EXPECT_EQ(md_tunbin_ht_get_id_by_alias("x"), 0U);
    EXPECT_THAT(configuration_->held_ids().list(present_ms()), IsEmpty()) << "never freed";
    // One ID is not left to two.
    remove("z");
    add("y");
    set_id("y", 0);
    add("x");
    set_id("x", 0);
    EXPECT_EQ(commit_in_vain(), ": tunnels \"x\" and \"y\" ask for one ID, 0 (tunnels)\n");
}

TEST_F(Tunnels, LeaveTheirIdsHeldBack)
{
    add("a");
    add("b");
    ASSERT_EQ(commit(), "committed");
    remove("a");
    ASSERT_EQ(commit(), "committed");
    EXPECT_THAT(bound(), ElementsAre("b 1"));
    EXPECT_EQ(md_tunbin_ht_get_id_by_name("a"), none);
    EXPECT_THAT(configuration_->held_ids().list(present_ms()), ElementsAre(HeldId{0, 61}));

    pass(12'500);
    add("c");
    ASSERT_EQ(commit(), "committed");
    EXPECT_EQ(stored("c"), "uint16 2, string c");
    add("d");
    set_id("d", 0);
    const std::string held = tunnel("d", "id") + ": ID 0 was freed a short time ago and is held "
                                                 "back: it is free again in ";
    EXPECT_EQ(commit(), held + "48 s (tunnels)\n");
    pass(47'500);
    EXPECT_EQ(commit(), held + "1 s (tunnels)\n") << "60000 ms";
    pass(1);
    EXPECT_EQ(commit(), "committed") << "60001 ms";
    EXPECT_THAT(bound(), ElementsAre("b 1", "c 2", "d 0"));
    EXPECT_THAT(configuration_->held_ids().list(present_ms()), IsEmpty());
}

TEST_F(Tunnels, LeaveAReserveOfIds)
{
    add_many(0, 1005);
    EXPECT_EQ(commit_in_vain(), ": no IDs for 1005 new tunnels: 0 of 1024 are in use, and 20 stay "
                                "in reserve (tunnels)\n");
    EXPECT_EQ(md_get_total_tunnels(), 0);
    add_many(0, 1004);
    ASSERT_EQ(commit(), "committed");
    add("x");
    const std::string refusal =
        ": no ID for 1 new tunnel: 1004 of 1024 are in use, and 20 stay in reserve (tunnels)\n";
    EXPECT_EQ(commit(), refusal);
    set_id("x", 1010);
    EXPECT_EQ(commit(), refusal) << "the reserve is not for those who know an ID";
    remove("p0");
    EXPECT_EQ(commit(), ": no ID for 1 new tunnel: 1004 of 1024 are in use until deletions are "
                        "committed, and 20 stay in reserve (tunnels)\n");
    configuration_->discard();
    remove("p0");
    ASSERT_EQ(commit(), "committed");
    add("x");
    ASSERT_EQ(commit(), "committed");
    EXPECT_EQ(stored("x"), "uint16 1004, string x");
    // A rename needs no new ID.
    remove("x");
    add("y");
    set_id("y", 1004);
    ASSERT_EQ(commit(), "committed");
}

TEST_F(Tunnels, WaitForIdsThatAreHeldBack)
{
    add_many(0, 1004);
    ASSERT_EQ(commit(), "committed");
    remove_many(0, 500);
    ASSERT_EQ(commit(), "committed");
    pass(10'000);
    remove_many(500, 504);
    ASSERT_EQ(commit(), "committed");
    add_many(2000, 19);
    ASSERT_EQ(commit(), "committed") << "IDs that were never used";

    pass(5'000);
    add("a");
    add("b");
    EXPECT_EQ(commit_in_vain(),
              ": no IDs for 2 new tunnels: 1 can be given now, and freed ones are held back for "
              "60 s: the first is free again in 46 s (tunnels)\n");
    add_many(3000, 502);
    EXPECT_EQ(commit_in_vain(),
              ": no IDs for 502 new tunnels: 1 can be given now, and freed ones are held back for "
              "60 s: the first is free again in 46 s, enough are in 56 s (tunnels)\n");
    EXPECT_EQ(md_get_total_tunnels(), 19);
    pass(45'000);
    add("a");
    add("b");
    EXPECT_EQ(commit(), ": no IDs for 2 new tunnels: 1 can be given now, and freed ones are held "
                        "back for 60 s: the first is free again in 1 s (tunnels)\n");
    pass(1);
    ASSERT_EQ(commit(), "committed");
    EXPECT_EQ(stored("a"), "uint16 1023, string a");
    EXPECT_EQ(stored("b"), "uint16 0, string b");
}

TEST_F(Tunnels, AreHeldBackForEverByAClockThatStands)
{
    time_info_ptr->time_since_boot_ms = 0;
    add("a");
    ASSERT_EQ(commit(), "committed");
    remove("a");
    ASSERT_EQ(commit(), "committed");
    EXPECT_THAT(configuration_->held_ids().list(present_ms()), IsEmpty())
        << "at 0 ms nothing is held back";
    pass(1);
    add("a");
    ASSERT_EQ(commit(), "committed");
    remove("a");
    ASSERT_EQ(commit(), "committed");
    for (int tries = 0; tries < 3; ++tries) {
        EXPECT_THAT(configuration_->held_ids().list(present_ms()), ElementsAre(HeldId{1, 61}));
    }
}

TEST_F(Tunnels, ShareAnAliasThatThenLeadsToNoneOfThem)
{
    add("a", "hq");
    add("b", "hq");
    add("c", "hq");
    ASSERT_EQ(commit(), "committed");
    EXPECT_EQ(md_tunbin_ht_get_id_by_alias("hq"), none);
    EXPECT_EQ(md_tunbin_ht_get_id_by_name("a"), 0U);
    remove("b");
    ASSERT_EQ(commit(), "committed");
    EXPECT_EQ(md_tunbin_ht_get_id_by_alias("hq"), none) << "a and c";
    set(tunnel("a", "alias"), bt_string, "branch");
    ASSERT_EQ(commit(), "committed");
    EXPECT_EQ(md_tunbin_ht_get_id_by_alias("hq"), 2U) << "c alone";
    EXPECT_EQ(md_tunbin_ht_get_id_by_alias("branch"), 0U);
    // An alias that is somebody's name, which stands in for an alias there.
    add("branch");
    ASSERT_EQ(commit(), "committed");
    EXPECT_EQ(md_tunbin_ht_get_id_by_alias("branch"), none);
    EXPECT_EQ(md_tunbin_ht_get_id_by_name("branch"), 3U);
}

TEST_F(Tunnels, SwapAliasesInOneCommit)
{
    add("a", "one");
    add("b", "two");
    ASSERT_EQ(commit(), "committed");
    set(tunnel("a", "alias"), bt_string, "two");
    set(tunnel("b", "alias"), bt_string, "one");
    ASSERT_EQ(commit(), "committed");
    EXPECT_EQ(md_tunbin_ht_get_id_by_alias("two"), 0U);
    EXPECT_EQ(md_tunbin_ht_get_id_by_alias("one"), 1U);
    erase(tunnel("a", "alias"));
    ASSERT_EQ(commit(), "committed");
    EXPECT_EQ(stored("a"), "uint16 0, string a");
    EXPECT_EQ(md_tunbin_ht_get_id_by_alias("a"), 0U);
    EXPECT_EQ(md_tunbin_ht_get_id_by_alias("two"), none);
}

TEST_F(Tunnels, AreTheSameAfterARestart)
{
    add("a", "hq");
    add("b", "hq");
    add("c", "x");
    ASSERT_EQ(commit(), "committed");
    remove("a");
    add("d", "hq");
    ASSERT_EQ(commit(), "committed");
    restart();
    EXPECT_THAT(bound(), ElementsAre("b 1", "c 2", "d 3"));
    EXPECT_EQ(md_tunbin_ht_get_id_by_name("a"), none);
    EXPECT_EQ(md_tunbin_ht_get_id_by_name("d"), 3U);
    EXPECT_EQ(md_tunbin_ht_get_id_by_alias("hq"), none);
    EXPECT_EQ(md_tunbin_ht_get_id_by_alias("x"), 2U);
    EXPECT_THAT(configuration_->held_ids().list(present_ms()), IsEmpty());
    EXPECT_THAT(module_log(), IsEmpty());
}

TEST_F(Tunnels, AreLeftOutAtTheStartWithoutAnIdOfTheirOwn)
{
    configuration_.reset();
    std::vector<StoredChange> nodes;
    const auto store = [&nodes](const std::string &name, const char *id) {
        nodes.push_back({tunnel(name), StoredValue{bt_string, name}});
        if (id != nullptr) {
            nodes.push_back({tunnel(name, "id"), StoredValue{bt_uint16, id}});
        }
    };
    store("a", "5");
    store("b", "5");
    store("c", "1024");
    store("d", nullptr);
    Store::open(state_.path()).commit(nodes);
    restart();
    const char *const advice = "; delete it, commit, and add it again";
    EXPECT_THAT(
        module_log(),
        ElementsAre(
            std::string("error tunnel \"b\" is left out: its ID 5 belongs to tunnel \"a\"") +
                advice,
            std::string("error tunnel \"c\" is left out: its ID 1024 is past what the model "
                        "allows, 1024 tunnels") +
                advice,
            std::string("error tunnel \"d\" is left out: it has no ID") + advice));
    EXPECT_THAT(bound(), ElementsAre("a 5"));

    // They take nothing along when they go, and are as good as new afterwards.
    remove("b");
    remove("c");
    remove("d");
    ASSERT_EQ(commit(), "committed");
    EXPECT_STREQ(md_tunbin_ht_get_name_by_id(5), "a");
    EXPECT_THAT(bound(), ElementsAre("a 5"));
    add("b");
    ASSERT_EQ(commit(), "committed");
    EXPECT_THAT(bound(), ElementsAre("a 5", "b 0"));
}

TEST_F(Tunnels, ThatWereLeftOutStayOutUntilTheyCanHaveAnId)
{
    configuration_.reset();
    Store::open(state_.path())
        .commit(std::vector<StoredChange>{{tunnel("a"), StoredValue{bt_string, "a"}},
                                          {tunnel("b"), StoredValue{bt_string, "b"}},
                                          {tunnel("b", "id"), StoredValue{bt_uint16, "2000"}}});
    restart();
    set(tunnel("b", "alias"), bt_string, "x");
    ASSERT_EQ(commit(), "committed");
    EXPECT_THAT(bound(), IsEmpty());
    set(tunnel("a", "alias"), bt_string, "y");
    ASSERT_EQ(commit(), "committed");
    EXPECT_THAT(bound(), ElementsAre("a 0")) << "one without an ID gets it when it is touched";
    EXPECT_EQ(md_tunbin_ht_get_id_by_alias("y"), 0U);
}

TEST_F(Tunnels, ThatWereLeftOutStayOutWhenTheirAliasIsNoLongerAmbiguous)
{
    configuration_.reset();
    std::vector<StoredChange> nodes;
    const auto store = [&nodes](const std::string &name, const char *id) {
        nodes.push_back({tunnel(name), StoredValue{bt_string, name}});
        nodes.push_back({tunnel(name, "alias"), StoredValue{bt_string, "hq"}});
        if (id != nullptr) {
            nodes.push_back({tunnel(name, "id"), StoredValue{bt_uint16, id}});
        }
    };
    store("a", "5");
    store("b", "6");
    store("c", "6");
    store("d", nullptr);
    Store::open(state_.path()).commit(nodes);
    restart();
    EXPECT_EQ(md_tunbin_ht_get_id_by_alias("hq"), none);
    remove("a");
    ASSERT_EQ(commit(), "committed");
    EXPECT_EQ(md_tunbin_ht_get_id_by_alias("hq"), 6U) << "b alone";
    EXPECT_STREQ(md_tunbin_ht_get_name_by_id(6), "b");
    EXPECT_EQ(md_tunbin_ht_get_id_by_name("c"), none);
}

TEST_F(Tunnels, OfTheModelsDefaultsHaveIds)
{
    configuration_.reset();
    const ovtest::ScratchDir other;
    write_file("/var/opt/tms/.preserved_db", "/ov/tunneld/tunnel/config/a,string,a\n"
                                             "/ov/tunneld/tunnel/config/b,string,b\n"
                                             "/ov/tunneld/tunnel/config/b/id,uint16,0\n");
    configuration_.emplace(other.path());
    configuration_->start();
    EXPECT_THAT(bound(), ElementsAre("a 1", "b 0"));
    EXPECT_EQ(stored("a"), "uint16 1, string a");
    configuration_.reset();
}

TEST_F(Tunnels, KeepTheModelFromAllowingFewer)
{
    add("a");
    set_id("a", 500);
    add("b");
    ASSERT_EQ(commit(), "committed");
    const std::string node = "/ov/model/limits/max_tunnels";
    set(node, bt_uint32, "500");
    EXPECT_EQ(commit_in_vain(), node + ": must be more than 500, the ID of tunnel \"a\" "
                                       "(tunnels)\n");
    set(node, bt_uint32, "0");
    EXPECT_EQ(commit_in_vain(), node + ": must be more than 500, the ID of tunnel \"a\" "
                                       "(tunnels)\n");
    remove("a");
    set(node, bt_uint32, "1");
    add("c");
    EXPECT_EQ(commit_in_vain(), tunnel("c", "id") + ": ID 1 is out of range: tunnels have IDs from "
                                                    "0 to 0 (tunnels)\n")
        << "not after the next start";
    set(node, bt_uint32, "501");
    ASSERT_EQ(commit(), "committed");
    add("c");
    set_id("c", 501);
    EXPECT_EQ(commit_in_vain(), tunnel("c", "id") + ": ID 501 is out of range: tunnels have IDs "
                                                    "from 0 to 500 (tunnels)\n");
    erase(node);
    EXPECT_EQ(commit(), "committed") << "1024 again";
}

TEST_F(Tunnels, MayNotBeWhereTheModelAllowsNone)
{
    set("/ov/model/limits/max_tunnels", bt_uint32, "0");
    ASSERT_EQ(commit(), "committed");
    add("a");
    EXPECT_EQ(commit(),
              tunnel("a", "id") + ": ID 0 cannot be: the model allows no tunnels (tunnels)\n");
}

} // namespace
