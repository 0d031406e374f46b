#pragma once
// Takes a refusal's words in a commit's stead, for a module that has more to say to them.

#include "host/framework/objects.h"

#include <optional>
#include <string>
#include <utility>

namespace ovhost
{

class RefusalCapture : public md_commit
{
  public:
    int refuse(int code, std::string message) override
    {
        code_ = code;
        message_ = std::move(message);
        return 0;
    }

    [[nodiscard]] int code() const { return code_; }

    /// Nothing as long as nobody has refused.
    [[nodiscard]] const std::optional<std::string> &message() const { return message_; }

  private:
    int code_ = 0;
    std::optional<std::string> message_;
};

} // namespace ovhost
