// Random commits of maps and ACLs against a model of the references: which records there must be
// after each commit, and which commits must be refused. What a commit wants it reaches in different
// ways: entries and maps are edited, or deleted and set again.

#include "host/modules/acl_references.h"
#include "tests/mgmtd/map_fixture.h"
#include "tests/support/sanitized.h"

#include <map>
#include <random>
#include <set>
#include <sstream>

namespace
{

using namespace ovhost;
using namespace mgmtd_test;

constexpr unsigned most_maps = 10;

struct EntryName {
    std::size_t kind = 0;
    std::string map;
    unsigned priority = 0;

    auto operator<=>(const EntryName &) const = default;
};

using MapName = std::pair<std::size_t, std::string>;

/// Maps and ACLs as they are, or as a commit wants them.
struct Policy {
    std::set<std::string> acls;
    std::set<MapName> maps;
    /// The ACL of each entry: nothing when it has no such node, empty when it names none.
    std::map<EntryName, std::optional<std::string>> entries;

    bool operator==(const Policy &) const = default;

    [[nodiscard]] std::string acl_of(const EntryName &entry) const
    {
        const auto found = entries.find(entry);
        return found != entries.end() ? found->second.value_or("") : "";
    }
};

/// A record: the ACL, and the entry that it is about.
using Record = std::pair<std::string, EntryName>;

bool is_default(const EntryName &entry)
{
    return entry.priority == 65535;
}

std::string node_of(const EntryName &entry)
{
    return entry_node(map_kinds[entry.kind], entry.map, std::to_string(entry.priority));
}

std::string match_of(const EntryName &entry)
{
    return node_of(entry) + "/" + map_kinds[entry.kind].match;
}

std::string acl_node_of(const EntryName &entry)
{
    return match_of(entry) + "/acl";
}

class PolicyModel
{
  public:
    /// How the lines begin that may refuse the commit; none when nothing may.
    std::set<std::string> refusals(const Policy &wanted) const
    {
        std::set<std::string> lines;
        add_missing_acls(wanted, lines);
        add_too_many_maps(wanted, lines);
        add_used_acls(wanted, lines);
        return lines;
    }

    void commit(const Policy &wanted)
    {
        std::set<EntryName> all;
        for (const auto &[entry, acl] : policy.entries) {
            all.insert(entry);
        }
        for (const auto &[entry, acl] : wanted.entries) {
            all.insert(entry);
        }
        for (const EntryName &entry : all) {
            if (!is_default(entry)) {
                follow(entry, wanted);
            }
        }
        std::erase_if(records,
                      [&](const Record &record) { return !wanted.acls.contains(record.first); });
        policy = wanted;
    }

    Policy policy;
    std::set<Record> records;

  private:
    /// Whether the commit sets an entry's ACL.
    bool is_set(const EntryName &entry, const Policy &wanted) const
    {
        const auto before = policy.entries.find(entry);
        const auto after = wanted.entries.find(entry);
        return after->second && (before == policy.entries.end() || before->second != after->second);
    }

    void add_missing_acls(const Policy &wanted, std::set<std::string> &lines) const
    {
        for (const auto &[entry, named] : wanted.entries) {
            const std::string name = named.value_or("");
            if (!name.empty() && !wanted.acls.contains(name) && is_set(entry, wanted)) {
                lines.insert(acl_node_of(entry) + ": there is no ACL \"" + name +
                             "\": set /ov/tunneld/acl/config/NAME to its name first (" +
                             map_kinds[entry.kind].name + ")");
            }
        }
    }

    void add_too_many_maps(const Policy &wanted, std::set<std::string> &lines) const
    {
        for (const MapName &map : wanted.maps) {
            const MapKind &kind = map_kinds[map.first];
            const auto of_kind = [&map](const MapName &other) { return other.first == map.first; };
            if (kind.type != MAP_TYPE_SEC && !policy.maps.contains(map) &&
                std::ranges::count_if(policy.maps, of_kind) >= most_maps) {
                lines.insert(map_node(kind, map.second) +
                             ": Cannot add map because maximum reached. (" + kind.name + ")");
            }
        }
    }

    void add_used_acls(const Policy &wanted, std::set<std::string> &lines) const
    {
        for (const auto &[name, entry] : records) {
            if (!wanted.acls.contains(name) && wanted.acl_of(entry) == name) {
                lines.insert(acl(name) + ": Cannot delete an ACL when used by a ");
            }
        }
    }

    /// What the commit makes of the records of one entry.
    void follow(const EntryName &entry, const Policy &wanted)
    {
        const std::string before = policy.acl_of(entry);
        const auto after = wanted.entries.find(entry);
        if (after == wanted.entries.end() || !after->second) {
            records.erase({before, entry});
        } else if (is_set(entry, wanted)) {
            records.erase({before, entry});
            if (!after->second->empty()) {
                records.insert({*after->second, entry});
            }
        }
    }
};

class RandomMaps : public MapTest
{
  protected:
    unsigned below(unsigned limit) { return static_cast<unsigned>(random_() % limit); }

    std::string any_acl() { return "a" + std::to_string(below(8)); }

    MapName any_map() { return {below(map_kinds.size()), "m" + std::to_string(below(12))}; }

    EntryName any_entry()
    {
        const MapName map = any_map();
        const unsigned priority = below(5);
        return {map.first, map.second, priority == 0 ? 65535 : priority * 10};
    }

    void change_acls(Policy &wanted)
    {
        for (unsigned i = below(4); i > 0; --i) {
            const std::string acl = any_acl();
            if (below(3) != 0) {
                wanted.acls.insert(acl);
            } else {
                wanted.acls.erase(acl);
                // Often all that name it let go of it in the same commit.
                for (auto &[entry, named] : wanted.entries) {
                    if (named == acl && below(8) != 0) {
                        named = below(2) == 0 ? any_acl() : "";
                    }
                }
            }
        }
    }

    void change_entry(Policy &wanted)
    {
        const EntryName entry = any_entry();
        wanted.maps.insert({entry.kind, entry.map});
        switch (below(6)) {
        case 0:
            wanted.entries.erase(entry);
            break;
        case 1:
            wanted.entries[entry] = "";
            break;
        case 2:
            wanted.entries[entry] = std::nullopt;
            break;
        default:
            wanted.entries[entry] = any_acl();
        }
    }

    Policy any_policy()
    {
        Policy wanted = model_.policy;
        for (unsigned i = below(10); i > 0; --i) {
            change_entry(wanted);
        }
        if (below(2) == 0 && !wanted.entries.empty()) {
            const auto skipped = below(static_cast<unsigned>(wanted.entries.size()));
            std::next(wanted.entries.begin(), skipped)->second = std::nullopt;
        }
        if (below(4) == 0) {
            const MapName map = any_map();
            wanted.maps.erase(map);
            std::erase_if(wanted.entries, [&map](const auto &entry) {
                return entry.first.kind == map.first && entry.first.map == map.second;
            });
        }
        change_acls(wanted);
        return wanted;
    }

    static MapName map_of(const EntryName &entry) { return {entry.kind, entry.map}; }

    static bool has_entries(const Policy &policy, const MapName &map)
    {
        return std::ranges::any_of(
            policy.entries, [&map](const auto &entry) { return map_of(entry.first) == map; });
    }

    void edit_maps(const Policy &wanted)
    {
        const Policy &present = model_.policy;
        replaced_.clear();
        for (const auto &[kind, map] : present.maps) {
            const bool stays = wanted.maps.contains({kind, map});
            if (!stays || below(12) == 0) {
                erase(map_node(map_kinds[kind], map));
                if (stays) {
                    replaced_.insert({kind, map});
                }
            }
        }
        for (const auto &[kind, map] : wanted.maps) {
            const bool is_gone =
                !present.maps.contains({kind, map}) || replaced_.contains({kind, map});
            if (is_gone && (below(2) == 0 || !has_entries(wanted, {kind, map}))) {
                set(map_node(map_kinds[kind], map), map);
            }
        }
        for (const auto &[entry, named] : present.entries) {
            if (!wanted.entries.contains(entry) && wanted.maps.contains(map_of(entry)) &&
                !replaced_.contains(map_of(entry))) {
                erase(node_of(entry));
            }
        }
    }

    /// Whether the entry's nodes must be set anew: it was not there, or its map is replaced, or it
    /// is to be replaced itself.
    bool begins_anew(const EntryName &entry)
    {
        if (!model_.policy.entries.contains(entry) || replaced_.contains(map_of(entry))) {
            return true;
        }
        const bool is_replaced = below(8) == 0;
        if (is_replaced) {
            erase(node_of(entry));
        }
        return is_replaced;
    }

    void edit_entries(const Policy &wanted)
    {
        for (const auto &[entry, named] : wanted.entries) {
            const bool is_new = begins_anew(entry);
            if (is_new) {
                set(node_of(entry), bt_uint16, std::to_string(entry.priority));
                set(match_of(entry) + "/matchstr", "any");
            }
            if (named) {
                set(acl_node_of(entry), *named);
            } else if (!is_new && model_.policy.entries.at(entry)) {
                erase(below(2) == 0 ? acl_node_of(entry) : match_of(entry));
            }
        }
    }

    void edit(const Policy &wanted)
    {
        edit_maps(wanted);
        edit_entries(wanted);
        for (const std::string &name : model_.policy.acls) {
            if (!wanted.acls.contains(name)) {
                erase(acl(name));
            }
        }
        for (const std::string &name : wanted.acls) {
            set(acl(name), name);
        }
    }

    void expect_agreement()
    {
        std::set<std::string> expected;
        for (const auto &[acl_name, entry] : model_.records) {
            expected.insert(acl_name + "/" + map_kinds[entry.kind].key + "/" + entry.map + "/" +
                            std::to_string(entry.priority));
        }
        const std::vector<std::string> present = records();
        ASSERT_EQ(std::set(present.begin(), present.end()), expected);
        const ReferenceCheck check = check_references(configuration_->running_db());
        EXPECT_EQ(check.records, expected.size());
        EXPECT_TRUE(check.faults.empty()) << check.faults.front().message;
    }

    /// What a commit has answered: with no reason to refuse it, that it is done, and else lines of
    /// which each is such a reason. Not all of them are told: what follows from other changes is
    /// not looked at once one is refused.
    static void expect_answer(const std::string &outcome, const std::set<std::string> &reasons)
    {
        if (reasons.empty()) {
            ASSERT_THAT(outcome, testing::AnyOf("committed", "unchanged"));
            return;
        }
        std::istringstream lines(outcome);
        unsigned refusals = 0;
        for (std::string line; std::getline(lines, line);) {
            // What stands behind a refusal's first line is indented.
            if (!line.starts_with(' ')) {
                ++refusals;
                EXPECT_TRUE(std::ranges::any_of(reasons, [&line](const std::string &reason) {
                    return line.starts_with(reason);
                })) << line;
            }
        }
        ASSERT_GT(refusals, 0U) << outcome;
    }

    /// Entries that name an ACL and are wanted without the node that does.
    unsigned let_go(const Policy &wanted) const
    {
        return static_cast<unsigned>(
            std::ranges::count_if(model_.policy.entries, [&wanted](const auto &entry) {
                const auto after = wanted.entries.find(entry.first);
                return !entry.second.value_or("").empty() && after != wanted.entries.end() &&
                       !after->second;
            }));
    }

    std::set<MapName> replaced_; ///< deleted and set again by the commit that is edited
    std::mt19937 random_{20240307};
    PolicyModel model_;
};

TEST_F(RandomMaps, HaveTheRecordsThatTheModelHas)
{
    G_daemon_log_level = 2;
    unsigned refused = 0;
    unsigned lost = 0;
    constexpr unsigned steps = ovtest::sanitized ? 300 : 600;
    for (unsigned step = 0; step < steps; ++step) {
        SCOPED_TRACE(step);
        const Policy wanted = any_policy();
        edit(wanted);
        const std::string outcome = commit();
        lost += outcome == "committed" ? let_go(wanted) : 0;
        const std::set<std::string> reasons = model_.refusals(wanted);
        expect_answer(outcome, reasons);
        if (reasons.empty()) {
            model_.commit(wanted);
        } else {
            ++refused;
        }
        configuration_->discard();
        expect_agreement();
        if (step % 100 == 99) {
            restart();
            expect_agreement();
        }
        if (HasFatalFailure() || HasNonfatalFailure()) {
            return;
        }
    }
    EXPECT_GT(model_.records.size(), 20U);
    EXPECT_GT(refused, steps / 12) << "the test must come to where commits are refused";
    EXPECT_LT(refused, steps * 3 / 4);
    EXPECT_GT(lost, steps / 12) << "and to entries that lose their ACL's node and stay";
}

} // namespace
