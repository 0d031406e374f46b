#pragma once
// Tells a user at a terminal how far a long request is, in one line that goes again. run.h uses it.

#include "host/control/client.h"

#include <chrono>
#include <iosfwd>
#include <string>
#include <string_view>

namespace ovhost
{

class ProgressLine
{
  public:
    using Clock = std::chrono::steady_clock;

    /// `what` is sent, by its name for people. Nothing is printed where `stream` is no terminal
    /// (terminal.h), and nothing before the request has taken a moment.
    ProgressLine(std::ostream &stream, std::string_view what, Clock::time_point now = Clock::now());

    /// Takes the line away.
    ~ProgressLine();
    ProgressLine(const ProgressLine &) = delete;
    ProgressLine &operator=(const ProgressLine &) = delete;

    void update(const CallProgress &progress, Clock::time_point now = Clock::now());

  private:
    [[nodiscard]] std::string text_for(const CallProgress &progress, Clock::time_point now) const;
    void show(const std::string &text);

    std::ostream &stream_;
    std::string what_;
    Clock::time_point began_;
    std::string shown_;
};

} // namespace ovhost
