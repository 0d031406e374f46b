#include "tests/mgmtd/map_fixture.h"

#include "host/tree/name.h"

namespace mgmtd_test
{

using namespace ovhost;

std::string rmap(const std::string &below)
{
    return "/ov/tunneld/route_map/config/map/" + below;
}

std::string acl(const std::string &below)
{
    return "/ov/tunneld/acl/config/" + below;
}

std::string matched(const MapKind &kind, const std::string &map, const std::string &priority,
                    const std::string &leaf)
{
    const std::string index = kind.type == MAP_TYPE_SEC ? "" : "0/";
    return std::string(kind.root) + "/" + map + "/prio/" + priority + "/match/" + index + leaf;
}

std::string record(const std::string &acl_name, const MapKind &kind, const std::string &map,
                   const std::string &priority)
{
    return acl(acl_name + "/" + kind.key + "/" + map + "/prio/" + priority);
}

std::string key_of(const testing::TestParamInfo<MapKind> &kind)
{
    return kind.param.key;
}

std::vector<std::string> MapTest::records() const
{
    std::vector<std::string> texts;
    const std::vector<std::string> acls = split_name("/ov/tunneld/acl/config").value();
    const auto add = [&texts](Tree::Parts name, const Value &held) {
        // ov, tunneld, acl, config, ACL, KEY, MAP, prio, PRIORITY
        if (name.size() != 9 || name[7] != "prio") {
            return;
        }
        const bool is_good = held == Value{bt_uint32, name[8]};
        texts.push_back(name[4] + "/" + name[5] + "/" + name[6] + "/" + name[8] +
                        (is_good ? "" : " " + held.text));
    };
    configuration_->running().visit(add, acls);
    return texts;
}

} // namespace mgmtd_test
