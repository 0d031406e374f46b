#include "tests/mgmtd/configuration_fixture.h"

#include "host/commit/commit_store.h"
#include "host/tree/diff.h"
#include "host/tree/name.h"

namespace mgmtd_test
{

using namespace ovhost;

ConfigurationTest::ConfigurationTest(Start start)
{
    if (start == Start::now) {
        restart();
    }
}

void ConfigurationTest::restart()
{
    configuration_.reset();
    configuration_.emplace(state_.path());
    configuration_->start();
}

void ConfigurationTest::put_in_store(const std::string &node, bn_type type,
                                     const std::optional<std::string> &value)
{
    configuration_.reset();
    {
        Store store = Store::open(state_.path());
        StoreAdapter adapter(store);
        const Tree before = load_tree(adapter);
        Tree after = before;
        const auto parts = split_name(node).value();
        if (value) {
            after.set(parts, {type, *value});
        } else {
            EXPECT_TRUE(after.erase(parts)) << node;
        }
        (void)adapter.commit(stored_changes(diff(before, after)), {});
    }
    restart();
}

void ConfigurationTest::set(const std::string &node, bn_type type, const std::string &value)
{
    EXPECT_EQ(configuration_->candidate().set(node, type, value), std::nullopt);
}

void ConfigurationTest::erase(const std::string &node)
{
    EXPECT_EQ(configuration_->candidate().erase(node), std::nullopt);
}

std::string ConfigurationTest::commit()
{
    const CommitReport report = configuration_->commit(daemon_note(""));
    EXPECT_THAT(report.warnings, testing::IsEmpty());
    if (report.accepted()) {
        return report.outcome == CommitOutcome::committed ? "committed" : "unchanged";
    }
    std::string text;
    for (const std::string &refusal : refusals_of(report.refusals)) {
        text += refusal + "\n";
    }
    return text;
}

std::string ConfigurationTest::commit_in_vain()
{
    const std::string text = commit();
    configuration_->discard();
    return text;
}

std::string ConfigurationTest::value(const std::string &node) const
{
    return value_in(configuration_->running(), node);
}

} // namespace mgmtd_test
