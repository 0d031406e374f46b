// The main program of these tests: the daemons that they start see a network of their own.
#include "tests/support/namespaces.h"
#include "tests/support/run_tests.h"

int main(int argc, char **argv)
{
    return ovtest::run_tests(argc, argv, [] {
        ovtest::enter_private_network();
        return true;
    });
}
