#include "tests/support/host_fixture.h"

#include "framework/appliance.h"
#include "framework/logging.h"
#include "host/framework/appliance_config.h"
#include "host/framework/log_config.h"
#include "host/framework/sessions.h"
#include "tests/support/fault_layer.h"

#include <algorithm>
#include <cstdlib>
#include <filesystem>
#include <iterator>
#include <stdexcept>

namespace ovtest
{

namespace
{

namespace fs = std::filesystem;

constexpr char peer_name[] = "jsond";
constexpr int max_level = 7;
constexpr unsigned char default_module_level = 6;

void empty_directory(const fs::path &dir)
{
    for (const auto &entry : fs::directory_iterator(dir)) {
        fs::remove_all(entry.path());
    }
}

std::string describe(const bn_binding &binding)
{
    const ovhost::Value &value = binding.attribs.attribs.at(ba_value);
    return binding.name + ' ' + lc_enum_to_string_quiet_null(bn_type_map, value.type) + ' ' +
           value.text;
}

} // namespace

bool TestSession::send(const bn_request &request)
{
    if (gone) {
        return false;
    }
    Event event = {request.event_name};
    std::ranges::transform(request.bindings, std::back_inserter(event), describe);
    events.push_back(std::move(event));
    return true;
}

int TestCommit::refuse(int code, std::string message)
{
    refusals.push_back(std::to_string(code) + ' ' + message);
    return 0;
}

HostFixture::HostFixture()
{
    reset_fault_layer();
    ovhost::set_log_sink([](const ovhost::LogRecord &) {});
    ovhost::set_config_name({});
    ovhost::set_running_db_source([this] { return &db_; });
    ov_system_info = {};
    time_info_ptr = nullptr;
    std::fill_n(ov_log_module_levels, ov_log_module_ovmd + 1, default_module_level);
    set_log_level(max_level);
    for (const char *dir : {"/opt/orvale", "/var/opt/tms"}) {
        empty_directory(dir);
    }
}

HostFixture::~HostFixture()
{
    ovhost::unregister_session(peer_name, jsond_);
    ovhost::set_running_db_source({});
    ovhost::set_log_sink({});
    time_info_ptr = nullptr;
}

void HostFixture::set(const std::string &node, bn_type type, const std::string &value)
{
    db_.writable = true;
    const int status =
        mdb_set_node_str(nullptr, &db_, bsso_create, 0, type, value.c_str(), "%s", node.c_str());
    db_.writable = false;
    if (status != 0) {
        throw std::invalid_argument("cannot set " + node + ": " + std::to_string(status));
    }
}

TestSession &HostFixture::connect_jsond()
{
    ovhost::register_session(peer_name, jsond_);
    return jsond_;
}

void HostFixture::set_log_level(int level)
{
    G_daemon_log_level = -1;
    G_log_level = level;
}

void HostFixture::set_time(uint64 ms_since_boot)
{
    time_.time_since_boot_ms = ms_since_boot;
    time_info_ptr = &time_;
}

std::string taken(char *text)
{
    if (text == nullptr) {
        return "null";
    }
    std::string copy = text;
    std::free(text);
    return copy;
}

std::string taken(tstring *text)
{
    std::string copy = text != nullptr ? ts_str(text) : "null";
    ts_free(&text);
    return copy;
}

std::string taken(tstr_array *array)
{
    if (array == nullptr) {
        return "null";
    }
    std::string all = "[";
    for (int32 i = 0; i < tstr_array_length_quick(array); ++i) {
        all += i != 0 ? ", " : "";
        all += tstr_array_get_str_quick(array, static_cast<uint32>(i));
    }
    tstr_array_free(&array);
    return all + ']';
}

} // namespace ovtest
