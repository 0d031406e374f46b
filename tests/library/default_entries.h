// Calls a reader of default databases and puts what it delivers into words.
#pragma once

#include "orvale/md_db_default.h"
#include "tests/support/fault_layer.h"

#include <cstdlib>
#include <string>
#include <vector>

namespace ovtest
{

using DefaultsReader = int (*)(bn_str_value **, uint32 *, bn_str_value **, uint32 *);

inline constexpr char debug_file[] = "/var/opt/tms/.debug_default_db";
inline constexpr char preserved_file[] = "/var/opt/tms/.preserved_db";
inline constexpr char preserved_read_file[] = "/var/opt/tms/.preserved_db.read";

// One kind of entries as a reader delivers them: array and count with what was in them before.
class DeliveredEntries
{
  public:
    DeliveredEntries() = default;
    DeliveredEntries(const DeliveredEntries &) = delete;
    DeliveredEntries &operator=(const DeliveredEntries &) = delete;
    ~DeliveredEntries()
    {
        if (entries_ == &untouched_) {
            return;
        }
        if (count_ == 0) {
            std::free(entries_); // an array of no good entries is not bn_str_value_free's
        } else {
            in_library(bn_str_value_free, &entries_, count_);
        }
    }

    bn_str_value **entries() { return &entries_; }
    uint32 *count() { return &count_; }

    // "COUNT ARRAY": the array is "untouched", "null", or its entries in brackets, each
    // "NAME TYPE VALUE" with a null value as "null" and any other in quotes.
    std::string text() const
    {
        std::string text = std::to_string(count_) + ' ';
        if (entries_ == &untouched_) {
            return text + "untouched";
        }
        if (entries_ == nullptr) {
            return text + "null";
        }
        text += '[';
        const char *separator = "";
        for (uint32 i = 0; i < count_; ++i) {
            const bn_str_value &entry = entries_[i];
            text +=
                separator + (entry.bv_name + (' ' + std::to_string(entry.bv_type))) + ' ' +
                (entry.bv_value != nullptr ? '\'' + std::string(entry.bv_value) + '\'' : "null");
            separator = ", ";
        }
        return text + ']';
    }

  private:
    bn_str_value untouched_ = {};
    bn_str_value *entries_ = &untouched_;
    uint32 count_ = 99;
};

// "STATUS | VALUES | REMOVALS".
template <typename Call>
std::string delivered(Call call)
{
    DeliveredEntries values;
    DeliveredEntries removals;
    const int status = call(values.entries(), values.count(), removals.entries(), removals.count());
    return std::to_string(status) + " | " + values.text() + " | " + removals.text();
}

inline std::string read_defaults(DefaultsReader reader)
{
    return delivered([=](auto... out) { return in_library(reader, out...); });
}

inline std::string read_preserved(tbool rename_when_done)
{
    return delivered(
        [=](auto... out) { return in_library(db_preserved_get_all, out..., rename_when_done); });
}

} // namespace ovtest
