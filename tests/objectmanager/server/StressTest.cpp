/* Many clients at once, over the wire: each gets, to every request that CIM-XML's cases have, the very reply. */
#include "HttpClient.h"
#include "cimxml/ServiceFixture.h"
#include "cimxml/WireCase.h"

#include "server/HttpServer.h"

#include <algorithm>
#include <atomic>
#include <filesystem>
#include <fstream>
#include <iterator>
#include <optional>
#include <random>
#include <thread>

namespace ServerTest {
namespace {

using namespace ObjectManager;
using CimXml::WireCase;

/** Lets everybody in under his own name, with the rights that the cases give him. */
class Doorkeeper : public Server::Authenticator {
public:
    Server::LogIn logIn(const std::string& user, const std::string& /*password*/,
                        const std::string& /*address*/) override {
        return {Server::Caller{user, user != "stranger", user == "operator"}, ""};
    }
};

struct Exchange {
    std::string name;
    std::string request;
    WireCase expected;
};

std::string requestOf(const WireCase& given) {
    std::string text = given.method + " /cimom HTTP/1.1\r\n";
    for (const auto& [name, value] : given.headers) {
        text += name + ": " + value + "\r\n";
    }
    return text + logInAs(given.caller.user, "password") + "Content-Length: " + std::to_string(given.body.size()) +
           "\r\n\r\n" + given.body;
}

std::vector<Exchange> exchanges() {
    std::vector<Exchange> all;
    for (const auto& file : std::filesystem::directory_iterator(TEST_CASES)) {
        std::ifstream stream(file.path(), std::ios::binary);
        const WireCase given = CimXml::readWireCase({std::istreambuf_iterator<char>(stream), {}});
        all.push_back({file.path().stem(), requestOf(given), given});
    }
    return all;
}

/** What a case expects, read as what came over the wire is. */
void expectReply(const Reply& reply, const Exchange& exchange) {
    const WireCase expected = CimXml::readWireCase("# reply\n" + exchange.expected.reply);
    EXPECT_EQ(std::to_string(reply.status), expected.method) << exchange.name;
    EXPECT_EQ(reply.body, expected.body) << exchange.name;
    for (const auto& [name, value] : expected.headers) {
        std::string lower = name;
        std::transform(lower.begin(), lower.end(), lower.begin(), [](unsigned char c) { return std::tolower(c); });
        const auto header = reply.headers.find(lower);
        EXPECT_TRUE(header != reply.headers.end() && header->second == value) << exchange.name << ": " << name;
    }
}

class StressTest : public CimXml::ServiceFixture {};

TEST_F(StressTest, everyClientGetsItsOwnReplies) {
    constexpr unsigned int clients = 64;
    constexpr std::size_t requestsPerConnection = 40;
    const std::vector<Exchange> all = exchanges();
    ASSERT_GT(all.size(), 100U);
    Doorkeeper doorkeeper;
    Server::Settings settings;
    settings.threads = 8;
    settings.promptMethods = {"GetInstance", "EnumerateInstanceNames", "Associators"};
    const Server::HttpServer server(
        settings,
        [](const Server::HttpRequest& request, const Server::Caller& caller) {
            return service().answer(request, caller);
        },
        &doorkeeper, [](const std::string&) {});
    std::atomic<std::size_t> answered = 0;
    const auto run = [&](unsigned int seed) {
        std::vector<const Exchange*> order;
        for (const Exchange& exchange : all) {
            order.push_back(&exchange);
        }
        std::shuffle(order.begin(), order.end(), std::minstd_rand(seed));
        std::optional<HttpClient> client;
        for (std::size_t i = 0; i < order.size(); ++i) {
            if (!client || i % requestsPerConnection == 0) {
                client.emplace(server.port());
            }
            client->send(order[i]->request);
            const Reply reply = client->receive();
            expectReply(reply, *order[i]);
            if (const auto header = reply.headers.find("connection");
                header != reply.headers.end() && header->second == "close") {
                client.reset();
            }
            ++answered;
        }
    };
    std::vector<std::thread> running;
    for (unsigned int i = 0; i < clients; ++i) {
        running.emplace_back(run, i);
    }
    for (std::thread& thread : running) {
        thread.join();
    }
    EXPECT_EQ(answered, clients * all.size());
}

} // namespace
} // namespace ServerTest
