// Bindings and node names of framework/bnode.h; event_message.cpp has the messages.
#include "framework/bnode.h"

#include "host/framework/binding_build.h"
#include "host/framework/c_boundary.h"
#include "host/framework/objects.h"
#include "host/tree/name.h"
#include "host/tree/value_type.h"

#include <charconv>
#include <optional>
#include <string>
#include <string_view>
#include <utility>
#include <vector>

namespace
{

using ovhost::at_c_boundary;
using ovhost::hand_out;
using ovhost::NamePattern;
using ovhost::split_name;
using ovhost::Value;

const Value *find_attribute(const bn_attrib_array &attribs, uint32 attrib_id)
{
    const auto entry = attribs.attribs.find(attrib_id);
    return entry == attribs.attribs.end() ? nullptr : &entry->second;
}

std::optional<uint32> parse_uint32(std::string_view text)
{
    uint32 number = 0;
    const auto [end, fault] = std::from_chars(text.data(), text.data() + text.size(), number);
    const bool is_number = fault == std::errc() && end == text.data() + text.size();
    return is_number ? std::optional(number) : std::nullopt;
}

std::optional<tbool> parse_bool(std::string_view text)
{
    if (text == "true") {
        return true;
    }
    return text == "false" ? std::optional(false) : std::nullopt;
}

/// Reads an attribute of one type; `ret` is left alone on failure.
template <typename Result>
int get_typed(const bn_binding *binding, uint32 attrib_id, bn_type type,
              std::optional<Result> (*parse)(std::string_view), Result *ret)
{
    if (binding == nullptr || ret == nullptr) {
        return lc_err_unexpected_null;
    }
    const Value *attribute = find_attribute(binding->attribs, attrib_id);
    if (attribute == nullptr) {
        return lc_err_not_found;
    }
    const auto result = attribute->type == type ? parse(attribute->text) : std::nullopt;
    if (!result) {
        return lc_err_bad_type;
    }
    *ret = *result;
    return lc_err_no_error;
}

template <typename Text>
bool matches(std::span<const Text> parts, const char *pattern)
{
    const std::optional<NamePattern> parsed = NamePattern::parse(pattern);
    return parsed && parsed->matches(parts);
}

} // namespace

namespace ovhost
{

int build_binding(const char *name, uint32 attrib_id, bn_type type, const char *text,
                  bn_binding &binding)
{
    if (!split_name(name)) {
        return lc_err_bad_path;
    }
    if (value_fault(type, text)) {
        return lc_err_bad_type;
    }
    binding.name = name;
    binding.attribs.attribs.insert_or_assign(attrib_id, Value{type, text});
    return lc_err_no_error;
}

} // namespace ovhost

int bn_binding_new_str(bn_binding **ret, const char *name, uint32 attrib_id, bn_type type,
                       uint32 /*flags*/, const char *value)
{
    if (ret == nullptr) {
        return lc_err_unexpected_null;
    }
    *ret = nullptr;
    if (name == nullptr || value == nullptr) {
        return lc_err_unexpected_null;
    }
    return at_c_boundary([&] {
        bn_binding binding;
        const int status = ovhost::build_binding(name, attrib_id, type, value, binding);
        return status == lc_err_no_error ? hand_out(ret, std::move(binding)) : status;
    });
}

int bn_binding_new_named(bn_binding **ret, const char *name)
{
    if (ret == nullptr) {
        return lc_err_unexpected_null;
    }
    *ret = nullptr;
    if (name == nullptr) {
        return lc_err_unexpected_null;
    }
    return at_c_boundary([&]() -> int {
        return split_name(name) ? hand_out(ret, bn_binding{name, {}}) : lc_err_bad_path;
    });
}

void bn_binding_free(bn_binding **binding)
{
    ovhost::release(binding);
}

int bn_binding_get_str(const bn_binding *binding, uint32 attrib_id, bn_type type, uint32 /*flags*/,
                       char **ret)
{
    if (ret == nullptr) {
        return lc_err_unexpected_null;
    }
    *ret = nullptr;
    if (binding == nullptr) {
        return lc_err_unexpected_null;
    }
    const Value *attribute = find_attribute(binding->attribs, attrib_id);
    if (attribute == nullptr) {
        return lc_err_no_error;
    }
    if (type != bt_any && type != attribute->type) {
        return lc_err_bad_type;
    }
    return ovhost::hand_out_text(ret, attribute->text);
}

int bn_binding_get_uint32(const bn_binding *binding, uint32 attrib_id, uint32 /*flags*/,
                          uint32 *ret)
{
    return get_typed(binding, attrib_id, bt_uint32, parse_uint32, ret);
}

int bn_binding_get_tbool(const bn_binding *binding, uint32 attrib_id, uint32 /*flags*/, tbool *ret)
{
    return get_typed(binding, attrib_id, bt_bool, parse_bool, ret);
}

int bn_binding_name_to_parts(const char *name, tstr_array **ret, tbool /*flag*/)
{
    if (ret == nullptr) {
        return lc_err_unexpected_null;
    }
    *ret = nullptr;
    if (name == nullptr) {
        return lc_err_unexpected_null;
    }
    return at_c_boundary([&]() -> int {
        std::optional<std::vector<std::string>> parts = split_name(name);
        return parts ? hand_out(ret, tstr_array(*parts)) : lc_err_bad_path;
    });
}

tbool bn_binding_name_pattern_match(const char *name, const char *pattern)
{
    if (name == nullptr || pattern == nullptr) {
        return false;
    }
    return at_c_boundary(
        [&] {
            const std::optional<std::vector<std::string>> parts = split_name(name);
            return parts && matches(std::span<const std::string>(*parts), pattern);
        },
        false);
}

tbool bn_binding_name_parts_pattern_match(const tstr_array *parts, tbool /*flag*/,
                                          const char *pattern)
{
    if (parts == nullptr || pattern == nullptr) {
        return false;
    }
    return at_c_boundary(
        [&] { return matches(std::span<const char *const>(parts->texts), pattern); }, false);
}

int bn_attrib_array_get_attrib_tstr(const bn_attrib_array *attribs, uint32 attrib_id, tstring **ret)
{
    if (ret == nullptr) {
        return lc_err_unexpected_null;
    }
    *ret = nullptr;
    const Value *attribute = attribs == nullptr ? nullptr : find_attribute(*attribs, attrib_id);
    if (attribute == nullptr) {
        return lc_err_no_error;
    }
    return at_c_boundary([&] { return hand_out(ret, tstring{attribute->text}); });
}
