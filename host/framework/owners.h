#pragma once
// Owners of what the host's operations hand out, for C++ that calls them as the library does.

#include "framework/bnode.h"
#include "framework/tstr_array.h"
#include "framework/tstring.h"
#include "framework/typed_arrays.h"

#include <cstdlib>

namespace ovhost
{

template <typename Object, void (*Free)(Object **)>
class Owned
{
  public:
    Owned() = default;
    Owned(const Owned &) = delete;
    Owned &operator=(const Owned &) = delete;
    ~Owned() { Free(&object_); }

    /// Where an operation puts the object; one that is held is freed first.
    Object **out()
    {
        Free(&object_);
        return &object_;
    }
    /// The pointer's address as it is, for operations that take the object over.
    Object **address() { return &object_; }
    [[nodiscard]] Object *get() const { return object_; }

  private:
    Object *object_ = nullptr;
};

inline void free_text(char **text)
{
    std::free(*text);
    *text = nullptr;
}

using OwnedString = Owned<tstring, ts_free>;
using OwnedStrings = Owned<tstr_array, tstr_array_free>;
using OwnedIntegers = Owned<uint32_array, uint32_array_free>;
using OwnedBinding = Owned<bn_binding, bn_binding_free>;
using OwnedRequest = Owned<bn_request, bn_request_msg_free>;
using OwnedText = Owned<char, free_text>;

} // namespace ovhost
