#pragma once
// What the main programs of tests have in common.

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <exception>
#include <iostream>

namespace ovtest
{

/// Runs the program's tests in the surroundings that `enter` makes, and what it answers is there as
/// long as they run. To list the tests needs none.
template <typename Enter>
int run_tests(int argc, char **argv, Enter enter)
{
    testing::InitGoogleMock(&argc, argv);
    if (testing::GTEST_FLAG(list_tests)) {
        return RUN_ALL_TESTS();
    }
    try {
        [[maybe_unused]] const auto surroundings = enter();
        return RUN_ALL_TESTS();
    } catch (const std::exception &error) {
        std::cerr << error.what() << '\n';
        return 1;
    }
}

} // namespace ovtest
