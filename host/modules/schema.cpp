#include "host/modules/schema.h"

#include "host/modules/commit_access.h"
#include "host/modules/interface_nodes.h"
#include "host/modules/map_kinds.h"
#include "host/modules/node_access.h"
#include "host/tree/name.h"

#include <algorithm>
#include <array>
#include <string_view>

namespace ovhost
{
namespace
{

struct NodeRule {
    std::string pattern;
    bn_type type;
    /// The texts that are allowed, up to the first null; none: every text of the type.
    std::array<const char *, 4> texts = {};
};

const NodeRule fixed_rules[] = {
    {"/ov/tunneld/system/config/mode", bt_string, {"bridge", "router", "server"}},
    {"/ov/tunneld/system/config/submode", bt_string},
    {"/ov/tunneld/system/config/routing_inline", bt_bool},
    {"/ov/tunneld/system/config/mode/router/*/ifname", bt_string},
    {"/ov/tunneld/system/config/10g", bt_bool},
    {"/ov/tunneld/system/config/bonding", bt_bool},
    {"/ov/tunneld/system/config/limits/*", bt_uint32},
    {"/ov/tunneld/tunnel/config/*", bt_string},
    {"/ov/tunneld/tunnel/config/*/alias", bt_string},
    {"/ov/tunneld/tunnel/config/*/id", bt_uint16},
    {"/ov/tunneld/tunnel/config/*/remote", bt_ipaddr},
    {"/ov/tunneld/tunnel/config/*/bandwidth", bt_uint32},
    {"/ov/tunneld/acl/config/*", bt_string},
    {"/ov/tunneld/acl/config/*/entry/*", bt_uint16},
    {"/ov/tunneld/acl/config/*/entry/*/matchstr", bt_string},
    {"/ov/tunneld/acl/config/*/entry/*/protocol", bt_string},
    {"/ov/tunneld/acl/config/*/entry/*/application", bt_string},
    {"/ov/tunneld/app/config/*/name", bt_string},
    {tunneld_interfaces_node(vlan_kind) + "/*", bt_string},
    {tunneld_interfaces_node(tunnel_kind) + "/*", bt_string},
    {"/ov/tunneld/net/routes/config/ipv4/prefix/*", bt_ipv4prefix},
    {"/ov/tunneld/net/routes/config/ipv4/prefix/*/nhop/*", bt_ipv4addr},
    {"/ov/tunneld/net/routes/config/ipv4/prefix/*/nhop/*/preferred_if", bt_string},
    {"/ov/wccpd/wccp/srv_grp/config/*/interface", bt_string},
    {"/ov/redd/net/interface/vrrp/config/*", bt_string},
    {"/net/interface/config/*", bt_string},
    {"/net/interface/config/*/enable", bt_bool},
    {"/net/interface/config/*/addr/ipv4/static/*/ip", bt_ipv4addr},
    {"/net/interface/config/*/addr/ipv4/static/*/mask_len", bt_uint8},
    {"/ov/iflabels/config/*/*", bt_string},
    {"/ov/model/config/name", bt_string},
    {"/ov/model/limits/*", bt_uint32},
};

void add_map_rules(std::vector<NodeRule> &rules, const MapKind &kind)
{
    const std::string map = std::string(kind.root_pattern) + "/*";
    const std::string entry = map + "/prio/*";
    const std::string match = entry + (is_security_map(kind) ? "/match/" : "/match/*/");
    rules.push_back({map, bt_string});
    rules.push_back({entry, bt_uint16});
    for (const char *leaf : {"acl", "matchstr", "application"}) {
        rules.push_back({match + leaf, bt_string});
    }
    rules.push_back({"/ov/tunneld/acl/config/*/" + std::string(kind.key) + "/*/prio/*", bt_uint32});
}

/// A rule with its pattern taken apart: every change is held against every rule.
struct ReadyRule {
    NodeRule rule;
    NamePattern pattern;
};

std::vector<ReadyRule> make_rules()
{
    std::vector<NodeRule> rules(std::begin(fixed_rules), std::end(fixed_rules));
    for (const MapKind &kind : map_kinds) {
        add_map_rules(rules, kind);
    }
    for (const char *leaf : {"auto_mod", "auto_prefif"}) {
        rules.push_back(
            {std::string(map_kinds.front().root) + "/*/prio/*/set/0/" + leaf, bt_string});
    }
    std::vector<ReadyRule> ready;
    for (NodeRule &rule : rules) {
        NamePattern pattern = NamePattern::parse(rule.pattern).value();
        ready.push_back({std::move(rule), std::move(pattern)});
    }
    return ready;
}

const std::vector<ReadyRule> &node_rules()
{
    static const std::vector<ReadyRule> rules = make_rules();
    return rules;
}

const NodeRule *rule_of(const mdb_db_change *change)
{
    const std::vector<std::string> parts = name_parts(change);
    const auto rule = std::ranges::find_if(node_rules(), [&parts](const ReadyRule &candidate) {
        return candidate.pattern.matches(parts);
    });
    return rule != node_rules().end() ? &rule->rule : nullptr;
}

/// "bridge, router or server"; empty when every text is allowed.
std::string choices(const NodeRule &rule)
{
    std::string list;
    for (std::size_t i = 0; i < rule.texts.size() && rule.texts[i] != nullptr; ++i) {
        const bool last = i + 1 == rule.texts.size() || rule.texts[i + 1] == nullptr;
        list += i == 0 ? "" : last ? " or " : ", ";
        list += rule.texts[i];
    }
    return list;
}

bool is_choice(const NodeRule &rule, std::string_view text)
{
    return rule.texts[0] == nullptr ||
           std::any_of(rule.texts.begin(), rule.texts.end(), [text](const char *allowed) {
               return allowed != nullptr && text == allowed;
           });
}

} // namespace

std::vector<std::string> SchemaModule::patterns() const
{
    std::vector<std::string> patterns;
    for (const ReadyRule &ready : node_rules()) {
        patterns.push_back(ready.rule.pattern);
    }
    return patterns;
}

int SchemaModule::check_change(md_dbinfo *dbinfo, mdb_db_change *change)
{
    const NodeRule *const rule = rule_of(change);
    if (rule == nullptr || is_deleted(change)) {
        return 0;
    }
    const char *const node = ts_str(change->mdc_name);
    OwnedBinding binding;
    require(mdb_get_node_binding(nullptr, dbinfo->newdb, node, 0, binding.out()), "read", node);
    OwnedText text;
    const int err = bn_binding_get_str(binding.get(), ba_value, rule->type, 0, text.out());
    if (err == lc_err_bad_type) {
        return refuse(dbinfo, "must be of type " + type_name(rule->type));
    }
    if (err == 0 && !is_choice(*rule, text.get())) {
        return refuse(dbinfo, "must be " + choices(*rule) + ", not \"" + text.get() + "\"");
    }
    return err;
}

} // namespace ovhost
