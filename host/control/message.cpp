#include "host/control/message.h"

#include "host/support/printable.h"

#include <nlohmann/json.hpp>

namespace ovhost
{

using nlohmann::json;

namespace
{

constexpr int deepest = 64;

/// Whether brackets stand deeper within each other than may be. Looked at before the parser runs:
/// with a callback it goes over all elements of an array again for each one that it adds.
bool is_too_deep(std::string_view line)
{
    int depth = 0;
    bool in_text = false;
    for (std::size_t at = 0; at < line.size(); ++at) {
        const char character = line[at];
        if (in_text && character == '\\') {
            ++at;
        } else if (character == '"') {
            in_text = !in_text;
        } else if (!in_text && (character == '[' || character == '{') && ++depth > deepest) {
            return true;
        } else if (!in_text && (character == ']' || character == '}')) {
            --depth;
        }
    }
    return false;
}

/// The parser's message without its own prefix, and without the token it stopped at: that can be as
/// long as the request.
std::string fault_of(const json::exception &fault)
{
    std::string text = fault.what();
    if (const auto prefix = text.find("] "); prefix != std::string::npos) {
        text.erase(0, prefix + 2);
    }
    if (const auto token = text.find("; last read"); token != std::string::npos) {
        text.erase(token);
    }
    constexpr std::size_t longest = 300;
    if (text.size() > longest) {
        text.resize(longest);
    }
    return text;
}

constexpr std::size_t longest_text = 4096;
constexpr std::size_t most_details = 200;

/// The beginning of a text that is too long to be read, cut between two characters.
std::string shortened(std::string text)
{
    if (text.size() <= longest_text) {
        return text;
    }
    std::size_t end = longest_text;
    while (end > 0 && (static_cast<unsigned char>(text[end]) & 0xc0) == 0x80) {
        --end;
    }
    const std::string left_out = std::to_string(text.size() - end);
    text.resize(end);
    return text + "... (" + left_out + " bytes more)";
}

std::string more_text(std::size_t count)
{
    return "and " + std::to_string(count) + " more";
}

json detail_json(const ErrorDetail &detail)
{
    json row = {{"node", shortened(detail.node)},
                {"message", shortened(detail.message)},
                {"module", detail.module}};
    if (detail.line > 0) {
        row["line"] = detail.line;
    }
    return row;
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
    if (const auto at = line.find('\0'); at != std::string_view::npos) {
        throw RequestError(error_code::bad_json,
                           "not valid JSON: a NUL byte at column " + std::to_string(at + 1));
    }
    if (is_too_deep(line)) {
        throw RequestError(error_code::bad_json, "not valid here: values are nested deeper than " +
                                                     std::to_string(deepest));
    }
    try {
        return json::parse(line);
    } catch (const json::exception &fault) {
        throw RequestError(error_code::bad_json, "not valid JSON: " + fault_of(fault));
    }
}

json parse_request(std::string_view line, json &id)
{
    json request = parse_line(line);
    if (!request.is_object()) {
        throw RequestError(error_code::bad_request,
                           std::string("a request is a JSON object, this is of type ") +
                               request.type_name());
    }
    // A null id is one that was left out: the answer carries null for both.
    if (const auto given = request.find("id"); given != request.end() && !given->is_null()) {
        if (!given->is_number_integer()) {
            throw RequestError(error_code::bad_request,
                               std::string("\"id\" is a whole number, this is of type ") +
                                   given->type_name());
        }
        id = *given;
    }
    const auto command = request.find("command");
    if (command == request.end() || !command->is_string()) {
        throw RequestError(error_code::bad_request, "a request needs a \"command\" of type string");
    }
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

std::string gap_line(std::uint64_t left_out)
{
    return event_line({{"kind", "gap"}, {"left_out", left_out}});
}

std::string goodbye_line(const std::string &code, const std::string &message)
{
    return to_line({{"goodbye", {{"code", code}, {"message", message}}}});
}

json error_to_json(const RequestError &error)
{
    json details = json::array();
    const std::vector<ErrorDetail> &all = error.details();
    const std::size_t told = all.size() <= most_details ? all.size() : most_details - 1;
    for (std::size_t i = 0; i < told; ++i) {
        details.push_back(detail_json(all[i]));
    }
    if (told < all.size()) {
        details.push_back(detail_json({{}, more_text(all.size() - told), {}, 0}));
    }
    return {{"code", error.code()},
            {"message", shortened(error.what())},
            {"details", std::move(details)}};
}

RequestError error_from_json(const json &error)
{
    std::vector<ErrorDetail> details;
    for (const json &row : error.value("details", json::array())) {
        details.push_back({row.value("node", ""), row.at("message").get<std::string>(),
                           row.value("module", ""), row.value("line", 0L)});
    }
    return {error.at("code").get<std::string>(), error.at("message").get<std::string>(),
            std::move(details)};
}

} // namespace ovhost
