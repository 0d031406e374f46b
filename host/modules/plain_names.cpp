#include "host/modules/plain_names.h"

#include "host/modules/node_access.h"
#include "host/support/printable.h"

namespace ovhost
{

std::optional<std::string> plain_name_fault(const char *thing, const std::string &name,
                                            std::size_t longest)
{
    if (name.empty() || name.size() > longest) {
        return std::string(thing) + " is 1 to " + std::to_string(longest) + " bytes long, not " +
               std::to_string(name.size());
    }
    const std::size_t position = name.find_first_of("/\\*");
    if (position != std::string::npos) {
        return std::string(thing) + " must not hold \"" + name[position] +
               "\": choose another name";
    }
    if (const std::string shown = printable(name); shown != name) {
        return std::string(thing) + " must not hold control characters, as \"" + shown +
               "\" does: choose another name";
    }
    return std::nullopt;
}

std::optional<std::string> entry_number_fault(const char *thing, const std::string &number)
{
    constexpr uint32 last = 65535;
    const std::optional<uint32> parsed = parse_number(number);
    const bool is_good = parsed && *parsed >= 1 && *parsed <= last && number.front() != '0';
    return is_good ? std::nullopt
                   : std::optional(std::string(thing) + " is a decimal number from 1 to " +
                                   std::to_string(last) + ", not \"" + number + "\"");
}

} // namespace ovhost
