#include "host/mgmtd/private_root.h"

#include <fcntl.h>
#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <linux/filter.h>
#include <linux/seccomp.h>
#include <sched.h>
#include <sys/mount.h>
#include <sys/prctl.h>
#include <sys/stat.h>
#include <sys/syscall.h>
#include <unistd.h>

#include <array>
#include <cerrno>
#include <cstddef>
#include <filesystem>
#include <functional>
#include <set>
#include <stdexcept>
#include <string>
#include <thread>

#include "tests/store/child.h"
#include "tests/support/files.h"
#include "tests/support/namespaces.h"
#include "tests/support/scratch_dir.h"

namespace
{

namespace fs = std::filesystem;
using ovhost::enter_private_root;
using ovtest::become_unprivileged;
using ovtest::in_child;
using ovtest::ScratchDir;
using ovtest::write_file;

std::string text_of(const fs::path &file)
{
    return ovtest::read_file(file).value_or("");
}

// Names, types and modes of what is in a directory of the machine.
std::set<std::string> listing(const fs::path &dir)
{
    std::set<std::string> entries;
    std::error_code missing;
    for (const auto &entry : fs::directory_iterator(dir, missing)) {
        struct stat about {
        };
        ::lstat(entry.path().c_str(), &about);
        entries.insert(entry.path().filename().string() + " " + std::to_string(about.st_mode) +
                       " " + std::to_string(about.st_ino));
    }
    return entries;
}

std::set<std::string> names_in(const fs::path &dir)
{
    std::set<std::string> names;
    for (const auto &entry : fs::directory_iterator(dir)) {
        names.insert(entry.path().filename().string());
    }
    return names;
}

void mount_memory(const char *dir)
{
    if (::mount("tmpfs", dir, "tmpfs", 0, "mode=0755") != 0) {
        throw std::runtime_error(std::string("cannot mount on ") + dir);
    }
}

// Puts empty directories in memory over the machine's, so that a test says what is in them.
void make_up_a_machine()
{
    ovtest::unshare_as_any_user(CLONE_NEWNS);
    if (::mount(nullptr, "/", nullptr, MS_REC | MS_PRIVATE, nullptr) != 0) {
        throw std::runtime_error("cannot make the mounts private");
    }
    mount_memory("/opt");
    mount_memory("/var/opt");
}

void forbid_unshare()
{
    std::array<sock_filter, 4> rules{{
        BPF_STMT(BPF_LD | BPF_W | BPF_ABS, offsetof(seccomp_data, nr)),
        BPF_JUMP(BPF_JMP | BPF_JEQ | BPF_K, SYS_unshare, 0, 1),
        BPF_STMT(BPF_RET | BPF_K, SECCOMP_RET_ERRNO | EPERM),
        BPF_STMT(BPF_RET | BPF_K, SECCOMP_RET_ALLOW),
    }};
    const sock_fprog program{static_cast<unsigned short>(rules.size()), rules.data()};
    if (::prctl(PR_SET_NO_NEW_PRIVS, 1, 0, 0, 0) != 0 ||
        ::prctl(PR_SET_SECCOMP, SECCOMP_MODE_FILTER, &program) != 0) {
        throw std::runtime_error("cannot forbid unshare");
    }
}

// What a host does in its private root; "done" when all of it worked.
std::string use_private_root(const fs::path &dir)
{
    enter_private_root(dir);
    write_file("/var/opt/tms/x", "from the host");
    write_file("/var/opt/tms/output/y", "an output");
    write_file("/opt/orvale/z", "an etc file");
    if (text_of(dir / "var/opt/tms/x") != "from the host")
        return "not in the root";
    return "done";
}

void expect_written(const fs::path &dir)
{
    EXPECT_EQ(text_of(dir / "var/opt/tms/x"), "from the host");
    EXPECT_EQ(text_of(dir / "var/opt/tms/output/y"), "an output");
    EXPECT_EQ(text_of(dir / "opt/orvale/z"), "an etc file");
}

class PrivateRoot : public testing::Test
{
  protected:
    void SetUp() override { ASSERT_EQ(::chmod(scratch_.path().c_str(), 0777), 0); }

    // None of this may show on the machine.
    void TearDown() override
    {
        EXPECT_EQ(listing("/opt"), opt_);
        EXPECT_EQ(listing("/var/opt"), var_opt_);
        EXPECT_EQ(text_of("/proc/self/mounts"), mounts_);
    }

    ScratchDir scratch_;

  private:
    std::set<std::string> opt_ = listing("/opt");
    std::set<std::string> var_opt_ = listing("/var/opt");
    std::string mounts_ = text_of("/proc/self/mounts");
};

constexpr const char *kNotAllowed =
    "exception: cannot enter a private root: making a user and mount namespace failed: Operation"
    " not permitted; run as root, or allow user namespaces (sysctl"
    " kernel.unprivileged_userns_clone=1, user.max_user_namespaces above 0; a container must allow"
    " unshare and mount)";

bool user_namespaces_allowed()
{
    return in_child([]() -> std::string {
               become_unprivileged();
               return ::unshare(CLONE_NEWUSER | CLONE_NEWNS) == 0 ? "yes" : "no";
           }) == "yes";
}

TEST_F(PrivateRoot, FixedPathsAreInTheDirectory)
{
    EXPECT_EQ(in_child([&] { return use_private_root(scratch_.path()); }), "done");
    expect_written(scratch_.path());
}

// Runs as an unprivileged user. Where those have no namespaces, whatever they ask is refused.
void expect_as_user(const std::string &expected, const std::function<std::string()> &run)
{
    const std::string answer = in_child([&] {
        become_unprivileged();
        return run();
    });
    if (user_namespaces_allowed()) {
        EXPECT_EQ(answer, expected);
    } else {
        EXPECT_THAT(answer, testing::StartsWith("exception: cannot enter a private root: "));
    }
}

TEST_F(PrivateRoot, AnUnprivilegedUserNeedsUserNamespaces)
{
    expect_as_user("done", [&] { return use_private_root(scratch_.path()); });
    if (user_namespaces_allowed())
        expect_written(scratch_.path());
}

TEST_F(PrivateRoot, WithoutNamespacesTheErrorSaysWhatToDo)
{
    EXPECT_EQ(in_child([&] {
                  forbid_unshare();
                  return use_private_root(scratch_.path());
              }),
              kNotAllowed);
}

TEST_F(PrivateRoot, ARelativeDirectoryIsFound)
{
    EXPECT_EQ(in_child([&] {
                  fs::current_path(scratch_.path());
                  enter_private_root(".");
                  write_file("/var/opt/tms/x", "text");
                  return text_of("var/opt/tms/x");
              }),
              "text");
}

TEST_F(PrivateRoot, WhatIsInTheDirectoryAlreadyIsSeen)
{
    fs::create_directories(scratch_ / "var/opt/tms");
    write_file(scratch_ / "var/opt/tms/x", "from before");
    EXPECT_EQ(in_child([&] {
                  enter_private_root(scratch_.path());
                  return text_of("/var/opt/tms/x");
              }),
              "from before");
}

TEST_F(PrivateRoot, AMissingDirectoryIsRefused)
{
    const std::string dir = (scratch_ / "none").string();
    EXPECT_EQ(in_child([&] { return use_private_root(dir); }),
              "exception: cannot enter a private root: opening " + dir +
                  " failed: No such file or directory; make the directory first");
    EXPECT_FALSE(fs::exists(dir));
}

TEST_F(PrivateRoot, ALinkThatLeadsOutIsRefused)
{
    fs::create_directories(scratch_ / "machine");
    fs::create_symlink(scratch_ / "machine", scratch_ / "opt");
    EXPECT_EQ(in_child([&] { return use_private_root(scratch_.path()); }),
              "exception: cannot enter a private root: opening " + (scratch_ / "opt").string() +
                  " failed: Not a directory; it must be a directory and no link");
    EXPECT_EQ(names_in(scratch_ / "machine"), std::set<std::string>{});
}

TEST_F(PrivateRoot, ADirectoryThatCannotBeWrittenIsRefused)
{
    ASSERT_EQ(::chmod(scratch_.path().c_str(), 0555), 0);
    EXPECT_EQ(in_child([&] {
                  become_unprivileged();
                  return use_private_root(scratch_.path());
              }),
              "exception: cannot enter a private root: making " + (scratch_ / "opt").string() +
                  " failed: Permission denied; give this user write permission");
}

TEST_F(PrivateRoot, AProcessWithThreadsIsToldSo)
{
    EXPECT_EQ(in_child([&] {
                  become_unprivileged();
                  std::thread other([] { ::sleep(1); });
                  std::string answer;
                  try {
                      enter_private_root(scratch_.path());
                  } catch (const std::runtime_error &error) {
                      answer = error.what();
                  }
                  other.join();
                  return answer;
              }),
              "cannot enter a private root: making a user and mount namespace failed: Invalid"
              " argument; the process must have one thread");
}

TEST_F(PrivateRoot, AUserStaysBoundByPermissions)
{
    expect_as_user("denied", [&]() -> std::string {
        enter_private_root(scratch_.path());
        write_file("/var/opt/tms/closed", "text");
        ::chmod("/var/opt/tms/closed", 0000);
        if (::open("/var/opt/tms/closed", O_RDONLY) >= 0)
            return "opened";
        return errno == EACCES ? "denied" : "another error";
    });
}

TEST_F(PrivateRoot, CanBeEnteredAgain)
{
    const ScratchDir second;
    EXPECT_EQ(in_child([&] {
                  enter_private_root(scratch_.path());
                  return use_private_root(second.path());
              }),
              "done");
    expect_written(second.path());
    EXPECT_EQ(names_in(scratch_ / "opt/orvale"), std::set<std::string>{});
}

// Each of these tests makes up what the machine has, and enters as root and as another user.
class PrivateRootOnMachine : public PrivateRoot, public testing::WithParamInterface<bool>
{
  protected:
    std::string on_machine(const std::function<void()> &furnish,
                           const std::function<std::string()> &run)
    {
        return in_child([&] {
            make_up_a_machine();
            furnish();
            if (GetParam())
                become_unprivileged();
            return run();
        });
    }
};

TEST_P(PrivateRootOnMachine, ExistingPathsAreCovered)
{
    EXPECT_EQ(on_machine(
                  [] {
                      for (const char *dir : {"/opt/orvale", "/var/opt/tms"}) {
                          fs::create_directory(dir);
                          write_file(fs::path(dir) / "machine", "kept");
                      }
                  },
                  [&]() -> std::string {
                      const std::string answer = use_private_root(scratch_.path());
                      return fs::exists("/opt/orvale/machine") ? "not covered" : answer;
                  }),
              "done");
    expect_written(scratch_.path());
}

TEST_P(PrivateRootOnMachine, NeighboursOfMissingPathsStayVisible)
{
    EXPECT_EQ(on_machine(
                  [] {
                      fs::create_directories("/opt/their/bin");
                      write_file("/opt/their/bin/program", "theirs");
                      write_file("/opt/file", "a file");
                      fs::create_symlink("their/bin", "/opt/link");
                      fs::create_directory("/opt/mounted");
                      mount_memory("/opt/mounted");
                      write_file("/opt/mounted/inside", "mounted");
                      fs::create_directory("/opt/closed");
                      ::chmod("/opt/closed", 0700);
                  },
                  [&]() -> std::string {
                      const std::string answer = use_private_root(scratch_.path());
                      const std::set<std::string> expected{"closed",  "file",   "link",
                                                           "mounted", "orvale", "their"};
                      if (names_in("/opt") != expected)
                          return "other entries";
                      return answer + ": " + text_of("/opt/link/program") + ", " +
                             text_of("/opt/file") + ", " + text_of("/opt/mounted/inside");
                  }),
              "done: theirs, a file, mounted");
}

TEST_P(PrivateRootOnMachine, WhatWouldBeLostBesideThePathsCannotBeWritten)
{
    EXPECT_EQ(on_machine([] {},
                         [&]() -> std::string {
                             enter_private_root(scratch_.path());
                             if (::mkdir("/opt/other", 0755) == 0)
                                 return "made";
                             return errno == EROFS ? "read-only" : "another error";
                         }),
              "read-only");
}

TEST_P(PrivateRootOnMachine, ADirectoryBesideThePathsItself)
{
    EXPECT_EQ(on_machine(
                  [] {
                      fs::create_directories("/opt/demo/root");
                      ::chmod("/opt/demo/root", 0777);
                  },
                  [] { return use_private_root("/opt/demo/root"); }),
              "done");
}

TEST_P(PrivateRootOnMachine, ADirectoryBelowAPathItself)
{
    EXPECT_EQ(on_machine(
                  [] {
                      fs::create_directories("/opt/orvale/root");
                      ::chmod("/opt/orvale/root", 0777);
                  },
                  []() -> std::string {
                      enter_private_root("/opt/orvale/root");
                      write_file("/opt/orvale/z", "text");
                      return fs::exists("/opt/orvale/root") ? "not covered" : "done";
                  }),
              "done");
}

TEST_P(PrivateRootOnMachine, ALinkThatLeadsNowhereIsCoveredToo)
{
    EXPECT_EQ(on_machine([] { fs::create_symlink("/nowhere", "/opt/orvale"); },
                         [&] { return use_private_root(scratch_.path()); }),
              "done");
}

TEST_P(PrivateRootOnMachine, AMissingParentIsNamed)
{
    EXPECT_EQ(on_machine(
                  [] {
                      ::umount("/var/opt");
                      mount_memory("/var");
                  },
                  [&]() -> std::string {
                      try {
                          enter_private_root(scratch_.path());
                      } catch (const std::runtime_error &error) {
                          return error.what();
                      }
                      return "entered";
                  }),
              "cannot enter a private root: opening /var/opt failed: No such file or directory;"
              " make the directory /var/opt");
}

INSTANTIATE_TEST_SUITE_P(RootAndUser, PrivateRootOnMachine, testing::Bool(),
                         [](const auto &about) { return about.param ? "User" : "Root"; });

} // namespace
