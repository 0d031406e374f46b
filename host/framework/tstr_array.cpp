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

/// Adds a text at the end as the array's duplicate policy wants it. The text is taken only when
/// nothing can fail any more, so that on failure the caller still has it.
void append(tstr_array &arr, std::string &text)
{
    auto &elements = arr.elements;
    if (arr.options.ao_dup_policy != adp_add) {
        const auto present = std::ranges::find(elements, text);
        if (present != elements.end()) {
            if (arr.options.ao_dup_policy == adp_delete_old) {
                std::rotate(present, present + 1, elements.end());
            }
            return;
        }
    }
    elements.push_back(std::move(text));
}

} // namespace

int tstr_array_new(tstr_array **ret, const tstr_array_options *opts)
{
    if (ret == nullptr) {
        return lc_err_unexpected_null;
    }
    *ret = nullptr;
    return at_c_boundary([&] {
        return hand_out(ret, tstr_array{{}, opts == nullptr ? tstr_array_options{} : *opts});
    });
}

void tstr_array_free(tstr_array **arr)
{
    ovhost::release(arr);
}

int32 tstr_array_length_quick(const tstr_array *arr)
{
    return static_cast<int32>(arr->elements.size());
}

const char *tstr_array_get_str_quick(const tstr_array *arr, uint32 index)
{
    return arr->elements[index].c_str();
}

int tstr_array_append_str(tstr_array *arr, const char *text)
{
    if (arr == nullptr || text == nullptr) {
        return lc_err_unexpected_null;
    }
    return at_c_boundary([&]() -> int {
        std::string copy = text;
        append(*arr, copy);
        return lc_err_no_error;
    });
}

int tstr_array_append_takeover(tstr_array *arr, tstring **str)
{
    if (arr == nullptr || str == nullptr || *str == nullptr) {
        return lc_err_unexpected_null;
    }
    return at_c_boundary([&]() -> int {
        append(*arr, (*str)->text);
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
    if (index >= arr->elements.size()) {
        return lc_err_not_found;
    }
    return at_c_boundary([&]() -> int {
        const auto element = arr->elements.begin() + index;
        if (ret != nullptr) {
            *ret = new tstring;
            (*ret)->text = std::move(*element);
        }
        arr->elements.erase(element);
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
    return at_c_boundary([&] { return hand_out(ret, tstr_array(*arr)); });
}
