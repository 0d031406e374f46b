// Kills the daemon at random moments under a stream of commits, as often as OVMD_KILLS says (10
// unless it is set): each time, all of what was acknowledged must be there after the restart,
// nothing in part, and everything must agree with everything else. scripts/kill-test runs it long.
//
// OVMD_SEED repeats a run's random choices; the moments of the kills are the machine's.

#include "host/control/client.h"
#include "tests/e2e/harness.h"
#include "tests/e2e/kill_model.h"

#include <nlohmann/json.hpp>

#include <chrono>
#include <csignal>
#include <cstdlib>
#include <iostream>
#include <memory>
#include <optional>
#include <random>
#include <string>
#include <thread>

namespace
{

using namespace e2e;
using namespace std::chrono_literals;
using nlohmann::json;
using ovhost::ClientError;
using ovhost::ControlClient;
using ovhost::RequestError;

unsigned from_environment(const char *name, unsigned otherwise)
{
    const char *const text = std::getenv(name);
    return text != nullptr ? static_cast<unsigned>(std::stoul(text)) : otherwise;
}

/// What the clients know of the daemon's state.
struct Knowledge {
    std::uint64_t number = 0;
    KillModel model;
    /// The commit that waits for its confirmation; 0 when none does.
    std::uint64_t waits = 0;
};

class KillTest : public E2eTest
{
  protected:
    KillTest();
    ~KillTest() override;

    void start_daemon();
    void connect() { client_ = std::make_unique<ControlClient>(socket_); }

    /// Commits until the daemon is gone.
    void commit_until_killed();
    void step();
    void commit_edit();
    void roll_back();
    void confirm();

    /// Sends a request that leads to `next` if it is carried out.
    void send(const std::string &command, const json &arguments, const Knowledge &next);

    void verify();
    void verify_number();
    void verify_nodes();
    void verify_tunnels();
    void verify_references();
    void verify_history();
    void verify_acknowledged();

    [[nodiscard]] Nodes read_nodes();

    unsigned seed_ = from_environment("OVMD_SEED", std::random_device{}());
    std::mt19937 random_{seed_};
    std::unique_ptr<ControlClient> client_;
    Nodes first_;
    Knowledge known_;
    /// What is in force if the request under way was carried out before the kill.
    std::optional<Knowledge> under_way_;
    std::map<std::uint64_t, KillModel> past_;
    /// Commits of this life of the daemon, with the number of changes that was acknowledged.
    std::map<std::uint64_t, std::size_t> acknowledged_;
    Nodes verified_;
    std::uint64_t verified_number_ = 0;
    std::map<std::string, unsigned> counts_;
};

KillTest::KillTest()
{
    write_file(root_ + "/opt/orvale/defdb.conf.big", "/ov/model/limits/max_tunnels,uint32,4000\n");
    std::filesystem::permissions(root_ + "/opt/orvale/defdb.conf.big",
                                 std::filesystem::perms(0644));
}

KillTest::~KillTest()
{
    std::cout << "seed " << seed_;
    for (const auto &[what, count] : counts_) {
        std::cout << ", " << count << " " << what;
    }
    std::cout << "\n";
}

void KillTest::start_daemon()
{
    start({"--model", "big"});
    connect();
}

void KillTest::send(const std::string &command, const json &arguments, const Knowledge &next)
{
    under_way_ = next;
    const json answer = client_->call(command, arguments);
    under_way_.reset();
    known_ = next;
    if (answer.contains("number")) {
        EXPECT_EQ(answer.at("number"), next.number) << command;
        if (const std::size_t changes = answer.at("changes"); changes != 0) {
            acknowledged_[next.number] = changes;
        }
        past_[next.number] = next.model;
    }
    ++counts_[command + "s"];
}

void KillTest::commit_edit()
{
    Knowledge next = known_;
    const std::string text = next.model.edit(random_);
    (void)client_->call("load", {{"text", text}});
    ++next.number;
    json arguments = {{"comment", "stamp"}};
    next.waits = 0;
    if (random_() % 4 == 0) {
        arguments["confirm"] = 3600;
        next.waits = next.number;
    }
    send("commit", arguments, next);
}

void KillTest::roll_back()
{
    const std::uint64_t oldest = past_.begin()->first;
    const std::uint64_t back = std::min<std::uint64_t>(random_() % 6, known_.number - oldest);
    const std::uint64_t target = known_.number - back;
    Knowledge next = known_;
    next.model = past_.at(target);
    next.waits = 0;
    // There is nothing to commit when nothing differs.
    next.number += next.model.nodes() == known_.model.nodes() ? 0 : 1;
    send("rollback", {{"number", target}}, next);
}

void KillTest::confirm()
{
    Knowledge next = known_;
    next.waits = 0;
    send("confirm", json::object(), next);
}

void KillTest::step()
{
    try {
        const auto choice = random_() % 8;
        if (choice == 0) {
            roll_back();
        } else if (choice <= 2 && known_.waits != 0) {
            confirm();
        } else {
            commit_edit();
        }
    } catch (const RequestError &refusal) {
        // A tunnel's ID may be held back, or another one than it was.
        EXPECT_EQ(refusal.code(), "refused") << refusal.what();
        for (const auto &detail : refusal.details()) {
            EXPECT_EQ(detail.module, "tunnels") << detail.message;
        }
        ++counts_["refusals"];
        under_way_.reset();
        (void)client_->call("discard");
    }
}

void KillTest::commit_until_killed()
{
    const auto delay = std::chrono::microseconds(random_() % 150000);
    std::jthread killer([this, delay] {
        std::this_thread::sleep_for(delay);
        daemon_->signal(SIGKILL);
    });
    try {
        while (!HasFailure()) {
            step();
        }
    } catch (const ClientError &) {
        ++counts_["kills"];
    }
    killer.join();
    EXPECT_EQ(daemon_->wait(), 128 + SIGKILL);
}

Nodes KillTest::read_nodes()
{
    Nodes nodes;
    const json answer = client_->call("get", {{"name", "/"}, {"subtree", true}});
    for (const json &node : answer.at("nodes")) {
        nodes[node.at("name")] = {node.at("type"), node.at("value")};
    }
    return nodes;
}

void KillTest::verify()
{
    verify_number();
    verify_nodes();
    verify_tunnels();
    verify_references();
    verify_acknowledged();
    verify_history();
    acknowledged_.clear();
}

/// Settles what became of the request under way. Its effect shows in the number, or in the wait.
void KillTest::verify_number()
{
    const json status = client_->call("status");
    const std::uint64_t number = status.at("commit");
    const std::uint64_t waits =
        status.contains("waits") ? status.at("waits").at("number").get<std::uint64_t>() : 0;
    if (under_way_ && under_way_->number == number && under_way_->waits == waits) {
        counts_["carried out without an answer"] += number != known_.number ? 1 : 0;
        known_ = *under_way_;
        past_[number] = known_.model;
    }
    under_way_.reset();
    ASSERT_EQ(number, known_.number);
    ASSERT_EQ(waits, known_.waits);
}

void KillTest::verify_nodes()
{
    const Nodes present = read_nodes();
    Nodes without_ids = present;
    std::erase_if(without_ids, [](const auto &node) {
        return node.first.starts_with(tunnels_root) && node.first.ends_with("/id");
    });
    Nodes expected = first_;
    expected.merge(known_.model.nodes());
    ASSERT_EQ(without_ids, expected);
    // What the history says was changed since the last time leads to what is there.
    Nodes led_to = verified_;
    const json diff = client_->call("diff", {{"after", verified_number_}, {"to", known_.number}});
    for (const json &change : diff.at("changes")) {
        const std::string name = change.at("name");
        const auto before = led_to.find(name);
        ASSERT_EQ(change.at("old").is_null(), before == led_to.end()) << name;
        led_to.erase(name);
        if (!change.at("new").is_null()) {
            led_to[name] = {change.at("new").at("type"), change.at("new").at("value")};
        }
    }
    ASSERT_EQ(led_to, present);
    verified_ = present;
    verified_number_ = known_.number;
}

void KillTest::verify_tunnels()
{
    std::map<std::string, std::string> ids;
    std::set<std::string> different;
    const json tunnels = client_->call("show", {{"what", "tunnels"}});
    for (const json &tunnel : tunnels.at("tunnels")) {
        const std::string name = tunnel.at("name");
        const std::string id = std::to_string(tunnel.at("id").get<unsigned>());
        ASSERT_EQ(verified_.at(tunnels_root + name + "/id").second, id);
        ASSERT_TRUE(different.insert(id).second) << "ID " << id << " twice";
        // The allocator and the cache of this life have taken the tunnel up.
        const json found =
            client_->call("show", {{"what", "tunnel"}, {"tunnel_id", std::stoul(id)}});
        ASSERT_EQ(found.at("tunnels").at(0).at("name"), name);
    }
    ASSERT_EQ(different.size(), known_.model.tunnels().size());
    const json tables = client_->call("show", {{"what", "tunnel-tables"}});
    ASSERT_EQ(tables.at("ids").at("in_use"), different.size());
}

void KillTest::verify_references()
{
    const json check = client_->call("show", {{"what", "references"}, {"check", true}});
    ASSERT_EQ(check.at("faults"), json::array());
    ASSERT_EQ(check.at("records"), known_.model.references());
}

void KillTest::verify_acknowledged()
{
    for (const auto &[number, changes] : acknowledged_) {
        const json shown = client_->call("show", {{"what", "commit"}, {"number", number}});
        ASSERT_EQ(shown.at("changes").size(), changes) << "commit " << number;
        ASSERT_EQ(shown.at("commit").at("changes"), changes);
        ++counts_["acknowledged commits looked up"];
    }
}

void KillTest::verify_history()
{
    std::uint64_t expected = known_.number;
    const json history = client_->call("history", {{"limit", 60}});
    for (const json &commit : history.at("commits")) {
        ASSERT_EQ(commit.at("number"), expected--);
        const json &confirmation = commit.at("confirmation");
        const bool waits = !confirmation.is_null() && confirmation.at("state") == "waiting";
        // Commits before the last one may wait together with it.
        ASSERT_TRUE(known_.waits != 0 || !waits) << commit;
        ASSERT_TRUE(known_.waits != commit.at("number") || waits) << commit;
    }
    ASSERT_EQ(history.at("commits").size(), std::min<std::uint64_t>(known_.number, 60));
}

TEST_F(KillTest, LosesNoAcknowledgedCommitAndKeepsNoneInPart)
{
    start_daemon();
    first_ = verified_ = read_nodes();
    known_.number = verified_number_ = 1;
    past_[1] = {};
    const unsigned kills = from_environment("OVMD_KILLS", 10);
    for (unsigned round = 1; round <= kills && !HasFailure(); ++round) {
        SCOPED_TRACE("kill " + std::to_string(round));
        commit_until_killed();
        if (!HasFailure()) {
            start_daemon();
            verify();
        }
    }
    EXPECT_GT(known_.number, 1U) << "no commit came through at all";
}

} // namespace
