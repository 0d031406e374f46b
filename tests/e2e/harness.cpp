#include "tests/e2e/harness.h"

#include <filesystem>
#include <ostream>
#include <sstream>

namespace e2e
{

namespace fs = std::filesystem;

namespace
{

Words joined(Words words, const Words &more)
{
    words.insert(words.end(), more.begin(), more.end());
    return words;
}

std::string binding(const std::string &name, const std::string &type, const std::string &value)
{
    return R"({"name":"/mgmtd/notification/dbchange/0)" + name + R"(","type":")" + type +
           R"(","value":")" + value + R"("})";
}

} // namespace

std::vector<std::string> lines_of(const std::string &text)
{
    std::vector<std::string> lines;
    std::istringstream stream(text);
    for (std::string line; std::getline(stream, line);) {
        lines.push_back(line);
    }
    return lines;
}

std::vector<std::string> log_lines(const std::string &log)
{
    std::vector<std::string> lines = lines_of(log);
    for (std::string &line : lines) {
        line.erase(0, line.find(' ') + 1);
    }
    return lines;
}

bool exists(const std::string &path)
{
    return fs::exists(path);
}

std::string event_line(const std::string &kind, const std::string &node, const char *new_value,
                       const char *old_value)
{
    std::string bindings = binding("/change_type", "string", kind) + "," +
                           binding("", "uint32", "0") + "," + binding("/name", "name", node);
    if (new_value != nullptr) {
        bindings += "," + binding("/new_attribs/value", "string", new_value);
    }
    if (old_value != nullptr) {
        bindings += "," + binding("/prev_attribs/value", "string", old_value);
    }
    return R"({"bindings":[)" + bindings + R"(],"name":"/mgmtd/notify/dbchange"})";
}

E2eTest::E2eTest()
{
    fs::create_directory(root_);
}

void E2eTest::install_samples() const
{
    fs::copy(E2E_SAMPLES, root_, fs::copy_options::recursive);
    // The source tree's permissions are not the test's concern.
    fs::permissions(root_ + "/opt/orvale/defdb.conf.branch-100", fs::perms::others_write,
                    fs::perm_options::remove);
}

Words E2eTest::daemon_words(const Words &more) const
{
    return joined({E2E_MGMTD, "--root", root_, "--state-dir", state_, "--socket", socket_}, more);
}

void E2eTest::start(const Words &more)
{
    daemon_ = std::make_unique<Process>(daemon_words(more));
    ASSERT_TRUE(eventually([this] { return log().find(": ready on ") != std::string::npos; }))
        << log();
}

void E2eTest::start_quietly(const std::string &log_level, const Words &more)
{
    Words words{"--log-level", log_level};
    words.insert(words.end(), more.begin(), more.end());
    daemon_ = std::make_unique<Process>(daemon_words(words));
    ASSERT_TRUE(eventually([this] { return ovctl({"status"}).exit_code == 0; })) << log();
}

int E2eTest::stop(int signal)
{
    daemon_->signal(signal);
    return daemon_->wait();
}

Outcome E2eTest::ovctl(const Words &words, const std::string &input) const
{
    return run(joined({E2E_OVCTL, "--socket", socket_}, words), input);
}

void E2eTest::commit(const std::string &node, const std::string &type,
                     const std::string &value) const
{
    ASSERT_EQ(ovctl({"set", node, type, value}), done());
    const Outcome outcome = ovctl({"commit"});
    ASSERT_EQ(outcome.exit_code, 0) << outcome.err;
}

std::unique_ptr<Process> E2eTest::start_jsond(const Words &more) const
{
    auto jsond = std::make_unique<Process>(
        joined({E2E_JSOND, "--socket", socket_, "--output", events_}, more));
    EXPECT_TRUE(eventually([&jsond] {
        return jsond->err().find("registered with mgmtd") != std::string::npos;
    })) << jsond->err();
    return jsond;
}

std::vector<std::string> E2eTest::await_events(std::size_t count) const
{
    EXPECT_TRUE(eventually([&] { return events().size() >= count; })) << events().size();
    return events();
}

} // namespace e2e
