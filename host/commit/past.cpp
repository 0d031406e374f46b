#include "host/commit/past.h"

#include "host/commit/patch.h"
#include "host/store/store.h"
#include "host/tree/name.h"

#include <algorithm>
#include <map>
#include <optional>
#include <string>
#include <utility>
#include <vector>

namespace ovhost
{

namespace
{

using Parts = std::vector<std::string>;

Parts parts_of(const std::string &name)
{
    std::optional<Parts> parts = split_name(name);
    if (!parts || parts->empty()) {
        throw StoreError("the history holds a change of '" + name +
                         "', which is not a node name: restore the store from a backup");
    }
    return *std::move(parts);
}

} // namespace

std::uint64_t oldest_known_commit(const Store &store)
{
    const std::uint64_t oldest = store.oldest_recorded();
    // What the oldest one changed tells of the one before it; before the first there is none.
    return oldest == 0 ? store.commit_number() : std::max<std::uint64_t>(oldest - 1, 1);
}

Tree configuration_after(const Store &store, const Tree &running, std::uint64_t number)
{
    // Of the changes of one node the oldest counts, which comes last.
    std::map<Parts, std::optional<StoredValue>> before;
    store.visit_back_to(number, [&before](RecordedChange &&change) {
        before.insert_or_assign(parts_of(change.name), std::move(change.before));
    });
    std::vector<Change> back;
    back.reserve(before.size());
    for (auto &[parts, value] : before) {
        Change &change = back.emplace_back();
        change.parts = parts;
        if (value) {
            change.after = Value{static_cast<bn_type>(value->type), std::move(value->text)};
        }
    }
    return with_changes(running, back);
}

} // namespace ovhost
