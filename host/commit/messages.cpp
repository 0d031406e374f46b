#include "host/commit/messages.h"

namespace ovhost
{

namespace
{

std::string code_text(int code)
{
    std::string text = std::to_string(code);
    if (const char *words =
            lc_enum_to_string_quiet_null(lc_error_code_map, static_cast<uint32>(code))) {
        text.append(" (").append(words).append(")");
    }
    return text;
}

} // namespace

std::string check_failed_message(const std::string &module, const std::string &node, int code)
{
    return "module " + module + " failed the check of " + (node.empty() ? "the commit" : node) +
           " with code " + code_text(code);
}

std::string cancelled_message()
{
    return "cancelled";
}

std::string join_names(const std::set<std::string> &modules)
{
    std::string names;
    for (const std::string &module : modules) {
        names.append(names.empty() ? "" : ", ").append(module);
    }
    return names;
}

std::string unsettled_message(const std::set<std::string> &modules, const std::string &node,
                              unsigned rounds)
{
    const bool several = modules.size() > 1;
    return (several ? "modules " : "module ") + join_names(modules) +
           (several ? " keep" : " keeps") + " amending the configuration: " + node +
           " still changed in check round " + std::to_string(rounds) + ", the last";
}

std::string apply_failed_message(const std::string &module, int code)
{
    return "module " + module + " failed to apply the commit with code " + code_text(code) +
           "; the commit stands";
}

std::string exception_message(const std::string &module, Phase phase, const std::string &reason)
{
    return "module " + module + " threw an exception in " + duty_of(phase).phase + " (" +
           (reason.empty() ? "no reason given" : reason) + "); the commit stands";
}

std::string breach_message(const std::string &module, Phase phase, const std::string &deed)
{
    return "module " + module + " " + deed + " in " + duty_of(phase).phase + "; " +
           duty_of(phase).sentence;
}

} // namespace ovhost
