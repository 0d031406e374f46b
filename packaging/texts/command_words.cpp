#include "packaging/texts/command_words.h"

#include <algorithm>
#include <set>

namespace ovhost
{

namespace
{

using enum ArgumentSpec::Kind;

constexpr ArgumentSpec global[] = {
    {flag, "help", "Print the help of the command"},
    {flag, "version", "Print the version"},
    {text, "socket", "The control socket of mgmtd"},
    {flag, "json", "Print one line of JSON for programs"},
    {number, "timeout", "Seconds to wait for the answer"},
};

void add_word(std::vector<Word> &words, const Word &word)
{
    const auto same = [&word](const Word &known) { return known.text == word.text; };
    if (std::ranges::none_of(words, same))
        words.push_back(word);
}

} // namespace

std::span<const ArgumentSpec> global_options()
{
    return global;
}

bool is_option(const ArgumentSpec &argument)
{
    return argument.kind == text || argument.kind == number || argument.kind == flag;
}

bool takes_value(const ArgumentSpec &argument)
{
    return argument.kind == text || argument.kind == number;
}

std::map<std::string, std::vector<Word>> words_after()
{
    std::map<std::string, std::vector<Word>> words;
    for (const Command &command : commands()) {
        const std::string name = command.name;
        const std::size_t blank = name.find(' ');
        if (blank == std::string::npos) {
            add_word(words[""], {name, command.help});
            continue;
        }
        const std::string group = name.substr(0, blank);
        add_word(words[""], {group, group_help(group)});
        add_word(words[group], {name.substr(blank + 1), command.help});
    }
    return words;
}

std::vector<std::string> options_with_values()
{
    std::set<std::string> names;
    const auto add = [&names](std::span<const ArgumentSpec> arguments) {
        for (const ArgumentSpec &argument : arguments)
            if (takes_value(argument))
                names.insert(std::string("--") + argument.name);
    };
    add(global_options());
    for (const Command &command : commands())
        add(command.arguments);
    return {names.begin(), names.end()};
}

std::vector<std::string> commands_with_file()
{
    std::vector<std::string> names;
    for (const Command &command : commands())
        if (!command.arguments.empty() && !is_option(command.arguments.front()) &&
            command.arguments.front().name == std::string("file"))
            names.emplace_back(command.name);
    return names;
}

} // namespace ovhost
