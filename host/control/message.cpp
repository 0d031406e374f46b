#include "host/control/message.h"

#include <nlohmann/json.hpp>

namespace ovhost
{

using nlohmann::json;

namespace
{

constexpr int deepest = 64;

struct TooDeep : std::exception {
};

bool limit_depth(int depth, json::parse_event_t event, json &)
{
    const bool opens =
        event == json::parse_event_t::object_start || event == json::parse_event_t::array_start;
    if (opens && depth >= deepest)
        throw TooDeep();
    return true;
}

/// The parser's message without its own prefix, and without the token it stopped at: that can be as
/// long as the request.
std::string fault_of(const json::exception &fault)
{
    std::string text = fault.what();
    if (const auto prefix = text.find("] "); prefix != std::string::npos)
        text.erase(0, prefix + 2);
    if (const auto token = text.find("; last read"); token != std::string::npos)
        text.erase(token);
    constexpr std::size_t longest = 300;
    if (text.size() > longest)
        text.resize(longest);
    return text;
}

} // namespace

std::string to_line(const json &message)
{
    std::string line = message.dump(-1, ' ', false, json::error_handler_t::replace);
    line += '\n';
    return line;
}

json parse_line(std::string_view line)
{
    try {
        return json::parse(line, limit_depth);
    } catch (const TooDeep &) {
        throw RequestError(error_code::bad_json, "not valid here: values are nested deeper than " +
                                                     std::to_string(deepest));
    } catch (const json::exception &fault) {
        throw RequestError(error_code::bad_json, "not valid JSON: " + fault_of(fault));
    }
}

json parse_request(std::string_view line, json &id)
{
    json request = parse_line(line);
    if (!request.is_object())
        throw RequestError(error_code::bad_request,
                           std::string("a request is a JSON object, this is of type ") +
                               request.type_name());
    if (const auto given = request.find("id"); given != request.end()) {
        if (!given->is_number_integer())
            throw RequestError(error_code::bad_request,
                               std::string("\"id\" is a whole number, this is of type ") +
                                   given->type_name());
        id = *given;
    }
    const auto command = request.find("command");
    if (command == request.end() || !command->is_string())
        throw RequestError(error_code::bad_request, "a request needs a \"command\" of type string");
    return request;
}

std::string result_line(const json &id, const json &result)
{
    return to_line({{"id", id}, {"ok", true}, {"result", result}});
}

std::string error_line(const json &id, const RequestError &error)
{
    return to_line({{"id", id}, {"ok", false}, {"error", error_to_json(error)}});
}

std::string event_line(const json &event)
{
    return to_line({{"event", event}});
}

std::string goodbye_line(const std::string &code, const std::string &message)
{
    return to_line({{"goodbye", {{"code", code}, {"message", message}}}});
}

json error_to_json(const RequestError &error)
{
    json details = json::array();
    for (const ErrorDetail &detail : error.details()) {
        json row = {{"node", detail.node}, {"message", detail.message}, {"module", detail.module}};
        if (detail.line > 0)
            row["line"] = detail.line;
        details.push_back(std::move(row));
    }
    return {{"code", error.code()}, {"message", error.what()}, {"details", std::move(details)}};
}

RequestError error_from_json(const json &error)
{
    std::vector<ErrorDetail> details;
    for (const json &row : error.value("details", json::array()))
        details.push_back({row.value("node", ""), row.at("message").get<std::string>(),
                           row.value("module", ""), row.value("line", 0L)});
    return {error.at("code").get<std::string>(), error.at("message").get<std::string>(),
            std::move(details)};
}

} // namespace ovhost
