#pragma once
// Writes events to a file, a pipe or a terminal, one JSON line each. peer.h is where they come
// from.

#include "host/support/unique_fd.h"

#include <nlohmann/json_fwd.hpp>

#include <string>
#include <system_error>

namespace ovhost
{

class EventWriter
{
  public:
    /// Appends to the file `path`, created when it is not there; standard output when `path` is
    /// empty. A wait for a slow reader ends when `stop_fd` becomes readable. Throws
    /// std::runtime_error that names the file.
    EventWriter(const std::string &path, int stop_fd);

    /// Writes one line; when it returns true the system has all of it. False when told to stop.
    /// Throws std::runtime_error that names the file.
    [[nodiscard]] bool write(const nlohmann::json &event);

  private:
    [[noreturn]] void fail(const std::error_code &cause) const;

    std::string name_;
    UniqueFd file_;
    int fd_;
    int stop_fd_;
};

} // namespace ovhost
