#include "host/modules/model.h"

#include "framework/appliance.h"
#include "host/framework/appliance_config.h"
#include "tests/mgmtd/fixture.h"

namespace
{

using namespace ovhost;
using namespace mgmtd_test;
using testing::Contains;
using testing::ElementsAre;
using testing::IsEmpty;

class Model : public DaemonTest
{
  protected:
    Model() { configuration_.start(); }

    CommitReport commit(const std::string &name, bn_type type, const std::string &text)
    {
        EXPECT_EQ(configuration_.candidate().set(name, type, text), std::nullopt);
        return configuration_.commit(daemon_note(""));
    }

    std::vector<std::string> module_log() const
    {
        std::vector<std::string> texts;
        for (const test::LoggedLine &line : log_.lines) {
            if (line.unit == "model") {
                texts.push_back(log_level_word(line.level) + " " + line.text);
            }
        }
        return texts;
    }

    Configuration configuration_{state_.path()};
};

TEST_F(Model, FollowsTheConfiguration)
{
    EXPECT_EQ(get_max_rmap_entries(), 300U);
    ASSERT_TRUE(commit("/ov/model/limits/max_rmap_entries", bt_uint32, "7").accepted());
    EXPECT_EQ(get_max_rmap_entries(), 7U);
    ASSERT_TRUE(commit("/ov/model/limits/max_interfaces", bt_uint32, "3").accepted());
    EXPECT_EQ(ov_system_info.system_max_interfaces, 3U);
    ASSERT_TRUE(commit("/ov/model/config/name", bt_string, "m7").accepted());
    EXPECT_STREQ(get_config_name(), "m7");
    EXPECT_THAT(module_log(), IsEmpty());
    ASSERT_EQ(configuration_.candidate().erase("/ov/model"), std::nullopt);
    ASSERT_TRUE(configuration_.commit(daemon_note("")).accepted());
    EXPECT_EQ(get_max_rmap_entries(), 300U);
}

TEST_F(Model, StaysAsItIsWhenACommitIsRefused)
{
    EXPECT_FALSE(commit("/ov/model/limits/max_rmap_entries", bt_string, "7").accepted());
    EXPECT_EQ(get_max_rmap_entries(), 300U);
}

TEST_F(Model, CountsAnotherNumberOfTunnelsAtTheNextStart)
{
    const uint32 in_force = get_max_tunnel_number();
    ASSERT_EQ(in_force, 1024U);
    ASSERT_TRUE(commit("/ov/model/limits/max_tunnels", bt_uint32, "2000").accepted());
    EXPECT_EQ(get_max_tunnel_number(), in_force);
    EXPECT_THAT(module_log(),
                ElementsAre("warning /ov/model/limits/max_tunnels counts from the next start on: "
                            "until then 1024 tunnels are allowed, not 2000"));
    log_.lines.clear();
    ASSERT_TRUE(commit("/ov/model/limits/max_tunnels", bt_uint32, "1024").accepted());
    EXPECT_THAT(module_log(), IsEmpty());
}

TEST_F(Model, IsToldWhenTheCommandLineNamesAnother)
{
    ASSERT_TRUE(commit("/ov/model/config/name", bt_string, "m7").accepted());
    log_.lines.clear();
    configuration_.start();
    EXPECT_THAT(daemon_log(), IsEmpty());
    set_config_name("m7");
    configuration_.start();
    EXPECT_THAT(daemon_log(), IsEmpty());
    set_config_name("m8");
    configuration_.start();
    EXPECT_THAT(daemon_log(), ElementsAre("warning the configuration is of model \"m7\", --model "
                                          "is \"m8\": start without --model, or with the stored "
                                          "one"));
}

} // namespace
