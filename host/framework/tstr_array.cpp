#include "framework/tstr_array.h"

#include "host/framework/c_boundary.h"
#include "host/framework/objects.h"

#include <algorithm>
#include <string>
#include <utility>

namespace
{

using ovhost::at_c_boundary;
using ovhost::hand_out;

/// Adds a text at the end as the array's duplicate policy wants it.
void append_by_policy(tstr_array &arr, std::string_view text)
{
    if (arr.options.ao_dup_policy != adp_add) {
        const auto present = std::ranges::find(arr.texts, text);
        if (present != arr.texts.end()) {
            if (arr.options.ao_dup_policy == adp_delete_old) {
                std::rotate(present, present + 1, arr.texts.end());
            }
            return;
        }
    }
    arr.append(text);
}

} // namespace

tstr_array::tstr_array(std::span<const std::string> from)
{
    texts.reserve(from.size());
    std::ranges::for_each(from, [this](const std::string &text) { append(text); });
}

char *tstr_array::claim(std::size_t size)
{
    if (!blocks_) {
        blocks_ = std::make_unique<std::pmr::monotonic_buffer_resource>();
    }
    return static_cast<char *>(blocks_->allocate(size, 1));
}

void tstr_array::append(std::string_view text)
{
    // A text ends at its first NUL for everybody who reads it, so it may end there at once.
    char *const copy = claim(text.size() + 1);
    *std::ranges::copy(text, copy).out = '\0';
    texts.push_back(copy);
}

int tstr_array_new(tstr_array **ret, const tstr_array_options *opts)
{
    if (ret == nullptr) {
        return lc_err_unexpected_null;
    }
    *ret = nullptr;
    return at_c_boundary([&] {
        tstr_array made;
        made.options = opts == nullptr ? tstr_array_options{} : *opts;
        return hand_out(ret, std::move(made));
    });
}

void tstr_array_free(tstr_array **arr)
{
    ovhost::release(arr);
}

int32 tstr_array_length_quick(const tstr_array *arr)
{
    return static_cast<int32>(arr->texts.size());
}

const char *tstr_array_get_str_quick(const tstr_array *arr, uint32 index)
{
    return arr->texts[index];
}

int tstr_array_append_str(tstr_array *arr, const char *text)
{
    if (arr == nullptr || text == nullptr) {
        return lc_err_unexpected_null;
    }
    return at_c_boundary([&]() -> int {
        append_by_policy(*arr, text);
        return lc_err_no_error;
    });
}

int tstr_array_append_takeover(tstr_array *arr, tstring **str)
{
    if (arr == nullptr || str == nullptr || *str == nullptr) {
        return lc_err_unexpected_null;
    }
    return at_c_boundary([&]() -> int {
        append_by_policy(*arr, (*str)->text);
        ovhost::release(str);
        return lc_err_no_error;
    });
}

int tstr_array_remove(tstr_array *arr, uint32 index, tstring **ret)
{
    if (ret != nullptr) {
        *ret = nullptr;
    }
    if (arr == nullptr) {
        return lc_err_unexpected_null;
    }
    if (index >= arr->texts.size()) {
        return lc_err_not_found;
    }
    return at_c_boundary([&]() -> int {
        const auto element = arr->texts.begin() + index;
        if (ret != nullptr) {
            *ret = new tstring{*element};
        }
        arr->texts.erase(element);
        return lc_err_no_error;
    });
}

int tstr_array_duplicate(const tstr_array *arr, tstr_array **ret)
{
    if (ret == nullptr) {
        return lc_err_unexpected_null;
    }
    *ret = nullptr;
    if (arr == nullptr) {
        return lc_err_no_error;
    }
    return at_c_boundary([&] {
        tstr_array copy;
        copy.options = arr->options;
        copy.texts.reserve(arr->texts.size());
        std::ranges::for_each(arr->texts, [&copy](const char *text) { copy.append(text); });
        return hand_out(ret, std::move(copy));
    });
}
