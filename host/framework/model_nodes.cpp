#include "host/framework/model_nodes.h"

#include "framework/logging.h"
#include "host/framework/log_config.h"
#include "host/tree/name.h"

#include <charconv>
#include <string>
#include <utility>

namespace ovhost
{

namespace
{

constexpr const char *log_unit = "model";

const Value *find_value(const Tree &tree, const char *node)
{
    const auto parts = split_name(node);
    return parts ? tree.value(*parts) : nullptr;
}

int report_bad_type(const char *node, const char *expected)
{
    log_host_line(ov_log_error, log_unit,
                  std::string("model node ") + node + " must hold a " + expected);
    return lc_err_bad_type;
}

uint32 lowered(uint32 number, const ModelLimit &limit)
{
    if (number <= limit.largest) {
        return number;
    }
    log_host_line(ov_log_warning, log_unit,
                  std::string("model node ") + limit.node + ": " + std::to_string(number) +
                      " is too large, " + std::to_string(limit.largest) + " is used");
    return limit.largest;
}

int read_limit(const Tree &tree, const ModelLimit &limit, ModelInfo &info)
{
    const Value *value = find_value(tree, limit.node);
    if (value == nullptr) {
        return lc_err_no_error;
    }
    uint32 number = 0;
    const char *const text_end = value->text.data() + value->text.size();
    const auto [end, fault] = std::from_chars(value->text.data(), text_end, number);
    if (value->type != bt_uint32 || fault != std::errc() || end != text_end) {
        return report_bad_type(limit.node, "uint32");
    }
    info.*limit.field = lowered(number, limit);
    return lc_err_no_error;
}

int read_name(const Tree &tree, ModelInfo &info)
{
    const Value *value = find_value(tree, model_name_node);
    if (value == nullptr) {
        return lc_err_no_error;
    }
    if (value->type != bt_string) {
        return report_bad_type(model_name_node, "string");
    }
    info.config_name = value->text;
    return lc_err_no_error;
}

} // namespace

ModelInfo default_model_info()
{
    ModelInfo info;
    for (const ModelLimit &limit : model_limits) {
        info.*limit.field = limit.when_absent;
    }
    return info;
}

int read_model_info(const Tree &tree, ModelInfo &info)
{
    ModelInfo read = default_model_info();
    if (const int status = read_name(tree, read); status != lc_err_no_error) {
        return status;
    }
    for (const ModelLimit &limit : model_limits) {
        if (const int status = read_limit(tree, limit, read); status != lc_err_no_error) {
            return status;
        }
    }
    info = std::move(read);
    return lc_err_no_error;
}

} // namespace ovhost
