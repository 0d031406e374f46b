#include "framework/md_commit.h"

#include "host/framework/objects.h"
#include "host/framework/sessions.h"
#include "tests/framework/allocation_failure.h"

#include <gtest/gtest.h>

#include <cwchar>
#include <string>

namespace ovhost::test
{
namespace
{

struct FakeCommit : md_commit {
    int refuse(int code, std::string message) override
    {
        last_code = code;
        last_message = std::move(message);
        return answer;
    }

    int answer = 0;
    int last_code = 0;
    std::string last_message = "none";
};

struct FakeSession : gcl_session {
    bool send(const bn_request & /*request*/) override { return true; }
};

TEST(CommitMessage, PassesCodeAndText)
{
    FakeCommit commit;
    ASSERT_EQ(md_commit_set_return_status_msg(&commit, 1, "100 % wrong\n"), 0);
    EXPECT_EQ(commit.last_code, 1);
    EXPECT_EQ(commit.last_message, "100 % wrong\n");
}

TEST(CommitMessage, FormatsWithoutCutting)
{
    FakeCommit commit;
    const std::string long_text(5000, 'm');
    ASSERT_EQ(
        md_commit_set_return_status_msg_fmt(&commit, 1, "Invalid %s - %d\n", long_text.c_str(), 7),
        0);
    EXPECT_EQ(commit.last_message, "Invalid " + long_text + " - 7\n");
}

TEST(CommitMessage, AnswersWhatTheCommitAnswers)
{
    FakeCommit commit;
    commit.answer = 14002;
    EXPECT_EQ(md_commit_set_return_status_msg(&commit, 1, "late"), 14002);
    EXPECT_EQ(md_commit_set_return_status_msg_fmt(&commit, 1, "%s", "late"), 14002);
}

TEST(CommitMessage, ReportsAnArgumentThatCannotBePrinted)
{
    FakeCommit commit;
    constexpr wint_t no_character = 0x7FFFFFFF;
    EXPECT_EQ(md_commit_set_return_status_msg_fmt(&commit, 1, "%lc", no_character), 14000);
    EXPECT_EQ(commit.last_message, "none");
}

TEST(CommitMessage, RefusesNull)
{
    FakeCommit commit;
    const char *no_text = nullptr;
    EXPECT_EQ(md_commit_set_return_status_msg(nullptr, 1, "x"), 14001);
    EXPECT_EQ(md_commit_set_return_status_msg(&commit, 1, no_text), 14001);
    EXPECT_EQ(md_commit_set_return_status_msg_fmt(nullptr, 1, "%s", "x"), 14001);
    EXPECT_EQ(md_commit_set_return_status_msg_fmt(&commit, 1, no_text, 1), 14001);
    EXPECT_EQ(commit.last_message, "none");
}

TEST(CommitMessage, ReportsLackOfMemory)
{
    FakeCommit commit;
    const std::string text(100, 'm');
    expect_allocation_failures_reported(
        [&] { return md_commit_set_return_status_msg(&commit, 1, text.c_str()); });
    expect_allocation_failures_reported(
        [&] { return md_commit_set_return_status_msg_fmt(&commit, 1, "%s", text.c_str()); });
}

TEST(Sessions, ComeAndGo)
{
    FakeSession jsond;
    gcl_session *found = &jsond;
    ASSERT_EQ(md_gcl_find_session("jsond", &found), 0);
    EXPECT_EQ(found, nullptr);
    register_session("jsond", jsond);
    ASSERT_EQ(md_gcl_find_session("jsond", &found), 0);
    EXPECT_EQ(found, &jsond);
    unregister_session("jsond", jsond);
    ASSERT_EQ(md_gcl_find_session("jsond", &found), 0);
    EXPECT_EQ(found, nullptr);
}

TEST(Sessions, AreKeptApartByName)
{
    FakeSession jsond;
    FakeSession other;
    register_session("jsond", jsond);
    register_session("other", other);
    EXPECT_EQ(find_session("jsond"), &jsond);
    EXPECT_EQ(find_session("other"), &other);
    EXPECT_EQ(find_session("json"), nullptr);
    unregister_session("other", other);
    EXPECT_EQ(find_session("jsond"), &jsond);
    unregister_session("jsond", jsond);
}

TEST(Sessions, APeerThatCameBackKeepsItsNameWhenTheOldSessionEnds)
{
    FakeSession old_session;
    FakeSession new_session;
    register_session("jsond", old_session);
    register_session("jsond", new_session);
    unregister_session("jsond", old_session);
    EXPECT_EQ(find_session("jsond"), &new_session);
    unregister_session("jsond", new_session);
    EXPECT_EQ(find_session("jsond"), nullptr);
    unregister_session("jsond", new_session);
}

TEST(Sessions, FindRefusesNull)
{
    gcl_session *found = nullptr;
    EXPECT_EQ(md_gcl_find_session(nullptr, &found), 14001);
    EXPECT_EQ(md_gcl_find_session("jsond", nullptr), 14001);
}

} // namespace
} // namespace ovhost::test
