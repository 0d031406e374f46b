#pragma once
// Owners of an SQLite connection and of its statements, with SQLite's statuses turned into
// exceptions. What the statements say is up to schema.h and store.h.

#include <cstdint>
#include <filesystem>
#include <memory>
#include <stdexcept>
#include <string>
#include <string_view>

struct sqlite3;
struct sqlite3_stmt;

namespace ovhost
{

class SqliteError : public std::runtime_error
{
  public:
    SqliteError(int code, const std::string &what) : std::runtime_error(what), code_(code) {}

    /// SQLite's primary result code.
    [[nodiscard]] int code() const noexcept { return code_; }

  private:
    int code_;
};

class Statement
{
  public:
    Statement(sqlite3 *db, std::string_view sql);

    /// Binds a parameter, counted from 1. A text is not copied: it has to live until reset().
    void bind(int parameter, std::int64_t value);
    void bind(int parameter, std::string_view value);

    /// Goes to the next row; false when there is none.
    [[nodiscard]] bool step();

    /// Runs a statement that answers no row, and makes it ready to be bound again.
    void run();

    /// Forgets the run and the bound values.
    void reset() noexcept;

    /// A column of the present row, counted from 0.
    [[nodiscard]] std::int64_t integer(int column) const;
    [[nodiscard]] std::string text(int column) const;
    [[nodiscard]] bool is_null(int column) const;

  private:
    struct Finalize {
        void operator()(sqlite3_stmt *statement) const noexcept;
    };

    void check(int status) const;

    std::unique_ptr<sqlite3_stmt, Finalize> statement_;
};

class SqliteConnection
{
  public:
    /// Opens an existing database for reading and writing. A database is not changed by opening
    /// it, nor by closing it again before checkpoint_on_close().
    explicit SqliteConnection(const std::filesystem::path &file);

    /// A database of its own in memory.
    [[nodiscard]] static SqliteConnection in_memory();

    /// Lets the end of the connection move the write-ahead log's content into the database.
    void checkpoint_on_close();

    [[nodiscard]] Statement prepare(std::string_view sql) const;

    /// Runs SQL text of one or more statements.
    void execute(const std::string &sql) const;

    /// The only value of a query that answers one row; throws when there is no row.
    [[nodiscard]] std::int64_t integer(std::string_view sql) const;
    [[nodiscard]] std::string text(std::string_view sql) const;

    /// False after a failure that SQLite itself has rolled back.
    [[nodiscard]] bool in_transaction() const noexcept;

  private:
    struct Close {
        void operator()(sqlite3 *db) const noexcept;
    };

    SqliteConnection(const std::string &name, int flags);

    std::unique_ptr<sqlite3, Close> db_;
};

} // namespace ovhost
