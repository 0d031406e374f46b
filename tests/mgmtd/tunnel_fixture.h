#pragma once
// A daemon's configuration with tunnels in it, and a clock that stands still until it is moved.

#include "tests/mgmtd/configuration_fixture.h"

#include <string>
#include <vector>

namespace mgmtd_test
{

[[nodiscard]] std::string tunnel(const std::string &name, const std::string &field = {});

class TunnelTest : public ConfigurationTest
{
  protected:
    explicit TunnelTest(Start start = Start::now);

    void pass(uint64 milliseconds);

    void add(const std::string &name, const std::string &alias = {});
    void remove(const std::string &name) { erase(tunnel(name)); }
    void set_id(const std::string &name, unsigned id);

    /// "ID ALIAS" of a tunnel, from the running configuration.
    [[nodiscard]] std::string stored(const std::string &name) const;

    /// "NAME ID" for each tunnel that the library's allocator knows, in its order.
    [[nodiscard]] static std::vector<std::string> bound();
};

} // namespace mgmtd_test
