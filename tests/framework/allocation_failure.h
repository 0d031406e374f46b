#pragma once
// Makes operator new fail on purpose, to see what an operation answers when memory runs out.

#include <gtest/gtest.h>

namespace ovhost::test
{

/// While it lives, the nth allocation from now on (counted from 0) fails, and every later one.
class AllocationFailure
{
  public:
    explicit AllocationFailure(int nth);
    AllocationFailure(const AllocationFailure &) = delete;
    AllocationFailure &operator=(const AllocationFailure &) = delete;
    ~AllocationFailure();

    /// Lets allocations succeed again; whether one has failed.
    bool end();
};

/// Fails the first allocation of the call, then the second, and so on until a run needs no more.
/// Every failed run has to answer `status_of_failure`. At least one allocation is expected.
template <typename Call>
void expect_allocation_failures_reported(Call call, int status_of_failure = 14000)
{
    for (int nth = 0;; ++nth) {
        AllocationFailure failure(nth);
        const int status = call();
        if (!failure.end()) {
            EXPECT_EQ(status, 0);
            EXPECT_GT(nth, 0) << "the call allocates nothing";
            return;
        }
        EXPECT_EQ(status, status_of_failure) << "allocation " << nth;
    }
}

} // namespace ovhost::test
