#include "host/store/history_tables.h"

#include "host/store/store.h"

#include <algorithm>
#include <array>
#include <string_view>
#include <utility>

namespace ovhost
{
namespace
{

// In the order of the enumeration. The words stand in the database.
constexpr std::array<std::string_view, 4> kConfirmations{"none", "waiting", "confirmed", "undone"};

std::string_view word_of(Confirmation confirmation)
{
    return kConfirmations.at(static_cast<std::size_t>(confirmation));
}

Confirmation confirmation_of(std::string_view word)
{
    const auto *const found = std::ranges::find(kConfirmations, word);
    return static_cast<Confirmation>(found - kConfirmations.begin());
}

std::int64_t signed_of(std::uint64_t number)
{
    return static_cast<std::int64_t>(number);
}

std::uint64_t unsigned_at(const Statement &row, int column)
{
    return static_cast<std::uint64_t>(row.integer(column));
}

template <typename Number>
std::optional<Number> number_or_none(const Statement &row, int column)
{
    if (row.is_null(column)) {
        return std::nullopt;
    }
    return static_cast<Number>(row.integer(column));
}

// A parameter that is not bound is NULL.
template <typename Number>
void bind_if_any(Statement &statement, int parameter, const std::optional<Number> &number)
{
    if (number) {
        statement.bind(parameter, static_cast<std::int64_t>(*number));
    }
}

void bind_value(Statement &statement, int parameter, const std::optional<StoredValue> &value)
{
    if (!value) {
        return;
    }
    statement.bind(parameter, std::int64_t{value->type});
    statement.bind(parameter + 1, value->text);
}

std::optional<StoredValue> value_at(const Statement &row, int column)
{
    if (row.is_null(column)) {
        return std::nullopt;
    }
    return StoredValue{static_cast<std::uint32_t>(row.integer(column)), row.text(column + 1)};
}

constexpr const char *kCommitColumns =
    "SELECT number, time, uid, author, comment, rollback_to, changes, confirmation, ended_by,"
    " undo_refusal FROM commits ";

RecordedCommit commit_of(const Statement &row)
{
    return {unsigned_at(row, 0),
            row.integer(1),
            number_or_none<std::uint32_t>(row, 2),
            row.text(3),
            row.text(4),
            number_or_none<std::uint64_t>(row, 5),
            unsigned_at(row, 6),
            confirmation_of(row.text(7)),
            number_or_none<std::uint64_t>(row, 8),
            row.text(9)};
}

RecordedChange change_of(const Statement &row)
{
    return {row.text(0), value_at(row, 1), value_at(row, 3)};
}

} // namespace

HistoryTables::HistoryTables(const SqliteConnection &db, const HistoryBounds &bounds)
    : db_(db), bounds_(bounds),
      read_old_(db.prepare("SELECT type, text FROM nodes WHERE name = ?1")),
      add_change_(db.prepare("INSERT INTO changes (number, position, name, old_type, old_text,"
                             " new_type, new_text) VALUES (?1, ?2, ?3, ?4, ?5, ?6, ?7)")),
      add_commit_(db.prepare("INSERT INTO commits (number, time, uid, author, comment, rollback_to,"
                             " changes, bytes) VALUES (?1, ?2, ?3, ?4, ?5, ?6, ?7, ?8)"))
{
}

void HistoryTables::begin(std::uint64_t number)
{
    number_ = number;
    changes_ = 0;
    bytes_ = 0;
}

void HistoryTables::record(const StoredChange &change)
{
    // From the nodes themselves: a history that does not fit them could not be gone back in.
    read_old_.bind(1, change.name);
    const std::optional<StoredValue> before =
        read_old_.step() ? value_at(read_old_, 0) : std::nullopt;
    read_old_.reset();
    if (!before && !change.after) {
        return;
    }
    add_change_.bind(1, signed_of(number_));
    add_change_.bind(2, signed_of(changes_));
    add_change_.bind(3, change.name);
    bind_value(add_change_, 4, before);
    bind_value(add_change_, 6, change.after);
    add_change_.run();
    ++changes_;
    bytes_ += change.name.size() + (before ? before->text.size() : 0) +
              (change.after ? change.after->text.size() : 0);
}

void HistoryTables::finish(const CommitNote &note)
{
    add_commit_.bind(1, signed_of(number_));
    add_commit_.bind(2, note.time);
    bind_if_any(add_commit_, 3, note.uid);
    add_commit_.bind(4, note.author);
    add_commit_.bind(5, note.comment);
    bind_if_any(add_commit_, 6, note.rollback_to);
    add_commit_.bind(7, signed_of(changes_));
    add_commit_.bind(8, signed_of(bytes_));
    add_commit_.run();
}

void HistoryTables::end_wait(const std::optional<Wait> &wait, Confirmation as,
                             std::optional<std::uint64_t> by)
{
    if (!wait) {
        return;
    }
    Statement mark = db_.prepare("UPDATE commits SET confirmation = ?1, ended_by = ?2"
                                 " WHERE number > ?3 AND number <= ?4");
    mark.bind(1, word_of(as));
    bind_if_any(mark, 2, by);
    mark.bind(3, signed_of(wait->back_to));
    mark.bind(4, signed_of(wait->number));
    mark.run();
    db_.execute("DELETE FROM wait");
}

void HistoryTables::begin_wait(const Wait &wait)
{
    Statement put = db_.prepare("INSERT OR REPLACE INTO wait (id, number, back_to, deadline,"
                                " seconds) VALUES (1, ?1, ?2, ?3, ?4)");
    put.bind(1, signed_of(wait.number));
    put.bind(2, signed_of(wait.back_to));
    put.bind(3, wait.deadline);
    put.bind(4, std::int64_t{wait.seconds});
    put.run();
    Statement mark = db_.prepare("UPDATE commits SET confirmation = ?1 WHERE number = ?2");
    mark.bind(1, word_of(Confirmation::waiting));
    mark.bind(2, signed_of(wait.number));
    mark.run();
}

void HistoryTables::note_refusal(const Wait &wait, const std::string &why)
{
    Statement mark = db_.prepare("UPDATE commits SET undo_refusal = ?1"
                                 " WHERE number > ?2 AND number <= ?3");
    mark.bind(1, why);
    mark.bind(2, signed_of(wait.back_to));
    mark.bind(3, signed_of(wait.number));
    mark.run();
}

bool HistoryTables::is_over(std::uint64_t oldest) const
{
    if (number_ - oldest >= bounds_.commits) {
        return true;
    }
    return static_cast<std::uint64_t>(db_.integer("SELECT sum(bytes) FROM commits")) >
           bounds_.bytes;
}

void HistoryTables::prune(std::uint64_t keep_after)
{
    const std::uint64_t last = std::min(keep_after, number_ - 1);
    for (std::uint64_t number = oldest(); number <= last && is_over(number); ++number) {
        for (const char *table : {"commits", "changes"}) {
            db_.execute("DELETE FROM " + std::string(table) +
                        " WHERE number = " + std::to_string(number));
        }
    }
}

void HistoryTables::reset() noexcept
{
    for (Statement *statement : {&read_old_, &add_change_, &add_commit_}) {
        statement->reset();
    }
}

std::optional<Wait> HistoryTables::wait() const
{
    Statement query = db_.prepare("SELECT number, back_to, deadline, seconds FROM wait");
    if (!query.step()) {
        return std::nullopt;
    }
    return Wait{unsigned_at(query, 0), unsigned_at(query, 1), query.integer(2),
                static_cast<std::uint32_t>(query.integer(3))};
}

std::vector<RecordedCommit> HistoryTables::newest(std::uint64_t limit) const
{
    Statement query = db_.prepare(std::string(kCommitColumns) + "ORDER BY number DESC LIMIT ?1");
    query.bind(1, signed_of(limit));
    std::vector<RecordedCommit> commits;
    while (query.step()) {
        commits.push_back(commit_of(query));
    }
    return commits;
}

std::optional<RecordedCommit> HistoryTables::find(std::uint64_t number) const
{
    Statement query = db_.prepare(std::string(kCommitColumns) + "WHERE number = ?1");
    query.bind(1, signed_of(number));
    if (!query.step()) {
        return std::nullopt;
    }
    return commit_of(query);
}

std::uint64_t HistoryTables::oldest() const
{
    return static_cast<std::uint64_t>(db_.integer("SELECT coalesce(min(number), 0) FROM commits"));
}

std::vector<RecordedChange> HistoryTables::changes_of(std::uint64_t number) const
{
    Statement query = db_.prepare("SELECT name, old_type, old_text, new_type, new_text"
                                  " FROM changes WHERE number = ?1 ORDER BY position");
    query.bind(1, signed_of(number));
    std::vector<RecordedChange> changes;
    while (query.step()) {
        changes.push_back(change_of(query));
    }
    return changes;
}

void HistoryTables::visit_back_to(std::uint64_t number,
                                  const std::function<void(RecordedChange &&)> &take) const
{
    Statement query = db_.prepare("SELECT name, old_type, old_text, new_type, new_text"
                                  " FROM changes WHERE number > ?1"
                                  " ORDER BY number DESC, position DESC");
    query.bind(1, signed_of(number));
    while (query.step()) {
        take(change_of(query));
    }
}

} // namespace ovhost
