#include "packaging/texts/command_words.h"
#include "packaging/texts/completion.h"

#include <ostream>

namespace ovhost
{

namespace
{

// Walks over the words before the one to complete: which command they make, and how many
// positional arguments follow it. "--option=value" comes as three words.
constexpr const char *walk = R"(
    local current=${COMP_WORDS[COMP_CWORD]} command= word i positionals=0 option=
    for ((i = 1; i < COMP_CWORD; i++)); do
        word=${COMP_WORDS[i]}
        if [[ -n $option && $word == = ]]; then
            continue
        elif [[ -n $option ]]; then
            option=
        elif [[ " $with_value " == *" $word "* ]]; then
            option=$word
        elif [[ $word == -* ]]; then
            :
        elif [[ -z $command ]]; then
            command=$word
        elif [[ " $groups " == *" $command "* ]]; then
            command+=" $word"
        else
            ((positionals++))
        fi
    done
    [[ $current == = ]] && current=
    COMPREPLY=()
    case $option in
    '') ;;
    --socket)
        compopt -o filenames 2>/dev/null
        mapfile -t COMPREPLY < <(compgen -f -- "$current")
        return
        ;;
    *) return ;;
    esac
)";

constexpr const char *answer = R"(
    if [[ $current == -* ]]; then
        mapfile -t COMPREPLY < <(compgen -W "$options" -- "$current")
    elif [[ -n $words ]]; then
        mapfile -t COMPREPLY < <(compgen -W "$words" -- "$current")
    elif [[ -n $file && $positionals -eq 0 ]]; then
        compopt -o filenames 2>/dev/null
        mapfile -t COMPREPLY < <(compgen -f -- "$current")
    fi
}

complete -F _ovctl ovctl
)";

std::string joined(const std::vector<std::string> &texts)
{
    std::string all;
    for (const std::string &text : texts)
        all += (all.empty() ? "" : " ") + text;
    return all;
}

void print_words(std::ostream &out)
{
    out << "    local words= file= options=\"";
    for (const ArgumentSpec &option : global_options())
        out << (&option == global_options().data() ? "--" : " --") << option.name;
    out << "\"\n    case $command in\n";
    for (const auto &[beginning, words] : words_after()) {
        out << "    '" << beginning << "') words=\"";
        for (const Word &word : words)
            out << (&word == words.data() ? "" : " ") << word.text;
        out << "\" ;;\n";
    }
    for (const std::string &command : commands_with_file())
        out << "    '" << command << "') file=yes ;;\n";
    out << "    esac\n";
}

void print_options(std::ostream &out)
{
    out << "    case $command in\n";
    for (const Command &command : commands()) {
        std::string options;
        for (const ArgumentSpec &argument : command.arguments)
            if (is_option(argument))
                options += std::string(" --") + argument.name;
        if (!options.empty())
            out << "    '" << command.name << "') options+=\"" << options << "\" ;;\n";
    }
    out << "    esac\n";
}

} // namespace

void print_bash_completion(std::ostream &out)
{
    std::vector<std::string> groups;
    for (const auto &[beginning, words] : words_after())
        if (!beginning.empty())
            groups.push_back(beginning);
    out << "# Completion of ovctl for bash, made from its command table.\n\n_ovctl()\n{\n"
        << "    local groups=\"" << joined(groups) << "\"\n"
        << "    local with_value=\"" << joined(options_with_values()) << "\"" << walk;
    print_words(out);
    print_options(out);
    out << answer;
}

} // namespace ovhost
