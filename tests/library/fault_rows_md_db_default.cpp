#include "host/framework/appliance_config.h"
#include "orvale/md_db_default.h"
#include "tests/library/default_entries.h"
#include "tests/library/fault_rows.h"

#include <cstdlib>
#include <cstring>

namespace ovtest
{

namespace
{

const UnitLines unit("md_db_default");

constexpr char parser[] = "db_default_get_file_default";
constexpr char converter[] = "convert_line_to_bn_str_value";
constexpr char removal_converter[] = "convert_removal";

// One value and one removal, each with a type of its own and with all its fields.
constexpr char file_text[] = "/a,string,x\n-/b,uint32,5\n";
constexpr char only_a[] = "[/a 101 'x']";
constexpr char only_b[] = "[/b 5 '5']";

// What differs between the readers when a line fails.
struct ReaderTraits {
    std::string function;
    bool delivers_with_error; // the good entries come even with a failing status
    bool moves_file = false;
};

std::string moved(const ReaderTraits &reader, bool parse_succeeded)
{
    return !reader.moves_file ? "" : parse_succeeded ? " | moved" : " | stays";
}

Outcome last_line_failed(const ReaderTraits &reader, const std::string &status,
                         std::vector<ExpectedLine> log, int code = 0)
{
    log.push_back(unit.bail(parser, code));
    log.push_back(unit.bail(reader.function, code));
    const std::string entries = reader.delivers_with_error
                                    ? " | 1 " + std::string(only_a) + " | 0 []"
                                    : " | 0 untouched | 0 untouched";
    return {status + entries + moved(reader, false), std::move(log)};
}

Outcome first_line_failed(const ReaderTraits &reader, std::vector<ExpectedLine> log, int code = 0)
{
    log.push_back(unit.bail(parser, code));
    const std::string values = reader.delivers_with_error ? "0 []" : "0 untouched";
    return {"0 | " + values + " | 1 " + only_b + moved(reader, true), std::move(log)};
}

Outcome both_lines_failed(const ReaderTraits &reader, const std::string &status,
                          std::vector<ExpectedLine> first, std::vector<ExpectedLine> second,
                          int code = 0)
{
    std::vector<ExpectedLine> log = std::move(first);
    log.push_back(unit.bail(parser, code));
    log.insert(log.end(), second.begin(), second.end());
    log.push_back(unit.bail(parser, code));
    log.push_back(unit.bail(reader.function, code));
    const std::string none = reader.delivers_with_error ? "0 []" : "0 untouched";
    return {status + " | " + none + " | " + none + moved(reader, false), std::move(log)};
}

void add_lookup_failures(const ReaderTraits &reader, std::vector<FailureRow> &failures)
{
    const std::vector<ExpectedLine> unknown = {
        unit.error(converter, "Unable to convert string type")};
    failures.push_back(
        {fails_once(Operation::lc_string_to_enum, 1), first_line_failed(reader, unknown)});
    failures.push_back({fails_from(Operation::lc_string_to_enum, 1),
                        both_lines_failed(reader, "{code}", unknown, {})});
    failures.push_back(
        {fails(Operation::lc_string_to_enum, 2), last_line_failed(reader, "{code}", {})});
}

// Memory is asked for in this order: both arrays; for each line its type's name, its own name and
// its value. A line goes on asking for its value when its name found none.
void add_allocation_failures(const ReaderTraits &reader, std::vector<FailureRow> &failures)
{
    const Outcome silent = {"0 | 0 untouched | 0 untouched" + moved(reader, true)};
    const std::vector<ExpectedLine> first = {unit.unexpected_null(converter)};
    const std::vector<ExpectedLine> last = {unit.unexpected_null(removal_converter)};
    failures.push_back({fails(Operation::allocation, 1), silent});
    failures.push_back({fails(Operation::allocation, 2), silent});
    for (const unsigned call : {3U, 4U, 5U}) {
        failures.push_back(
            {fails_once(Operation::allocation, call), first_line_failed(reader, first, 14001)});
        failures.push_back({fails_from(Operation::allocation, call),
                            both_lines_failed(reader, "14001", first, last, 14001)});
    }
    for (const unsigned call : {6U, 7U, 8U}) {
        failures.push_back(
            {fails(Operation::allocation, call), last_line_failed(reader, "14001", last, 14001)});
    }
}

std::vector<FailureRow> reader_failures(const ReaderTraits &reader)
{
    const std::string nothing = " | 0 untouched | 0 untouched";
    const Outcome passed_up = {"{code}" + nothing + moved(reader, false),
                               {unit.bail(parser), unit.bail(reader.function)}};
    std::vector<FailureRow> failures = {
        {fails(Operation::lf_test_exists), passed_up},
        {fails(Operation::lf_read_file_lines), passed_up},
        {hands_out_nothing(Operation::lf_read_file_lines), {"0" + nothing + moved(reader, true)}},
        {fails(Operation::conf_file_okay), {"0" + nothing}},
        {fails(Operation::get_config_name), {"0" + nothing}},
    };
    add_lookup_failures(reader, failures);
    add_allocation_failures(reader, failures);
    return failures;
}

Outcome all_read(const ReaderTraits &reader)
{
    return {"0 | 1 " + std::string(only_a) + " | 1 " + only_b + moved(reader, true)};
}

std::string read_and_tell_where_the_file_is(HostFixture &)
{
    std::string answer = read_preserved(true);
    if (read_file(preserved_read_file) == file_text && !read_file(preserved_file)) {
        return answer + " | moved";
    }
    const bool stays = read_file(preserved_file) == file_text && !read_file(preserved_read_file);
    return answer + (stays ? " | stays" : " | lost");
}

std::vector<FaultRow> reader_rows()
{
    const ReaderTraits debug = {"db_default_get_all", true};
    const ReaderTraits model = {"db_model_def_get_all", false};
    const ReaderTraits preserved = {"db_preserved_get_all", true, true};
    return {
        {debug.function, "of_two_lines", [](HostFixture &) { write_file(debug_file, file_text); },
         [](HostFixture &) { return read_defaults(db_default_get_all); }, all_read(debug),
         reader_failures(debug)},
        {model.function, "of_two_lines",
         [](HostFixture &) {
             ovhost::set_config_name("m1");
             write_file("/opt/orvale/defdb.conf.m1", file_text);
         },
         [](HostFixture &) { return read_defaults(db_model_def_get_all); }, all_read(model),
         reader_failures(model)},
        {preserved.function, "of_two_lines",
         [](HostFixture &) { write_file(preserved_file, file_text); },
         read_and_tell_where_the_file_is, all_read(preserved), reader_failures(preserved)},
    };
}

} // namespace

std::vector<FaultRow> md_db_default_rows()
{
    std::vector<FaultRow> rows = reader_rows();
    // These two call nothing that could fail.
    rows.push_back({"db_default_set_all",
                    "of_nothing",
                    [](HostFixture &) {},
                    [](HostFixture &) {
                        return std::to_string(in_library(db_default_set_all, nullptr, nullptr));
                    },
                    {"0"},
                    {}});
    rows.push_back({"bn_str_value_free",
                    "of_an_entry",
                    [](HostFixture &) {},
                    [](HostFixture &) {
                        auto *array = static_cast<bn_str_value *>(calloc(1, sizeof(bn_str_value)));
                        array[0] = {strdup("/a"), bt_string, strdup("x")};
                        const int status = in_library(bn_str_value_free, &array, 1);
                        return std::to_string(status) + (array == nullptr ? " null" : " left");
                    },
                    {"0 null"},
                    {}});
    return rows;
}

} // namespace ovtest
