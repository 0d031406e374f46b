// Waits for something another thread or process does.
#pragma once

#include <chrono>
#include <thread>

namespace ovtest
{

// True as soon as `condition` is; false when it is not within a minute, which is for a busy
// machine.
template <typename Condition>
[[nodiscard]] bool eventually(Condition condition)
{
    const auto deadline = std::chrono::steady_clock::now() + std::chrono::minutes(1);
    while (!condition()) {
        if (std::chrono::steady_clock::now() > deadline) {
            return false;
        }
        std::this_thread::sleep_for(std::chrono::milliseconds(2));
    }
    return true;
}

} // namespace ovtest
