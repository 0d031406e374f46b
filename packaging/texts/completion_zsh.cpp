#include "packaging/texts/command_words.h"
#include "packaging/texts/completion.h"

#include <ostream>

namespace ovhost
{

namespace
{

constexpr const char *walk = R"(
    local command= word i positionals=0 option=
    for ((i = 2; i < CURRENT; i++)); do
        word=$words[i]
        if [[ -n $option ]]; then
            option=
        elif (( $with_value[(Ie)$word] )); then
            option=$word
        elif [[ $word == -* ]]; then
            :
        elif [[ -z $command ]]; then
            command=$word
        elif (( $groups[(Ie)$command] )); then
            command+=" $word"
        else
            (( positionals++ ))
        fi
    done
    if [[ -z $option ]] && compset -P '--*='; then
        option=${IPREFIX%=}
    fi
    case $option in
    '') ;;
    --socket) _files; return ;;
    *) _message 'value'; return ;;
    esac
)";

constexpr const char *answer = R"(
    if [[ $PREFIX == -* ]]; then
        _describe -o 'option' options
    elif (( $#choices )); then
        _describe 'command' choices
    elif [[ -n $file && $positionals -eq 0 ]]; then
        _files
    else
        _message 'argument'
    fi
}

_ovctl "$@"
)";

/// A text within single quotes, as part of "word:description".
std::string quoted(const std::string &text)
{
    std::string result;
    for (const char character : text) {
        if (character == '\'')
            result += R"('\'')";
        else if (character == ':' || character == '\\')
            result += std::string("\\") + character;
        else
            result += character;
    }
    return result;
}

void print_array(std::ostream &out, const char *name, const std::vector<std::string> &texts)
{
    out << "    local -a " << name << "=(";
    for (const std::string &text : texts)
        out << (&text == texts.data() ? "" : " ") << text;
    out << ")\n";
}

void print_options(std::ostream &out, std::span<const ArgumentSpec> arguments)
{
    for (const ArgumentSpec &argument : arguments)
        if (is_option(argument))
            out << " '--" << argument.name << ':' << quoted(argument.help) << '\'';
}

void print_words(std::ostream &out)
{
    out << "    case $command in\n";
    for (const auto &[beginning, words] : words_after()) {
        out << "    '" << beginning << "')\n        choices=(\n";
        for (const Word &word : words)
            out << "            '" << quoted(word.text) << ':' << quoted(word.help) << "'\n";
        out << "        )\n        ;;\n";
    }
    for (const std::string &command : commands_with_file())
        out << "    '" << command << "') file=yes ;;\n";
    out << "    esac\n";
}

void print_command_options(std::ostream &out)
{
    out << "    case $command in\n";
    for (const Command &command : commands()) {
        bool any = false;
        for (const ArgumentSpec &argument : command.arguments)
            any = any || is_option(argument);
        if (!any)
            continue;
        out << "    '" << command.name << "') options+=(";
        print_options(out, command.arguments);
        out << " ) ;;\n";
    }
    out << "    esac\n";
}

} // namespace

void print_zsh_completion(std::ostream &out)
{
    std::vector<std::string> groups;
    for (const auto &[beginning, words] : words_after())
        if (!beginning.empty())
            groups.push_back(beginning);
    out << "#compdef ovctl\n# Completion of ovctl for zsh, made from its command table.\n\n"
        << "_ovctl()\n{\n";
    print_array(out, "groups", groups);
    print_array(out, "with_value", options_with_values());
    out << walk << "    local file=\n    local -a choices\n    local -a options=(";
    print_options(out, global_options());
    out << " )\n";
    print_words(out);
    print_command_options(out);
    out << answer;
}

} // namespace ovhost
