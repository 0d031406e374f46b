#include "host/modules/name_depth.h"

#include "host/modules/acl_nodes.h"
#include "host/modules/commit_access.h"
#include "host/modules/dns_proxy_maps.h"
#include "host/modules/map_kinds.h"
#include "host/tree/name.h"

#include <algorithm>

namespace ovhost
{
namespace
{

struct DepthRule {
    NamePattern root;
    std::size_t levels;
};

std::vector<DepthRule> make_rules()
{
    std::vector<DepthRule> rules;
    const auto add = [&rules](const std::string &root, std::size_t levels) {
        rules.push_back({NamePattern::parse(root).value(), levels});
    };
    add(acls_node, levels_of_an_acl);
    add(dns_proxy_maps_node("*"), levels_of_a_map);
    for (const MapKind &kind : map_kinds) {
        add(kind.root_pattern, levels_of_a_map);
    }
    return rules;
}

const std::vector<DepthRule> &depth_rules()
{
    static const std::vector<DepthRule> rules = make_rules();
    return rules;
}

/// The most parts that a name has to which no rule can say anything.
std::size_t always_allowed()
{
    static const std::size_t most = [] {
        std::size_t least = max_name_components;
        for (const DepthRule &rule : depth_rules()) {
            least = std::min(least, rule.root.parts().size() + rule.levels);
        }
        return least;
    }();
    return most;
}

bool is_too_deep(const DepthRule &rule, const std::vector<std::string> &parts)
{
    const std::size_t above = rule.root.parts().size();
    return parts.size() > above + rule.levels && rule.root.matches(std::span(parts).first(above));
}

} // namespace

int NameDepthModule::check_change(md_dbinfo *dbinfo, mdb_db_change *change)
{
    const auto length = static_cast<std::size_t>(tstr_array_length_quick(change->mdc_name_parts));
    if (is_deleted(change) || length <= always_allowed()) {
        return 0;
    }
    const std::vector<std::string> parts = name_parts(change);
    const auto rule = std::ranges::find_if(depth_rules(), [&parts](const DepthRule &candidate) {
        return is_too_deep(candidate, parts);
    });
    return rule == depth_rules().end()
               ? 0
               : refuse(dbinfo, "too deep: a name in here has " +
                                    std::to_string(rule->root.parts().size() + rule->levels) +
                                    " parts at most, not " + std::to_string(parts.size()));
}

} // namespace ovhost
