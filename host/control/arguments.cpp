#include "host/control/arguments.h"

#include "host/control/request_error.h"

#include <nlohmann/json.hpp>

#include <limits>

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
    if (given == request.end() || !given->is_string()) {
        refuse(request, name, "given, as a string");
    }
    return given->get<std::string>();
}

std::string optional_text(const json &request, const char *name, const std::string &otherwise)
{
    const auto given = request.find(name);
    if (given == request.end() || given->is_null()) {
        return otherwise;
    }
    if (!given->is_string()) {
        refuse(request, name, "a string");
    }
    return given->get<std::string>();
}

std::optional<std::uint32_t> optional_number(const json &request, const char *name)
{
    const auto given = request.find(name);
    if (given == request.end() || given->is_null()) {
        return std::nullopt;
    }
    constexpr auto largest = std::numeric_limits<std::uint32_t>::max();
    if (!given->is_number_integer() || *given < 0 || *given > largest) {
        refuse(request, name, "a whole number from 0 to 4294967295");
    }
    return given->get<std::uint32_t>();
}

bool optional_flag(const json &request, const char *name, bool otherwise)
{
    const auto given = request.find(name);
    if (given == request.end() || given->is_null()) {
        return otherwise;
    }
    if (!given->is_boolean()) {
        refuse(request, name, "true or false");
    }
    return given->get<bool>();
}

} // namespace ovhost
