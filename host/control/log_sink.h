#pragma once
// Where the control socket's own log lines go. The daemon hands in a function, so that this folder
// needs no logger.

#include <functional>
#include <string>

namespace ovhost
{

enum class ControlLogLevel { error, warning, info, debug };

using ControlLog = std::function<void(ControlLogLevel level, const std::string &text)>;

} // namespace ovhost
