#include "tests/control/test_server.h"

namespace ovhost::test
{

using nlohmann::json;

namespace
{

json echo(const json &request, const ClientInfo &)
{
    const auto &command = request.at("command").get_ref<const std::string &>();
    if (command != "echo")
        throw RequestError(error_code::unknown_command, "no command \"" + command + "\"");
    return {{"text", request.at("text")}};
}

} // namespace

TestServer::TestServer(Handler handler, ServerLimits limits, std::string path, AccessPolicy access)
    : path_(path.empty() ? dir_.path("socket") : std::move(path)),
      handler_(handler ? std::move(handler) : echo)
{
    RequestHandler &behind = *this;
    server_ = std::make_unique<ControlServer>(
        loop_, path_, limits, behind,
        [this](ControlLogLevel, const std::string &text) {
            const std::lock_guard lock(log_mutex_);
            log_.push_back(text);
        },
        std::move(access));
    thread_ = std::thread([this] { loop_.run(); });
}

TestServer::~TestServer()
{
    stop();
}

void TestServer::stop()
{
    if (!thread_.joinable())
        return;
    loop_.stop();
    thread_.join();
    server_.reset();
}

bool TestServer::send_to_peer(const std::string &name, const json &event)
{
    return in_loop([&](ControlServer &server) { return server.send_to_peer(name, event); });
}

std::vector<PeerStatus> TestServer::peers()
{
    return in_loop([](ControlServer &server) { return server.peers(); });
}

std::size_t TestServer::client_count()
{
    return in_loop([](ControlServer &server) { return server.client_count(); });
}

std::vector<std::string> TestServer::logged(const std::string &text)
{
    const std::lock_guard lock(log_mutex_);
    std::vector<std::string> found;
    for (const std::string &line : log_)
        if (line.find(text) != std::string::npos)
            found.push_back(line);
    return found;
}

json TestServer::handle(const json &request, const ClientInfo &client)
{
    return handler_(request, client);
}

} // namespace ovhost::test
