#include "host/control/request_error.h"

#include "host/support/printable.h"

#include <utility>

namespace ovhost
{

RequestError::RequestError(std::string code, const std::string &message,
                           std::vector<ErrorDetail> details)
    : std::runtime_error(printable(message)), code_(std::move(code)), details_(std::move(details))
{
}

} // namespace ovhost
