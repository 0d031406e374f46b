// Lets every write and every flush of the store fail in turn, once and for good, and looks at
// what is left: in the store at hand, and in a copy of its files, which is what a crash at that
// moment would leave.

#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <signal.h>
#include <sqlite3.h>
#include <sys/resource.h>
#include <sys/syscall.h>
#include <unistd.h>

#include <cerrno>
#include <map>
#include <optional>
#include <vector>

#include "host/store/store.h"
#include "tests/store/child.h"
#include "tests/store/store_testing.h"
#include "tests/support/scratch_dir.h"

namespace
{

namespace fs = std::filesystem;
using ovhost::Store;
using ovhost::StoreError;
using ovtest::gone;
using ovtest::Nodes;
using ovtest::nodes_of;
using ovtest::numbered;
using ovtest::put;
using ovtest::ScratchDir;

// Counts the operations; the nth fails, and with `lasting` every later one.
struct Faults {
    bool active = false;
    bool lasting = false;
    bool flushes_only = false;
    int fail_at = 0;
    int seen = 0;
    int hits = 0;

    bool hit(bool flush)
    {
        if (!active || (flushes_only && !flush))
            return false;
        ++seen;
        if (seen < fail_at || (seen > fail_at && !lasting))
            return false;
        ++hits;
        return true;
    }
};

Faults faults;

class FaultsFrom
{
  public:
    FaultsFrom(int fail_at, bool lasting, bool flushes_only = false)
    {
        faults = {true, lasting, flushes_only, fail_at, 0, 0};
    }
    FaultsFrom(const FaultsFrom &) = delete;
    FaultsFrom &operator=(const FaultsFrom &) = delete;
    ~FaultsFrom() { faults.active = false; }
};

ssize_t failing_write(int fd, const void *bytes, std::size_t size)
{
    if (!faults.hit(false))
        return ::write(fd, bytes, size);
    errno = ENOSPC;
    return -1;
}

ssize_t failing_pwrite(int fd, const void *bytes, std::size_t size, off_t offset)
{
    if (!faults.hit(false))
        return ::pwrite(fd, bytes, size, offset);
    errno = ENOSPC;
    return -1;
}

int failing_ftruncate(int fd, off_t size)
{
    if (!faults.hit(false))
        return ::ftruncate(fd, size);
    errno = EIO;
    return -1;
}

template <class Function>
sqlite3_syscall_ptr as_system_call(Function *function)
{
    return reinterpret_cast<sqlite3_syscall_ptr>(function);
}

void put_faults_beneath_sqlite()
{
    sqlite3_vfs *vfs = sqlite3_vfs_find(nullptr);
    vfs->xSetSystemCall(vfs, "write", as_system_call(failing_write));
    vfs->xSetSystemCall(vfs, "pwrite", as_system_call(failing_pwrite));
    vfs->xSetSystemCall(vfs, "pwrite64", as_system_call(failing_pwrite));
    vfs->xSetSystemCall(vfs, "ftruncate", as_system_call(failing_ftruncate));
}

int failing_flush(long call, int fd)
{
    if (!faults.hit(true))
        return static_cast<int>(::syscall(call, fd));
    errno = EIO;
    return -1;
}

} // namespace

// SQLite has no seam for its flushes: these stand in for the C library's.
extern "C" int fsync(int fd)
{
    return failing_flush(SYS_fsync, fd);
}
extern "C" int fdatasync(int fd)
{
    return failing_flush(SYS_fdatasync, fd);
}

namespace
{

struct Content {
    std::uint64_t number = 0;
    Nodes nodes;
    std::map<std::uint64_t, std::vector<ovhost::RecordedChange>> history;
    std::optional<ovhost::Wait> wait;

    bool operator==(const Content &) const = default;
};

Content content_of(const Store &store)
{
    Content content{store.commit_number(), nodes_of(store), {}, store.wait()};
    for (const ovhost::RecordedCommit &commit : store.history(100))
        content.history[commit.number] = store.changes_of(commit.number);
    return content;
}

// What a crash now would leave.
Content content_after_crash(const fs::path &dir)
{
    const ScratchDir copy;
    for (const auto &[name, bytes] : ovtest::files_of(dir)) {
        ovtest::write_file(copy / name, bytes);
    }
    return content_of(Store::open(copy.path()));
}

class StoreFault : public testing::TestWithParam<bool>
{
  protected:
    static void SetUpTestSuite() { put_faults_beneath_sqlite(); }
    static void TearDownTestSuite()
    {
        sqlite3_vfs *vfs = sqlite3_vfs_find(nullptr);
        vfs->xSetSystemCall(vfs, nullptr, nullptr);
    }

    // Whether the commit was acknowledged.
    static bool try_commit(Store &store, int fail_at, bool lasting)
    {
        const FaultsFrom active(fail_at, lasting);
        try {
            auto changes = numbered(200, "after");
            changes.push_back(gone("/kept"));
            ovhost::CommitNote note;
            note.confirm_within = 60;
            store.commit(changes, note);
            return true;
        } catch (const StoreError &) {
            return false;
        }
    }
};

TEST_P(StoreFault, ACommitIsStoredWholeOrNotAtAll)
{
    const bool lasting = GetParam();
    int refusals = 0;
    for (int n = 1;; ++n) {
        SCOPED_TRACE(n);
        const ScratchDir scratch;
        Content expected;
        {
            Store store = Store::open(scratch.path());
            store.commit(numbered(200, "before"));
            store.commit(std::vector{put("/kept", "1")});
            const Content before = content_of(store);
            const bool acknowledged = try_commit(store, n, lasting);
            if (faults.hits == 0) {
                EXPECT_TRUE(acknowledged);
                break;
            }
            if (!acknowledged) {
                ++refusals;
                EXPECT_EQ(content_of(store), before);
            }
            // A disk that fails for good cannot be cleared of what it holds already.
            if (acknowledged || !lasting) {
                EXPECT_EQ(content_after_crash(scratch.path()), content_of(store));
            }
            EXPECT_EQ(store.commit(std::vector{put("/next", "1")}), acknowledged ? 4U : 3U);
            EXPECT_EQ(content_after_crash(scratch.path()), content_of(store));
            expected = content_of(store);
        }
        EXPECT_EQ(content_of(Store::open(scratch.path())), expected);
    }
    EXPECT_GT(refusals, 2);
}

TEST_P(StoreFault, AConfirmationIsStoredOrTheWaitGoesOn)
{
    const bool lasting = GetParam();
    int refusals = 0;
    for (int n = 1;; ++n) {
        SCOPED_TRACE(n);
        const ScratchDir scratch;
        Store store = Store::open(scratch.path());
        ovhost::CommitNote note;
        note.confirm_within = 60;
        store.commit(std::vector{put("/a", "1")}, note);
        const Content before = content_of(store);
        bool acknowledged = true;
        {
            const FaultsFrom active(n, lasting);
            try {
                store.end_wait(ovhost::Confirmation::confirmed);
            } catch (const StoreError &error) {
                EXPECT_THAT(
                    error.what(),
                    testing::StartsWith("cannot store the end of the wait for a confirmation in "));
                acknowledged = false;
                ++refusals;
            }
        }
        EXPECT_EQ(store.wait().has_value(), !acknowledged);
        if (!acknowledged) {
            EXPECT_EQ(content_of(store), before);
        }
        if (acknowledged || !lasting) {
            EXPECT_EQ(content_after_crash(scratch.path()), content_of(store));
        }
        if (faults.hits == 0)
            break;
    }
    EXPECT_GT(refusals, 0);
}

TEST_P(StoreFault, NoCommitIsAcknowledgedBeforeItIsOnTheDisk)
{
    const ScratchDir scratch;
    Store store = Store::open(scratch.path());
    // The first commit begins the log, which is flushed for its own sake.
    store.commit(std::vector{put("/a", "1")});
    for (int round = 0; round < 3; ++round) {
        const FaultsFrom active(1, GetParam(), true);
        EXPECT_THROW(store.commit(std::vector{put("/b", "1")}), StoreError);
    }
    EXPECT_EQ(store.commit_number(), 1U);
}

TEST_P(StoreFault, ACommitThatMovesTheLogIntoTheDatabase)
{
    // Commits go by until one moves the log, which is the one with more operations.
    const bool lasting = GetParam();
    const std::string big(5'000'000, 'b');
    for (int n = 1, hits = 1; hits != 0; n = n < 20 ? n + 1 : n * 3 / 2) {
        SCOPED_TRACE(n);
        const ScratchDir scratch;
        Store store = Store::open(scratch.path());
        store.commit(std::vector{put("/a", "1")});
        const Content before = content_of(store);
        bool acknowledged = true;
        {
            const FaultsFrom active(n, lasting);
            try {
                store.commit(std::vector{put("/big", big)});
            } catch (const StoreError &) {
                acknowledged = false;
            }
        }
        hits = faults.hits;
        EXPECT_TRUE(acknowledged ? store.commit_number() == 2 : content_of(store) == before);
        EXPECT_EQ(nodes_of(store).count("/big"), acknowledged ? 1U : 0U);
        if (acknowledged || !lasting) {
            EXPECT_TRUE(content_after_crash(scratch.path()) == content_of(store));
        }
    }
}

TEST_P(StoreFault, ANewStoreIsMadeWholeOrNotAtAll)
{
    int refusals = 0;
    for (int n = 1;; ++n) {
        SCOPED_TRACE(n);
        const ScratchDir scratch;
        {
            const FaultsFrom active(n, GetParam());
            if (!ovtest::refusal(scratch.path()).empty())
                ++refusals;
        }
        if (faults.hits == 0)
            break;
        EXPECT_EQ(ovtest::refusal(scratch.path()), "");
        EXPECT_TRUE(Store::open(scratch.path()).empty());
    }
    EXPECT_GT(refusals, 2);
}

TEST_P(StoreFault, ANewStoreThatFindsNoRoomDoesNotAskForPermissions)
{
    using testing::EndsWith;
    for (int n = 1;; ++n) {
        SCOPED_TRACE(n);
        const ScratchDir scratch;
        std::string message;
        {
            const FaultsFrom active(n, GetParam());
            message = ovtest::refusal(scratch.path());
        }
        if (faults.hits == 0)
            break;
        EXPECT_THAT(message, testing::Not(testing::HasSubstr("permission")));
        if (n == 1) {
            EXPECT_THAT(message, testing::StartsWith("cannot write the configuration database " +
                                                     scratch.path().string()));
            EXPECT_THAT(message, EndsWith("(No space left on device); free space on its file system"
                                          " and start again"));
        }
    }
}

TEST_P(StoreFault, TheEndOfAStoreLosesNothing)
{
    for (int n = 1;; ++n) {
        SCOPED_TRACE(n);
        const ScratchDir scratch;
        auto store = std::make_unique<Store>(Store::open(scratch.path()));
        store->commit(numbered(200, "text"));
        const Content before = content_of(*store);
        {
            const FaultsFrom active(n, GetParam());
            store.reset();
        }
        EXPECT_EQ(content_of(Store::open(scratch.path())), before);
        if (faults.hits == 0)
            break;
    }
}

INSTANTIATE_TEST_SUITE_P(OnceAndForGood, StoreFault, testing::Bool(),
                         [](const auto &about) { return about.param ? "ForGood" : "Once"; });

// The same from the system itself: no file may grow any more.
TEST(StoreLimit, ACommitThatDoesNotFitIsRefusedAndTheStoreGoesOn)
{
    const ScratchDir scratch;
    const std::string answer = ovtest::in_child([&]() -> std::string {
        Store store = Store::open(scratch.path());
        store.commit(std::vector{put("/a", "1")});
        ::signal(SIGXFSZ, SIG_IGN);
        rlimit limit{};
        ::getrlimit(RLIMIT_FSIZE, &limit);
        const rlim_t before = limit.rlim_cur;
        limit.rlim_cur = 100'000;
        ::setrlimit(RLIMIT_FSIZE, &limit);
        std::string message;
        try {
            store.commit(std::vector{put("/big", std::string(1'000'000, 'b')), gone("/a")});
        } catch (const StoreError &error) {
            message = error.what();
        }
        if (nodes_of(store) != Nodes{{"/a", {10, "1"}}})
            return "changed by " + message;
        // What fits can be committed before there is room again, and the rest after it.
        if (store.commit(std::vector{put("/b", "2")}) != 2)
            return "wrong number";
        limit.rlim_cur = before;
        ::setrlimit(RLIMIT_FSIZE, &limit);
        store.commit(std::vector{put("/big", "b")});
        return message;
    });
    EXPECT_EQ(answer,
              "cannot store the commit in " + (scratch / "config.db").string() +
                  ": disk I/O error (File too large); the stored configuration is as it was:"
                  " check the free space and the state of its file system, and try again");
    const Store store = Store::open(scratch.path());
    EXPECT_EQ(nodes_of(store), (Nodes{{"/a", {10, "1"}}, {"/b", {10, "2"}}, {"/big", {10, "b"}}}));
    EXPECT_EQ(store.commit_number(), 3U);
}

} // namespace
