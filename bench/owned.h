#pragma once
// Owners of what the host hands out, and nodes of a bench's own database.

#include "framework/bnode.h"
#include "framework/tstr_array.h"
#include "framework/tstring.h"
#include "host/framework/objects.h"

#include <string>

namespace ovbench
{

template <typename T, void (*Free)(T **)>
class Owned
{
  public:
    Owned() = default;
    Owned(const Owned &) = delete;
    Owned &operator=(const Owned &) = delete;
    ~Owned() { Free(&object_); }

    T *get() const { return object_; }
    T **out() { return &object_; }

  private:
    T *object_ = nullptr;
};

void free_text(char **text);

using OwnedText = Owned<char, free_text>;
using OwnedString = Owned<tstring, ts_free>;
using OwnedStrings = Owned<tstr_array, tstr_array_free>;
using OwnedBinding = Owned<bn_binding, bn_binding_free>;

void require(bool holds, const char *what);

/// Sets a node.
void set(mdb_db &db, const std::string &node, bn_type type, const std::string &value);

} // namespace ovbench
