// What a client sends to the daemon: lines are cut where they end, however the bytes arrive, and
// every request that is taken is answered with a line that reads back as what was meant.
#include "fuzz/host.h"
#include "host/control/arguments.h"
#include "host/control/framing.h"
#include "host/control/message.h"

#include <fuzzer/FuzzedDataProvider.h>
#include <nlohmann/json.hpp>

#include <optional>
#include <string>
#include <string_view>
#include <vector>

namespace
{

using namespace ovfuzz;
using nlohmann::json;
using ovhost::RequestError;

constexpr std::size_t longest_line = 64;

struct Cut {
    std::vector<std::string> lines;
    std::string rest;
    bool too_long = false;

    bool operator==(const Cut &) const = default;
};

// All at once.
Cut cut_at_newlines(std::string_view bytes)
{
    Cut cut;
    for (std::size_t begin = 0; begin <= bytes.size() && !cut.too_long;) {
        const std::size_t end = bytes.find('\n', begin);
        const std::string_view line = bytes.substr(begin, end - begin);
        if (line.size() > longest_line) {
            cut.too_long = true;
            cut.rest.clear();
        } else if (end == std::string_view::npos) {
            cut.rest = line;
            break;
        } else {
            cut.lines.emplace_back(line);
            begin = end + 1;
        }
    }
    return cut;
}

Cut cut_piecewise(std::string_view bytes, std::size_t piece_size)
{
    Cut cut;
    ovhost::LineSplitter splitter(longest_line);
    while (!bytes.empty()) {
        splitter.feed(bytes.substr(0, piece_size));
        bytes.remove_prefix(std::min(piece_size, bytes.size()));
        while (const auto line = splitter.next()) {
            cut.lines.emplace_back(*line);
        }
    }
    cut.rest = splitter.rest();
    cut.too_long = splitter.too_long();
    return cut;
}

std::string_view without_newline(const std::string &line)
{
    require(line.find('\n') == line.size() - 1, "an answer is one line");
    return std::string_view(line).substr(0, line.size() - 1);
}

void read_arguments(const json &request)
{
    (void)ovhost::optional_text(request, "path");
    (void)ovhost::optional_number(request, "limit");
    (void)ovhost::optional_flag(request, "follow");
    (void)ovhost::required_text(request, "node");
}

void answer(std::string_view line)
{
    json id;
    try {
        const json request = ovhost::parse_request(line, id);
        const std::string told = ovhost::result_line(id, request);
        const json read = ovhost::parse_line(without_newline(told));
        require(read.at("result") == request && read.at("id") == id,
                "an answer reads back as what was meant");
        read_arguments(request);
    } catch (const RequestError &error) {
        const std::string told = ovhost::error_line(id, error);
        const json read = ovhost::parse_line(without_newline(told));
        require(!read.at("ok").get<bool>() && read.at("id") == id, "an error names the request");
        require(ovhost::error_from_json(read.at("error")).code() == error.code(),
                "an error keeps its code");
    }
}

} // namespace

int LLVMFuzzerTestOneInput(const std::uint8_t *data, std::size_t size)
{
    FuzzedDataProvider input(data, size);
    const auto piece_size = input.ConsumeIntegralInRange<std::size_t>(1, 100);
    const std::string bytes = input.ConsumeRemainingBytesAsString();
    require(cut_piecewise(bytes, piece_size) == cut_at_newlines(bytes),
            "lines end at newlines, however the bytes arrive");
    answer(bytes);
    return 0;
}
