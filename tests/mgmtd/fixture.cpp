#include "tests/mgmtd/fixture.h"

#include "framework/appliance.h"
#include "host/framework/appliance_config.h"
#include "host/framework/objects.h"
#include "host/modules/node_access.h"
#include "host/tree/name.h"

#include <filesystem>

namespace mgmtd_test
{

namespace fs = std::filesystem;
using namespace ovhost;

DaemonTest::DaemonTest()
{
    set_config_name({});
    const mdb_db nothing;
    EXPECT_EQ(init_model_info(&nothing), 0);
    ov_system_info = {};
    G_daemon_log_level = ov_log_notice;
    for (const char *dir : {"/opt/orvale", "/var/opt/tms"}) {
        for (const auto &entry : fs::directory_iterator(dir)) {
            fs::remove_all(entry.path());
        }
    }
}

std::vector<std::string> DaemonTest::daemon_log() const
{
    std::vector<std::string> texts;
    for (const test::LoggedLine &line : log_.lines) {
        if (line.unit == "mgmtd") {
            texts.push_back(log_level_word(line.level) + " " + line.text);
        }
    }
    return texts;
}

std::vector<std::string> nodes_of(const Tree &tree)
{
    std::vector<std::string> nodes;
    tree.visit([&nodes](Tree::Parts name, const Value &value) {
        nodes.push_back(join_name(name) + " " + type_name(value.type) + " " + value.text);
    });
    return nodes;
}

std::string value_in(const Tree &tree, const std::string &name)
{
    const Value *const value = tree.value(split_name(name).value());
    return value != nullptr ? type_name(value->type) + " " + value->text : "none";
}

std::vector<std::string> refusals_of(const std::vector<Refusal> &refusals)
{
    std::vector<std::string> texts;
    texts.reserve(refusals.size());
    for (const Refusal &refusal : refusals) {
        texts.push_back(refusal.node + ": " + refusal.message + " (" + refusal.module + ")");
    }
    return texts;
}

} // namespace mgmtd_test
