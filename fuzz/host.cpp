#include "fuzz/host.h"

#include "framework/logging.h"
#include "host/framework/log_config.h"
#include "host/mgmtd/private_root.h"
#include "host/tree/name.h"

#include <cstdio>
#include <cstdlib>
#include <filesystem>

namespace ovfuzz
{

void report_broken(const char *promise)
{
    (void)std::fprintf(stderr, "Broken promise: %s\n", promise);
    std::abort();
}

ScratchRoot::ScratchRoot()
{
    std::string path = (std::filesystem::temp_directory_path() / "ovfuzz.XXXXXX").string();
    require(::mkdtemp(path.data()) != nullptr, "a temporary folder can be made");
    ovhost::enter_private_root(path);
}

int Commit::refuse(int, std::string)
{
    ++num_refusals;
    return 0;
}

void set(mdb_db &db, const std::string &node, const std::string &value)
{
    db.tree.set(ovhost::split_name(node).value(), {bt_string, value});
}

const std::string *text_of(const mdb_db &db, const std::string &node)
{
    const ovhost::Value *const value = db.tree.value(ovhost::split_name(node).value());
    return value != nullptr ? &value->text : nullptr;
}

} // namespace ovfuzz

int LLVMFuzzerInitialize(int *, char ***)
{
    G_log_level = ov_log_debug;
    ovhost::set_log_sink([](const ovhost::LogRecord &) {});
    return 0;
}
