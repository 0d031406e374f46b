#include "host/ovctl/options.h"

#include "host/ovctl/exit_code.h"
#include "host/support/command_line.h"
#include "host/support/version.h"

#include <cctype>
#include <map>

namespace ovhost
{

namespace
{

constexpr const char *footer =
    "Edits go to one candidate configuration that all clients share; commit makes it the running "
    "one.\n"
    "A value that starts with a hyphen goes behind --: ovctl set -- NAME TYPE -VALUE\n\n"
    "Exit codes:\n"
    "  0  done\n"
    "  1  mgmtd refused or failed, or a check found something; the messages say why\n"
    "  2  the command line, or a file named on it, is wrong, or the output cannot be written\n"
    "  3  mgmtd cannot be reached or did not answer\n"
    "  4  the answer was not understood\n\n"
    "Example:\n"
    "  ovctl set /ov/tunneld/system/config/mode string router\n"
    "  ovctl diff\n"
    "  ovctl commit --comment \"router mode\"";

std::string upper(std::string text)
{
    for (char &letter : text) {
        letter = static_cast<char>(std::toupper(static_cast<unsigned char>(letter)));
    }
    return text;
}

/// A number that is none compares with nothing: it is out of every range.
std::string timeout_fault(const std::string &text)
{
    double seconds = 0;
    const bool fits =
        CLI::detail::lexical_cast(text, seconds) && seconds >= 0.001 && seconds <= 86400;
    return fits ? "" : "must be a number of seconds from 0.001 to 86400";
}

class CommandLine
{
  public:
    explicit CommandLine(Invocation &invocation)
        : invocation_(invocation), app_("The client of mgmtd.", "ovctl")
    {
        app_.footer(footer);
        app_.set_version_flag("--version", program_version());
        app_.require_subcommand(1);
        // Global options are taken after the command's name too.
        app_.fallthrough();
        add_global_options();
        for (const Command &command : commands()) {
            add_command(command);
        }
    }

    CLI::App &app() { return app_; }

    /// The words of a command that there is none of; empty when it is not that.
    [[nodiscard]] std::string unknown_command() const
    {
        const std::vector<std::string> rest = app_.remaining(true);
        if (rest.empty() || rest.front().starts_with('-')) {
            return {};
        }
        const std::vector<CLI::App *> groups = app_.get_subcommands();
        return (groups.empty() ? "" : groups.front()->get_name() + " ") + rest.front();
    }

  private:
    void add_global_options()
    {
        Options &options = invocation_.options;
        options.socket = "/run/mgmtd/control.sock";
        app_.add_option("--socket", options.socket, "The control socket of mgmtd")
            ->envname("OVCTL_SOCKET")
            ->check(not_empty())
            ->capture_default_str();
        app_.add_flag("--json", options.json,
                      "Print one line of JSON for programs, {\"ok\":true,\"result\":...} or "
                      "{\"ok\":false,\"error\":...}");
        app_.add_option("--timeout", options.timeout_seconds, "Seconds to wait for the answer")
            ->check(CLI::Validator(timeout_fault, ""))
            ->capture_default_str();
    }

    void add_command(const Command &command)
    {
        CLI::App &added = add_words(command.name);
        added.description(command.help);
        added.footer(std::string("Example:\n  ") + command.example);
        for (const ArgumentSpec &argument : command.arguments) {
            add_argument(added, argument);
        }
        added.callback([this, &command] { invocation_.command = &command; });
    }

    /// The subcommand for a command's name; the first of two words is a group.
    CLI::App &add_words(const std::string &name)
    {
        const std::size_t blank = name.find(' ');
        CLI::App &parent = blank == std::string::npos ? app_ : group(name.substr(0, blank));
        CLI::App *added =
            parent.add_subcommand(blank == std::string::npos ? name : name.substr(blank + 1));
        added->fallthrough();
        return *added;
    }

    CLI::App &group(const std::string &word)
    {
        CLI::App *&found = groups_[word];
        if (found == nullptr) {
            found = app_.add_subcommand(word, group_help(word));
            found->require_subcommand(1);
            found->fallthrough();
            // Otherwise it takes over the footer of the whole program.
            found->footer("");
        }
        return *found;
    }

    void add_argument(CLI::App &command, const ArgumentSpec &argument)
    {
        const std::string name = argument.name;
        const auto store = [this, name](const std::string &value) {
            invocation_.arguments[name] = value;
        };
        switch (argument.kind) {
        case ArgumentSpec::Kind::positional:
            command.add_option_function<std::string>(name, store, argument.help)
                ->option_text(upper(name))
                ->required();
            return;
        case ArgumentSpec::Kind::optional:
            command.add_option_function<std::string>(name, store, argument.help)
                ->option_text("[" + upper(name) + "]");
            return;
        case ArgumentSpec::Kind::text:
        case ArgumentSpec::Kind::number:
            command.add_option_function<std::string>("--" + name, store, argument.help)
                ->option_text(argument.kind == ArgumentSpec::Kind::text ? "TEXT" : "N");
            return;
        case ArgumentSpec::Kind::flag:
            command.add_flag_callback(
                "--" + name, [store] { store("true"); }, argument.help);
            return;
        }
    }

    Invocation &invocation_;
    CLI::App app_;
    std::map<std::string, CLI::App *> groups_;
};

} // namespace

std::optional<Invocation> read_command_line(int argc, const char *const *argv, std::ostream &out,
                                            std::ostream &err, int &exit_code)
{
    Invocation invocation;
    CommandLine line(invocation);
    try {
        line.app().parse(argc, argv);
        return invocation;
    } catch (const CLI::RequiredError &error) {
        const std::string unknown = line.unknown_command();
        err << (unknown.empty() ? error.what() : "there is no command \"" + unknown + "\"")
            << "\nRun with --help for more information.\n";
        exit_code = static_cast<int>(ExitCode::usage);
        return std::nullopt;
    } catch (const CLI::ParseError &error) {
        const int code = line.app().exit(error, out, err);
        exit_code = static_cast<int>(code == 0 ? ExitCode::ok : ExitCode::usage);
        return std::nullopt;
    }
}

} // namespace ovhost
