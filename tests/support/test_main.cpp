// The main program of tests that call the library: the library's fixed directories and the kernel's
// network interfaces are the program's own before the first test runs.
#include "host/mgmtd/private_root.h"
#include "tests/support/namespaces.h"
#include "tests/support/run_tests.h"
#include "tests/support/scratch_dir.h"

#include <memory>

int main(int argc, char **argv)
{
    return ovtest::run_tests(argc, argv, [] {
        ovtest::enter_private_network();
        auto root = std::make_unique<const ovtest::ScratchDir>();
        ovhost::enter_private_root(root->path());
        return root;
    });
}
