#pragma once
// A ControlServer at work in a thread of its own, with a handler the test gives.

#include "host/control/event_loop.h"
#include "host/control/server.h"
#include "tests/support/scratch_dir.h"

#include <nlohmann/json.hpp>

#include <functional>
#include <future>
#include <memory>
#include <mutex>
#include <string>
#include <thread>
#include <vector>

namespace ovhost::test
{

class TestServer : private RequestHandler
{
  public:
    using Handler =
        std::function<nlohmann::json(const nlohmann::json &request, const ClientInfo &client)>;

    /// Without a handler: "echo" answers with the request's "text", anything else is refused as an
    /// unknown command.
    explicit TestServer(Handler handler = {}, ServerLimits limits = {}, std::string path = {},
                        AccessPolicy access = AccessPolicy());
    ~TestServer() override;

    [[nodiscard]] const std::string &path() const { return path_; }

    /// Ends the server as a daemon that stops does.
    void stop();

    /// Has `work` done by the server's thread and returns its result.
    template <typename Work>
    auto in_loop(Work work)
    {
        std::promise<decltype(work(*server_))> done;
        loop_.post([&] { done.set_value(work(*server_)); });
        return done.get_future().get();
    }

    [[nodiscard]] bool send_to_peer(const std::string &name, const nlohmann::json &event);
    [[nodiscard]] std::vector<PeerStatus> peers();
    [[nodiscard]] std::size_t client_count();
    /// Lines the server logged that contain `text`.
    [[nodiscard]] std::vector<std::string> logged(const std::string &text);

    /// Only for handlers: they run in the server's thread.
    [[nodiscard]] ControlServer &server() { return *server_; }

  private:
    nlohmann::json handle(const nlohmann::json &request, const ClientInfo &client) override;

    ovtest::ScratchDir dir_;
    std::string path_;
    Handler handler_;
    std::mutex log_mutex_;
    std::vector<std::string> log_;
    EventLoop loop_;
    std::unique_ptr<ControlServer> server_;
    std::thread thread_;
};

} // namespace ovhost::test
