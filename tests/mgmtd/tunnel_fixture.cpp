#include "tests/mgmtd/tunnel_fixture.h"

#include "framework/appliance.h"
#include "framework/sys_time.h"
#include "host/modules/node_access.h"
#include "host/tree/name.h"
#include "orvale/md_tunneld_tunnel_common.h"

namespace mgmtd_test
{

using namespace ovhost;

std::string tunnel(const std::string &name, const std::string &field)
{
    return "/ov/tunneld/tunnel/config/" + escape_component(name) +
           (field.empty() ? "" : "/" + field);
}

TunnelTest::TunnelTest()
{
    ctime_init();
    time_info_ptr->time_since_boot_ms = 1'000'000;
    restart();
    // What the messages and counts of the tests rest on.
    EXPECT_EQ(get_max_tunnel_number(), 1024U);
}

void TunnelTest::restart()
{
    configuration_.reset();
    configuration_.emplace(state_.path());
    configuration_->start();
}

void TunnelTest::pass(uint64 milliseconds)
{
    time_info_ptr->time_since_boot_ms += milliseconds;
}

void TunnelTest::set(const std::string &node, bn_type type, const std::string &value)
{
    EXPECT_EQ(configuration_->candidate().set(node, type, value), std::nullopt);
}

void TunnelTest::erase(const std::string &node)
{
    EXPECT_EQ(configuration_->candidate().erase(node), std::nullopt);
}

void TunnelTest::add(const std::string &name, const std::string &alias)
{
    set(tunnel(name), bt_string, name);
    if (!alias.empty()) {
        set(tunnel(name, "alias"), bt_string, alias);
    }
}

void TunnelTest::set_id(const std::string &name, unsigned id)
{
    set(tunnel(name, "id"), bt_uint16, std::to_string(id));
}

std::string TunnelTest::commit()
{
    const CommitReport report = configuration_->commit("");
    EXPECT_THAT(report.warnings, testing::IsEmpty());
    if (report.accepted()) {
        return report.outcome == CommitOutcome::committed ? "committed" : "unchanged";
    }
    std::string text;
    for (const std::string &refusal : refusals_of(report.refusals)) {
        text += refusal + "\n";
    }
    return text;
}

std::string TunnelTest::commit_in_vain()
{
    const std::string text = commit();
    configuration_->discard();
    return text;
}

std::string TunnelTest::value(const std::string &node) const
{
    return value_in(configuration_->running(), node);
}

std::string TunnelTest::stored(const std::string &name) const
{
    return value(tunnel(name, "id")) + ", " + value(tunnel(name, "alias"));
}

std::vector<std::string> TunnelTest::bound()
{
    std::vector<std::string> tunnels;
    for (uint32 position = 0; position < static_cast<uint32>(md_get_total_tunnels()); ++position) {
        const char *name = nullptr;
        uint32 id = 0;
        EXPECT_EQ(md_get_tunnel_name_str_sorted(position, &name), 0);
        EXPECT_EQ(md_get_tunnel_id_sorted(make_tstring(name).get(), &id), 0);
        tunnels.push_back(std::string(name) + " " + std::to_string(id));
    }
    return tunnels;
}

} // namespace mgmtd_test
