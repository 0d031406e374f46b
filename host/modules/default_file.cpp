#include "host/modules/default_file.h"

#include "host/commit/engine.h"
#include "host/modules/schema.h"
#include "host/support/read_file.h"
#include "host/support/unique_fd.h"
#include "host/tree/name.h"

#include <fcntl.h>
#include <sys/stat.h>

#include <algorithm>
#include <cerrno>
#include <cstdlib>
#include <limits>
#include <optional>
#include <string_view>
#include <system_error>

namespace ovhost
{
namespace
{

[[noreturn]] void fail_to_read(const std::string &path, const std::string &reason)
{
    throw DefaultsError(path + " cannot be read: " + reason +
                        "; mend that, or move it away, and start again");
}

/// The file as it is: the lines that the library is given end at their first NUL byte. Nothing when
/// there is no file.
std::optional<std::string> read_text(const std::string &path)
{
    // Without O_NONBLOCK a pipe in the file's place would hold the daemon until somebody writes.
    const UniqueFd file(::open(path.c_str(), O_RDONLY | O_CLOEXEC | O_NONBLOCK));
    if (!file && (errno == ENOENT || errno == ENOTDIR)) {
        return std::nullopt;
    }
    struct stat status = {};
    if (!file || ::fstat(file.get(), &status) != 0) {
        fail_to_read(path, std::generic_category().message(errno));
    }
    if (!S_ISREG(status.st_mode)) {
        fail_to_read(path, "it is not a regular file");
    }
    try {
        return read_to_end(file.get(), std::numeric_limits<std::size_t>::max() - 1);
    } catch (const std::system_error &error) {
        fail_to_read(path, error.code().message());
    }
}

/// Keeps nothing: what is asked of the engine here is a dry run.
class NoStore : public CommitStore
{
  public:
    void load(const std::function<void(StoredNode &&)> &) const override {}
    std::uint64_t commit(std::span<const StoredChange>, const CommitNote &) override
    {
        throw StoreError("there is no store");
    }
};

/// What the daemon's own nodes may not hold.
std::vector<Refusal> schema_refusals(const Candidate &candidate)
{
    NoStore store;
    SchemaModule schema;
    CommitEngine engine(store);
    engine.add_module(schema);
    return engine.check(candidate).refusals;
}

/// A name as refusals write it.
std::string plain_name(const char *name)
{
    const auto parts = split_name(name);
    return parts ? join_name(*parts) : name;
}

} // namespace

DefaultFile::EntryArray::~EntryArray()
{
    if (count != 0) {
        (void)bn_str_value_free(&entries, count);
    } else {
        std::free(entries); // the library leaves an array of no good entries to its owner
    }
}

DefaultFile::DefaultFile(const std::string &path, Reader read)
{
    const std::optional<std::string> text = read_text(path);
    const int err = read(&value_array_.entries, &value_array_.count, &removal_array_.entries,
                         &removal_array_.count);
    Candidate scratch;
    LoadResult loaded = load_text(scratch, text.value_or(""), CommaRule::ends_value);
    faults_ = std::move(loaded.faults);
    cut_values_ = std::move(loaded.cut);
    // The model's reader keeps all of its entries when the last line is bad.
    const bool are_kept = err != 0 && value_array_.count == 0 && removal_array_.count == 0;
    if (are_kept && !faults_.empty()) {
        return;
    }
    if (!number_entries(text.value_or(""))) {
        fail_to_read(path, "it changes meanwhile, or memory runs out (error code " +
                               std::to_string(err) + ")");
    }
    do {
        drop_bad_lines();
    } while (judge_values());
}

/// The library hands out the entries in the order of their lines; false when it has found others.
bool DefaultFile::number_entries(const std::string &text)
{
    const auto take = [](const EntryArray &array, std::vector<Entry> &entries, long line) {
        const std::size_t next = entries.size();
        entries.push_back({line, next < array.count ? &array.entries[next] : nullptr});
    };
    std::string_view rest = text;
    for (long line = 1; !rest.empty(); ++line) {
        const std::size_t end = rest.find('\n');
        const ov_defdb_line_kind kind = entry_kind(std::string(rest.substr(0, end)).c_str());
        if (kind == ov_defdb_value) {
            take(value_array_, values_, line);
        } else if (kind == ov_defdb_removal) {
            take(removal_array_, removals_, line);
        }
        rest.remove_prefix(end == std::string_view::npos ? rest.size() : end + 1);
    }
    return values_.size() == value_array_.count && removals_.size() == removal_array_.count;
}

void DefaultFile::drop_bad_lines()
{
    std::ranges::sort(faults_, {}, &LineFault::line);
    const auto is_bad = [this](const Entry &entry) {
        return std::ranges::binary_search(faults_, entry.line, {}, &LineFault::line);
    };
    std::erase_if(values_, is_bad);
    std::erase_if(removals_, is_bad);
}

/// Finds values that no module takes; false when there is none. Of several lines about one node the
/// last one is judged: without it, the one before it counts.
bool DefaultFile::judge_values()
{
    Candidate candidate;
    for (const auto &[line, value] : values_) {
        // Those that do not fit their types were among the bad lines.
        (void)candidate.set(value->bv_name, value->bv_type, value->bv_value);
    }
    const std::size_t before = faults_.size();
    for (const Refusal &refusal : schema_refusals(candidate)) {
        const auto judged =
            std::find_if(values_.rbegin(), values_.rend(), [&refusal](const Entry &entry) {
                return plain_name(entry.value->bv_name) == refusal.node;
            });
        if (judged != values_.rend()) {
            faults_.push_back({judged->line, refusal.node, refusal.message});
        }
    }
    return faults_.size() != before;
}

} // namespace ovhost
