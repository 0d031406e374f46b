// The daemon's event loop: host/control/event_loop.h.

#include "host/control/event_loop.h"

#include <gtest/gtest.h>

#include <unistd.h>

#include <array>
#include <cerrno>
#include <csignal>
#include <thread>
#include <vector>

namespace ovhost
{
namespace
{

TEST(EventLoopTest, StopEndsARunThatStartsLater)
{
    EventLoop loop;
    loop.stop();
    EXPECT_EQ(loop.run(), 0);
}

TEST(EventLoopTest, TasksRunInTheLoopsThreadInOrder)
{
    EventLoop loop;
    std::vector<int> done;
    std::thread::id runner;
    std::thread other([&] {
        for (int i = 0; i < 100; ++i)
            loop.post([&done, &runner, i] {
                done.push_back(i);
                runner = std::this_thread::get_id();
            });
        loop.stop();
    });
    EXPECT_EQ(loop.run(), 0);
    other.join();
    ASSERT_EQ(done.size(), 100U);
    for (int i = 0; i < 100; ++i)
        EXPECT_EQ(done[static_cast<std::size_t>(i)], i);
    EXPECT_EQ(runner, std::this_thread::get_id());
}

TEST(EventLoopTest, ATaskMayPostAnother)
{
    EventLoop loop;
    bool reached = false;
    loop.post([&] {
        loop.post([&] {
            reached = true;
            loop.stop();
        });
    });
    loop.run();
    EXPECT_TRUE(reached);
}

TEST(EventLoopTest, SignalsEndTheRun)
{
    for (const int number : {SIGTERM, SIGINT}) {
        EventLoop loop;
        loop.stop_on_signals();
        loop.post([number] { std::raise(number); });
        EXPECT_EQ(loop.run(), number);
    }
}

TEST(EventLoopTest, AWriteThatNobodyReadsFailsAndDoesNotEndTheProcess)
{
    // By default the signal that comes with such a write ends the process.
    const auto before = std::signal(SIGPIPE, SIG_DFL);
    {
        const EventLoop loop;
        std::array<int, 2> ends{};
        ASSERT_EQ(::pipe(ends.data()), 0);
        ::close(ends[0]);
        EXPECT_EQ(::write(ends[1], "x", 1), -1);
        EXPECT_EQ(errno, EPIPE);
        ::close(ends[1]);
    }
    std::signal(SIGPIPE, before);
}

} // namespace
} // namespace ovhost
