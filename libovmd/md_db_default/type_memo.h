// Type names that the host has already resolved in this file.
//
// A file names the same few types on line after line, and the host looks each up by comparing it
// with row after row of the table. Only what the host accepted is remembered: an unknown name goes
// to the host every time.
#pragma once

#include "framework/bnode.h"
#include "orvale/ov_defdb_line.h"

#include <cstring>

namespace ovmd
{

class type_memo
{
  public:
    // `name` is not empty. Answers false when the name must be asked of the host.
    bool find(const ov_defdb_field &name, bn_type &ret_type) const
    {
        const slot &known = slots_[slot_of(name)];
        if (known.name.length != name.length ||
            memcmp(known.name.text, name.text, name.length) != 0) {
            return false;
        }
        ret_type = known.type;
        return true;
    }

    // The name's text must stay as long as the memo; a name that shares its slot is forgotten.
    void remember(const ov_defdb_field &name, bn_type type)
    {
        slots_[slot_of(name)] = {name, type};
    }

  private:
    struct slot {
        ov_defdb_field name = {nullptr, 0};
        bn_type type = 0;
    };

    static constexpr size_t num_slots = 64;

    // Length and both ends tell most type names apart.
    static size_t slot_of(const ov_defdb_field &name)
    {
        const auto first = static_cast<unsigned char>(name.text[0]);
        const auto last = static_cast<unsigned char>(name.text[name.length - 1]);
        return (name.length * 5 + size_t{first} * 7 + last) % num_slots;
    }

    slot slots_[num_slots];
};

} // namespace ovmd
