#pragma once
// Bytes waiting to be written to a socket that is never waited for. Used by connection.h.

#include <cstddef>
#include <string>
#include <string_view>

namespace ovhost
{

class OutputQueue
{
  public:
    void append(std::string_view bytes);

    /// Writes what the socket takes now. False when the connection is broken.
    [[nodiscard]] bool write_to(int fd);

    /// Number of bytes still waiting.
    [[nodiscard]] std::size_t size() const { return bytes_.size() - written_; }

  private:
    std::string bytes_;
    std::size_t written_ = 0;
};

} // namespace ovhost
