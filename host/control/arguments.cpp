#include "host/control/arguments.h"

#include "host/control/request_error.h"

#include <nlohmann/json.hpp>

namespace ovhost
{

using nlohmann::json;

namespace
{

[[noreturn]] void refuse(const json &request, const char *name, const char *needed)
{
    throw RequestError(error_code::bad_request, "command \"" +
                                                    request.value("command", std::string()) +
                                                    "\": \"" + name + "\" must be " + needed);
}

} // namespace

std::string required_text(const json &request, const char *name)
{
    const auto given = request.find(name);
    if (given == request.end() || !given->is_string())
        refuse(request, name, "given, as a string");
    return given->get<std::string>();
}

std::string optional_text(const json &request, const char *name, const std::string &otherwise)
{
    const auto given = request.find(name);
    if (given == request.end() || given->is_null())
        return otherwise;
    if (!given->is_string())
        refuse(request, name, "a string");
    return given->get<std::string>();
}

bool optional_flag(const json &request, const char *name, bool otherwise)
{
    const auto given = request.find(name);
    if (given == request.end() || given->is_null())
        return otherwise;
    if (!given->is_boolean())
        refuse(request, name, "true or false");
    return given->get<bool>();
}

} // namespace ovhost
