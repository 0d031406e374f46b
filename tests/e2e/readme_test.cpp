// The walk in the README, taken step by step: each command prints what stands there.

#include "tests/e2e/harness.h"

#include <filesystem>
#include <map>
#include <regex>
#include <string>
#include <vector>

namespace
{

using namespace e2e;
using testing::IsEmpty;

/// A command, with the lines of its "<<END" input, and what it prints.
struct Step {
    std::string command;
    std::string output;
};

/// Lines of the README's section, those in code blocks alone.
std::vector<std::string> lines_of_the_walk()
{
    std::vector<std::string> lines;
    bool in_section = false;
    bool in_code = false;
    for (const std::string &line : lines_of(read_file(E2E_SOURCE "/README.md").value())) {
        if (line.starts_with("## ")) {
            in_section = line == "## One minute with it";
        } else if (line.starts_with("```")) {
            in_code = !in_code;
        } else if (in_section && in_code) {
            lines.push_back(line);
        }
    }
    return lines;
}

std::vector<Step> steps_of_the_walk()
{
    std::vector<Step> steps;
    bool in_input = false;
    for (const std::string &line : lines_of_the_walk()) {
        if (line.starts_with("$ ")) {
            steps.push_back({line.substr(2) + "\n", ""});
            in_input = line.ends_with("<<END");
        } else if (in_input) {
            steps.back().command += line + "\n";
            in_input = line != "END";
        } else if (!steps.empty()) {
            steps.back().output += line + "\n";
        }
    }
    return steps;
}

std::string replaced(std::string text, const std::string &old, const std::string &by)
{
    for (std::size_t at = 0; (at = text.find(old, at)) != std::string::npos; at += by.size()) {
        text.replace(at, old.size(), by);
    }
    return text;
}

/// When a commit was made and by whom is another matter each time, and with the user's name the
/// widths of the table's columns.
std::string without_times_and_users(const std::string &text)
{
    const std::string time_text = R"(\d{4}-\d\d-\d\d \d\d:\d\d:\d\d)";
    const std::regex time(time_text);
    const std::regex time_and_user(time_text + R"( +(?!mgmtd )\S+)");
    if (!std::regex_search(text, time)) {
        return text;
    }
    const std::string narrow = std::regex_replace(text, std::regex(" +"), " ");
    return std::regex_replace(std::regex_replace(narrow, time_and_user, "TIME USER"), time, "TIME");
}

class Readme : public E2eTest
{
  protected:
    // The walk copies the samples to a place where nothing is yet.
    Readme() { std::filesystem::remove(root_); }

    /// Takes a walk to its end: "COMMAND\nOUTPUT" of each step that prints something else.
    std::vector<std::string> surprises(const std::vector<Step> &steps)
    {
        std::vector<std::string> all;
        for (const Step &step : steps) {
            const std::string printed = take(step.command);
            if (without_times_and_users(printed) != without_times_and_users(step.output)) {
                all.push_back(step.command + printed);
            }
        }
        return all;
    }

  private:
    /// In the test's own places.
    [[nodiscard]] std::string moved(std::string text) const
    {
        for (const auto &[theirs, own] : places_) {
            text = replaced(text, theirs, own);
        }
        return text;
    }

    [[nodiscard]] std::string moved_back(std::string text) const
    {
        for (const auto &[theirs, own] : places_) {
            text = replaced(text, own, theirs);
        }
        return text;
    }

    /// What the command prints.
    std::string take(const std::string &command)
    {
        if (command.starts_with("mgmtd ")) {
            start_daemon(moved(command));
            return "";
        }
        // Where the programs are is what the build says.
        if (command.starts_with("PATH=")) {
            return "";
        }
        const std::string folder = std::filesystem::path(E2E_OVCTL).parent_path().string();
        const std::string script = "exec 2>&1\ncd '" E2E_SOURCE "'\nPATH='" + folder +
                                   "':$PATH\nexport OVCTL_SOCKET='" + socket_ + "'\n";
        return moved_back(run({"/bin/sh", "-c", script + moved(command)}).out);
    }

    void start_daemon(const std::string &command)
    {
        const std::string script = replaced(command, "mgmtd ", "exec " E2E_MGMTD " ");
        daemon_ = std::make_unique<Process>(Words{"/bin/sh", "-c", replaced(script, " &\n", "")});
        ASSERT_TRUE(eventually([this] { return log().find(": ready on ") != std::string::npos; }))
            << log();
    }

    const std::map<std::string, std::string> places_{
        {"/tmp/root", root_}, {"/tmp/state", state_}, {"/tmp/control.sock", socket_}};
};

TEST_F(Readme, PrintsWhatTheProgramsPrint)
{
    const std::vector<Step> steps = steps_of_the_walk();
    ASSERT_GT(steps.size(), 30U) << "the section's name or its code blocks are others";
    EXPECT_THAT(surprises(steps), IsEmpty());
}

TEST_F(Readme, IsFoundOutWhenANumberIsWrong)
{
    std::vector<Step> steps = steps_of_the_walk();
    std::string &last = steps.back().output;
    char &digit = last.at(last.find_last_of("0123456789"));
    digit = digit == '9' ? '0' : static_cast<char>(digit + 1);
    EXPECT_EQ(surprises(steps).size(), 1U) << last;
}

} // namespace
