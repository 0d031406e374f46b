#pragma once
// A module of the daemon: a part that has a say in every commit that touches its nodes, and keeps
// state that follows the configuration. engine.h calls it; supervisor.h sees to it that each phase
// of a commit keeps to its duty below.

#include "framework/md_commit.h"

#include <array>
#include <cstddef>
#include <string>
#include <vector>

namespace ovhost
{

enum class Phase { check, apply, notify };

/// What a module may do in one phase of a commit.
struct PhaseDuty {
    const char *phase;
    const char *sentence;
};

/// One row for each Phase. The log tells a module that breaks its duty in these words.
inline constexpr std::array<PhaseDuty, 3> phase_duties{{
    {"check", "a check may refuse with a message and may write the new database, but must not "
              "write the old one and must not keep anything"},
    {"apply", "apply brings the module's own state in line with what is stored, and may neither "
              "refuse nor write"},
    {"notify", "notify tells peers what is in force, and may neither refuse nor write nor fail"},
}};

[[nodiscard]] constexpr const PhaseDuty &duty_of(Phase phase)
{
    return phase_duties[static_cast<std::size_t>(phase)];
}

static_assert(phase_duties.size() == static_cast<std::size_t>(Phase::notify) + 1);

class Module
{
  public:
    virtual ~Module() = default;

    /// Short and unique: messages and log lines name the module with it.
    [[nodiscard]] virtual std::string name() const = 0;

    /// Patterns over the names of the nodes whose changes concern the module; one with "/**" behind
    /// it stands for all nodes below. None: every change does. Asked once, when the module is
    /// registered.
    [[nodiscard]] virtual std::vector<std::string> patterns() const { return {}; }

    /// Once before the first commit: takes up what is in force already. `running` is empty at the
    /// very first start. Throws when the daemon cannot run without the module.
    virtual void start(const mdb_db *) {}

    /// Phase "check", once for each change that concerns the module, parents before children. A
    /// change that a module has made in the new database is checked too, in the next round.
    /// Refuses by md_commit_set_return_status_msg, whatever it returns then; by a code other than
    /// 0; or by an exception, whose words are the message. Code 14120 refuses quietly, with the
    /// message "cancelled".
    virtual int check_change(md_dbinfo *, mdb_db_change *) { return 0; }

    /// Phase "check", once per round in which a change concerned the module, after check_change:
    /// what the commit amounts to. `changes` are all changes of the commit as they stand when the
    /// round begins, those that do not concern the module included. Refuses as check_change does.
    virtual int check_commit(md_dbinfo *, const mdb_db_change_array *) { return 0; }

    /// Phase "apply", once per stored commit that concerns the module, with all its changes. A code
    /// other than 0 or an exception is a warning to the client: the commit stands.
    virtual int apply(const md_dbinfo *, const mdb_db_change_array *) { return 0; }

    /// Phase "notify", once per stored commit that concerns the module, after every module has
    /// applied it, with all its changes.
    virtual void notify(const mdb_db_change_array *) {}
};

} // namespace ovhost
