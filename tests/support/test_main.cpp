// The main program of tests that call the library: the library's fixed directories and the kernel's
// network interfaces are the program's own before the first test runs.
#include "host/mgmtd/private_root.h"
#include "tests/support/namespaces.h"
#include "tests/support/scratch_dir.h"

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
        const ovtest::ScratchDir root;
        ovhost::enter_private_root(root.path());
        return RUN_ALL_TESTS();
    } catch (const std::exception &error) {
        std::cerr << error.what() << '\n';
        return 1;
    }
}
