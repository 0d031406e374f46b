#include "host/modules/schema.h"

#include "framework/md_commit.h"
#include "host/modules/node_access.h"

#include <algorithm>
#include <array>
#include <string_view>

namespace ovhost
{
namespace
{

struct NodeRule {
    const char *pattern;
    bn_type type;
    /// The texts that are allowed, up to the first null; none: every text of the type.
    std::array<const char *, 4> texts;
};

constexpr NodeRule node_rules[] = {
    {"/ov/tunneld/system/config/mode", bt_string, {"bridge", "router", "server"}},
    {"/ov/tunneld/system/config/submode", bt_string, {}},
    {"/ov/tunneld/system/config/routing_inline", bt_bool, {}},
    {"/ov/tunneld/system/config/mode/router/*/ifname", bt_string, {}},
    {"/ov/tunneld/system/config/10g", bt_bool, {}},
    {"/ov/tunneld/system/config/bonding", bt_bool, {}},
    {"/ov/tunneld/system/config/limits/*", bt_uint32, {}},
    {"/ov/tunneld/tunnel/config/*", bt_string, {}},
    {"/ov/tunneld/tunnel/config/*/alias", bt_string, {}},
    {"/ov/tunneld/tunnel/config/*/id", bt_uint16, {}},
    {"/ov/tunneld/tunnel/config/*/remote", bt_ipaddr, {}},
    {"/ov/tunneld/tunnel/config/*/bandwidth", bt_uint32, {}},
    {"/ov/model/config/name", bt_string, {}},
    {"/ov/model/limits/*", bt_uint32, {}},
};

const NodeRule *rule_of(const mdb_db_change *change)
{
    const auto rule = std::find_if(std::begin(node_rules), std::end(node_rules),
                                   [change](const NodeRule &candidate) {
                                       return bn_binding_name_parts_pattern_match(
                                           change->mdc_name_parts, true, candidate.pattern);
                                   });
    return rule != std::end(node_rules) ? rule : nullptr;
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
    for (const NodeRule &rule : node_rules) {
        patterns.emplace_back(rule.pattern);
    }
    return patterns;
}

int SchemaModule::check_change(md_dbinfo *dbinfo, mdb_db_change *change)
{
    const NodeRule *const rule = rule_of(change);
    if (rule == nullptr || change->mdc_change_type == mdct_delete) {
        return 0;
    }
    BindingPtr binding = node_binding(dbinfo->newdb, ts_str(change->mdc_name));
    char *text = nullptr;
    const int err = bn_binding_get_str(binding.get(), ba_value, rule->type, 0, &text);
    const TextPtr owned_text(text);
    if (err == lc_err_bad_type) {
        return md_commit_set_return_status_msg_fmt(dbinfo->commit, 1, "must be of type %s",
                                                   type_name(rule->type).c_str());
    }
    if (err == 0 && !is_choice(*rule, text)) {
        return md_commit_set_return_status_msg_fmt(dbinfo->commit, 1, "must be %s, not \"%s\"",
                                                   choices(*rule).c_str(), text);
    }
    return err;
}

} // namespace ovhost
