#pragma once
// What every host operation needs where C++ meets C: exceptions become statuses, and objects and
// texts pass into the caller's hands. format.h is the other half, for printf-style arguments.

#include "framework/errors.h"

#include <cstdlib>
#include <cstring>
#include <exception>
#include <string_view>
#include <utility>

namespace ovhost
{

/// Runs the body of a C operation. No exception may leave one: the caller may have been built
/// without them. Memory is the one thing that runs out here, hence one answer for all.
template <typename Body, typename Answer = int>
[[nodiscard]] Answer at_c_boundary(Body &&body, Answer on_failure = lc_err_generic_error) noexcept
{
    try {
        return std::forward<Body>(body)();
    } catch (const std::exception &) {
        return on_failure;
    }
}

/// Gives a new object to the caller, who releases it with the free operation of its family.
template <typename Object>
[[nodiscard]] int hand_out(Object **ret, Object object)
{
    *ret = new Object(std::move(object));
    return lc_err_no_error;
}

/// What every free operation does.
template <typename Object>
void release(Object **object) noexcept
{
    if (object != nullptr) {
        delete std::exchange(*object, nullptr);
    }
}

/// Gives a copy of the text to the caller, who releases it with free().
[[nodiscard]] inline int hand_out_text(char **ret, std::string_view text) noexcept
{
    auto *copy = static_cast<char *>(std::malloc(text.size() + 1));
    if (copy == nullptr) {
        return lc_err_generic_error;
    }
    std::memcpy(copy, text.data(), text.size());
    copy[text.size()] = '\0';
    *ret = copy;
    return lc_err_no_error;
}

} // namespace ovhost
