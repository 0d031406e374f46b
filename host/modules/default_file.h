#pragma once
// One file of default values: the entries that the library reads from it, each with its line, and
// what is wrong with the lines. default_values.h is what becomes of them.

#include "host/modules/load_text.h"
#include "orvale/md_db_default.h"

#include <span>
#include <stdexcept>
#include <string>
#include <vector>

namespace ovhost
{

/// A source that cannot be used; the message names it and says what to do.
class DefaultsError : public std::runtime_error
{
  public:
    using std::runtime_error::runtime_error;
};

class DefaultFile
{
  public:
    using Reader = int (*)(bn_str_value **, uint32 *, bn_str_value **, uint32 *);

    struct Entry {
        long line = 0;
        const bn_str_value *value = nullptr; ///< of the library, never null
    };

    /// Reads the file at the path, which is where `read` finds it. One that is not there has no
    /// lines. Throws DefaultsError when it cannot be read.
    DefaultFile(const std::string &path, Reader read);

    /// The bad lines, in their order. The library logs a code for each that it cannot take and
    /// answers that of the last line alone; it finds nothing wrong with values that do not fit
    /// their types, or that no module takes, nor with what stands behind a NUL byte.
    [[nodiscard]] const std::vector<LineFault> &faults() const { return faults_; }

    /// Good lines whose values the format has ended at a comma, in their order.
    [[nodiscard]] const std::vector<LineFault> &cut_values() const { return cut_values_; }

    /// The entries of the good lines, in their order.
    [[nodiscard]] std::span<const Entry> values() const { return values_; }
    [[nodiscard]] std::span<const Entry> removals() const { return removals_; }

  private:
    /// An array that the library has handed out.
    struct EntryArray {
        bn_str_value *entries = nullptr;
        uint32 count = 0;

        EntryArray() = default;
        EntryArray(const EntryArray &) = delete;
        EntryArray &operator=(const EntryArray &) = delete;
        ~EntryArray();
    };

    [[nodiscard]] bool number_entries(const std::string &text);
    void drop_bad_lines();
    [[nodiscard]] bool judge_values();

    EntryArray value_array_;
    EntryArray removal_array_;
    std::vector<Entry> values_;
    std::vector<Entry> removals_;
    std::vector<LineFault> faults_;
    std::vector<LineFault> cut_values_;
};

} // namespace ovhost
