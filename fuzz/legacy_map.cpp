// Entries of the older form: an upgrade leaves either a match string or what was there, and no
// field is lost that there is room for.
#include "framework/appliance.h"
#include "fuzz/host.h"
#include "orvale/md_xmap_common.h"

#include <fuzzer/FuzzedDataProvider.h>

#include <array>
#include <string>
#include <utility>

namespace
{

using namespace ovfuzz;

// Of the kinds that have an older form.
constexpr std::pair<int, const char *> roots[] = {
    {MAP_TYPE_R, "/ov/tunneld/route_map/config/map"},
    {MAP_TYPE_O, "/ov/tunneld/opt_map/config/map"},
    {MAP_TYPE_Q, "/ov/tunneld/qos_map/config/map"},
    {MAP_TYPE_S, "/ov/tunneld/stats_map/config/map"},
    {MAP_TYPE_N, "/ov/tunneld/nat_map/config/map"},
};

struct Field {
    const char *node;
    const char *key;          // null: what becomes of it depends on other fields
    const char *says_nothing; // beside no text
};

constexpr Field fields[] = {
    {"application", "application", "any"},
    {"src/port", "src_port", "0"},
    {"dest/port", "dst_port", "0"},
    {"vlan", "vlan", "any"},
    {"protocol", "protocol", "ip"},
    {"dscp", "dscp", "any"},
    {"ipver", nullptr, nullptr},
    {"source/addr/ipv4/static/ipaddr", nullptr, nullptr},
    {"source/addr/ipv4/static/mask_len", nullptr, nullptr},
    {"source/addr/ipv6/static/ipv6prefix", nullptr, nullptr},
    {"dest/addr/ipv4/static/ipaddr", nullptr, nullptr},
    {"dest/addr/ipv4/static/mask_len", nullptr, nullptr},
    {"dest/addr/ipv6/static/ipv6prefix", nullptr, nullptr},
};

// More than all keys, separators and addresses that the library adds by itself.
constexpr std::size_t longest_overhead = 200;

bool holds(const std::string &match_string, const std::string &pair)
{
    return (',' + match_string + ',').find(',' + pair + ',') != std::string::npos;
}

void check_converted(const mdb_db &olddb, const mdb_db &newdb, const std::string &match_node,
                     std::size_t num_characters)
{
    const std::string *const match_string = text_of(newdb, match_node + "/matchstr");
    require(match_string != nullptr && !match_string->empty(), "every entry gets a match string");
    require(match_string->size() < MD_XMAP_MATCHSTR_SIZE, "a match string keeps to its size");
    for (const Field &field : fields) {
        const std::string node = match_node + '/' + field.node;
        require(text_of(newdb, node) == nullptr, "no field of the older form is left");
        const std::string *const value = text_of(olddb, node);
        if (value == nullptr || field.key == nullptr || value->empty() ||
            *value == field.says_nothing || num_characters + longest_overhead > 1023) {
            continue;
        }
        require(holds(*match_string, std::string(field.key) + ':' + *value),
                "a field that says something has its pair");
    }
}

} // namespace

int LLVMFuzzerTestOneInput(const std::uint8_t *data, std::size_t size)
{
    FuzzedDataProvider input(data, size);
    const auto &[mtype, root] = input.PickValueInArray(roots);
    const std::string match_node = std::string(root) + "/m/prio/10/match/0";
    mdb_db olddb;
    std::size_t num_characters = 0;
    for (const Field &field : fields) {
        if (input.ConsumeBool()) {
            const std::string value = input.ConsumeRandomLengthString(1100).c_str();
            num_characters += value.size();
            set(olddb, match_node + '/' + field.node, value);
        }
    }
    const bool has_acl = input.ConsumeBool();
    if (has_acl) {
        set(olddb, match_node + "/acl", "office");
    }
    mdb_db newdb = {.tree = olddb.tree, .writable = true};

    const int status = md_xmap_upgrade_to_pattern_match(&newdb, &olddb, mtype);
    const bool has_entry = olddb.tree.size() != 0;
    if (!has_entry || has_acl) {
        require(status == 0, "nothing to convert is no error");
        require(text_of(newdb, match_node + "/matchstr") == nullptr, "no match string comes of it");
    } else if (status == 0) {
        check_converted(olddb, newdb, match_node, num_characters);
    } else {
        require(text_of(newdb, match_node + "/matchstr") == nullptr,
                "a conversion that failed writes nothing");
    }
    return 0;
}
