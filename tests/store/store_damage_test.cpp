// What Store::open refuses, the words it refuses it with, and that it leaves every byte alone.

#include <fcntl.h>
#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <sqlite3.h>
#include <sys/stat.h>

#include <fstream>

#include "host/store/store.h"
#include "tests/store/child.h"
#include "tests/store/store_testing.h"
#include "tests/support/scratch_dir.h"

namespace
{

namespace fs = std::filesystem;
using ovhost::Store;
using ovtest::Files;
using ovtest::files_of;
using ovtest::nodes_of;
using ovtest::numbered;
using ovtest::read_file;
using ovtest::refusal;
using ovtest::run_sql;
using ovtest::ScratchDir;
using ovtest::write_file;
using testing::StartsWith;

constexpr std::size_t kPage = 4096;

// Changes the bytes of a file that stays in use.
void overwrite(const fs::path &file, const std::string &bytes)
{
    std::fstream open_file(file, std::ios::binary | std::ios::in | std::ios::out);
    open_file << bytes;
    ASSERT_TRUE(open_file.flush());
}

class StoreDamage : public testing::Test
{
  protected:
    ScratchDir scratch_;
    fs::path file_ = scratch_ / "config.db";

    void make_store(int nodes = 1)
    {
        Store store = Store::open(scratch_.path());
        store.commit(numbered(nodes, "some text to fill the pages"));
    }

    // Opening must fail and change nothing.
    std::string refused()
    {
        const Files before = files_of(scratch_.path());
        std::string message = refusal(scratch_.path());
        EXPECT_EQ(files_of(scratch_.path()), before) << message;
        return message;
    }

    [[nodiscard]] std::string damaged(const std::string &how) const
    {
        return "the configuration database " + file_.string() + " is damaged (" + how +
               "); the file was left as it was: put a good copy in its place, or move it and its"
               " -wal file away to begin with an empty store";
    }

    [[nodiscard]] std::string foreign(const std::string &how) const
    {
        return file_.string() + " is not a configuration database of this program (" + how +
               "); the file was left as it was: move it away, or choose another state directory";
    }
};

TEST_F(StoreDamage, AnEmptyFileHasLostItsContent)
{
    make_store();
    fs::resize_file(file_, 0);
    EXPECT_EQ(refusal(scratch_.path()), damaged("it is empty"));
    EXPECT_EQ(fs::file_size(file_), 0U);
}

TEST_F(StoreDamage, AFileThatEndsWithinItsHeader)
{
    make_store();
    for (const unsigned size : {1U, 15U, 16U, 99U}) {
        fs::resize_file(file_, size);
        EXPECT_EQ(refused(), damaged("it ends within its header")) << size;
        fs::remove(file_);
        make_store();
    }
}

TEST_F(StoreDamage, ATextFile)
{
    write_file(file_, "these are not the pages of a database\n");
    EXPECT_EQ(refused(), foreign("it does not begin like an SQLite database"));
}

TEST_F(StoreDamage, AFileCutAnywhere)
{
    make_store(300);
    const std::string whole = read_file(file_).value();
    ASSERT_GE(whole.size(), 4 * kPage);
    for (std::size_t size = 100; size < whole.size(); size += kPage / 2) {
        write_file(file_, whole.substr(0, size));
        EXPECT_THAT(refused(),
                    StartsWith("the configuration database " + file_.string() + " is damaged ("))
            << size;
    }
    write_file(file_, whole);
    EXPECT_EQ(refusal(scratch_.path()), "");
}

TEST_F(StoreDamage, AnyPageOverwritten)
{
    make_store(300);
    const std::string whole = read_file(file_).value();
    for (std::size_t page = 0; page < whole.size(); page += kPage) {
        std::string bytes = whole;
        const std::size_t begin = page == 0 ? 100 : page;
        bytes.replace(begin, page + kPage - begin, page + kPage - begin, '\xa5');
        write_file(file_, bytes);
        EXPECT_THAT(refused(),
                    StartsWith("the configuration database " + file_.string() + " is damaged ("))
            << page;
    }
}

TEST_F(StoreDamage, AHeaderOfGarbage)
{
    make_store();
    std::string bytes = read_file(file_).value();
    bytes.replace(0, 100, 100, '\xa5');
    write_file(file_, bytes);
    EXPECT_EQ(refused(), foreign("it does not begin like an SQLite database"));
}

// The files of a store in use are those a killed daemon leaves.
TEST_F(StoreDamage, ADamagedFileBesideALogWithCommits)
{
    make_store(300);
    Files killed;
    {
        Store store = Store::open(scratch_.path());
        store.commit(numbered(1, "in the log"));
        killed = files_of(scratch_.path());
    }
    ASSERT_EQ(killed.size(), 2U);
    for (const auto &[name, bytes] : killed)
        write_file(scratch_ / name, bytes);
    EXPECT_EQ(nodes_of(Store::open(scratch_.path())).at("/n/0").second, "in the log");

    std::string &database = killed.at("config.db");
    const std::size_t size = database.size() - kPage;
    database.replace(kPage, size, size, '\xa5');
    for (const auto &[name, bytes] : killed)
        write_file(scratch_ / name, bytes);
    EXPECT_THAT(refused(),
                StartsWith("the configuration database " + file_.string() + " is damaged ("));
    EXPECT_EQ(files_of(scratch_.path()), killed);
}

TEST_F(StoreDamage, ADatabaseOfAnotherProgram)
{
    run_sql(file_, "CREATE TABLE their (a); INSERT INTO their VALUES (1)");
    write_file(scratch_ / "config.db-journal", "their journal");
    EXPECT_EQ(refused(), foreign("it belongs to another program"));
    EXPECT_EQ(read_file(scratch_ / "config.db-journal"), "their journal");
}

TEST_F(StoreDamage, AnotherApplicationId)
{
    make_store();
    run_sql(file_, "PRAGMA application_id = 1");
    EXPECT_EQ(refused(), foreign("it belongs to another program"));
}

TEST_F(StoreDamage, OtherTables)
{
    for (const char *sql :
         {"CREATE TABLE their (a)", "DROP TABLE nodes", "ALTER TABLE nodes ADD COLUMN more INTEGER",
          "CREATE INDEX their ON nodes (text)",
          "CREATE TRIGGER their AFTER INSERT ON nodes BEGIN DELETE FROM nodes;"
          " END"}) {
        make_store();
        run_sql(file_, sql);
        EXPECT_EQ(refused(), foreign("its tables are not this program's")) << sql;
        fs::remove(file_);
    }
}

TEST_F(StoreDamage, StatisticsOfTheTablesDoNoHarm)
{
    make_store();
    run_sql(file_, "ANALYZE");
    EXPECT_EQ(refusal(scratch_.path()), "");
}

TEST_F(StoreDamage, ANewerVersion)
{
    make_store();
    run_sql(file_, "PRAGMA user_version = 3; CREATE TABLE later (a)");
    EXPECT_EQ(refused(), "the configuration database " + file_.string() +
                             " was written by a newer version of this program (its schema is"
                             " version 3, this program knows up to 2); the file was left as it"
                             " was: run the newer version");
}

TEST_F(StoreDamage, ANegativeVersion)
{
    make_store();
    run_sql(file_, "PRAGMA user_version = -1");
    EXPECT_EQ(refused(), damaged("its version is -1"));
}

TEST_F(StoreDamage, AMissingCommitNumber)
{
    make_store();
    run_sql(file_, "DELETE FROM meta");
    EXPECT_EQ(refused(), damaged("its commit number is missing"));
}

TEST_F(StoreDamage, AHistoryWithAGap)
{
    for (const char *sql :
         {"DELETE FROM commits WHERE number = 2", "DELETE FROM commits WHERE number = 3",
          "UPDATE meta SET commits = 4"}) {
        {
            Store store = Store::open(scratch_.path());
            for (int i = 0; i < 3; ++i)
                store.commit({});
        }
        run_sql(file_, sql);
        EXPECT_EQ(refused(), damaged("its history does not lead to its last commit")) << sql;
        fs::remove(file_);
    }
}

TEST_F(StoreDamage, AWaitingCommitThatCannotBeUndone)
{
    for (const char *sql : {"DELETE FROM commits WHERE number <= 2", "UPDATE wait SET number = 2",
                            "DELETE FROM commits"}) {
        {
            Store store = Store::open(scratch_.path());
            store.commit({});
            ovhost::CommitNote note;
            note.confirm_within = 60;
            store.commit({}, note);
            store.commit({}, note);
        }
        run_sql(file_, sql);
        EXPECT_EQ(refused(), damaged("its history lacks what a waiting commit needs")) << sql;
        fs::remove(file_);
    }
}

TEST_F(StoreDamage, AValueOutOfItsRange)
{
    make_store();
    run_sql(file_, "PRAGMA ignore_check_constraints = 1; UPDATE nodes SET type = -1");
    EXPECT_EQ(refused(), damaged("CHECK constraint failed in nodes"));
}

TEST_F(StoreDamage, ADirectory)
{
    fs::create_directory(file_);
    write_file(file_ / "inside", "kept");
    EXPECT_EQ(refusal(scratch_.path()), foreign("it is a directory"));
    EXPECT_EQ(read_file(file_ / "inside"), "kept");
}

TEST_F(StoreDamage, AnotherKindOfFile)
{
    ASSERT_EQ(::mkfifo(file_.c_str(), 0600), 0);
    EXPECT_EQ(refusal(scratch_.path()), foreign("it is not a regular file"));
    EXPECT_TRUE(fs::is_fifo(file_));
}

TEST_F(StoreDamage, ALinkThatLeadsNowhere)
{
    fs::create_symlink("nowhere", file_);
    EXPECT_EQ(refusal(scratch_.path()), "cannot name the new database " + file_.string() +
                                            ": File exists; move what has this name away");
    EXPECT_EQ(fs::read_symlink(file_), "nowhere");
}

TEST_F(StoreDamage, AFileThisUserMayNotReadOrWrite)
{
    make_store();
    for (const mode_t mode : {0000U, 0444U}) {
        fs::remove(scratch_ / "lock");
        ASSERT_EQ(::chmod(file_.c_str(), mode), 0);
        if (::geteuid() == 0) {
            ASSERT_EQ(::chown(scratch_.path().c_str(), ovtest::kUnprivilegedUser,
                              ovtest::kUnprivilegedUser),
                      0);
        }
        EXPECT_EQ(ovtest::in_child([&] {
                      ovtest::become_unprivileged();
                      return refusal(scratch_.path());
                  }),
                  "cannot open " + file_.string() +
                      ": Permission denied; give this user read and write permission for it and"
                      " its directory");
    }
}

TEST_F(StoreDamage, AFileInUseByAnotherProgram)
{
    make_store();
    sqlite3 *other = nullptr;
    ASSERT_EQ(sqlite3_open(file_.c_str(), &other), SQLITE_OK);
    ASSERT_EQ(sqlite3_exec(other, "BEGIN IMMEDIATE", nullptr, nullptr, nullptr), SQLITE_OK);
    const std::string message = ovtest::in_child([&] { return refusal(scratch_.path()); });
    sqlite3_close(other);
    EXPECT_EQ(message, "the configuration database " + file_.string() +
                           " is in use by another program; end that program and try again");
}

TEST_F(StoreDamage, ALogWithoutItsDatabase)
{
    write_file(scratch_ / "config.db-wal", "perhaps commits");
    EXPECT_EQ(refused(), "the configuration database " + file_.string() +
                             " is missing but its log " + file_.string() +
                             "-wal is there; put the database back, or move the log away to begin"
                             " with an empty store");
    EXPECT_FALSE(fs::exists(file_));
}

TEST_F(StoreDamage, WhatACrashLeftOfANewDatabaseIsNoHindrance)
{
    write_file(scratch_ / "config.db.new", "half");
    write_file(scratch_ / "config.db.new-wal", "half");
    EXPECT_EQ(refusal(scratch_.path()), "");
    EXPECT_TRUE(Store::open(scratch_.path()).empty());
    EXPECT_FALSE(fs::exists(scratch_ / "config.db.new"));
    EXPECT_FALSE(fs::exists(scratch_ / "config.db.new-wal"));
}

// SQLite leaves the transaction open after this failure, unlike after those of the disk.
TEST_F(StoreDamage, APageFoundDamagedInACommitLeavesTheStoreAsItWas)
{
    ovtest::Nodes before;
    {
        Store store = Store::open(scratch_.path());
        store.commit(numbered(20'000, std::string(200, 'x'))); // more than SQLite keeps in memory
        before = nodes_of(store);
    }
    {
        Store store = Store::open(scratch_.path());
        const std::string whole = read_file(file_).value();
        overwrite(file_, whole.substr(0, kPage) + std::string(whole.size() - kPage, '\xa5'));
        EXPECT_THROW(store.commit(numbered(20'000, "y")), ovhost::StoreError);
        // The commit number's page is in memory since the start.
        EXPECT_EQ(store.commit({}), 2U);
        overwrite(file_, whole);
    }
    const Store store = Store::open(scratch_.path());
    EXPECT_EQ(nodes_of(store), before);
    EXPECT_EQ(store.commit_number(), 2U);
}

TEST_F(StoreDamage, ARefusalLetsTheDirectoryGo)
{
    write_file(file_, "text");
    EXPECT_NE(refusal(scratch_.path()), "");
    fs::remove(file_);
    EXPECT_EQ(refusal(scratch_.path()), "");
}

TEST_F(StoreDamage, AStoreInUseIsHeldByItsDaemon)
{
    make_store();
    const Store store = Store::open(scratch_.path());
    EXPECT_THAT(refusal(scratch_.path()),
                StartsWith("the state directory " + scratch_.path().string() +
                           " is held by another daemon (process "));
}

} // namespace
