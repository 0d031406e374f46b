#pragma once
// How long to wait before the next try: longer each time, up to a limit.

#include <chrono>

namespace ovhost
{

class Backoff
{
  public:
    using Milliseconds = std::chrono::milliseconds;

    Backoff(Milliseconds shortest, Milliseconds longest)
        : shortest_(shortest), longest_(longest), next_(shortest)
    {
    }

    /// The next wait; twice the one before, never over the longest.
    [[nodiscard]] Milliseconds next();

    /// Starts again with the shortest.
    void reset() { next_ = shortest_; }

  private:
    Milliseconds shortest_;
    Milliseconds longest_;
    Milliseconds next_;
};

} // namespace ovhost
