// The completions of ovctl, in the shells they are for: packaging/texts/completion.h.

#include "host/ovctl/command_table.h"
#include "packaging/texts/command_words.h"
#include "tests/packaging/shell.h"
#include "tests/support/files.h"
#include "tests/support/pty.h"
#include "tests/support/scratch_dir.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <set>
#include <sstream>
#include <string>
#include <vector>

namespace
{

using namespace ovhost;
using ovtest::PtyProcess;
using ovtest::ScratchDir;
using packaging_test::Outcome;
using packaging_test::run;
using testing::Contains;
using testing::ElementsAre;
using testing::IsEmpty;
using testing::Not;

using Words = std::vector<std::string>;

Words sorted_lines(const std::string &text)
{
    std::multiset<std::string> lines;
    std::istringstream stream(text);
    for (std::string line; std::getline(stream, line);)
        lines.insert(line);
    return {lines.begin(), lines.end()};
}

/// What bash offers for the last of the words, which may be empty, sorted.
Words offered_by_bash(const Words &words)
{
    Words argv{"bash", "-c",
               R"(. "$0"; COMP_WORDS=("$@"); COMP_CWORD=$(($# - 1)); _ovctl; )"
               R"([ ${#COMPREPLY[@]} -eq 0 ] || printf '%s\n' "${COMPREPLY[@]}")",
               OVMD_BASH_COMPLETION};
    argv.insert(argv.end(), words.begin(), words.end());
    const Outcome outcome = run(argv);
    EXPECT_EQ(outcome.exit_code, 0);
    EXPECT_EQ(outcome.err, "");
    return sorted_lines(outcome.out);
}

Words split(const std::string &name)
{
    std::istringstream stream(name);
    return {std::istream_iterator<std::string>(stream), {}};
}

TEST(BashCompletion, OffersEveryCommandOfTheTable)
{
    ASSERT_FALSE(commands().empty());
    for (const Command &command : commands()) {
        Words words{"ovctl"};
        for (const std::string &word : split(command.name)) {
            words.emplace_back();
            EXPECT_THAT(offered_by_bash(words), Contains(word)) << command.name;
            words.back() = word;
        }
    }
}

TEST(BashCompletion, OffersEveryOptionOfACommandAndTheOnesOfAll)
{
    for (const Command &command : commands()) {
        std::set<std::string> expected{"--help", "--version", "--socket", "--json", "--timeout"};
        for (const ArgumentSpec &argument : command.arguments)
            if (is_option(argument))
                expected.insert(std::string("--") + argument.name);
        Words words{"ovctl"};
        for (const std::string &word : split(command.name))
            words.push_back(word);
        words.emplace_back("-");
        EXPECT_THAT(offered_by_bash(words), testing::ElementsAreArray(expected)) << command.name;
    }
}

TEST(BashCompletion, OffersWhatBeginsAsTyped)
{
    EXPECT_THAT(offered_by_bash({"ovctl", "di"}), ElementsAre("diff", "disable", "discard"));
    EXPECT_THAT(offered_by_bash({"ovctl", "show", "tunnel-"}), ElementsAre("tunnel-tables"));
    EXPECT_THAT(offered_by_bash({"ovctl", "fly"}), IsEmpty());
    EXPECT_THAT(offered_by_bash({"ovctl", "show", "mode", ""}), IsEmpty());
}

TEST(BashCompletion, PassesOverOptionsAndTheirValues)
{
    EXPECT_THAT(offered_by_bash({"ovctl", "--json", "--socket", "load", "di"}),
                ElementsAre("diff", "disable", "discard"));
    EXPECT_THAT(offered_by_bash({"ovctl", "--socket", "=", "/s", "show", "--timeout", "5", "ma"}),
                ElementsAre("maps"));
    EXPECT_THAT(offered_by_bash({"ovctl", "commit", "--comment", ""}), IsEmpty());
    EXPECT_THAT(offered_by_bash({"ovctl", "commit", "--comment", "x", "--con"}),
                ElementsAre("--confirm"));
}

TEST(BashCompletion, OffersFilesWhereAFileIsNeeded)
{
    const ScratchDir dir;
    const std::string file = dir.path("site one.db");
    ovtest::write_file(file, "");
    const std::string begun = dir.path("si");
    for (const char *command : {"load", "upgrade"})
        EXPECT_THAT(offered_by_bash({"ovctl", command, begun}), ElementsAre(file)) << command;
    EXPECT_THAT(offered_by_bash({"ovctl", "--socket", begun}), ElementsAre(file));
    EXPECT_THAT(offered_by_bash({"ovctl", "--socket", "=", begun}), ElementsAre(file));
    EXPECT_THAT(offered_by_bash({"ovctl", "load", file, begun}), IsEmpty()) << "one file only";
    EXPECT_THAT(offered_by_bash({"ovctl", "delete", begun}), IsEmpty());
}

TEST(Completion, KnowsEveryOptionThatAllCommandsTake)
{
    const Outcome help = run({OVMD_OVCTL, "--help"});
    ASSERT_EQ(help.exit_code, 0);
    std::set<std::string> told;
    for (std::size_t at = help.out.find(" --"); at != std::string::npos;
         at = help.out.find("--", at + 3)) {
        const std::size_t begin = help.out.find("--", at);
        const std::size_t end =
            help.out.find_first_not_of("abcdefghijklmnopqrstuvwxyz-", begin + 2);
        if (begin + 2 < end)
            told.insert(help.out.substr(begin, end - begin));
    }
    told.insert("--help");
    // The example of the help has an option of a command.
    told.erase("--comment");
    std::set<std::string> known;
    for (const ArgumentSpec &option : global_options())
        known.insert(std::string("--") + option.name);
    EXPECT_EQ(known, told);
}

TEST(Completion, AnOptionTakesAValueInAllCommandsOrInNone)
{
    const Words with_value = options_with_values();
    for (const Command &command : commands())
        for (const ArgumentSpec &argument : command.arguments)
            if (is_option(argument) && !takes_value(argument)) {
                EXPECT_THAT(with_value, Not(Contains(std::string("--") + argument.name)))
                    << command.name;
            }
}

/// What an interactive zsh, which has loaded the completion as it loads an installed one, shows
/// when TAB is typed after a command line; all of it when that is not `expected`.
std::string shown_by_zsh(const std::string &typed, const std::string &expected)
{
    PtyProcess zsh({"/usr/bin/env", "zsh", "-f"}, 200,
                   {"TERM=dumb", std::string("OVMD_DIR=") + OVMD_ZSH_FOLDER});
    // The mark says that all is set; what is typed is shown too, and must not look like it.
    zsh.type("PS1='%% ' fpath=($OVMD_DIR $fpath); autoload -Uz compinit; compinit -u -D; "
             "print rea''dy\n");
    if (!zsh.read_until("\nready"))
        return "not ready: " + zsh.shown();
    zsh.type(typed + "\t");
    return zsh.read_until(expected) ? expected : zsh.shown();
}

TEST(ZshCompletion, CompletesCommandsGroupsAndOptions)
{
    for (const auto &[typed, line] : std::map<std::string, std::string>{
             {"ovctl disc", "ovctl discard "},
             {"ovctl show tunnel-", "ovctl show tunnel-tables "},
             {"ovctl show --json refe", "ovctl show --json references "},
             {"ovctl get --cand", "ovctl get --candidate "},
             {"ovctl --socket watch hist", "ovctl --socket watch history "}}) {
        EXPECT_EQ(shown_by_zsh(typed, line), line);
    }
}

TEST(ZshCompletion, CompletesFiles)
{
    const ScratchDir dir;
    const std::string file = dir.path("site.db");
    ovtest::write_file(file, "");
    EXPECT_EQ(shown_by_zsh("ovctl load " + dir.path("si"), file + " "), file + " ");
    EXPECT_EQ(shown_by_zsh("ovctl --socket " + dir.path("si"), file + " "), file + " ");
    EXPECT_EQ(shown_by_zsh("ovctl --socket=" + dir.path("si"), file + " "), file + " ");
}

TEST(ZshCompletion, ListsWhatCommandsAreFor)
{
    const std::string help = "Drop the changes of the candidate";
    EXPECT_EQ(shown_by_zsh("ovctl di", help), help);
}

TEST(ZshCompletionText, HasEveryCommandAndOptionOfTheTable)
{
    const std::string text = ovtest::read_file(OVMD_ZSH_FOLDER "/_ovctl").value();
    for (const Command &command : commands()) {
        const Words words = split(command.name);
        EXPECT_NE(text.find("'" + words.back() + ":"), std::string::npos) << command.name;
        for (const ArgumentSpec &argument : command.arguments)
            if (is_option(argument)) {
                EXPECT_NE(text.find(std::string("'--") + argument.name + ":"), std::string::npos)
                    << command.name << ' ' << argument.name;
            }
    }
}

} // namespace
