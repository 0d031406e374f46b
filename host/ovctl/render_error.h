#pragma once
// Prints why a command was not done: for people on the error stream, or as one line of JSON.

#include "host/control/request_error.h"

#include <iosfwd>
#include <string>

namespace ovhost
{

/// "mgmtd refused SUBJECT: ...", with every detail on a line of its own.
void render_refusal(const RequestError &error, const std::string &subject, std::ostream &err);

/// {"ok":false,"error":{...}}
void render_error_json(const RequestError &error, std::ostream &out);

} // namespace ovhost
