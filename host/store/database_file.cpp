#include "host/store/database_file.h"

#include "host/store/schema.h"
#include "host/store/store_error.h"
#include "host/support/unique_fd.h"

#include <fcntl.h>
#include <sqlite3.h>
#include <sys/stat.h>
#include <unistd.h>

#include <array>
#include <cerrno>
#include <cstdio>
#include <string>
#include <string_view>

namespace ovhost
{
namespace
{

namespace fs = std::filesystem;

// Layout of the first bytes of every SQLite database.
constexpr std::size_t kHeaderSize = 100;
constexpr std::size_t kApplicationIdOffset = 68;
constexpr std::string_view kMagic("SQLite format 3\0", 16);

constexpr const char *kReplaceAdvice =
    "; the file was left as it was: put a good copy in its place, or move it and its -wal file"
    " away to begin with an empty store";
constexpr const char *kForeignAdvice =
    "; the file was left as it was: move it away, or choose another state directory";
constexpr const char *kPermissionAdvice =
    "; give this user read and write permission for it and its directory";

[[noreturn]] void throw_damaged(const fs::path &file, const std::string &how)
{
    throw StoreError("the configuration database " + file.string() + " is damaged (" + how + ")" +
                     kReplaceAdvice);
}

[[noreturn]] void throw_foreign(const fs::path &file, const std::string &how)
{
    throw StoreError(file.string() + " is not a configuration database of this program (" + how +
                     ")" + kForeignAdvice);
}

[[noreturn]] void throw_system(const std::string &doing, int cause, const char *advice)
{
    throw StoreError("cannot " + doing + ": " + system_message(cause) + advice_for(cause, advice));
}

[[noreturn]] void throw_for(const SqliteError &error, const fs::path &file)
{
    switch (error.code()) {
    case SQLITE_CORRUPT:
    case SQLITE_NOTADB:
        throw_damaged(file, error.what());
    case SQLITE_BUSY:
        throw StoreError("the configuration database " + file.string() +
                         " is in use by another program; end that program and try again");
    case SQLITE_FULL:
        throw StoreError("cannot write the configuration database " + file.string() + ": " +
                         error.what() + space_advice);
    case SQLITE_IOERR:
        throw StoreError("cannot use the configuration database " + file.string() + ": " +
                         error.what() +
                         "; check the free space and the state of its file system, and start"
                         " again");
    default:
        throw StoreError("cannot open the configuration database " + file.string() + ": " +
                         error.what() + kPermissionAdvice);
    }
}

std::uint32_t big_endian(std::string_view bytes)
{
    std::uint32_t value = 0;
    for (const char byte : bytes.substr(0, 4)) {
        value = (value << 8) | static_cast<unsigned char>(byte);
    }
    return value;
}

UniqueFd open_regular(const fs::path &file)
{
    struct stat about {
    };
    if (::stat(file.c_str(), &about) == 0 && !S_ISREG(about.st_mode)) {
        throw_foreign(file,
                      S_ISDIR(about.st_mode) ? "it is a directory" : "it is not a regular file");
    }
    UniqueFd opened(::open(file.c_str(), O_RDWR | O_CLOEXEC));
    if (!opened) {
        throw_system("open " + file.string(), errno, kPermissionAdvice);
    }
    return opened;
}

// A copy that was put back may have come with another mode. The log is made with the mode of the
// database, but one that was copied with it has its own.
void close_to_others(const fs::path &file)
{
    for (const char *side : {"", "-wal"}) {
        const fs::path path = file.string() + side;
        struct stat about {
        };
        if (::stat(path.c_str(), &about) != 0 || (about.st_mode & 07777U) == 0600) {
            continue;
        }
        if (::chmod(path.c_str(), 0600) != 0) {
            throw_system("give " + path.string() + " mode 0600", errno, kPermissionAdvice);
        }
    }
}

// Judges the file before SQLite sees it, which would already replay the journal of another
// program's database. A file made here is never empty, not even after a crash: an empty one has
// lost its content, and taking it for new would make the loss silent.
void check_header(const fs::path &file)
{
    const UniqueFd opened = open_regular(file);
    std::array<char, kHeaderSize> bytes{};
    const ssize_t got = ::pread(opened.get(), bytes.data(), bytes.size(), 0);
    if (got < 0) {
        throw_system("read " + file.string(), errno, kPermissionAdvice);
    }
    const std::string_view header(bytes.data(), static_cast<std::size_t>(got));
    if (header.empty()) {
        throw_damaged(file, "it is empty");
    }
    if (!header.starts_with(kMagic.substr(0, header.size()))) {
        throw_foreign(file, "it does not begin like an SQLite database");
    }
    if (header.size() < kHeaderSize) {
        throw_damaged(file, "it ends within its header");
    }
    if (big_endian(header.substr(kApplicationIdOffset)) != kApplicationId) {
        throw_foreign(file, "it belongs to another program");
    }
}

void check_version(const SqliteConnection &db, const fs::path &file)
{
    const std::int64_t version = db.integer("PRAGMA user_version");
    if (version < 0) {
        throw_damaged(file, "its version is " + std::to_string(version));
    }
    if (version <= schema_version()) {
        return;
    }
    throw StoreError("the configuration database " + file.string() +
                     " was written by a newer version of this program (its schema is version " +
                     std::to_string(version) + ", this program knows up to " +
                     std::to_string(schema_version()) +
                     "); the file was left as it was: run the newer version");
}

// Nothing of the history may be missing between its first commit and the last one of all.
void check_history(const SqliteConnection &db, const fs::path &file)
{
    if (db.integer("SELECT count(*) = 0 OR (max(number) = (SELECT commits FROM meta)"
                   " AND max(number) - min(number) + 1 = count(*)) FROM commits") != 1) {
        throw_damaged(file, "its history does not lead to its last commit");
    }
    if (db.integer(
            "SELECT count(*) FROM wait"
            " WHERE number <> (SELECT commits FROM meta)"
            " OR back_to + 1 < (SELECT coalesce(min(number), wait.number + 1) FROM commits)") !=
        0) {
        throw_damaged(file, "its history lacks what a waiting commit needs");
    }
}

void check_content(const SqliteConnection &db, const fs::path &file)
{
    const std::string verdict = db.text("PRAGMA quick_check(1)");
    if (verdict != "ok") {
        throw_damaged(file, verdict);
    }
    const std::int64_t version = db.integer("PRAGMA user_version");
    if (schema_of(db) != expected_schema(version)) {
        throw_foreign(file, "its tables are not this program's");
    }
    if (db.integer("SELECT count(*) FROM meta") != 1) {
        throw_damaged(file, "its commit number is missing");
    }
    if (version >= kHistoryVersion) {
        check_history(db, file);
    }
}

// Every commit is on the disk before it is acknowledged. No other process is to read or write
// meanwhile, which also spares the shared-memory file.
SqliteConnection connect(const fs::path &file)
{
    SqliteConnection db(file);
    db.execute("PRAGMA locking_mode = EXCLUSIVE; PRAGMA synchronous = FULL");
    return db;
}

// SQLite answers the mode in use and no error when it cannot change it.
void use_log(const SqliteConnection &db)
{
    const std::string mode = db.text("PRAGMA journal_mode = WAL");
    if (mode != "wal") {
        throw SqliteError(SQLITE_ERROR, "it stays in journal mode " + mode);
    }
}

void remove_file(const fs::path &file)
{
    if (::unlink(file.c_str()) == 0 || errno == ENOENT) {
        return;
    }
    throw_system("remove " + file.string(), errno, "; remove it");
}

void sync_directory(const fs::path &dir)
{
    const UniqueFd opened(::open(dir.c_str(), O_RDONLY | O_DIRECTORY | O_CLOEXEC));
    if (!opened || ::fsync(opened.get()) != 0) {
        throw_system("write the directory " + dir.string(), errno, "; check its file system");
    }
}

void write_new_database(const fs::path &file)
{
    const UniqueFd made(::open(file.c_str(), O_RDWR | O_CREAT | O_EXCL | O_CLOEXEC, 0600));
    if (!made) {
        throw_system("make " + file.string(), errno, kPermissionAdvice);
    }
    {
        SqliteConnection db = connect(file);
        use_log(db);
        upgrade_schema(db);
        db.execute("PRAGMA wal_checkpoint(TRUNCATE)");
        db.checkpoint_on_close();
    }
    if (::fsync(made.get()) != 0) {
        throw_system("write " + file.string(), errno, "; check its file system");
    }
}

// A missing database beside the log of one was lost or taken away: the log may hold commits.
void check_no_orphaned_log(const fs::path &file)
{
    const fs::path log = file.string() + "-wal";
    struct stat about {
    };
    if (::stat(log.c_str(), &about) != 0 || about.st_size == 0) {
        return;
    }
    throw StoreError("the configuration database " + file.string() + " is missing but its log " +
                     log.string() +
                     " is there; put the database back, or move the log away to"
                     " begin with an empty store");
}

// The new database gets its name only when it is whole, so that no crash leaves half a one.
void create_database(const fs::path &file)
{
    check_no_orphaned_log(file);
    const fs::path unfinished = file.string() + ".new";
    for (const char *side : {"", "-wal", "-journal"}) {
        remove_file(unfinished.string() + side);
    }
    write_new_database(unfinished);
    if (::renameat2(AT_FDCWD, unfinished.c_str(), AT_FDCWD, file.c_str(), RENAME_NOREPLACE) != 0) {
        throw_system("name the new database " + file.string(), errno,
                     "; move what has this name away");
    }
    sync_directory(file.parent_path());
}

bool is_missing(const fs::path &file)
{
    struct stat about {
    };
    return ::stat(file.c_str(), &about) != 0 && errno == ENOENT;
}

} // namespace

SqliteConnection open_database(const fs::path &file)
try {
    if (is_missing(file)) {
        create_database(file);
    }
    check_header(file);
    SqliteConnection db = connect(file);
    check_version(db, file);
    check_content(db, file);
    close_to_others(file);
    db.checkpoint_on_close();
    use_log(db);
    upgrade_schema(db);
    return db;
} catch (const SqliteError &error) {
    throw_for(error, file);
}

} // namespace ovhost
