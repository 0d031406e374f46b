#include "framework/files.h"

#include "tests/framework/allocation_failure.h"
#include "tests/framework/log_capture.h"
#include "tests/framework/owned.h"
#include "tests/support/files.h"
#include "tests/support/scratch_dir.h"

#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <filesystem>
#include <string>

namespace ovhost::test
{
namespace
{

using testing::ElementsAre;
using testing::HasSubstr;
using testing::IsEmpty;

class Files : public testing::Test
{
  protected:
    [[nodiscard]] std::string path(const char *name) const { return dir.path(name); }

    std::string write(const char *name, std::string_view content) const
    {
        ovtest::write_file(path(name), std::string(content));
        return path(name);
    }

    std::vector<std::string> lines_of(std::string_view content) const
    {
        OwnedStrings lines;
        EXPECT_EQ(lf_read_file_lines(write("lines", content).c_str(), lines.out()), 0);
        return texts_of(lines);
    }

    ovtest::ScratchDir dir;
};

TEST_F(Files, ExistsTellsWhatIsThere)
{
    tbool exists = false;
    EXPECT_EQ(lf_test_exists(write("there", "").c_str(), &exists), 0);
    EXPECT_TRUE(exists);
    exists = false;
    EXPECT_EQ(lf_test_exists(dir.path().c_str(), &exists), 0);
    EXPECT_TRUE(exists);
}

TEST_F(Files, ExistsTellsWhatIsNot)
{
    std::filesystem::create_symlink(path("nowhere"), path("dangling"));
    write("file", "");
    for (const char *name : {"none", "none/deeper", "file/below", "dangling"}) {
        tbool exists = true;
        EXPECT_EQ(lf_test_exists(path(name).c_str(), &exists), 0) << name;
        EXPECT_FALSE(exists) << name;
    }
}

TEST_F(Files, ExistsSaysWhenItCannotBeTold)
{
    std::filesystem::create_symlink("loop", path("loop"));
    tbool exists = true;
    EXPECT_EQ(lf_test_exists(path("loop").c_str(), &exists), 14014);
    EXPECT_TRUE(exists);
    EXPECT_EQ(lf_test_exists(nullptr, &exists), 14001);
    EXPECT_EQ(lf_test_exists("/", nullptr), 14001);
}

TEST_F(Files, LinesLoseTheirEnds)
{
    EXPECT_THAT(lines_of("one\ntwo\n\nfour\n"), ElementsAre("one", "two", "", "four"));
}

TEST_F(Files, TheLastLineNeedsNoEnd)
{
    EXPECT_THAT(lines_of("one\ntwo"), ElementsAre("one", "two"));
    EXPECT_THAT(lines_of("one"), ElementsAre("one"));
}

TEST_F(Files, AnEmptyFileHasNoLines)
{
    EXPECT_THAT(lines_of(""), IsEmpty());
    EXPECT_THAT(lines_of("\n"), ElementsAre(""));
}

TEST_F(Files, ACarriageReturnIsPartOfTheLine)
{
    EXPECT_THAT(lines_of("one\r\ntwo\r"), ElementsAre("one\r", "two\r"));
}

TEST_F(Files, LinesMayBeLongerThanAnyBlock)
{
    const std::string first(3'000'000, 'a');
    const std::string second(700'000, 'b');
    EXPECT_THAT(lines_of(first + "\n" + second + "\nc"), ElementsAre(first, second, "c"));
}

TEST_F(Files, LinesAcrossBlockBordersComeOutWhole)
{
    // Lines of 1 to 97 bytes: every border between blocks falls somewhere else in a line.
    std::string content;
    std::vector<std::string> expected;
    for (std::size_t number = 0; content.size() < 1'200'000; ++number) {
        expected.push_back(std::string(number % 97, 'x') + std::to_string(number % 10));
        content += expected.back() + "\n";
    }
    EXPECT_EQ(lines_of(content), expected);
}

TEST_F(Files, LinesCanComeThroughALinkAndFromAFileThatDoesNotTellItsSize)
{
    write("file", "a\nb\n");
    std::filesystem::create_symlink("file", path("link"));
    OwnedStrings linked;
    ASSERT_EQ(lf_read_file_lines(path("link").c_str(), linked.out()), 0);
    EXPECT_THAT(texts_of(linked), ElementsAre("a", "b"));
    OwnedStrings untold;
    ASSERT_EQ(lf_read_file_lines("/proc/self/status", untold.out()), 0);
    EXPECT_THAT(texts_of(untold), testing::Contains(testing::StartsWith("Pid:")));
}

TEST_F(Files, LinesComeFromNothingButARegularFile)
{
    ASSERT_EQ(::mkfifo(path("pipe").c_str(), 0600), 0);
    std::filesystem::create_symlink("pipe", path("link"));
    std::filesystem::create_directory(path("dir"));
    // The pipe has no writer: waiting for one would last for ever.
    for (const std::string &name :
         {path("pipe"), path("link"), path("dir"), std::string("/dev/null")}) {
        OwnedStrings lines;
        EXPECT_EQ(lf_read_file_lines(name.c_str(), lines.out()), 14014) << name;
        EXPECT_EQ(lines.get(), nullptr) << name;
    }
}

TEST_F(Files, LinesDoNotComeFromAPipeThatHasSome)
{
    ASSERT_EQ(::mkfifo(path("pipe").c_str(), 0600), 0);
    const int writer = ::open(path("pipe").c_str(), O_RDWR | O_CLOEXEC);
    ASSERT_EQ(::write(writer, "a\nb\n", 4), 4);
    OwnedStrings lines;
    EXPECT_EQ(lf_read_file_lines(path("pipe").c_str(), lines.out()), 14014);
    ::close(writer);
}

TEST_F(Files, ReadSaysWhatFailed)
{
    OwnedStrings lines;
    EXPECT_EQ(lf_read_file_lines(path("none").c_str(), lines.out()), 14013);
    EXPECT_EQ(lf_read_file_lines(path("none/deeper").c_str(), lines.out()), 14013);
    EXPECT_EQ(lf_read_file_lines(dir.path().c_str(), lines.out()), 14014);
    std::filesystem::create_symlink("loop", path("loop"));
    EXPECT_EQ(lf_read_file_lines(path("loop").c_str(), lines.out()), 14014);
    EXPECT_EQ(lf_read_file_lines(nullptr, lines.out()), 14001);
    EXPECT_EQ(lf_read_file_lines("/", nullptr), 14001);
    EXPECT_EQ(lines.get(), nullptr);
}

TEST_F(Files, ReadReportsLackOfMemory)
{
    const std::string file = write("lines", std::string(100, 'a') + "\n" + std::string(100, 'b'));
    OwnedStrings lines;
    expect_allocation_failures_reported(
        [&] { return lf_read_file_lines(file.c_str(), lines.out()); });
    EXPECT_EQ(tstr_array_length_quick(lines.get()), 2);
}

TEST_F(Files, AConfigurationFileMayBeUsed)
{
    LogCapture log;
    EXPECT_TRUE(conf_file_okay(write("conf", "x").c_str()));
    std::filesystem::create_symlink("conf", path("link"));
    EXPECT_TRUE(conf_file_okay(path("link").c_str()));
    EXPECT_THAT(log.lines, IsEmpty());
}

TEST_F(Files, AConfigurationFileThatMayNotBeUsedIsSaidWhy)
{
    using std::filesystem::perms;
    write("open", "x");
    std::filesystem::permissions(path("open"), perms::owner_read | perms::others_write);
    ASSERT_EQ(::mkfifo(path("pipe").c_str(), 0600), 0);
    std::filesystem::create_directory(path("dir"));
    const std::pair<const char *, const char *> refused[] = {
        {"none", "No such file or directory"},
        {"dir", "not a regular file"},
        {"pipe", "not a regular file"},
        {"open", "everybody may write to it"},
    };
    for (const auto &[name, reason] : refused) {
        LogCapture log;
        G_daemon_log_level = 5;
        EXPECT_FALSE(conf_file_okay(path(name).c_str())) << name;
        ASSERT_EQ(log.lines.size(), 1U) << name;
        EXPECT_EQ(log.lines[0].level, 5);
        EXPECT_THAT(log.lines[0].text, HasSubstr(path(name)));
        EXPECT_THAT(log.lines[0].text, HasSubstr(reason));
    }
    EXPECT_FALSE(conf_file_okay(nullptr));
}

/// Root may read everything: while it lives, the test runs as an ordinary user.
class OrdinaryUser
{
  public:
    OrdinaryUser()
    {
        if (former_ == 0) {
            constexpr uid_t nobody = 65534;
            EXPECT_EQ(::seteuid(nobody), 0);
        }
    }
    OrdinaryUser(const OrdinaryUser &) = delete;
    OrdinaryUser &operator=(const OrdinaryUser &) = delete;
    ~OrdinaryUser() { EXPECT_EQ(::seteuid(former_), 0); }

  private:
    uid_t former_ = ::geteuid();
};

TEST_F(Files, AConfigurationFileThatMayNotBeReadIsRefused)
{
    write("locked", "x");
    std::filesystem::permissions(path("locked"), std::filesystem::perms::none);
    LogCapture log;
    {
        const OrdinaryUser user;
        EXPECT_FALSE(conf_file_okay(path("locked").c_str()));
    }
    ASSERT_EQ(log.lines.size(), 1U);
    EXPECT_EQ(log.lines[0].text, "configuration file " + path("locked") +
                                     " is not used: it cannot be opened: Permission denied");
}

} // namespace
} // namespace ovhost::test
