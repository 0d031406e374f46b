// Random commits of tunnels against a model of the IDs: what every tunnel must have, which commits
// must be refused, and that a restart changes nothing but what is held back.

#include "framework/sys_time.h"
#include "host/modules/node_access.h"
#include "orvale/md_tunbin_ht.h"
#include "orvale/md_tunneld_tunnel_common.h"
#include "tests/mgmtd/tunnel_fixture.h"
#include "tests/support/sanitized.h"

#include <algorithm>
#include <deque>
#include <map>
#include <random>
#include <set>

namespace
{

using namespace ovhost;
using namespace mgmtd_test;

constexpr unsigned bound_of_ids = 1024;
constexpr unsigned reserve = 20;
constexpr uint32 none = 65535;

struct ModelTunnel {
    unsigned id = 0;
    std::string alias;
};

struct FreeId {
    unsigned id = 0;
    uint64 freed_at = 0; ///< 0: never
};

/// What a commit is to do.
struct Edits {
    std::map<std::string, std::string> added; ///< name and alias
    std::set<std::string> deleted;
    std::map<std::string, std::string> renamed; ///< old name and new name
    std::map<std::string, std::string> aliases; ///< new aliases of tunnels that stay
};

class TunnelModel
{
  public:
    TunnelModel() { forget_times(); }

    /// Makes the edits; false, and nothing is changed, when there are no IDs for them.
    bool commit(const Edits &edits, uint64 now)
    {
        const std::size_t wanted = edits.added.size();
        if (wanted > 0 && tunnels.size() + wanted > bound_of_ids - reserve) {
            return false;
        }
        if (wanted > 0 && is_held(free_[wanted - 1], now)) {
            return false;
        }
        std::vector<unsigned> given;
        for (std::size_t i = 0; i < wanted; ++i) {
            given.push_back(free_[i].id);
        }
        free_.erase(free_.begin(), free_.begin() + static_cast<std::ptrdiff_t>(wanted));
        for (const auto &[name, alias] : edits.aliases) {
            tunnels[name].alias = alias;
        }
        for (const std::string &name : edits.deleted) {
            free_.push_back({tunnels[name].id, now});
            tunnels.erase(name);
        }
        for (const auto &[before, after] : edits.renamed) {
            tunnels[after] = tunnels[before];
            tunnels.erase(before);
        }
        auto id = given.begin();
        for (const auto &[name, alias] : edits.added) {
            tunnels[name] = {*id++, alias};
        }
        return true;
    }

    /// A restart: the free IDs stand in their order, and none is held back.
    void forget_times()
    {
        std::set<unsigned> used;
        for (const auto &[name, tunnel] : tunnels) {
            used.insert(tunnel.id);
        }
        free_.clear();
        for (unsigned id = 0; id < bound_of_ids; ++id) {
            if (!used.contains(id)) {
                free_.push_back({id, 0});
            }
        }
    }

    std::map<std::string, ModelTunnel> tunnels;

  private:
    static bool is_held(const FreeId &id, uint64 now)
    {
        return id.freed_at != 0 && now - id.freed_at <= 60'000;
    }

    std::deque<FreeId> free_;
};

class RandomTunnels : public TunnelTest
{
  protected:
    unsigned below(unsigned limit) { return static_cast<unsigned>(random_() % limit); }

    std::string fresh_name() { return "t" + std::to_string(next_name_++); }

    /// Few aliases for many tunnels, so that they are shared, lost and had alone again.
    std::string any_alias() { return "alias" + std::to_string(below(200)); }

    /// Tunnels that no other edit of this commit is about.
    std::vector<std::string> pick(std::size_t count)
    {
        std::vector<std::string> names;
        for (const auto &entry : model_.tunnels) {
            names.push_back(entry.first);
        }
        std::shuffle(names.begin(), names.end(), random_);
        names.resize(std::min(names.size(), count));
        return names;
    }

    Edits any_edits()
    {
        Edits edits;
        for (unsigned i = below(8); i > 0; --i) {
            edits.added[fresh_name()] = any_alias();
        }
        const std::vector<std::string> names = pick(below(16));
        for (std::size_t i = 0; i < names.size(); ++i) {
            if (i % 2 == 0) {
                edits.deleted.insert(names[i]);
            } else if (i % 4 == 1) {
                edits.renamed[names[i]] = fresh_name();
            } else {
                edits.aliases[names[i]] = any_alias();
            }
        }
        return edits;
    }

    void edit(const Edits &edits)
    {
        for (const std::string &name : edits.deleted) {
            remove(name);
        }
        for (const auto &[before, after] : edits.renamed) {
            const ModelTunnel &tunnel = model_.tunnels.at(before);
            remove(before);
            add(after, tunnel.alias);
            set_id(after, tunnel.id);
        }
        for (const auto &[name, alias] : edits.aliases) {
            set(tunnel(name, "alias"), bt_string, alias);
        }
        for (const auto &[name, alias] : edits.added) {
            add(name, alias);
        }
    }

    /// Configuration, allocator and cache against the model.
    void expect_agreement()
    {
        ASSERT_EQ(static_cast<std::size_t>(md_get_total_tunnels()), model_.tunnels.size());
        std::map<std::string, std::vector<unsigned>> claims;
        for (const auto &[name, expected] : model_.tunnels) {
            ASSERT_EQ(stored(name),
                      "uint16 " + std::to_string(expected.id) + ", string " + expected.alias);
            uint32 id = none;
            ASSERT_EQ(md_get_tunnel_id(TstringCopy(name).get(), &id), 0) << name;
            ASSERT_EQ(id, expected.id) << name;
            ASSERT_EQ(md_tunbin_ht_get_id_by_name(name.c_str()), expected.id) << name;
            ASSERT_STREQ(md_tunbin_ht_get_name_by_id(expected.id), name.c_str());
            claims[expected.alias].push_back(expected.id);
        }
        for (unsigned i = 0; i < 200; ++i) {
            const std::string alias = "alias" + std::to_string(i);
            const std::vector<unsigned> &ids = claims[alias];
            ASSERT_EQ(md_tunbin_ht_get_id_by_alias(alias.c_str()), ids.size() == 1 ? ids[0] : none)
                << alias;
        }
        for (const std::string &name : gone_) {
            ASSERT_EQ(md_tunbin_ht_get_id_by_name(name.c_str()), none) << name;
        }
    }

    /// One commit, whose outcome must be the model's; whether it was accepted.
    bool commit_both(const Edits &edits)
    {
        edit(edits);
        const bool accepted = configuration_->commit(daemon_note("")).accepted();
        EXPECT_EQ(accepted, model_.commit(edits, present_time()));
        if (!accepted) {
            configuration_->discard();
            return false;
        }
        gone_.clear();
        gone_.insert(edits.deleted.begin(), edits.deleted.end());
        for (const auto &entry : edits.renamed) {
            gone_.insert(entry.first);
        }
        return true;
    }

    static uint64 present_time() { return time_info_ptr->time_since_boot_ms; }

    std::mt19937 random_{20240229};
    unsigned next_name_ = 0;
    TunnelModel model_;
    std::set<std::string> gone_;
};

TEST_F(RandomTunnels, HaveWhatTheModelGivesThem)
{
    Edits many;
    for (unsigned i = 0; i < 930; ++i) {
        many.added[fresh_name()] = any_alias();
    }
    G_daemon_log_level = 2; // ambiguous aliases are errors to the library
    ASSERT_TRUE(commit_both(many));
    constexpr unsigned steps = ovtest::sanitized ? 150 : 400;
    unsigned refused = 0;
    for (unsigned step = 0; step < steps; ++step) {
        SCOPED_TRACE(step);
        refused += commit_both(any_edits()) ? 0 : 1;
        if (step % 50 == 49) {
            restart();
            model_.forget_times();
        }
        expect_agreement();
        if (HasFatalFailure() || HasNonfatalFailure()) {
            return;
        }
        pass(below(step % 100 < 60 ? 3'000 : 20'000));
    }
    EXPECT_GT(refused, 10U) << "the test must come to where IDs are held back";
    EXPECT_LT(refused, steps * 3 / 4);
}

} // namespace
