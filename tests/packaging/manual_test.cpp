// The manual pages: docs/man/, and the commands that packaging/texts/manual.h puts into one of
// them.

#include "host/ovctl/command_table.h"
#include "packaging/texts/command_words.h"
#include "packaging/texts/manual.h"
#include "tests/packaging/shell.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <set>
#include <sstream>
#include <string>
#include <vector>

namespace
{

using namespace ovhost;
using packaging_test::Outcome;
using packaging_test::run;
using testing::HasSubstr;

/// A page as people read it, with single blanks.
std::string read_page(const std::string &file)
{
    const Outcome outcome = run({"mandoc", "-T", "ascii", file});
    EXPECT_EQ(outcome.exit_code, 0) << outcome.err;
    std::string text;
    for (const char character : outcome.out) {
        const bool blank = character == ' ' || character == '\n';
        if (character == '\b' && !text.empty())
            text.pop_back();
        else if (!blank)
            text += character;
        else if (!text.empty() && text.back() != ' ')
            text += ' ';
    }
    return text;
}

/// The options of a program or command, as its --help lists them: "--name" and "-n".
std::set<std::string> options_in_help(std::vector<std::string> words)
{
    words.emplace_back("--help");
    const Outcome outcome = run(words);
    EXPECT_EQ(outcome.exit_code, 0) << outcome.err;
    std::set<std::string> options;
    std::istringstream lines(outcome.out);
    for (std::string line; std::getline(lines, line);) {
        if (!line.starts_with("  -"))
            continue;
        std::istringstream names(line.substr(2, line.find(' ', 2) - 2));
        for (std::string name; std::getline(names, name, ',');)
            options.insert(name);
    }
    return options;
}

struct Page {
    const char *program;
    const char *file;
};

void PrintTo(const Page &page, std::ostream *stream)
{
    *stream << page.file;
}

class ManualPage : public testing::TestWithParam<Page>
{
};

INSTANTIATE_TEST_SUITE_P(Each, ManualPage,
                         testing::Values(Page{OVMD_MGMTD, OVMD_MGMTD_PAGE},
                                         Page{OVMD_JSOND, OVMD_JSOND_PAGE},
                                         Page{OVMD_OVCTL, OVMD_OVCTL_PAGE}));

TEST_P(ManualPage, IsWellFormed)
{
    EXPECT_EQ(run({"mandoc", "-T", "lint", "-W", "warning", GetParam().file}),
              (Outcome{0, "", ""}));
}

TEST_P(ManualPage, TellsEveryOptionOfTheHelp)
{
    const std::string page = read_page(GetParam().file);
    const std::set<std::string> options = options_in_help({GetParam().program});
    EXPECT_GE(options.size(), 4U);
    for (const std::string &option : options)
        EXPECT_THAT(page, HasSubstr(" " + option)) << option;
}

/// Where the entry of each command begins, in the words of its first line.
std::string entry_of(const Command &command)
{
    std::string entry = std::string(" ") + command.name + " ";
    for (const ArgumentSpec &argument : command.arguments) {
        std::string value = argument.name;
        for (char &letter : value)
            letter = static_cast<char>(std::toupper(letter));
        const std::string option = std::string("[--") + argument.name;
        entry += argument.kind == ArgumentSpec::Kind::positional ? value
                 : argument.kind == ArgumentSpec::Kind::optional ? "[" + value + "]"
                 : argument.kind == ArgumentSpec::Kind::text     ? option + " TEXT]"
                 : argument.kind == ArgumentSpec::Kind::number   ? option + " N]"
                                                                 : option + "]";
        entry += " ";
    }
    return entry;
}

TEST(ManualOfOvctl, TellsEveryCommandWithItsArgumentsAndExample)
{
    const std::string page = read_page(OVMD_OVCTL_PAGE);
    for (const Command &command : commands()) {
        const std::size_t at = page.find(entry_of(command) + command.help + ".");
        ASSERT_NE(at, std::string::npos) << entry_of(command);
        const std::string entry = page.substr(at, page.find("Example: ", at) - at + 500);
        EXPECT_THAT(entry, HasSubstr(std::string("Example: ") + command.example + " "))
            << command.name;
        for (const ArgumentSpec &argument : command.arguments)
            EXPECT_THAT(entry, HasSubstr(std::string(argument.help) + "."))
                << command.name << ' ' << argument.name;
    }
}

TEST(ManualOfOvctl, TellsEveryOptionOfEachCommandsHelp)
{
    const std::string page = read_page(OVMD_OVCTL_PAGE);
    for (const Command &command : commands()) {
        std::vector<std::string> words{OVMD_OVCTL};
        std::istringstream name(command.name);
        for (std::string word; name >> word;)
            words.push_back(word);
        for (const std::string &option : options_in_help(words))
            EXPECT_THAT(page, HasSubstr(" " + option)) << command.name;
    }
}

TEST(ManualOfOvctl, NeedsAPlaceForTheCommands)
{
    std::istringstream without(".Sh NAME\n");
    std::ostringstream out;
    EXPECT_FALSE(print_manual(without, out));
    EXPECT_EQ(out.str(), ".Sh NAME\n");
}

} // namespace
