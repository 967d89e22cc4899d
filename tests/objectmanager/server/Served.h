/** A server on a free port, whose log lines are kept. */
#ifndef TESTS_SERVER_SERVED_H
#define TESTS_SERVER_SERVED_H

#include "HttpClient.h"

#include "server/HttpServer.h"

#include <gmock/gmock.h>

#include <chrono>
#include <future>
#include <mutex>
#include <optional>
#include <string>
#include <thread>
#include <utility>
#include <vector>

namespace ServerTest {

using namespace ObjectManager;
using namespace std::chrono_literals;

/** Waits until a condition is true; if it does not become true, the test fails. */
template <typename Condition>
void waitUntil(Condition isSo) {
    const auto end = std::chrono::steady_clock::now() + 60s;
    while (!isSo()) {
        ASSERT_LT(std::chrono::steady_clock::now(), end);
        std::this_thread::sleep_for(1ms);
    }
}

class Served : public testing::Test {
protected:
    /** The default handler: answers with the request's body. */
    static Server::HttpReply echo(const Server::HttpRequest& request, const Server::Caller& /*caller*/) {
        return {200, {{"Content-Type", "text/plain"}}, std::string(request.body)};
    }

    void serve(Server::Handler handler = echo, Server::Authenticator* authenticator = nullptr) {
        _server.emplace(_settings, std::move(handler), authenticator, [this](const std::string& line) {
            const std::lock_guard lock(_mutex);
            _logged.push_back(line);
        });
    }

    HttpClient client() const { return HttpClient(_server->port()); }

    /** Asks once, on a connection of its own. */
    Reply ask(const std::string& request) const {
        HttpClient asking = client();
        asking.send(request);
        return asking.receive();
    }

    std::vector<std::string> logged() {
        const std::lock_guard lock(_mutex);
        return _logged;
    }

    /** Waits until the log has `lines` lines, and returns them. */
    std::vector<std::string> logged(std::size_t lines) {
        waitUntil([&] { return logged().size() >= lines; });
        return logged();
    }

    Server::Settings _settings;
    std::mutex _mutex;
    std::vector<std::string> _logged;
    std::optional<Server::HttpServer> _server;
};

/** Lets whoever waits for it pass once it is opened. */
class Gate {
public:
    void open() { _promise.set_value(); }
    void wait() const { _opened.wait(); }

private:
    std::promise<void> _promise;
    std::shared_future<void> _opened{_promise.get_future()};
};

} // namespace ServerTest

#endif
