#pragma once
// A daemon's configuration with tunnels in it, and a clock that stands still until it is moved.

#include "tests/mgmtd/fixture.h"

#include <map>
#include <optional>
#include <string>
#include <vector>

namespace mgmtd_test
{

[[nodiscard]] std::string tunnel(const std::string &name, const std::string &field = {});

class TunnelTest : public DaemonTest
{
  protected:
    TunnelTest();

    /// Ends the daemon and starts it again on its store.
    void restart();

    void pass(uint64 milliseconds);

    /// Edits of the candidate, which must be possible.
    void set(const std::string &node, bn_type type, const std::string &value);
    void erase(const std::string &node);
    void add(const std::string &name, const std::string &alias = {});
    void remove(const std::string &name) { erase(tunnel(name)); }
    void set_id(const std::string &name, unsigned id);

    /// "committed", "unchanged", or every refusal on a line of its own.
    std::string commit();

    /// The same for a commit that fails; the candidate's edits are dropped.
    std::string commit_in_vain();

    [[nodiscard]] std::string value(const std::string &node) const;

    /// "ID ALIAS" of a tunnel, from the running configuration.
    [[nodiscard]] std::string stored(const std::string &name) const;

    /// "NAME ID" for each tunnel that the library's allocator knows, in its order.
    [[nodiscard]] static std::vector<std::string> bound();

    std::optional<ovhost::Configuration> configuration_;
};

} // namespace mgmtd_test
