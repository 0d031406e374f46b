#include "host/store/sqlite.h"

#include "host/store/store_error.h"

#include <sqlite3.h>

#include <cerrno>

namespace ovhost
{
namespace
{

[[noreturn]] void throw_last_error(sqlite3 *db)
{
    // SQLite keeps the system's error of some failures only; the others leave it in errno, which
    // whoever calls SQLite has cleared before.
    const int left = errno;
    const int code = sqlite3_errcode(db);
    const int kept = sqlite3_system_errno(db);
    const int cause = kept != 0 ? kept : left;
    const bool from_system = code == SQLITE_IOERR || code == SQLITE_FULL || code == SQLITE_CANTOPEN;
    std::string what = sqlite3_errmsg(db);
    if (from_system && cause != 0) {
        what += " (" + system_message(cause) + ")";
    }
    throw SqliteError(code, what);
}

Statement first_row(const SqliteConnection &db, std::string_view sql)
{
    Statement query = db.prepare(sql);
    if (!query.step()) {
        throw SqliteError(SQLITE_CORRUPT, "no answer to \"" + std::string(sql) + "\"");
    }
    return query;
}

} // namespace

void Statement::Finalize::operator()(sqlite3_stmt *statement) const noexcept
{
    sqlite3_finalize(statement);
}

Statement::Statement(sqlite3 *db, std::string_view sql)
{
    sqlite3_stmt *statement = nullptr;
    const int status = sqlite3_prepare_v3(db, sql.data(), static_cast<int>(sql.size()),
                                          SQLITE_PREPARE_PERSISTENT, &statement, nullptr);
    if (status != SQLITE_OK) {
        throw_last_error(db);
    }
    statement_.reset(statement);
}

void Statement::check(int status) const
{
    if (status != SQLITE_OK) {
        throw_last_error(sqlite3_db_handle(statement_.get()));
    }
}

void Statement::bind(int parameter, std::int64_t value)
{
    check(sqlite3_bind_int64(statement_.get(), parameter, value));
}

void Statement::bind(int parameter, std::string_view value)
{
    // A null pointer would bind SQL's NULL, not an empty text.
    const char *bytes = value.data() == nullptr ? "" : value.data();
    check(sqlite3_bind_text64(statement_.get(), parameter, bytes, value.size(), SQLITE_STATIC,
                              SQLITE_UTF8));
}

bool Statement::step()
{
    errno = 0;
    const int status = sqlite3_step(statement_.get());
    if (status == SQLITE_ROW) {
        return true;
    }
    if (status == SQLITE_DONE) {
        return false;
    }
    throw_last_error(sqlite3_db_handle(statement_.get()));
}

void Statement::run()
{
    while (step()) {
    }
    reset();
}

void Statement::reset() noexcept
{
    // It answers the status of the run that ends, which step() has already thrown.
    sqlite3_reset(statement_.get());
    sqlite3_clear_bindings(statement_.get());
}

std::int64_t Statement::integer(int column) const
{
    return sqlite3_column_int64(statement_.get(), column);
}

std::string Statement::text(int column) const
{
    const void *bytes = sqlite3_column_text(statement_.get(), column);
    const int size = sqlite3_column_bytes(statement_.get(), column);
    if (bytes == nullptr) {
        return {};
    }
    return {static_cast<const char *>(bytes), static_cast<std::size_t>(size)};
}

bool Statement::is_null(int column) const
{
    return sqlite3_column_type(statement_.get(), column) == SQLITE_NULL;
}

void SqliteConnection::Close::operator()(sqlite3 *db) const noexcept
{
    sqlite3_close_v2(db);
}

SqliteConnection::SqliteConnection(const std::filesystem::path &file)
    : SqliteConnection(std::filesystem::absolute(file).string(),
                       SQLITE_OPEN_READWRITE | SQLITE_OPEN_NOMUTEX)
{
    sqlite3_db_config(db_.get(), SQLITE_DBCONFIG_NO_CKPT_ON_CLOSE, 1, nullptr);
}

SqliteConnection::SqliteConnection(const std::string &name, int flags)
{
    sqlite3 *db = nullptr;
    const int status = sqlite3_open_v2(name.c_str(), &db, flags, nullptr);
    db_.reset(db);
    if (db == nullptr) {
        throw SqliteError(status, sqlite3_errstr(status));
    }
    if (status != SQLITE_OK) {
        throw_last_error(db);
    }
}

SqliteConnection SqliteConnection::in_memory()
{
    return {":memory:", SQLITE_OPEN_READWRITE | SQLITE_OPEN_MEMORY | SQLITE_OPEN_NOMUTEX};
}

void SqliteConnection::checkpoint_on_close()
{
    sqlite3_db_config(db_.get(), SQLITE_DBCONFIG_NO_CKPT_ON_CLOSE, 0, nullptr);
}

Statement SqliteConnection::prepare(std::string_view sql) const
{
    return {db_.get(), sql};
}

void SqliteConnection::execute(const std::string &sql) const
{
    errno = 0;
    if (sqlite3_exec(db_.get(), sql.c_str(), nullptr, nullptr, nullptr) != SQLITE_OK) {
        throw_last_error(db_.get());
    }
}

std::int64_t SqliteConnection::integer(std::string_view sql) const
{
    return first_row(*this, sql).integer(0);
}

std::string SqliteConnection::text(std::string_view sql) const
{
    return first_row(*this, sql).text(0);
}

bool SqliteConnection::in_transaction() const noexcept
{
    return sqlite3_get_autocommit(db_.get()) == 0;
}

} // namespace ovhost
