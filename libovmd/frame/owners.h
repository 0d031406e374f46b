// Owners of what the library holds: whatever a function leaves by, its destructors release it.
//
// framework/bail.h is the other half of the one clean-up path: it logs and returns.
#pragma once

#include "framework/bnode.h"
#include "framework/md_commit.h"
#include "framework/tstr_array.h"
#include "framework/tstring.h"

#include <cstdlib>

namespace ovmd
{

// Owns one object that `Free` releases through the pointer's address.
template <typename T, void (*Free)(T **)>
class owner
{
  public:
    owner() = default;
    owner(const owner &) = delete;
    owner &operator=(const owner &) = delete;
    ~owner() { reset(); }

    T *get() const { return object_; }

    // For an operation that takes the object over and nulls the pointer to it.
    T **address() { return &object_; }

    // Hands the object over to a caller.
    T *release()
    {
        T *const object = object_;
        object_ = nullptr;
        return object;
    }

    // For an operation that hands an object out; what was owned before is released.
    T **out()
    {
        reset();
        return &object_;
    }

    void reset()
    {
        if (object_ != nullptr) {
            Free(&object_);
        }
    }

  private:
    T *object_ = nullptr;
};

inline void free_text(char **text)
{
    free(*text);
    *text = nullptr;
}

using owned_binding = owner<bn_binding, bn_binding_free>;
using owned_request = owner<bn_request, bn_request_msg_free>;
using owned_tstr_array = owner<tstr_array, tstr_array_free>;
using owned_tstring = owner<tstring, ts_free>;
using owned_text = owner<char, free_text>;

} // namespace ovmd
