#pragma once
// Cuts the byte stream of a socket into lines. Used by connection.h for requests and by client.h
// for answers and events.

#include <cstddef>
#include <optional>
#include <string>
#include <string_view>

namespace ovhost
{

class LineSplitter
{
  public:
    /// `limit` is the longest line taken, in bytes, its newline not counted.
    explicit LineSplitter(std::size_t limit) : limit_(limit) {}

    void feed(std::string_view bytes);

    /// The next whole line without its newline; nothing when none is complete, or once too_long().
    /// The view is valid until the next call of feed() or next().
    [[nodiscard]] std::optional<std::string_view> next();

    /// True once a line passed the limit. Where the next line starts is then no longer known, so
    /// that nothing more comes out and further bytes are dropped.
    [[nodiscard]] bool too_long() const { return too_long_; }

    /// What came after the last newline: at the end of the stream, a line without one.
    [[nodiscard]] std::string_view rest() const;

    /// Forgets all that came, and with it the memory it took.
    void clear();

  private:
    void give_up();
    void drop_taken();

    std::size_t limit_;
    std::string bytes_;
    std::size_t line_start_ = 0;
    std::size_t searched_ = 0;
    bool too_long_ = false;
};

} // namespace ovhost
