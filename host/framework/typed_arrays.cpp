#include "framework/typed_arrays.h"

#include "host/framework/c_boundary.h"
#include "host/framework/objects.h"

#include <algorithm>
#include <utility>
#include <vector>

namespace
{

using ovhost::at_c_boundary;
using ovhost::hand_out;

constexpr array_options default_options = {nullptr, array_std_assign_func, adp_add};

using Position = std::vector<uint32>::iterator;

/// The elements that compare equal to the value, in an array that the comparison has in order.
std::pair<Position, Position> find_equal(uint32_array &arr, uint32 value)
{
    const auto is_less = [&arr](uint32 left, uint32 right) {
        return arr.options.ao_elem_compare_func(&left, &right) < 0;
    };
    return std::equal_range(arr.elements.begin(), arr.elements.end(), value, is_less);
}

/// The value as the options' assignment stores it.
int assigned(const uint32_array &arr, uint32 value, uint32 &stored)
{
    const auto assign = arr.options.ao_elem_assign_func;
    return (assign != nullptr ? assign : array_std_assign_func)(&stored, &value);
}

} // namespace

int array_options_get_defaults(array_options *opts)
{
    if (opts == nullptr) {
        return lc_err_unexpected_null;
    }
    *opts = default_options;
    return lc_err_no_error;
}

int array_std_assign_func(void *target, const void *source)
{
    if (target == nullptr || source == nullptr) {
        return lc_err_unexpected_null;
    }
    *static_cast<uint32 *>(target) = *static_cast<const uint32 *>(source);
    return lc_err_no_error;
}

int uint32_array_new_full(uint32_array **ret, const array_options *opts)
{
    if (ret == nullptr) {
        return lc_err_unexpected_null;
    }
    *ret = nullptr;
    return at_c_boundary([&] {
        return hand_out(ret, uint32_array{opts == nullptr ? default_options : *opts, {}});
    });
}

void uint32_array_free(uint32_array **arr)
{
    ovhost::release(arr);
}

int uint32_array_append(uint32_array *arr, uint32 value)
{
    if (arr == nullptr) {
        return lc_err_unexpected_null;
    }
    return at_c_boundary([&]() -> int {
        arr->elements.push_back(value);
        return lc_err_no_error;
    });
}

int uint32_array_insert_sorted(uint32_array *arr, uint32 value)
{
    if (arr == nullptr) {
        return lc_err_unexpected_null;
    }
    if (arr->options.ao_elem_compare_func == nullptr) {
        return lc_err_assertion_failed;
    }
    const std::pair<Position, Position> equal = find_equal(*arr, value);
    const bool is_duplicate = equal.first != equal.second;
    if (is_duplicate && arr->options.ao_dup_policy == adp_delete_new) {
        return lc_err_no_error;
    }
    uint32 stored = 0;
    if (const int status = assigned(*arr, value, stored); status != lc_err_no_error) {
        return status;
    }
    if (is_duplicate && arr->options.ao_dup_policy == adp_delete_old) {
        *equal.first = stored;
        return lc_err_no_error;
    }
    return at_c_boundary([&]() -> int {
        arr->elements.insert(equal.second, stored);
        return lc_err_no_error;
    });
}

int uint32_array_delete_by_value(uint32_array *arr, uint32 value)
{
    if (arr == nullptr) {
        return lc_err_unexpected_null;
    }
    const auto element = std::ranges::find(arr->elements, value);
    if (element == arr->elements.end()) {
        return lc_err_not_found;
    }
    arr->elements.erase(element);
    return lc_err_no_error;
}

uint32 uint32_array_get_quick(const uint32_array *arr, uint32 index)
{
    return arr->elements[index];
}

int32 uint32_array_length_quick(const uint32_array *arr)
{
    return static_cast<int32>(arr->elements.size());
}
