#include "host/mgmtd/options.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <vector>

namespace
{

using namespace ovhost;
using testing::HasSubstr;

/// What the command line comes to.
struct Parsed {
    std::optional<DaemonOptions> options;
    int exit_code = -1;
    std::string out;
    std::string err;
};

Parsed parse(std::vector<std::string> words)
{
    words.insert(words.begin(), "mgmtd");
    std::vector<char *> argv;
    for (std::string &word : words) {
        argv.push_back(word.data());
    }
    Parsed parsed;
    testing::internal::CaptureStdout();
    testing::internal::CaptureStderr();
    parsed.options = parse_options(static_cast<int>(argv.size()), argv.data(), parsed.exit_code);
    parsed.out = testing::internal::GetCapturedStdout();
    parsed.err = testing::internal::GetCapturedStderr();
    return parsed;
}

TEST(Options, HaveDefaults)
{
    const Parsed parsed = parse({});
    ASSERT_TRUE(parsed.options);
    EXPECT_EQ(parsed.options->state_dir, "/var/lib/mgmtd");
    EXPECT_EQ(parsed.options->socket, "/run/mgmtd/control.sock");
    EXPECT_EQ(parsed.options->model, "");
    EXPECT_EQ(parsed.options->root, "");
    EXPECT_EQ(parsed.options->log_level, 5);
    EXPECT_EQ(parsed.options->module_log_level, 6);
    EXPECT_EQ(parsed.options->peer_buffer_mib, 64U);
    EXPECT_EQ(parsed.options->group, "");
}

TEST(Options, TakeEachValue)
{
    const Parsed parsed =
        parse({"--state-dir", "/s", "--socket", "/c", "--model", "m", "--root", "/r", "--log-level",
               "debug", "--group", "g", "--module-log-level", "3", "--peer-buffer", "8"});
    ASSERT_TRUE(parsed.options);
    EXPECT_EQ(parsed.options->state_dir, "/s");
    EXPECT_EQ(parsed.options->socket, "/c");
    EXPECT_EQ(parsed.options->model, "m");
    EXPECT_EQ(parsed.options->root, "/r");
    EXPECT_EQ(parsed.options->group, "g");
    EXPECT_EQ(parsed.options->log_level, 7);
    EXPECT_EQ(parsed.options->module_log_level, 3);
    EXPECT_EQ(parsed.options->peer_buffer_mib, 8U);
}

TEST(Options, KnowLevelsByWordAndNumber)
{
    const std::pair<const char *, int> rows[] = {{"error", 3}, {"warning", 4}, {"notice", 5},
                                                 {"info", 6},  {"debug", 7},   {"4", 4}};
    for (const auto &[word, level] : rows) {
        const Parsed parsed = parse({"--log-level", word});
        ASSERT_TRUE(parsed.options) << word;
        EXPECT_EQ(parsed.options->log_level, level);
    }
}

TEST(Options, RefuseALevelThatIsNone)
{
    for (const char *flag : {"--log-level", "--module-log-level"}) {
        for (const char *word : {"loud", "8", "-1", "", "3x", "0", "2", "emergency", "critical"}) {
            const Parsed parsed = parse({std::string(flag) + "=" + word});
            EXPECT_FALSE(parsed.options) << word;
            EXPECT_EQ(parsed.exit_code, 2) << word;
            EXPECT_THAT(parsed.err, HasSubstr(flag)) << word;
            EXPECT_EQ(parsed.out, "") << word;
        }
    }
    EXPECT_THAT(parse({"--log-level", "loud"}).err,
                HasSubstr("\"loud\" is not a log level: use error, warning, notice, info, debug or "
                          "a number from 3 to 7"));
}

TEST(Options, RefuseWhatTheyDoNotKnow)
{
    for (const std::vector<std::string> &words : std::vector<std::vector<std::string>>{
             {"--no-such-option"}, {"stray"}, {"--socket"}, {"--state-dir"}}) {
        const Parsed parsed = parse(words);
        EXPECT_FALSE(parsed.options) << words[0];
        EXPECT_EQ(parsed.exit_code, 2) << words[0];
        EXPECT_THAT(parsed.err, HasSubstr(words[0]));
    }
}

TEST(Options, RefuseAPathThatIsEmpty)
{
    for (const std::string flag : {"--state-dir", "--socket", "--root", "--model"}) {
        for (const std::vector<std::string> &words :
             std::vector<std::vector<std::string>>{{flag, ""}, {flag + "="}}) {
            const Parsed parsed = parse(words);
            EXPECT_FALSE(parsed.options) << flag;
            EXPECT_EQ(parsed.exit_code, 2) << flag;
            EXPECT_THAT(parsed.err, HasSubstr(flag));
        }
    }
    EXPECT_THAT(parse({"--root", ""}).err, HasSubstr("--root: must not be empty"));
}

TEST(Options, RefuseAModelThatNamesNoFile)
{
    const std::string longest(104, 'm');
    EXPECT_EQ(parse({"--model", longest}).options->model, longest);
    for (const std::string &model : {longest + "m", std::string("../m"), std::string("a/b"),
                                     std::string("a\nb"), std::string("a\x7f")}) {
        const Parsed parsed = parse({"--model", model});
        EXPECT_FALSE(parsed.options) << model;
        EXPECT_EQ(parsed.exit_code, 2) << model;
        EXPECT_THAT(parsed.err,
                    HasSubstr("--model: a model's name is 1 to 104 bytes long, without slashes and "
                              "control characters"));
    }
}

TEST(Options, GiveHelpAndVersion)
{
    const Parsed help = parse({"--help"});
    EXPECT_FALSE(help.options);
    EXPECT_EQ(help.exit_code, 0);
    for (const char *flag : {"--state-dir", "--socket", "--model", "--root", "--log-level",
                             "--module-log-level", "/var/lib/mgmtd", "/run/mgmtd/control.sock"}) {
        EXPECT_THAT(help.out, HasSubstr(flag));
    }
    const Parsed version = parse({"--version"});
    EXPECT_FALSE(version.options);
    EXPECT_EQ(version.exit_code, 0);
    EXPECT_THAT(version.out, testing::MatchesRegex("[0-9]+\\.[0-9]+\\.[0-9]+\n"));
}

} // namespace
