#include "host/mgmtd/history_requests.h"

#include "host/control/server.h"
#include "host/mgmtd/requests.h"
#include "host/mgmtd/rollback_target.h"
#include "host/tree/name.h"
#include "tests/mgmtd/fixture.h"

#include <nlohmann/json.hpp>

#include <thread>

namespace
{

using namespace ovhost;
using namespace mgmtd_test;
using namespace std::chrono_literals;
using nlohmann::json;
using testing::Contains;
using testing::HasSubstr;

class HistoryRequests : public DaemonTest
{
  protected:
    HistoryRequests()
    {
        client_.uid = 1000;
        client_.user = "anna";
        restart();
    }

    void restart()
    {
        requests_.reset();
        configuration_.reset();
        configuration_.emplace(state_.path());
        configuration_->start();
        requests_.emplace(*configuration_,
                          DaemonView{[] { return std::vector<PeerStatus>(); },
                                     [this] { ++events_announced_; }, [this] { ++wait_changes_; }});
    }

    json ask(json request) { return requests_->handle(request, client_); }

    /// "CODE: MESSAGE" of what must be refused.
    std::string refusal(const json &request)
    {
        try {
            return "answered: " + ask(request).dump();
        } catch (const RequestError &error) {
            return error.code() + ": " + error.what();
        }
    }

    json commit(const std::string &node, const std::string &value, json arguments = json::object())
    {
        ask({{"command", "set"}, {"name", node}, {"type", "string"}, {"value", value}});
        arguments["command"] = "commit";
        return ask(arguments);
    }

    /// The past deadline of a wait that nobody has ended.
    void pass_deadline()
    {
        while (configuration_->confirmations().time_left() > 0ms) {
            std::this_thread::sleep_for(10ms);
        }
    }

    json recorded(unsigned number)
    {
        return ask({{"command", "show"}, {"what", "commit"}, {"number", number}}).at("commit");
    }

    ClientInfo client_;
    int events_announced_ = 0;
    int wait_changes_ = 0;
    std::optional<Configuration> configuration_;
    std::optional<Requests> requests_;
};

TEST_F(HistoryRequests, AnswerRecords)
{
    const std::int64_t before = commit_time();
    commit("/x", "1", {{"comment", "why"}});
    const json history = ask({{"command", "history"}});
    EXPECT_EQ(history.at("oldest"), 1);
    EXPECT_TRUE(history.at("waits").is_null());
    ASSERT_EQ(history.at("commits").size(), 2U);
    json newest = history.at("commits").at(0);
    EXPECT_GE(newest.at("time"), before);
    EXPECT_LE(newest.at("time"), commit_time());
    newest.erase("time");
    EXPECT_EQ(newest.dump(), R"({"author":{"uid":1000,"user":"anna"},"changes":1,"comment":"why",)"
                             R"("confirmation":null,"number":2,"rollback_to":null})");
    json first = history.at("commits").at(1);
    EXPECT_EQ(first.at("author").dump(), R"({"uid":null,"user":"mgmtd"})");
    EXPECT_EQ(first.at("comment"), "initial configuration");
    EXPECT_EQ(ask({{"command", "history"}, {"limit", 1}}).at("commits").size(), 1U);
}

TEST_F(HistoryRequests, AnswerChanges)
{
    commit("/x", "1");
    const json shown = ask({{"command", "show"}, {"what", "commit"}, {"number", 2}});
    EXPECT_EQ(shown.at("changes").dump(),
              R"([{"change":"add","name":"/x","new":{"type":"string","value":"1"},"old":null}])");
    const json diff = ask({{"command", "diff"}, {"after", 2}, {"to", 1}});
    EXPECT_EQ(
        diff.at("changes").dump(),
        R"([{"change":"delete","name":"/x","new":null,"old":{"type":"string","value":"1"}}])");
    EXPECT_EQ(ask({{"command", "diff"}, {"after", 1}}),
              ask({{"command", "diff"}, {"after", 1}, {"to", 2}}));
}

TEST_F(HistoryRequests, NeedSoundArguments)
{
    EXPECT_EQ(refusal({{"command", "rollback"}}), "bad-request: \"number\" must be given");
    EXPECT_EQ(refusal({{"command", "show"}, {"what", "commit"}}),
              "bad-request: \"number\" must be given");
    for (const unsigned seconds : {0U, 86401U}) {
        EXPECT_EQ(refusal({{"command", "commit"}, {"confirm", seconds}}),
                  "bad-value: \"confirm\" must be from 1 to 86400 seconds");
    }
    EXPECT_EQ(refusal({{"command", "rollback"}, {"number", 2}}),
              "not-found: there is no commit 2 in the history: it holds only commit 1");
    EXPECT_EQ(refusal({{"command", "diff"}, {"after", 1}, {"to", 2}}),
              "not-found: there is no commit 2 in the history: it holds only commit 1");
    EXPECT_EQ(refusal({{"command", "diff"}, {"to", 1}}), "bad-request: \"after\" must be given");
    EXPECT_EQ(refusal({{"command", "history"}, {"limit", 0}}),
              "bad-value: \"limit\" must be 1 at least");
    EXPECT_EQ(refusal({{"command", "confirm"}}), "not-found: no commit waits to be confirmed");
}

TEST_F(HistoryRequests, RollBackByACommitOfTheClient)
{
    commit("/x", "1");
    commit("/x", "2");
    const int events = events_announced_;
    EXPECT_EQ(ask({{"command", "rollback"}, {"number", 2}}).dump(),
              R"({"changes":1,"number":4,"warnings":[]})");
    EXPECT_EQ(events_announced_, events + 1);
    EXPECT_EQ(value_in(configuration_->running(), "/x"), "string 1");
    EXPECT_EQ(recorded(4).at("author").at("user"), "anna");
    EXPECT_EQ(recorded(4).at("comment"), "rollback to commit 2");
    EXPECT_EQ(recorded(4).at("rollback_to"), 2);
    EXPECT_THAT(daemon_log(), testing::Not(Contains(HasSubstr("unless confirmed"))));
}

TEST_F(HistoryRequests, RollBackIsRefusedByModules)
{
    // The ID of the tunnel is held back.
    const std::string tunnel = "/ov/tunneld/tunnel/config/paris";
    commit(tunnel, "paris");
    ask({{"command", "delete"}, {"name", tunnel}});
    ask({{"command", "commit"}});
    const Tree before = configuration_->running();
    EXPECT_EQ(refusal({{"command", "rollback"}, {"number", 2}}),
              "refused: the rollback is refused");
    EXPECT_TRUE(diff(before, configuration_->running()).empty());
    EXPECT_EQ(configuration_->commit_number(), 3U);
}

TEST_F(HistoryRequests, CommitThatWaitsTellsUntilWhen)
{
    const json answer = commit("/x", "1", {{"confirm", 60}});
    EXPECT_EQ(answer.at("waits").dump(),
              R"({"back_to":1,"number":2,"seconds_left":60,"undo_refusal":null})");
    EXPECT_EQ(wait_changes_, 1);
    EXPECT_EQ(ask({{"command", "status"}}).at("waits").at("number"), 2);
    EXPECT_EQ(recorded(2).at("confirmation").dump(),
              R"({"by":null,"state":"waiting","undo_refusal":null})");
    EXPECT_EQ(ask({{"command", "confirm"}}).dump(), R"({"confirmed":{"back_to":1,"number":2}})");
    EXPECT_EQ(wait_changes_, 2);
    EXPECT_FALSE(ask({{"command", "status"}}).contains("waits"));
    EXPECT_FALSE(configuration_->confirmations().time_left());
}

TEST_F(HistoryRequests, NothingToCommitConfirmsOrPutsOffAllTheSame)
{
    commit("/x", "1", {{"confirm", 60}});
    const json again = ask({{"command", "commit"}, {"confirm", 600}});
    EXPECT_EQ(again.at("changes"), 0);
    EXPECT_EQ(again.at("waits").dump(),
              R"({"back_to":1,"number":2,"seconds_left":600,"undo_refusal":null})")
        << "nothing to commit puts off the deadline all the same";
    EXPECT_EQ(ask({{"command", "commit"}}).dump(),
              R"({"changes":0,"confirmed":{"back_to":1,"number":2},"number":2,"warnings":[]})");
}

TEST_F(HistoryRequests, AreUndoneWhenTheTimeIsOver)
{
    commit("/x", "1", {{"confirm", 1}});
    configuration_->undo_if_due();
    EXPECT_EQ(value_in(configuration_->running(), "/x"), "string 1") << "not yet";
    ask({{"command", "set"}, {"name", "/mine"}, {"type", "string"}, {"value", "kept"}});
    pass_deadline();
    configuration_->undo_if_due();
    EXPECT_EQ(value_in(configuration_->running(), "/x"), "none");
    EXPECT_EQ(value_in(configuration_->candidate().tree(), "/x"), "none");
    EXPECT_EQ(value_in(configuration_->candidate().tree(), "/mine"), "string kept");
    EXPECT_EQ(recorded(2).at("confirmation").dump(),
              R"({"by":3,"state":"undone","undo_refusal":null})");
    EXPECT_EQ(recorded(3).at("author").at("user"), "mgmtd");
    EXPECT_EQ(recorded(3).at("rollback_to"), 1);
    EXPECT_THAT(daemon_log(), Contains("warning commit 2 was not confirmed in time: the "
                                       "configuration is again as after commit 1"));
    configuration_->undo_if_due();
    EXPECT_EQ(configuration_->commit_number(), 3U);
}

TEST_F(HistoryRequests, UndoThatChangesNothingEndsTheWait)
{
    commit("/x", "1");
    commit("/x", "2", {{"confirm", 1}});
    commit("/x", "1", {{"confirm", 1}});
    pass_deadline();
    configuration_->undo_if_due();
    EXPECT_EQ(configuration_->commit_number(), 4U);
    EXPECT_FALSE(configuration_->confirmations().time_left());
    EXPECT_FALSE(ask({{"command", "status"}}).contains("waits"));
    for (const unsigned number : {3U, 4U}) {
        EXPECT_EQ(recorded(number).at("confirmation").dump(),
                  R"({"by":null,"state":"undone","undo_refusal":null})")
            << "nobody has confirmed it";
    }
    EXPECT_THAT(daemon_log(), Contains(HasSubstr("commits 3 to 4 were not confirmed in time")));
    EXPECT_THAT(daemon_log(), testing::Not(Contains(HasSubstr("are confirmed"))));
}

TEST_F(HistoryRequests, RefusedUndoIsToldAndPutOff)
{
    const std::string tunnel = "/ov/tunneld/tunnel/config/paris";
    commit(tunnel, "paris");
    ask({{"command", "delete"}, {"name", tunnel}});
    ask({{"command", "commit"}, {"confirm", 1}});
    pass_deadline();
    configuration_->undo_if_due();
    const std::string why = tunnel + "/id: ID 0 was freed a short time ago and is held back";
    EXPECT_THAT(daemon_log(), Contains(HasSubstr("error commit 3 cannot be undone: " + why)));
    EXPECT_EQ(configuration_->commit_number(), 3U);
    EXPECT_GT(configuration_->confirmations().time_left(), 8s);
    EXPECT_THAT(recorded(3).at("confirmation").at("undo_refusal").get<std::string>(),
                HasSubstr(why));
    EXPECT_THAT(ask({{"command", "status"}}).at("waits").at("undo_refusal").get<std::string>(),
                HasSubstr(why));
    // Who confirms now keeps the commit for good.
    EXPECT_EQ(ask({{"command", "confirm"}}).dump(), R"({"confirmed":{"back_to":2,"number":3}})");
}

TEST_F(HistoryRequests, WaitGoesOnAfterARestart)
{
    commit("/x", "1", {{"confirm", 60}});
    restart();
    const auto left = configuration_->confirmations().time_left();
    ASSERT_TRUE(left);
    EXPECT_GT(*left, 50s);
    EXPECT_LE(*left, 60s);
    EXPECT_EQ(value_in(configuration_->running(), "/x"), "string 1");
}

TEST_F(HistoryRequests, ClockThatWentBackMakesNoWaitLonger)
{
    requests_.reset();
    configuration_.reset();
    for (const std::int64_t step : {-1000000, 1000000}) {
        {
            Store store = Store::open(state_.path());
            CommitNote note = daemon_note("");
            note.time += step;
            note.confirm_within = 60;
            const StoredChange change{"/x", StoredValue{bt_string, std::to_string(step)}};
            (void)store.commit(std::span(&change, 1), note);
        }
        restart();
        const auto left = configuration_->confirmations().time_left();
        if (step < 0) {
            EXPECT_FALSE(left) << "it is over";
            EXPECT_EQ(value_in(configuration_->running(), "/x"), "none");
        } else {
            ASSERT_TRUE(left);
            EXPECT_LE(*left, 60s);
        }
        requests_.reset();
        configuration_.reset();
    }
}

TEST(RollbackTarget, LeavesTheReferencesOfAclsAsTheyAre)
{
    const auto tree_of = [](std::initializer_list<const char *> names) {
        Tree tree;
        for (const char *name : names) {
            tree.set(split_name(name).value(), {bt_string, "1"});
        }
        return tree;
    };
    const Tree past =
        tree_of({"/ov/tunneld/acl/config/a", "/ov/tunneld/acl/config/a/entry/10",
                 "/ov/tunneld/acl/config/a/rmap/m/prio/10", "/ov/tunneld/acl/config/new",
                 "/ov/tunneld/acl/config/new/omap/m/prio/10", "/x"});
    const Tree running = tree_of({"/ov/tunneld/acl/config/a", "/ov/tunneld/acl/config/a/entry/20",
                                  "/ov/tunneld/acl/config/a/rmap/m/prio/20",
                                  "/ov/tunneld/acl/config/a/qmap/m/prio/30",
                                  "/ov/tunneld/acl/config/old/rmap/m/prio/40", "/y"});
    EXPECT_EQ(nodes_of(rollback_target(past, running)),
              nodes_of(tree_of({"/ov/tunneld/acl/config/a", "/ov/tunneld/acl/config/a/entry/10",
                                "/ov/tunneld/acl/config/a/rmap/m/prio/20",
                                "/ov/tunneld/acl/config/a/qmap/m/prio/30",
                                "/ov/tunneld/acl/config/new", "/x"})));
}

} // namespace
