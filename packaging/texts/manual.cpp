#include "packaging/texts/manual.h"

#include "packaging/texts/command_words.h"

#include <cctype>
#include <istream>
#include <ostream>
#include <string>

namespace ovhost
{

namespace
{

constexpr const char *place = ".\\\" COMMANDS";

/// A text as a line of its own that stands for itself. Hyphens stay hyphens, as one types them.
std::string text_line(const std::string &text)
{
    std::string result;
    for (const char character : text) {
        if (character == '\\')
            result += "\\e";
        else if (character == '-')
            result += "\\-";
        else if (character == '"')
            result += "\\(dq";
        else
            result += character;
    }
    const bool looks_like_a_macro = result.starts_with('.') || result.starts_with('\'');
    return (looks_like_a_macro ? "\\&" : "") + result;
}

std::string upper(std::string text)
{
    for (char &letter : text)
        letter = static_cast<char>(std::toupper(static_cast<unsigned char>(letter)));
    return text;
}

/// As it stands in the line that names the command.
std::string synopsis(const ArgumentSpec &argument)
{
    const std::string name = argument.name;
    switch (argument.kind) {
    case ArgumentSpec::Kind::positional:
        return "Ar " + upper(name);
    case ArgumentSpec::Kind::optional:
        return "Op Ar " + upper(name);
    case ArgumentSpec::Kind::text:
        return "Op Fl -" + name + " Ar TEXT";
    case ArgumentSpec::Kind::number:
        return "Op Fl -" + name + " Ar N";
    case ArgumentSpec::Kind::flag:
        return "Op Fl -" + name;
    }
    return {};
}

std::string entry(const ArgumentSpec &argument)
{
    return is_option(argument) ? "Fl -" + std::string(argument.name) : "Ar " + upper(argument.name);
}

void print_arguments(const Command &command, std::ostream &out)
{
    if (command.arguments.empty())
        return;
    out << ".Bl -tag -width Ds -compact\n";
    for (const ArgumentSpec &argument : command.arguments)
        out << ".It " << entry(argument) << '\n' << text_line(argument.help) << ".\n";
    out << ".El\n";
}

void print_command(const Command &command, std::ostream &out)
{
    out << ".It Xo\n.Cm " << command.name << '\n';
    for (const ArgumentSpec &argument : command.arguments)
        out << '.' << synopsis(argument) << '\n';
    out << ".Xc\n" << text_line(command.help) << ".\n";
    print_arguments(command, out);
    out << ".Pp\nExample:\n.Dl " << text_line(command.example) << '\n';
}

} // namespace

bool print_manual(std::istream &page, std::ostream &out)
{
    bool found = false;
    for (std::string line; std::getline(page, line);) {
        if (line != place) {
            out << line << '\n';
            continue;
        }
        found = true;
        out << ".Bl -tag -width Ds\n";
        for (const Command &command : commands())
            print_command(command, out);
        out << ".El\n";
    }
    return found;
}

} // namespace ovhost
