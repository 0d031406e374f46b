#pragma once
// A daemon's configuration that tests edit and commit.

#include "tests/mgmtd/fixture.h"

#include <optional>
#include <string>

namespace mgmtd_test
{

class ConfigurationTest : public DaemonTest
{
  protected:
    /// Later: by restart() or put_in_store(), once the test has prepared what the daemon finds.
    enum class Start { now, later };

    explicit ConfigurationTest(Start start = Start::now);

    /// Ends the daemon and starts it again on its store.
    void restart();

    /// Starts the daemon on a store that holds one more value, or another one, that no module has
    /// seen; without a text, one less.
    void put_in_store(const std::string &node, bn_type type,
                      const std::optional<std::string> &value);

    /// Edits of the candidate, which must be possible.
    void set(const std::string &node, bn_type type, const std::string &value);
    void set(const std::string &node, const std::string &text) { set(node, bt_string, text); }
    void erase(const std::string &node);

    /// "committed", "unchanged", or every refusal on a line of its own.
    std::string commit();

    /// The same for a commit that fails; the candidate's edits are dropped.
    std::string commit_in_vain();

    /// A value of the running configuration, as value_in() has it.
    [[nodiscard]] std::string value(const std::string &node) const;

    std::optional<ovhost::Configuration> configuration_;
};

} // namespace mgmtd_test
