#include "tests/e2e/kill_model.h"

#include <algorithm>
#include <iterator>

namespace e2e
{

namespace
{

constexpr unsigned stamped_nodes = 25;

std::string numbered(std::mt19937 &random, const char *prefix, unsigned count)
{
    return prefix + std::to_string(random() % count);
}

std::string stamp_node(unsigned index)
{
    return "/kill/stamp/" + std::to_string(index);
}

std::string set_line(const std::string &name, const std::string &type, const std::string &value)
{
    return name + "," + type + "," + value + "\n";
}

std::string entry_node(const std::pair<std::string, std::string> &entry)
{
    return entries_root + entry.first + "/prio/" + entry.second;
}

} // namespace

std::string KillModel::edit(std::mt19937 &random)
{
    std::string lines = stamp();
    // Not in each: an ID that was freed is held back, and stands in the way of going back.
    if (random() % 3 == 0) {
        lines += turn_tunnel(random);
    }
    lines += turn_acl(random);
    lines += turn_entry(random);
    return lines;
}

std::string KillModel::stamp()
{
    ++stamp_;
    std::string lines;
    for (unsigned index = 0; index < stamped_nodes; ++index) {
        lines += set_line(stamp_node(index), "uint64", std::to_string(stamp_));
    }
    return lines;
}

std::string KillModel::turn_tunnel(std::mt19937 &random)
{
    const std::string name = numbered(random, "t", 40);
    if (tunnels_.erase(name) != 0) {
        return "-" + (tunnels_root + name) + "\n";
    }
    tunnels_.insert(name);
    return set_line(tunnels_root + name, "string", name) +
           set_line(tunnels_root + name + "/alias", "string", "alias-" + name);
}

std::string KillModel::turn_entry(std::mt19937 &random)
{
    const std::pair<std::string, std::string> entry{numbered(random, "m", 4),
                                                    std::to_string(random() % 5 * 10 + 10)};
    if (entries_.erase(entry) != 0) {
        const bool is_last = std::ranges::none_of(
            entries_, [&entry](const auto &other) { return other.first.first == entry.first; });
        return "-" + (is_last ? entries_root + entry.first : entry_node(entry)) + "\n";
    }
    if (acls_.empty()) {
        return {};
    }
    const auto steps = static_cast<std::ptrdiff_t>(random() % acls_.size());
    const std::string acl = *std::next(acls_.begin(), steps);
    entries_[entry] = acl;
    return set_line(entries_root + entry.first, "string", entry.first) +
           set_line(entry_node(entry), "uint16", entry.second) +
           set_line(entry_node(entry) + "/match/0/acl", "string", acl);
}

std::string KillModel::turn_acl(std::mt19937 &random)
{
    const std::string name = numbered(random, "a", 6);
    const bool is_named =
        std::ranges::any_of(entries_, [&name](const auto &entry) { return entry.second == name; });
    if (is_named) {
        return {};
    }
    if (acls_.erase(name) != 0) {
        return "-" + (acls_root + name) + "\n";
    }
    acls_.insert(name);
    return set_line(acls_root + name, "string", name);
}

Nodes KillModel::nodes() const
{
    Nodes nodes;
    for (unsigned index = 0; stamp_ != 0 && index < stamped_nodes; ++index) {
        nodes[stamp_node(index)] = {"uint64", std::to_string(stamp_)};
    }
    for (const std::string &name : tunnels_) {
        nodes[tunnels_root + name] = {"string", name};
        nodes[tunnels_root + name + "/alias"] = {"string", "alias-" + name};
    }
    for (const std::string &name : acls_) {
        nodes[acls_root + name] = {"string", name};
    }
    for (const auto &[entry, acl] : entries_) {
        nodes[entries_root + entry.first] = {"string", entry.first};
        nodes[entry_node(entry)] = {"uint16", entry.second};
        nodes[entry_node(entry) + "/match/0/acl"] = {"string", acl};
        nodes[acls_root + acl + "/rmap/" + entry.first + "/prio/" + entry.second] = {"uint32",
                                                                                     entry.second};
    }
    return nodes;
}

} // namespace e2e
