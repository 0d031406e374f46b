#pragma once
// Maps and ACLs of a configuration, in few words.

#include "host/modules/map_kinds.h"
#include "tests/mgmtd/configuration_fixture.h"

#include <string>
#include <vector>

namespace mgmtd_test
{

/// Nodes below "/ov/tunneld/route_map/config/map/", such as "m1/prio/10".
[[nodiscard]] std::string rmap(const std::string &below);

/// Nodes below "/ov/tunneld/acl/config/".
[[nodiscard]] std::string acl(const std::string &below);

/// The same for the map of a kind: below its entry's match, and the record of an entry.
[[nodiscard]] std::string matched(const ovhost::MapKind &kind, const std::string &map,
                                  const std::string &priority, const std::string &leaf);
[[nodiscard]] std::string record(const std::string &acl, const ovhost::MapKind &kind,
                                 const std::string &map, const std::string &priority);

class MapTest : public ConfigurationTest
{
  protected:
    void add_acl(const std::string &name) { set(acl(name), name); }

    /// An entry of a route map that names an ACL.
    void add_entry(const std::string &map, const std::string &priority, const std::string &acl_name)
    {
        set(rmap(map + "/prio/" + priority + "/match/0/acl"), acl_name);
    }

    /// "ACL/KEY/MAP/PRIORITY" for each record in force, with " VALUE" when that is another.
    [[nodiscard]] std::vector<std::string> records() const;
};

/// Names the tests of a kind.
[[nodiscard]] std::string key_of(const testing::TestParamInfo<ovhost::MapKind> &kind);

/// For tests of every kind.
class EveryMapKind : public MapTest, public testing::WithParamInterface<ovhost::MapKind>
{
  protected:
    [[nodiscard]] static const ovhost::MapKind &kind() { return GetParam(); }

    [[nodiscard]] std::string entry(const std::string &map, const std::string &priority) const
    {
        return entry_node(kind(), map, priority);
    }

    [[nodiscard]] std::string match(const std::string &map, const std::string &priority,
                                    const std::string &leaf) const
    {
        return matched(kind(), map, priority, leaf);
    }
};

} // namespace mgmtd_test
