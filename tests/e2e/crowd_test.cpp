// A hundred clients of the real daemon at once: everyone gets the right answers, and the commits
// together hold what everyone has set, once.

#include "host/control/client.h"
#include "tests/e2e/harness.h"
#include "tests/support/sanitized.h"

#include <nlohmann/json.hpp>

#include <future>
#include <map>

namespace
{

using namespace e2e;
using nlohmann::json;
using ovhost::ControlClient;
using testing::Each;
using testing::EndsWith;
using testing::IsEmpty;

constexpr int clients = 100;
constexpr int rounds = ovtest::sanitized ? 2 : 4;

/// What one client has seen.
struct Share {
    std::vector<std::string> wrong;
    std::map<long, long> commits; ///< the changes of each commit that it made, by number
};

/// One client's work: a node of its own in a candidate that all of them share. Whoever commits
/// first commits for the others, too, so that a client's own commit may find nothing left to do.
class Member
{
  public:
    Member(ControlClient &client, int number, const json &mode)
        : client_(client), node_("/crowd/c" + std::to_string(number)), mode_(mode)
    {
    }

    Share take_part()
    {
        for (int round = 1; round <= rounds; ++round) {
            const std::string value = std::to_string(round);
            const json nodes = {
                {"nodes", json::array({{{"name", node_}, {"type", "uint32"}, {"value", value}}})}};
            expect("set", {{"name", node_}, {"type", "uint32"}, {"value", value}}, json::object());
            expect("get", {{"name", node_}, {"from", "candidate"}}, nodes);
            expect("show", {{"what", "mode"}}, mode_);
            commit();
            expect("get", {{"name", node_}}, nodes);
            check_status();
        }
        return share_;
    }

  private:
    void expect(const char *command, const json &arguments, const json &right)
    {
        const json answer = client_.call(command, arguments);
        if (answer != right) {
            share_.wrong.push_back(node_ + " " + command + ": " + answer.dump() + " instead of " +
                                   right.dump());
        }
    }

    void commit()
    {
        const json answer = client_.call("commit");
        const long number = answer.at("number").get<long>();
        const long changes = answer.at("changes").get<long>();
        const json right = {{"number", number}, {"changes", changes}, {"warnings", json::array()}};
        if (answer != right || number < newest_ || changes < 0 || changes > clients) {
            share_.wrong.push_back(node_ + " commit: " + answer.dump() + " after commit " +
                                   std::to_string(newest_));
        }
        if (changes > 0) {
            share_.commits[number] = changes;
        }
        newest_ = number;
    }

    void check_status()
    {
        const json answer = client_.call("status");
        const long number = answer.at("commit").get<long>();
        if (number < newest_ || answer.at("candidate_changes").get<long>() > clients ||
            answer.at("peers") != json::array()) {
            share_.wrong.push_back(node_ + " status: " + answer.dump() + " after commit " +
                                   std::to_string(newest_));
        }
        newest_ = number;
    }

    ControlClient &client_;
    std::string node_;
    const json &mode_;
    long newest_ = 1; // the first start's
    Share share_;
};

class Crowd : public E2eTest
{
  protected:
    /// All clients connect before the first one asks, and stay until the last one has its answers.
    std::vector<Share> let_all_work()
    {
        std::vector<std::unique_ptr<ControlClient>> connections;
        for (int i = 0; i < clients; ++i) {
            connections.push_back(std::make_unique<ControlClient>(socket_));
        }
        const json mode = connections.front()->call("show", {{"what", "mode"}});
        EXPECT_EQ(mode.at("mode"), "bridge");
        std::vector<std::future<Share>> work;
        for (int i = 0; i < clients; ++i) {
            ControlClient &client = *connections[static_cast<std::size_t>(i)];
            work.push_back(std::async(std::launch::async, [&client, &mode, i] {
                return Member(client, i, mode).take_part();
            }));
        }
        std::vector<Share> shares;
        for (std::future<Share> &one : work) {
            shares.push_back(one.get());
        }
        return shares;
    }
};

TEST_F(Crowd, AHundredClientsWorkAtOnce)
{
    start();
    std::map<long, long> commits;
    for (const Share &share : let_all_work()) {
        EXPECT_THAT(share.wrong, IsEmpty());
        for (const auto &[number, changes] : share.commits) {
            EXPECT_TRUE(commits.emplace(number, changes).second) << number << " was made twice";
        }
    }
    ASSERT_FALSE(commits.empty());
    EXPECT_EQ(commits.begin()->first, 2);
    EXPECT_EQ(commits.rbegin()->first, static_cast<long>(commits.size()) + 1) << "none is missing";
    long changes = 0;
    for (const auto &commit : commits) {
        changes += commit.second;
    }
    EXPECT_EQ(changes, clients * rounds) << "every edit was committed once";
    EXPECT_EQ(ovctl({"diff"}), done());
    const auto nodes = lines_of(ovctl({"get", "/crowd", "--subtree"}).out);
    EXPECT_EQ(nodes.size(), std::size_t{clients});
    EXPECT_THAT(nodes, Each(EndsWith(" uint32 " + std::to_string(rounds))));
}

} // namespace
