#pragma once
// Waits for something another thread or process does.

#include <chrono>
#include <thread>

namespace ovhost::test
{

/// True as soon as `condition` is; false when it is not within ten seconds.
template <typename Condition>
[[nodiscard]] bool eventually(Condition condition)
{
    const auto deadline = std::chrono::steady_clock::now() + std::chrono::seconds(10);
    while (!condition()) {
        if (std::chrono::steady_clock::now() > deadline)
            return false;
        std::this_thread::sleep_for(std::chrono::milliseconds(2));
    }
    return true;
}

} // namespace ovhost::test
