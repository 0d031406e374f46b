#pragma once
// Owners for what the host's operations hand out, so that a failing test leaks nothing and the
// leaks the sanitizer reports are the host's.

#include "framework/bnode.h"
#include "framework/tstr_array.h"
#include "framework/tstring.h"

#include <cstdlib>
#include <string>
#include <vector>

namespace ovhost::test
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

inline std::vector<std::string> texts_of(const OwnedStrings &array)
{
    std::vector<std::string> texts;
    const int32 length = tstr_array_length_quick(array.get());
    for (int32 index = 0; index < length; ++index) {
        texts.emplace_back(tstr_array_get_str_quick(array.get(), static_cast<uint32>(index)));
    }
    return texts;
}

} // namespace ovhost::test
