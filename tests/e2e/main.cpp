// The main program of these tests: the daemons that they start see a network of their own.
#include "tests/support/namespaces.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <exception>
#include <iostream>

int main(int argc, char **argv)
{
    testing::InitGoogleMock(&argc, argv);
    if (testing::GTEST_FLAG(list_tests)) {
        return RUN_ALL_TESTS();
    }
    try {
        ovtest::enter_private_network();
        return RUN_ALL_TESTS();
    } catch (const std::exception &error) {
        std::cerr << error.what() << '\n';
        return 1;
    }
}
