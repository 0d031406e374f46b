#include "tests/library/fault_rows.h"
#include "tests/library/tunnel_cache.h"

namespace ovtest
{

namespace
{

// Neither the cache nor its tables call anything that can fail: what is told here is that nothing
// is called, logged or kept besides.

constexpr int warnings_and_errors = 4;

void with_a_tunnel(HostFixture &host)
{
    host.set_log_level(warnings_and_errors);
    (void)md_tunbin_ht_init();
    const tunnel_config_bin_t record = record_of("alpha", "first", 7);
    (void)md_tunbin_ht_add(&record);
}

template <auto change>
std::string changed(HostFixture &)
{
    const tunnel_config_bin_t record = record_of("alpha", "first", 7);
    const int status = in_library(change, &record);
    return std::to_string(status) + (md_tunbin_ht_id_has_tunnel(7) ? " there" : " gone");
}

std::vector<FaultRow> cache_rows()
{
    const auto row = [](const char *function, std::string (*call)(HostFixture &),
                        const std::string &answer) {
        return FaultRow{function, "of_a_tunnel", with_a_tunnel, call, {answer}};
    };
    return {
        row(
            "md_tunbin_ht_init",
            [](HostFixture &) {
                const int status = in_library(md_tunbin_ht_init);
                return std::to_string(status) +
                       (md_tunbin_ht_id_has_tunnel(7) ? " there" : " gone");
            },
            "0 gone"),
        row("md_tunbin_ht_add", changed<md_tunbin_ht_add>, "0 there"),
        row("md_tunbin_ht_del", changed<md_tunbin_ht_del>, "0 gone"),
        row(
            "md_tunbin_ht_id_has_tunnel",
            [](HostFixture &) {
                return std::string(in_library(md_tunbin_ht_id_has_tunnel, 7U) ? "yes" : "no");
            },
            "yes"),
        row(
            "md_tunbin_ht_get_name_by_id",
            [](HostFixture &) { return std::string(in_library(md_tunbin_ht_get_name_by_id, 7U)); },
            "alpha"),
        row(
            "md_tunbin_ht_get_id_by_name",
            [](HostFixture &) {
                return std::to_string(in_library(md_tunbin_ht_get_id_by_name, "alpha"));
            },
            "7"),
        row(
            "md_tunbin_ht_get_id_by_alias",
            [](HostFixture &) {
                return std::to_string(in_library(md_tunbin_ht_get_id_by_alias, "first"));
            },
            "7"),
        row(
            "md_tunbin_ht_dump",
            [](HostFixture &) {
                in_library(md_tunbin_ht_dump);
                return std::string("dumped");
            },
            "dumped"),
    };
}

// What the text leads to.
template <std::size_t which>
std::string led_to(const char *text)
{
    uint32 id = 0;
    return table_operations[which].find(text, &id) == 0 ? std::to_string(id) : "nothing";
}

template <std::size_t which>
std::vector<FaultRow> table_rows()
{
    const auto row = [](const char *operation, std::string (*call)(HostFixture &),
                        const std::string &answer) {
        const auto set_up = [](HostFixture &host) {
            host.set_log_level(warnings_and_errors);
            (void)table_operations[which].init();
            char text[] = "alpha";
            table_operations[which].add(text, 7);
        };
        return FaultRow{
            table_operations[which].name_of(operation), "of_a_text", set_up, call, {answer}};
    };
    return {
        row(
            "init",
            [](HostFixture &) {
                const int status = in_library(table_operations[which].init);
                return std::to_string(status) + ' ' + led_to<which>("alpha");
            },
            "0 nothing"),
        row(
            "add",
            [](HostFixture &) {
                char text[] = "beta";
                in_library(table_operations[which].add, text, 8U);
                return led_to<which>("beta");
            },
            "8"),
        row(
            "del",
            [](HostFixture &) {
                char text[] = "alpha";
                in_library(table_operations[which].del, text);
                return led_to<which>("alpha");
            },
            "nothing"),
        row(
            "find",
            [](HostFixture &) {
                uint32 id = 0;
                const int status = in_library(table_operations[which].find, "alpha", &id);
                return std::to_string(status) + ' ' + std::to_string(id);
            },
            "0 7"),
        row(
            "dump",
            [](HostFixture &) { return std::to_string(in_library(table_operations[which].dump)); },
            "1"),
    };
}

} // namespace

std::vector<FaultRow> md_tunbin_ht_rows()
{
    std::vector<FaultRow> rows;
    for (const auto part : {cache_rows, table_rows<0>, table_rows<1>}) {
        for (FaultRow &row : part()) {
            rows.push_back(std::move(row));
        }
    }
    return rows;
}

} // namespace ovtest
