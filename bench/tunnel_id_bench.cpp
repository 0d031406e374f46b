// Finding a tunnel's ID by its name among 10,000: the library's search beside the one that compares
// the name of every record.

#include "bench/database.h"
#include "bench/goals.h"
#include "bench/tunnel_names.h"
#include "framework/appliance.h"
#include "framework/logging.h"
#include "framework/tstring.h"
#include "host/framework/model_nodes.h"
#include "host/framework/objects.h"
#include "orvale/md_tunneld_defs.h"
#include "orvale/md_tunneld_tunnel_common.h"

#include <algorithm>
#include <cstdlib>
#include <memory>
#include <random>
#include <string>
#include <vector>

namespace
{

using namespace ovbench;

constexpr std::size_t num_tunnels = 10'000;
constexpr std::size_t first_unknown = 500'000;

void set_max_tunnels()
{
    mdb_db db;
    const std::vector<std::string> node = {"ov", "model", "limits", "max_tunnels"};
    db.tree.set(node, {bt_uint32, std::to_string(num_tunnels)});
    require(init_model_info(&db) == 0, "the model cannot be read");
}

struct FreeString {
    void operator()(tstring *text) const { ts_free(&text); }
};
using OwnedString = std::unique_ptr<tstring, FreeString>;

std::vector<OwnedString> strings_of(const NameList &names)
{
    std::vector<OwnedString> strings;
    for (std::size_t i = 0; i < names.size(); ++i) {
        tstring *text = nullptr;
        require(ts_new_str(&text, names[i]) == 0, "out of memory");
        strings.emplace_back(text);
    }
    return strings;
}

struct LibrarySearch {
    static constexpr const char *name = "library";

    explicit LibrarySearch(const std::vector<OwnedString> &names)
    {
        require(md_init_tunnel_id() == 0, "the tunnel IDs cannot be initialised");
        for (uint32 id = 0; id < names.size(); ++id) {
            require(md_set_tunnel_id(id, names[id].get()) == 0, "a tunnel ID cannot be set");
        }
    }

    [[nodiscard]] static uint32 find(const tstring *text)
    {
        uint32 id = TUNNEL_ID_NONE;
        (void)md_get_tunnel_id(text, &id);
        return id;
    }
};

/// Records of the same size as the library's, and nothing beside them.
class ScanningSearch
{
  public:
    static constexpr const char *name = "scan";

    explicit ScanningSearch(const std::vector<OwnedString> &names) : records_(num_tunnels)
    {
        for (uint32 id = 0; id < names.size(); ++id) {
            tstring *copy = nullptr;
            require(ts_dup(names[id].get(), &copy) == 0, "out of memory");
            records_[id].name.reset(copy);
        }
    }

    [[nodiscard]] uint32 find(const tstring *text) const
    {
        const uint32 bound = get_max_tunnel_number();
        for (uint32 id = 0; id < bound; ++id) {
            if (records_[id].name != nullptr && ts_equal(records_[id].name.get(), text)) {
                return id;
            }
        }
        return TUNNEL_ID_NONE;
    }

  private:
    struct Record {
        void *links[2];
        OwnedString name;
        uint16 id;
        uint64 last_use;
    };

    std::vector<Record> records_;
};

template <typename Search>
void find(benchmark::State &state, const NameShape &shape, bool known)
{
    const auto names = strings_of(NameList(shape, num_tunnels, 0));
    const auto unknown_names = strings_of(NameList(shape, num_tunnels, first_unknown));
    const Search search(names);
    for (uint32 id = 0; id < num_tunnels; id += num_tunnels / 100) {
        if (search.find(names[id].get()) != id ||
            search.find(unknown_names[id].get()) != TUNNEL_ID_NONE) {
            state.SkipWithError("a name leads to a wrong ID");
        }
    }
    std::vector<const tstring *> asked;
    for (const OwnedString &text : known ? names : unknown_names) {
        asked.push_back(text.get());
    }
    std::ranges::shuffle(asked, std::mt19937_64(1)); // every ID is asked for equally often
    std::size_t i = 0;
    for (auto _ : state) {
        benchmark::DoNotOptimize(search.find(asked[i]));
        i = i + 1 == num_tunnels ? 0 : i + 1;
    }
}

std::string bench_name(bool known, const char *search, const NameShape &shape)
{
    return std::string("tunnel_id_") + (known ? "known" : "unknown") + "/" + search + "/" +
           shape.name;
}

template <typename Search>
void add_bench(const NameShape &shape, bool known)
{
    benchmark::RegisterBenchmark(
        bench_name(known, Search::name, shape).c_str(),
        [&shape, known](benchmark::State &state) { find<Search>(state, shape, known); })
        ->Unit(benchmark::kMicrosecond)
        ->MinTime(0.02)
        ->Repetitions(9)
        ->ReportAggregatesOnly();
}

} // namespace

int main(int argc, char **argv)
{
    constexpr double limit = 0.1;
    G_daemon_log_level = ov_log_error;
    set_max_tunnels();
    GoalTable table{
        "`md_get_tunnel_id` with 10,000 IDs in use, beside the comparison of the name with "
        "that of every record from ID 0 on. At most a tenth of it.",
        "name",
        "library",
        {"scan"},
        {}};
    std::vector<std::string> groups;
    for (const NameShape &shape : name_shapes) {
        groups.push_back(std::string("/") + shape.name + "/");
        for (const bool known : {true, false}) {
            add_bench<LibrarySearch>(shape, known);
            add_bench<ScanningSearch>(shape, known);
            table.rows.push_back({std::string(known ? "known" : "unknown") + ", " + shape.label,
                                  bench_name(known, LibrarySearch::name, shape),
                                  {{bench_name(known, ScanningSearch::name, shape), limit}}});
        }
    }
    return run_with_goals(argc, argv, {"Tunnel ID by name", {table}, groups});
}
