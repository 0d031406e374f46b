// The wake-up for a commit that nobody confirmed: host/mgmtd/undo_timer.h.

#include "host/mgmtd/undo_timer.h"

#include <gtest/gtest.h>

#include <chrono>
#include <optional>
#include <thread>

namespace
{

using namespace ovhost;
using namespace std::chrono_literals;
using std::chrono::milliseconds;
using std::chrono::steady_clock;

class UndoTimerTest : public testing::Test
{
  protected:
    /// Runs the loop for so long.
    void run_for(milliseconds span)
    {
        UndoTimer end(
            loop_, [span] { return std::optional(span); }, [this] { loop_.stop(); });
        end.set();
        loop_.run();
    }

    EventLoop loop_;
    std::optional<milliseconds> left_;
    int undone_ = 0;
    UndoTimer timer_{loop_, [this] { return left_; },
                     [this] {
                         ++undone_;
                         left_.reset();
                     }};
};

TEST_F(UndoTimerTest, UndoesInTheLoopWhenNoTimeIsLeft)
{
    for (const milliseconds left : {0ms, 20ms}) {
        undone_ = 0;
        left_ = left;
        timer_.set();
        EXPECT_EQ(undone_, 0);
        run_for(60ms);
        EXPECT_EQ(undone_, 1);
        run_for(60ms);
        EXPECT_EQ(undone_, 1) << "nothing waits any more";
    }
}

TEST_F(UndoTimerTest, SleepsWhileTimeIsLeft)
{
    left_ = 1h;
    timer_.set();
    run_for(20ms);
    EXPECT_EQ(undone_, 0);
}

TEST_F(UndoTimerTest, SleepsWhileNothingWaits)
{
    run_for(20ms);
    timer_.set();
    run_for(20ms);
    EXPECT_EQ(undone_, 0);
}

TEST_F(UndoTimerTest, IsSetAnewByWhatHappensMeanwhile)
{
    left_ = 20ms;
    timer_.set();
    left_.reset(); // confirmed
    timer_.set();
    run_for(60ms);
    EXPECT_EQ(undone_, 0);

    left_ = 20ms;
    timer_.set();
    left_ = 1h; // prolonged
    timer_.set();
    run_for(60ms);
    EXPECT_EQ(undone_, 0);

    left_ = 20ms; // shortened
    timer_.set();
    run_for(60ms);
    EXPECT_EQ(undone_, 1);
}

TEST_F(UndoTimerTest, TriesAgainWhileSomethingStillWaits)
{
    int tries = 0;
    UndoTimer stubborn(
        loop_, [] { return std::optional(5ms); },
        [&] {
            if (++tries == 3) {
                loop_.stop();
            }
        });
    stubborn.set();
    loop_.run();
    EXPECT_EQ(tries, 3);
}

TEST_F(UndoTimerTest, CountsFromNowAfterALongRequest)
{
    steady_clock::time_point began;
    UndoTimer timer(
        loop_, [] { return std::optional(200ms); }, [this] { loop_.stop(); });
    loop_.post([&] {
        std::this_thread::sleep_for(300ms);
        began = steady_clock::now();
        timer.set();
    });
    loop_.run();
    // The loop's clock may be some milliseconds late, and not a request.
    EXPECT_GE(steady_clock::now() - began, 150ms);
}

} // namespace
