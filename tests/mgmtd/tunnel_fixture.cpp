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

TunnelTest::TunnelTest(Start start) : ConfigurationTest(Start::later)
{
    ctime_init();
    time_info_ptr->time_since_boot_ms = 1'000'000;
    if (start == Start::now) {
        restart();
        // What the messages and counts of the tests rest on.
        EXPECT_EQ(get_max_tunnel_number(), 1024U);
    }
}

void TunnelTest::pass(uint64 milliseconds)
{
    time_info_ptr->time_since_boot_ms += milliseconds;
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
        EXPECT_EQ(md_get_tunnel_id_sorted(TstringCopy(name).get(), &id), 0);
        tunnels.push_back(std::string(name) + " " + std::to_string(id));
    }
    return tunnels;
}

} // namespace mgmtd_test
