#include "host/mgmtd/commit_watch.h"

#include "host/control/request_handler.h"
#include "host/mgmtd/history_requests.h"
#include "tests/mgmtd/configuration_fixture.h"

#include <nlohmann/json.hpp>

namespace
{

using namespace ovhost;
using namespace mgmtd_test;
using nlohmann::json;

class CommitWatchTest : public ConfigurationTest
{
  protected:
    /// Numbers of the commits that were reported, which are then forgotten.
    std::vector<int> reported()
    {
        std::vector<int> numbers;
        for (const json &event : events_) {
            numbers.push_back(event.at("commit").at("number").get<int>());
        }
        events_.clear();
        return numbers;
    }

    void commit_one(const std::string &value)
    {
        set("/x/a", value);
        ASSERT_EQ(commit(), "committed");
    }

    bool watched_ = true;
    std::vector<json> events_;
    CommitWatch watch_{
        *configuration_,
        {[this] { return watched_; }, [this](const json &event) { events_.push_back(event); }}};
};

TEST_F(CommitWatchTest, TellsEachCommitOnce)
{
    watch_.update();
    EXPECT_EQ(reported(), std::vector<int>{}) << "what was there before is not news";
    const int first = static_cast<int>(configuration_->commit_number()) + 1;
    commit_one("one");
    watch_.update();
    watch_.update();
    EXPECT_EQ(reported(), std::vector<int>{first});
    commit_one("two");
    commit_one("three");
    watch_.update();
    EXPECT_EQ(reported(), (std::vector<int>{first + 1, first + 2}));
}

TEST_F(CommitWatchTest, PassesOverWhatWasStoredWhileNobodyWatched)
{
    watched_ = false;
    commit_one("one");
    watch_.update();
    watched_ = true;
    watch_.update();
    EXPECT_EQ(reported(), std::vector<int>{});
}

TEST_F(CommitWatchTest, TellsTheCommitWithItsChanges)
{
    CommitNote note;
    note.uid = 1000;
    note.author = "alice";
    note.comment = "new site";
    note.time = 1234567890;
    set("/x/a", "one");
    ASSERT_EQ(configuration_->commit(note).outcome, CommitOutcome::committed);
    watch_.update();
    ASSERT_EQ(events_.size(), 1U);
    EXPECT_EQ(events_[0].at("kind"), "commit");
    const json &commit = events_[0].at("commit");
    EXPECT_EQ(commit.at("author"), (json{{"uid", 1000}, {"user", "alice"}}));
    EXPECT_EQ(commit.at("comment"), "new site");
    EXPECT_EQ(commit.at("time"), 1234567890);
    EXPECT_EQ(commit.at("changes"), 1);
    EXPECT_EQ(events_[0].at("changes"), json::parse(R"([{"change":"add","name":"/x/a",
        "old":null,"new":{"type":"string","value":"one"}}])"));
}

TEST_F(CommitWatchTest, LeavesOutChangesThatAreTooManyOrTooLong)
{
    for (int i = 0; i < 1000; ++i) {
        set("/x/n" + std::to_string(i), "v");
    }
    ASSERT_EQ(commit(), "committed");
    watch_.update();
    EXPECT_EQ(events_.back().at("changes").size(), 1000U);
    for (int i = 0; i < 1001; ++i) {
        set("/x/n" + std::to_string(i), "w");
    }
    ASSERT_EQ(commit(), "committed");
    watch_.update();
    EXPECT_TRUE(events_.back().at("changes").is_null());
    EXPECT_EQ(events_.back().at("commit").at("changes"), 1001);
    commit_one(std::string(300000, 'x'));
    watch_.update();
    EXPECT_TRUE(events_.back().at("changes").is_null());
    EXPECT_EQ(events_.size(), 3U);
}

TEST_F(CommitWatchTest, TellsARollback)
{
    commit_one("one");
    const auto back_to = configuration_->commit_number();
    commit_one("two");
    watch_.update();
    events_.clear();
    ASSERT_EQ(configuration_->rollback(back_to, {}).outcome, CommitOutcome::committed);
    watch_.update();
    ASSERT_EQ(events_.size(), 1U);
    EXPECT_EQ(events_[0].at("commit").at("rollback_to"), back_to);
}

TEST(ClientNote, BoundsTheComment)
{
    const auto fault = [](const std::string &comment) -> std::string {
        try {
            return client_note({{"command", "commit"}, {"comment", comment}}, {}).comment;
        } catch (const RequestError &error) {
            return error.code() + ": " + error.what();
        }
    };
    const std::string most(4096, 'x');
    EXPECT_EQ(fault(most), most);
    EXPECT_EQ(fault("two\nlines"), "two\nlines");
    const std::string refusal = "bad-value: a comment has at most 4096 bytes and no NUL character";
    EXPECT_EQ(fault(most + "x"), refusal);
    EXPECT_EQ(fault(std::string("a\0b", 3)), refusal);
}

} // namespace
