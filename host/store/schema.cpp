#include "host/store/schema.h"

#include "host/store/sqlite.h"

#include <array>

namespace ovhost
{
namespace
{

// Step n (from 0) brings version n to version n + 1. A step that was shipped is never edited:
// a change of the tables is a new step at the end.
constexpr std::array kSteps{
    R"(CREATE TABLE meta (
           id INTEGER PRIMARY KEY CHECK (id = 1),
           commits INTEGER NOT NULL CHECK (commits >= 0)
       ) STRICT;
       INSERT INTO meta VALUES (1, 0);
       CREATE TABLE nodes (
           name TEXT PRIMARY KEY NOT NULL,
           type INTEGER NOT NULL CHECK (type BETWEEN 0 AND 4294967295),
           text TEXT NOT NULL
       ) WITHOUT ROWID, STRICT;)",
    // The history begins with the next commit: what earlier ones changed is not known.
    R"(CREATE TABLE commits (
           number INTEGER PRIMARY KEY CHECK (number > 0),
           time INTEGER NOT NULL,
           uid INTEGER CHECK (uid BETWEEN 0 AND 4294967295),
           author TEXT NOT NULL,
           comment TEXT NOT NULL,
           rollback_to INTEGER,
           changes INTEGER NOT NULL,
           bytes INTEGER NOT NULL,
           confirmation TEXT NOT NULL DEFAULT 'none'
               CHECK (confirmation IN ('none', 'waiting', 'confirmed', 'undone')),
           ended_by INTEGER,
           undo_refusal TEXT NOT NULL DEFAULT ''
       ) STRICT;
       CREATE TABLE changes (
           number INTEGER NOT NULL,
           position INTEGER NOT NULL,
           name TEXT NOT NULL,
           old_type INTEGER CHECK (old_type BETWEEN 0 AND 4294967295),
           old_text TEXT,
           new_type INTEGER CHECK (new_type BETWEEN 0 AND 4294967295),
           new_text TEXT,
           PRIMARY KEY (number, position)
       ) WITHOUT ROWID, STRICT;
       CREATE TABLE wait (
           id INTEGER PRIMARY KEY CHECK (id = 1),
           number INTEGER NOT NULL,
           back_to INTEGER NOT NULL CHECK (back_to BETWEEN 0 AND number - 1),
           deadline INTEGER NOT NULL,
           seconds INTEGER NOT NULL CHECK (seconds BETWEEN 0 AND 4294967295)
       ) STRICT;)",
};

void run_steps(const SqliteConnection &db, std::int64_t from, std::int64_t to)
{
    for (std::int64_t version = from; version < to; ++version) {
        db.execute(kSteps[static_cast<std::size_t>(version)]);
    }
}

} // namespace

std::int64_t schema_version() noexcept
{
    return static_cast<std::int64_t>(kSteps.size());
}

void upgrade_schema(const SqliteConnection &db)
{
    const std::int64_t version = db.integer("PRAGMA user_version");
    if (version == schema_version()) {
        return;
    }
    db.execute("BEGIN IMMEDIATE");
    run_steps(db, version, schema_version());
    db.execute("PRAGMA application_id = " + std::to_string(kApplicationId));
    db.execute("PRAGMA user_version = " + std::to_string(schema_version()));
    db.execute("COMMIT");
}

std::vector<std::string> schema_of(const SqliteConnection &db)
{
    // SQLite's own entries, such as ANALYZE's statistics, do no harm.
    Statement query =
        db.prepare("SELECT type || ' ' || name || ': ' || coalesce(sql, '') FROM sqlite_schema"
                   " WHERE name NOT LIKE 'sqlite\\_%' ESCAPE '\\' ORDER BY name");
    std::vector<std::string> entries;
    while (query.step()) {
        entries.push_back(query.text(0));
    }
    return entries;
}

std::vector<std::string> expected_schema(std::int64_t version)
{
    const SqliteConnection db = SqliteConnection::in_memory();
    run_steps(db, 0, version);
    return schema_of(db);
}

} // namespace ovhost
