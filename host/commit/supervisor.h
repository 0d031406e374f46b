#pragma once
// Calls the modules of one commit and holds them to the duties of module.h: it owns the two
// database handles and the md_commit that modules get, opens them for the length of a check and no
// longer, and keeps what a module did although it must not. transaction.h decides who is called.

#include "host/commit/module.h"
#include "host/commit/report.h"
#include "host/framework/objects.h"
#include "host/tree/tree.h"

#include <functional>
#include <optional>
#include <string>
#include <vector>

namespace ovhost
{

/// What a check has said with md_commit_set_return_status_msg.
struct SpokenRefusal {
    int code = 0;
    std::string message;

    bool operator==(const SpokenRefusal &) const = default;
};

/// What came of one call of a module.
struct CallResult {
    int code = 0;
    /// The last one of the call; only a check has one.
    std::optional<SpokenRefusal> refusal;
    /// What the exception said with which the call ended; it may be empty.
    std::optional<std::string> exception;
};

class Supervisor
{
  public:
    Supervisor(Tree running, Tree proposed);

    /// Calls a module. An exception of the call ends up in the result.
    CallResult call(const std::string &module, Phase phase,
                    const std::function<int(md_dbinfo *)> &handler);

    [[nodiscard]] const Tree &running() const { return olddb_.tree; }
    [[nodiscard]] const Tree &proposed() const { return newdb_.tree; }

    /// Keeps a warning for the client, and writes it to the log.
    void warn(const std::string &module, Phase phase, int code, std::string message);

    [[nodiscard]] const std::vector<Warning> &warnings() const { return warnings_; }

  private:
    /// Takes refusals while a check runs, and at no other time.
    struct Context : md_commit {
        int refuse(int code, std::string message) override;

        bool checking = false;
        unsigned misplaced = 0;
        std::optional<SpokenRefusal> spoken;
    };

    void report_breaches(const std::string &module, Phase phase, const CallResult &result);

    mdb_db olddb_;
    mdb_db newdb_;
    Context context_;
    md_dbinfo info_;
    std::vector<Warning> warnings_;
};

} // namespace ovhost
