#include "host/jsond/event_writer.h"

#include "host/control/message.h"
#include "host/support/patient_write.h"

#include <fcntl.h>
#include <nlohmann/json.hpp>
#include <unistd.h>

#include <cerrno>
#include <stdexcept>

namespace ovhost
{

EventWriter::EventWriter(const std::string &path, int stop_fd)
    : name_(path.empty() ? "standard output" : path), fd_(STDOUT_FILENO), stop_fd_(stop_fd)
{
    if (path.empty()) {
        return;
    }
    file_ = UniqueFd(::open(path.c_str(), O_WRONLY | O_CREAT | O_APPEND | O_CLOEXEC, 0644));
    fd_ = file_.get();
    if (!file_) {
        fail({errno, std::generic_category()});
    }
}

bool EventWriter::write(const nlohmann::json &event)
{
    try {
        return write_unless_stopped(fd_, to_line(event), stop_fd_);
    } catch (const std::system_error &error) {
        fail(error.code());
    }
}

void EventWriter::fail(const std::error_code &cause) const
{
    throw std::runtime_error("cannot write to " + name_ + ": " + cause.message());
}

} // namespace ovhost
