#include "host/store/store.h"

#include "host/store/database_file.h"
#include "host/store/history_tables.h"
#include "host/store/sqlite.h"
#include "host/store/state_dir.h"

#include <utility>

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
    HistoryTables history;
    std::uint64_t commits = 0;
    std::optional<Wait> wait;

    Parts(const std::filesystem::path &state_dir, const HistoryBounds &bounds);

    void apply(const StoredChange &change);
    [[nodiscard]] std::optional<Wait> settle_wait(const CommitNote &note);
    void write(std::span<const StoredChange> changes, const CommitNote &note);
    void undo() noexcept;
    void transact(const char *deed, const std::function<void()> &steps);
    template <typename Query>
    [[nodiscard]] auto read(Query query) const;
};

Store::Parts::Parts(const std::filesystem::path &state_dir, const HistoryBounds &bounds)
    : dir(state_dir), file(dir.path() / "config.db"), db(open_database(file)),
      begin(db.prepare("BEGIN IMMEDIATE")),
      put(db.prepare("INSERT INTO nodes (name, type, text) VALUES (?1, ?2, ?3)"
                     " ON CONFLICT (name) DO UPDATE SET type = ?2, text = ?3")),
      remove(db.prepare("DELETE FROM nodes WHERE name = ?1")),
      count(db.prepare("UPDATE meta SET commits = ?1")), end(db.prepare("COMMIT")),
      history(db, bounds),
      commits(static_cast<std::uint64_t>(db.integer("SELECT commits FROM meta"))),
      wait(history.wait())
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

// The wait as it is after the commit.
std::optional<Wait> Store::Parts::settle_wait(const CommitNote &note)
{
    const std::uint64_t number = commits + 1;
    if (!note.confirm_within) {
        history.end_wait(wait, note.undoes_wait ? Confirmation::undone : Confirmation::confirmed,
                         number);
        return std::nullopt;
    }
    const Wait next{number, wait ? wait->back_to : commits, note.time + *note.confirm_within,
                    *note.confirm_within};
    history.begin_wait(next);
    return next;
}

void Store::Parts::write(std::span<const StoredChange> changes, const CommitNote &note)
{
    const std::uint64_t number = commits + 1;
    begin.run();
    history.begin(number);
    for (const StoredChange &change : changes) {
        history.record(change);
        apply(change);
    }
    history.finish(note);
    count.bind(1, static_cast<std::int64_t>(number));
    count.run();
    std::optional<Wait> next = settle_wait(note);
    history.prune(next ? next->back_to : number);
    end.run();
    wait = next;
    commits = number;
}

void Store::Parts::undo() noexcept
try {
    for (Statement *statement : {&begin, &put, &remove, &count, &end}) {
        statement->reset();
    }
    history.reset();
    if (db.in_transaction()) {
        db.execute("ROLLBACK");
    }
    // When the very last step failed, the log already holds the whole transaction, and a crash
    // from here on would bring it back: empty the log.
    db.execute("PRAGMA wal_checkpoint(TRUNCATE)");
} catch (const SqliteError &) {
    // The disk fails on; the next commit that succeeds writes over what is left in the log.
}

// Runs the steps in a transaction that is not a commit.
void Store::Parts::transact(const char *deed, const std::function<void()> &steps)
try {
    begin.run();
    steps();
    end.run();
} catch (const SqliteError &error) {
    undo();
    throw StoreError("cannot " + std::string(deed) + " in " + file.string() + ": " + error.what() +
                     "; check the free space and the state of its file system, and try again");
}

template <typename Query>
auto Store::Parts::read(Query query) const
try {
    return query();
} catch (const SqliteError &error) {
    throw StoreError("cannot read the configuration database " + file.string() + ": " +
                     error.what() + "; check its file system and start again");
}

Store::Store(std::unique_ptr<Parts> parts) noexcept : parts_(std::move(parts)) {}
Store::Store(Store &&other) noexcept = default;
Store &Store::operator=(Store &&other) noexcept = default;
Store::~Store() = default;

Store Store::open(const std::filesystem::path &state_dir, const HistoryBounds &bounds)
{
    try {
        return Store(std::make_unique<Parts>(state_dir, bounds));
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
{
    parts_->read([&] {
        Statement query = parts_->db.prepare("SELECT name, type, text FROM nodes ORDER BY name");
        while (query.step()) {
            take({query.text(0), static_cast<std::uint32_t>(query.integer(1)), query.text(2)});
        }
    });
}

std::uint64_t Store::commit(std::span<const StoredChange> changes, const CommitNote &note)
try {
    parts_->write(changes, note);
    return parts_->commits;
} catch (const SqliteError &error) {
    parts_->undo();
    throw StoreError("cannot store the commit in " + parts_->file.string() + ": " + error.what() +
                     "; the stored configuration is as it was: check the free space and the state"
                     " of its file system, and try again");
}

std::vector<RecordedCommit> Store::history(std::uint64_t limit) const
{
    return parts_->read([&] { return parts_->history.newest(limit); });
}

std::optional<RecordedCommit> Store::recorded(std::uint64_t number) const
{
    return parts_->read([&] { return parts_->history.find(number); });
}

std::uint64_t Store::oldest_recorded() const
{
    return parts_->read([&] { return parts_->history.oldest(); });
}

std::vector<RecordedChange> Store::changes_of(std::uint64_t number) const
{
    return parts_->read([&] { return parts_->history.changes_of(number); });
}

void Store::visit_back_to(std::uint64_t number,
                          const std::function<void(RecordedChange &&)> &take) const
{
    parts_->read([&] { parts_->history.visit_back_to(number, take); });
}

const std::optional<Wait> &Store::wait() const noexcept
{
    return parts_->wait;
}

void Store::end_wait(Confirmation as)
{
    parts_->transact("store the end of the wait for a confirmation",
                     [&] { parts_->history.end_wait(parts_->wait, as, std::nullopt); });
    parts_->wait.reset();
}

void Store::prolong_wait(std::int64_t now, std::uint32_t seconds)
{
    if (!parts_->wait) {
        return;
    }
    const Wait next{parts_->wait->number, parts_->wait->back_to, now + seconds, seconds};
    parts_->transact("store the new time for a confirmation",
                     [&] { parts_->history.begin_wait(next); });
    parts_->wait = next;
}

void Store::note_undo_refusal(const std::string &why)
{
    if (!parts_->wait) {
        return;
    }
    parts_->transact("record the refusal of an undo",
                     [&] { parts_->history.note_refusal(*parts_->wait, why); });
}

} // namespace ovhost
