#include "host/store/store.h"

#include <utility>

#include "host/store/database_file.h"
#include "host/store/sqlite.h"
#include "host/store/state_dir.h"

namespace ovhost
{

// The order matters: statements end before their connection, and both before the lock.
struct Store::Parts {
    StateDir dir;
    std::filesystem::path file;
    SqliteConnection db;
    Statement begin;
    Statement put;
    Statement remove;
    Statement count;
    Statement end;
    std::uint64_t commits = 0;

    explicit Parts(const std::filesystem::path &state_dir);

    void apply(const StoredChange &change);
    void write(std::span<const StoredChange> changes);
    void undo() noexcept;
};

Store::Parts::Parts(const std::filesystem::path &state_dir)
    : dir(state_dir), file(dir.path() / "config.db"), db(open_database(file)),
      begin(db.prepare("BEGIN IMMEDIATE")),
      put(db.prepare("INSERT INTO nodes (name, type, text) VALUES (?1, ?2, ?3)"
                     " ON CONFLICT (name) DO UPDATE SET type = ?2, text = ?3")),
      remove(db.prepare("DELETE FROM nodes WHERE name = ?1")),
      count(db.prepare("UPDATE meta SET commits = ?1")), end(db.prepare("COMMIT")),
      commits(static_cast<std::uint64_t>(db.integer("SELECT commits FROM meta")))
{
}

void Store::Parts::apply(const StoredChange &change)
{
    Statement &statement = change.after ? put : remove;
    statement.bind(1, change.name);
    if (change.after) {
        statement.bind(2, std::int64_t{change.after->type});
        statement.bind(3, change.after->text);
    }
    statement.run();
}

void Store::Parts::write(std::span<const StoredChange> changes)
{
    begin.run();
    for (const StoredChange &change : changes)
        apply(change);
    count.bind(1, static_cast<std::int64_t>(commits + 1));
    count.run();
    end.run();
}

void Store::Parts::undo() noexcept
try {
    for (Statement *statement : {&begin, &put, &remove, &count, &end})
        statement->reset();
    if (db.in_transaction())
        db.execute("ROLLBACK");
    // When the very last step failed, the log already holds the whole transaction, and a crash
    // from here on would bring it back: empty the log.
    db.execute("PRAGMA wal_checkpoint(TRUNCATE)");
} catch (const SqliteError &) {
    // The disk fails on; the next commit that succeeds writes over what is left in the log.
}

Store::Store(std::unique_ptr<Parts> parts) noexcept : parts_(std::move(parts)) {}
Store::Store(Store &&other) noexcept = default;
Store &Store::operator=(Store &&other) noexcept = default;
Store::~Store() = default;

Store Store::open(const std::filesystem::path &state_dir)
{
    try {
        return Store(std::make_unique<Parts>(state_dir));
    } catch (const SqliteError &error) {
        throw StoreError("cannot use the configuration database of " + state_dir.string() + ": " +
                         error.what() + "; check its file system and start again");
    }
}

std::uint64_t Store::commit_number() const noexcept
{
    return parts_->commits;
}

void Store::load(const std::function<void(StoredNode &&)> &take) const
try {
    Statement query = parts_->db.prepare("SELECT name, type, text FROM nodes ORDER BY name");
    while (query.step()) {
        take({query.text(0), static_cast<std::uint32_t>(query.integer(1)), query.text(2)});
    }
} catch (const SqliteError &error) {
    throw StoreError("cannot read the configuration database " + parts_->file.string() + ": " +
                     error.what() + "; check its file system and start again");
}

std::uint64_t Store::commit(std::span<const StoredChange> changes)
try {
    parts_->write(changes);
    return ++parts_->commits;
} catch (const SqliteError &error) {
    parts_->undo();
    throw StoreError("cannot store the commit in " + parts_->file.string() + ": " + error.what() +
                     "; the stored configuration is as it was: check the free space and the state"
                     " of its file system, and commit again");
}

} // namespace ovhost
