// Match strings: the library takes what the host's parser takes, and puts a string together again
// from its pairs. The rest of the input is a pair and the size of the buffer that it is appended
// in.
#include "host/framework/match_string.h"
#include "fuzz/host.h"
#include "orvale/md_xmap_common.h"

#include <fuzzer/FuzzedDataProvider.h>

#include <algorithm>
#include <array>
#include <cstring>
#include <string>
#include <vector>

namespace
{

using namespace ovfuzz;

void validate(const std::string &text)
{
    mdb_db db;
    set(db, "/ov/iflabels/config/wan0/internet", "internet");
    Commit commit;
    md_dbinfo dbinfo = {.commit = &commit, .olddb = &db, .newdb = &db};
    tbool is_valid = false;
    const int status = md_xmap_validate_match_str(&dbinfo, text.c_str(), &is_valid);

    ovhost::MatchString match;
    const bool is_parsed = !ovhost::parse_match_string(text, match).has_value();
    require(is_valid == is_parsed, "the library refuses what the parser refuses, and no more");
    require(status == 0 || (status == -1 && is_parsed), "a status is 0, or -1 for a VLAN");
    require(commit.num_refusals == (is_parsed ? 0 : 1), "a refusal is told once");
    if (!is_parsed || match.keys.empty()) {
        return;
    }
    char again[MD_XMAP_MATCHSTR_SIZE] = "";
    for (std::size_t i = 0; i < match.keys.size(); ++i) {
        require(md_xmap_concat_key_value(again, sizeof again, match.keys[i].c_str(),
                                         match.values[i].c_str()) == 0,
                "there is room for every pair of a match string");
    }
    require(text == again, "the pairs make up the string");
}

void append(const std::string &begun, std::size_t size, const std::string &key,
            const std::string &value)
{
    std::vector<char> buffer(size, '\0'); // on the heap, where a byte too many is noticed
    begun.copy(buffer.data(), std::min(size - 1, begun.size()));
    const std::string before = buffer.data();
    const int status = md_xmap_concat_key_value(buffer.data(), size, key.c_str(), value.c_str());

    const std::string pair = (before.empty() ? "" : ",") + key + ':' + value;
    const std::string after = before + pair.substr(0, MD_XMAP_MATCHSTR_SIZE - 1);
    const bool fits = after.size() < size;
    require(status == (fits ? 0 : 14002), "a pair is refused when there is no room for it");
    require((fits ? after : before) == buffer.data(), "the buffer has the pair whole, or not");
}

} // namespace

int LLVMFuzzerTestOneInput(const std::uint8_t *data, std::size_t size)
{
    // From its end the engine's reader takes numbers, from its beginning texts.
    FuzzedDataProvider input(data, size);
    const auto buffer_size = input.ConsumeIntegralInRange<std::size_t>(1, 1200);
    const std::string text = input.ConsumeRandomLengthString().c_str(); // up to a NUL
    const std::string key = input.ConsumeRandomLengthString().c_str();
    const std::string value = input.ConsumeRemainingBytesAsString().c_str();
    validate(text);
    append(text, buffer_size, key, value);
    return 0;
}
