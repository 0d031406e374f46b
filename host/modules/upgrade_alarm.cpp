#include "host/modules/upgrade_alarm.h"

#include "orvale/md_tunneld_tunnel_common.h"

#include <algorithm>
#include <cstdint>
#include <filesystem>

namespace ovhost
{
namespace
{

bool is_control(char character)
{
    return static_cast<unsigned char>(character) < ' ' || character == '\x7f';
}

std::uintmax_t file_size()
{
    std::error_code error;
    const std::uintmax_t size = std::filesystem::file_size(upgrade_alarms_file, error);
    return error ? 0 : size;
}

} // namespace

std::optional<std::string> alarm_fault(const std::string &text)
{
    if (text.empty()) {
        return "an alarm needs a text";
    }
    return std::ranges::any_of(text, is_control)
               ? std::optional<std::string>("an alarm is one line, without control characters")
               : std::nullopt;
}

std::optional<std::string> write_alarm(const std::string &text)
{
    const std::string file(upgrade_alarms_file);
    const std::uintmax_t size_before = file_size();
    if (const int err = md_tunneld_write_sw_upgrade_alarm(text.c_str()); err != 0) {
        return file + " cannot be opened (error code " + std::to_string(err) +
               "): see that its folder is there, and the rights of both";
    }
    // The library does not look whether its line could be written.
    if (file_size() < size_before + text.size() + 1) {
        return file + " could not take the whole alarm: see whether there is space left";
    }
    return std::nullopt;
}

} // namespace ovhost
