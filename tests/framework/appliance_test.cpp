#include "framework/appliance.h"

#include "host/framework/appliance_config.h"
#include "host/framework/model_nodes.h"
#include "host/framework/objects.h"
#include "host/tree/name.h"
#include "tests/framework/allocation_failure.h"
#include "tests/framework/log_capture.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <cstdlib>
#include <string>

namespace ovhost::test
{
namespace
{

using testing::HasSubstr;

void put(mdb_db &db, const char *name, Value value)
{
    db.tree.set(split_name(name).value(), std::move(value));
}

class ModelInfoTest : public testing::Test
{
  protected:
    ~ModelInfoTest() override
    {
        const mdb_db empty;
        EXPECT_EQ(init_model_info(&empty), 0);
        ov_system_info = {};
        set_config_name("");
        set_running_db_source({});
    }

    mdb_db db;
};

TEST_F(ModelInfoTest, DefaultsWhenNoNodeIsThere)
{
    ASSERT_EQ(init_model_info(&db), 0);
    EXPECT_EQ(ov_system_info.initialized, 1);
    EXPECT_EQ(ov_system_info.system_max_interfaces, 256U);
    EXPECT_EQ(get_max_rmap_entries(), 300U);
    EXPECT_EQ(get_max_omap_entries(), 300U);
    EXPECT_EQ(get_max_qmap_entries(), 300U);
    EXPECT_EQ(get_max_smap_entries(), 300U);
    EXPECT_EQ(get_max_nmap_entries(), 300U);
    EXPECT_EQ(get_max_dns_proxy_map_entries(), 128U);
    EXPECT_EQ(get_config_name(), nullptr);
}

TEST_F(ModelInfoTest, EachNodeFillsItsOwnLimit)
{
    put(db, "/ov/model/config/name", {bt_string, "branch-200"});
    put(db, "/ov/model/limits/max_interfaces", {bt_uint32, "1"});
    put(db, "/ov/model/limits/max_rmap_entries", {bt_uint32, "2"});
    put(db, "/ov/model/limits/max_omap_entries", {bt_uint32, "3"});
    put(db, "/ov/model/limits/max_qmap_entries", {bt_uint32, "4"});
    put(db, "/ov/model/limits/max_smap_entries", {bt_uint32, "5"});
    put(db, "/ov/model/limits/max_nmap_entries", {bt_uint32, "0"});
    put(db, "/ov/model/limits/max_dns_proxy_map_entries", {bt_uint32, "4294967295"});
    ASSERT_EQ(init_model_info(&db), 0);
    EXPECT_EQ(ov_system_info.system_max_interfaces, 1U);
    EXPECT_EQ(get_max_rmap_entries(), 2U);
    EXPECT_EQ(get_max_omap_entries(), 3U);
    EXPECT_EQ(get_max_qmap_entries(), 4U);
    EXPECT_EQ(get_max_smap_entries(), 5U);
    EXPECT_EQ(get_max_nmap_entries(), 0U);
    EXPECT_EQ(get_max_dns_proxy_map_entries(), 4294967295U);
    EXPECT_STREQ(get_config_name(), "branch-200");
}

TEST_F(ModelInfoTest, NodesOfAnotherTypeAreAnErrorThatChangesNothing)
{
    for (const char *node : {"/ov/model/config/name", "/ov/model/limits/max_tunnels",
                             "/ov/model/limits/max_dns_proxy_map_entries"}) {
        LogCapture log;
        mdb_db bad;
        put(bad, "/ov/model/limits/max_interfaces", {bt_uint32, "7"});
        put(bad, node, {bt_bool, "true"});
        EXPECT_EQ(init_model_info(&bad), 14020) << node;
        EXPECT_EQ(ov_system_info.initialized, 0);
        EXPECT_EQ(ov_system_info.system_max_interfaces, 0U);
        EXPECT_EQ(get_config_name(), nullptr);
        ASSERT_EQ(log.lines.size(), 1U);
        EXPECT_EQ(log.lines[0].level, 3);
        EXPECT_THAT(log.lines[0].text, HasSubstr(node));
    }
}

TEST_F(ModelInfoTest, ANumberOfAnotherTypeIsNoLimit)
{
    LogCapture log;
    put(db, "/ov/model/limits/max_rmap_entries", {bt_uint16, "5"});
    EXPECT_EQ(init_model_info(&db), 14020);
    EXPECT_EQ(get_max_rmap_entries(), 300U);
    put(db, "/ov/model/limits/max_rmap_entries", {bt_uint32, "5"});
    put(db, "/ov/model/config/name", {bt_hostname, "branch"});
    EXPECT_EQ(init_model_info(&db), 14020);
    EXPECT_EQ(get_config_name(), nullptr);
}

TEST_F(ModelInfoTest, TooManyTunnelsAreLoweredWithAWarning)
{
    LogCapture log;
    ModelInfo info;
    put(db, "/ov/model/limits/max_tunnels", {bt_uint32, "65535"});
    ASSERT_EQ(read_model_info(db.tree, info), 0);
    EXPECT_EQ(info.max_tunnels, 65535U);
    EXPECT_TRUE(log.lines.empty());
    put(db, "/ov/model/limits/max_tunnels", {bt_uint32, "65536"});
    ASSERT_EQ(read_model_info(db.tree, info), 0);
    EXPECT_EQ(info.max_tunnels, 65535U);
    ASSERT_EQ(log.lines.size(), 1U);
    EXPECT_EQ(log.lines[0].level, 4);
    EXPECT_THAT(log.lines[0].text, HasSubstr("/ov/model/limits/max_tunnels: 65536"));
}

TEST_F(ModelInfoTest, ALaterCallReadsAfresh)
{
    put(db, "/ov/model/limits/max_rmap_entries", {bt_uint32, "2"});
    ASSERT_EQ(init_model_info(&db), 0);
    put(db, "/ov/model/limits/max_rmap_entries", {bt_uint32, "9"});
    ASSERT_EQ(init_model_info(&db), 0);
    EXPECT_EQ(get_max_rmap_entries(), 9U);
}

TEST_F(ModelInfoTest, NullMeansTheDatabaseInForce)
{
    put(db, "/ov/model/limits/max_rmap_entries", {bt_uint32, "2"});
    set_running_db_source([this] { return &db; });
    ASSERT_EQ(init_model_info(nullptr), 0);
    EXPECT_EQ(get_max_rmap_entries(), 2U);
}

TEST_F(ModelInfoTest, NullWithoutADatabaseInForceIsAnError)
{
    LogCapture log;
    EXPECT_EQ(init_model_info(nullptr), 14001);
    set_running_db_source([] { return nullptr; });
    EXPECT_EQ(init_model_info(nullptr), 14001);
    EXPECT_EQ(ov_system_info.initialized, 0);
    EXPECT_EQ(log.lines.size(), 2U);
}

TEST_F(ModelInfoTest, TheNameGivenCountsBeforeTheNode)
{
    put(db, "/ov/model/config/name", {bt_string, "from-node"});
    set_config_name("given");
    ASSERT_EQ(init_model_info(&db), 0);
    EXPECT_STREQ(get_config_name(), "given");
    set_config_name("");
    EXPECT_STREQ(get_config_name(), "from-node");
}

TEST_F(ModelInfoTest, ReportsLackOfMemory)
{
    put(db, "/ov/model/config/name", {bt_string, std::string(100, 'n')});
    expect_allocation_failures_reported([&] { return init_model_info(&db); });
}

/// Runs a check in a process of its own: the number of tunnels is settled once for a process.
#define EXPECT_IN_NEW_PROCESS(condition)                                                           \
    EXPECT_EXIT(std::_Exit((condition) ? 0 : 1), testing::ExitedWithCode(0), "")

uint32 tunnels_after_init(uint32 number)
{
    mdb_db model;
    put(model, "/ov/model/limits/max_tunnels", {bt_uint32, std::to_string(number)});
    return init_model_info(&model) == 0 ? get_max_tunnel_number() : 0;
}

TEST(MaxTunnelNumber, ComesFromTheModelAndStays)
{
    EXPECT_IN_NEW_PROCESS(tunnels_after_init(77) == 77 && tunnels_after_init(99) == 77);
}

TEST(MaxTunnelNumber, IsTheDefaultWithoutANode)
{
    const mdb_db empty;
    EXPECT_IN_NEW_PROCESS(init_model_info(&empty) == 0 && get_max_tunnel_number() == 1024);
}

TEST(MaxTunnelNumber, IsNotSettledBeforeTheModelIsKnown)
{
    EXPECT_IN_NEW_PROCESS(get_max_tunnel_number() == 1024 && tunnels_after_init(77) == 77);
}

} // namespace
} // namespace ovhost::test
