#include "host/store/state_dir.h"

#include <gtest/gtest.h>
#include <sched.h>
#include <sys/stat.h>
#include <unistd.h>

#include <memory>

#include "host/store/store_error.h"
#include "tests/store/child.h"
#include "tests/store/store_testing.h"
#include "tests/support/scratch_dir.h"

namespace
{

using ovhost::StateDir;
using ovhost::StoreError;
using ovtest::in_child;
using ovtest::ScratchDir;

std::string lock_refusal(const std::filesystem::path &dir)
{
    try {
        const StateDir held(dir);
        return {};
    } catch (const StoreError &error) {
        return error.what();
    }
}

mode_t mode_of(const std::filesystem::path &file)
{
    struct stat about {
    };
    if (::stat(file.c_str(), &about) != 0)
        return 0;
    return about.st_mode & 07777;
}

TEST(StateDir, IsMadeForItsUserOnly)
{
    const ScratchDir scratch;
    const StateDir dir(scratch / "state");
    EXPECT_EQ(dir.path(), scratch / "state");
    EXPECT_EQ(mode_of(scratch / "state"), 0700U);
    EXPECT_EQ(mode_of(scratch / "state/lock"), 0600U);
}

TEST(StateDir, AnExistingOneIsClosedToOtherUsers)
{
    for (const char *file : {"", "lock", "config.db", "config.db-wal"}) {
        const ScratchDir scratch;
        if (*file != '\0')
            ovtest::write_file(scratch / file, "");
        ASSERT_EQ(::chmod(scratch.path().c_str(), 0777), 0);
        const StateDir dir(scratch.path());
        EXPECT_EQ(mode_of(scratch.path()), 0700U) << file;
    }
}

TEST(StateDir, OneThatHoldsOtherFilesTooKeepsItsMode)
{
    const ScratchDir scratch;
    ovtest::write_file(scratch / "other", "");
    const StateDir dir(scratch.path());
    EXPECT_EQ(mode_of(scratch.path()), 0755U);
}

TEST(StateDir, OneThatHoldsOtherFilesTooAndIsOpenToOtherUsersIsRefused)
{
    const ScratchDir scratch;
    ovtest::write_file(scratch / "other", "");
    for (const mode_t mode : {0777U, 01777U, 0775U, 0757U}) {
        ASSERT_EQ(::chmod(scratch.path().c_str(), mode), 0);
        EXPECT_EQ(lock_refusal(scratch.path()),
                  "other users can write the state directory " + scratch.path().string() +
                      "; give it mode 0700, or choose another state directory");
        EXPECT_EQ(mode_of(scratch.path()), mode);
        EXPECT_FALSE(std::filesystem::exists(scratch / "lock"));
    }
}

TEST(StateDir, ASecondHolderIsRefusedWithTheNumberOfTheFirst)
{
    const ScratchDir scratch;
    const StateDir dir(scratch.path());
    const std::string expected =
        "the state directory " + scratch.path().string() + " is held by another daemon (process " +
        std::to_string(::getpid()) + "); end that daemon, or choose another state directory";
    EXPECT_EQ(lock_refusal(scratch.path()), expected);
    EXPECT_EQ(in_child([&] { return lock_refusal(scratch.path()); }), expected);
}

TEST(StateDir, ARefusalWithoutAKnownHolderSaysSo)
{
    const ScratchDir scratch;
    const StateDir dir(scratch.path());
    // Nothing, no line end, an empty line, other text, and more text than a number is long.
    for (const std::string &text :
         {std::string(), std::string("12"), std::string("\n"), std::string("12 monkeys\n"),
          std::string("12\n13\n"), std::string("-1\n"), std::string(30, '1') + "\n"}) {
        ovtest::write_file(scratch / "lock", text);
        EXPECT_EQ(lock_refusal(scratch.path()),
                  "the state directory " + scratch.path().string() +
                      " is held by another daemon; end that daemon, or choose another state"
                      " directory")
            << text;
    }
}

TEST(StateDir, IsFreeAgainAfterItsHolder)
{
    const ScratchDir scratch;
    auto first = std::make_unique<StateDir>(scratch.path());
    first.reset();
    EXPECT_EQ(lock_refusal(scratch.path()), "");
}

TEST(StateDir, IsFreeAgainAfterItsHolderDied)
{
    const ScratchDir scratch;
    EXPECT_EQ(in_child([&]() -> std::string {
                  const StateDir held(scratch.path());
                  ::_exit(9);
              }),
              "died");
    EXPECT_EQ(lock_refusal(scratch.path()), "");
}

TEST(StateDir, ItsLockDoesNotPassToProgramsStarted)
{
    const ScratchDir scratch;
    auto held = std::make_unique<StateDir>(scratch.path());
    const pid_t sleeper = ::fork();
    if (sleeper == 0) {
        ::execlp("sleep", "sleep", "60", nullptr);
        ::_exit(127);
    }
    ASSERT_GT(sleeper, 0);
    // Until the child's exec its copy of the descriptor still holds the lock.
    const auto exe = std::filesystem::path("/proc") / std::to_string(sleeper) / "exe";
    const auto own = std::filesystem::read_symlink("/proc/self/exe");
    for (int i = 0; i < 1000 && std::filesystem::read_symlink(exe) == own; ++i)
        ::usleep(5000);
    held.reset();
    EXPECT_EQ(lock_refusal(scratch.path()), "");
    ::kill(sleeper, SIGKILL);
    ::waitpid(sleeper, nullptr, 0);
}

TEST(StateDir, AMissingParentIsNotMade)
{
    const ScratchDir scratch;
    const std::string dir = (scratch / "none/state").string();
    EXPECT_EQ(lock_refusal(dir), "cannot make the state directory " + dir +
                                     ": No such file or directory; make its parent directory"
                                     " first");
    EXPECT_FALSE(std::filesystem::exists(scratch / "none"));
}

TEST(StateDir, AFileInItsPlaceIsRefused)
{
    const ScratchDir scratch;
    ovtest::write_file(scratch / "state", "text");
    const std::string dir = (scratch / "state").string();
    EXPECT_EQ(lock_refusal(dir), "the state directory " + dir +
                                     " is not a directory; move it away, or choose another state"
                                     " directory");
    EXPECT_EQ(ovtest::read_file(dir), "text");
}

TEST(StateDir, OneThatCannotBeWrittenIsRefused)
{
    const ScratchDir scratch;
    const std::string dir = (scratch / "state").string();
    ASSERT_EQ(::mkdir(dir.c_str(), 0555), 0);
    EXPECT_EQ(in_child([&] {
                  ovtest::become_unprivileged();
                  return lock_refusal(dir);
              }),
              "the state directory " + dir +
                  " cannot be written: Permission denied; give this user write permission, or"
                  " choose another state directory");
}

TEST(StateDir, OneOfAnotherUserIsRefused)
{
    EXPECT_EQ(in_child([] {
                  ovtest::become_unprivileged();
                  const std::string user = std::to_string(::geteuid());
                  // In there the owner of the folder is somebody else than this user and root.
                  if (::unshare(CLONE_NEWUSER) != 0)
                      return std::string("no user namespace");
                  ovtest::write_file("/proc/self/uid_map", "0 " + user + " 1");
                  return lock_refusal("/var/tmp");
              }),
              "the state directory /var/tmp belongs to another user (uid 65534); make it this"
              " user's, or choose another state directory");
}

TEST(StateDir, OneThatCannotBeMadeIsRefused)
{
    const ScratchDir scratch;
    ASSERT_EQ(::mkdir((scratch / "closed").c_str(), 0555), 0);
    const std::string dir = (scratch / "closed/state").string();
    EXPECT_EQ(in_child([&] {
                  ovtest::become_unprivileged();
                  return lock_refusal(dir);
              }),
              "cannot make the state directory " + dir +
                  ": Permission denied; make it, or choose another state directory");
}

TEST(StateDir, SomethingElseInTheLocksPlaceIsRefused)
{
    const ScratchDir scratch;
    ASSERT_EQ(::mkdir((scratch / "lock").c_str(), 0755), 0);
    EXPECT_EQ(lock_refusal(scratch.path()),
              "cannot open the lock file " + (scratch / "lock").string() +
                  ": Is a directory; move it away, or give this user read and write permission");
}

} // namespace
