#pragma once
// A socket that sends whatever bytes a test wants, and reads lines.

#include "host/control/framing.h"
#include "host/support/unique_fd.h"

#include <optional>
#include <string>
#include <string_view>

namespace ovhost::test
{

class RawClient
{
  public:
    explicit RawClient(const std::string &path);

    /// Sends all of `bytes`; false when the other side closed meanwhile.
    bool send(std::string_view bytes);

    void shut_down_writing();

    /// The next line, or nothing at the end of the stream. Ten seconds of silence end the wait with
    /// a std::runtime_error.
    [[nodiscard]] std::optional<std::string> read_line();

    /// As read_line(), "<end>" for the end of the stream: for comparisons.
    [[nodiscard]] std::string line() { return read_line().value_or("<end>"); }

    /// Reads up to `most` bytes and drops them; how many there were, 0 at the end of the stream.
    /// Not to be mixed with reading lines.
    std::size_t skip(std::size_t most);

  private:
    UniqueFd fd_;
    LineSplitter input_;
};

} // namespace ovhost::test
