// Bytes waiting for a socket: host/control/output_queue.h.

#include "host/control/output_queue.h"

#include "host/support/unique_fd.h"

#include <gtest/gtest.h>
#include <sys/socket.h>

#include <array>
#include <string>

namespace ovhost
{
namespace
{

class OutputQueueTest : public testing::Test
{
  protected:
    OutputQueueTest()
    {
        std::array<int, 2> ends{-1, -1};
        EXPECT_EQ(::socketpair(AF_UNIX, SOCK_STREAM, 0, ends.data()), 0);
        writer_ = UniqueFd(ends[0]);
        reader_ = UniqueFd(ends[1]);
    }

    std::string read_some()
    {
        std::string bytes(100000, '\0');
        const ssize_t got = ::recv(reader_.get(), bytes.data(), bytes.size(), MSG_DONTWAIT);
        bytes.resize(got > 0 ? static_cast<std::size_t>(got) : 0);
        return bytes;
    }

    UniqueFd writer_;
    UniqueFd reader_;
    OutputQueue queue_;
};

TEST_F(OutputQueueTest, WritesWhatTheSocketTakesAndKeepsTheRestInOrder)
{
    std::string expected;
    for (int i = 0; i < 200000; ++i)
        expected += std::to_string(i) + ",";
    queue_.append(expected);
    ASSERT_TRUE(queue_.write_to(writer_.get()));
    ASSERT_GT(queue_.size(), 0U) << "the socket took it all: the test needs more bytes";

    queue_.append("the end");
    expected += "the end";
    std::string received;
    while (queue_.size() > 0) {
        received += read_some();
        ASSERT_TRUE(queue_.write_to(writer_.get()));
    }
    for (std::string piece = read_some(); !piece.empty(); piece = read_some())
        received += piece;
    EXPECT_EQ(received, expected);
}

TEST_F(OutputQueueTest, TellsOfAReaderThatIsGone)
{
    reader_ = UniqueFd();
    queue_.append("x");
    EXPECT_FALSE(queue_.write_to(writer_.get()));
}

TEST_F(OutputQueueTest, HasNothingToWriteWhenEmpty)
{
    EXPECT_TRUE(queue_.write_to(writer_.get()));
    EXPECT_EQ(queue_.size(), 0U);
}

} // namespace
} // namespace ovhost
