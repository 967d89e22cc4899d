/* Many clients at once, over the wire: each gets, to every request that CIM-XML's cases have, the very reply. */
#include "HttpClient.h"
#include "cimxml/ServiceFixture.h"
#include "cimxml/WireCase.h"

#include "basics/Files.h"
#include "broker/Arena.h"
#include "server/HttpServer.h"

#include <algorithm>
#include <atomic>
#include <chrono>
#include <cstdlib>
#include <filesystem>
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
    // Only old clients do without a host.
    const bool hasHost = std::any_of(given.headers.begin(), given.headers.end(),
                                     [](const auto& header) { return header.first == "Host"; });
    std::string text = given.method + " /cimom HTTP/1." + (hasHost ? "1" : "0") + "\r\n";
    for (const auto& [name, value] : given.headers) {
        text += name + ": " + value + "\r\n";
    }
    return text + logInAs(given.caller.user, "password") + "Content-Length: " + std::to_string(given.body.size()) +
           "\r\n\r\n" + given.body;
}

std::vector<Exchange> exchanges() {
    std::vector<Exchange> all;
    for (const auto& file : std::filesystem::directory_iterator(TEST_CASES)) {
        const std::vector<WireCase> given = CimXml::readWireCases(contentOf(file.path()));
        // Several requests of one file are for a server of their own.
        if (given.size() == 1) {
            all.push_back({file.path().stem(), requestOf(given.front()), given.front()});
        }
    }
    return all;
}

/** The reply that a case expects, in the form in which a client receives it. */
void expectReply(const Reply& reply, const Exchange& exchange) {
    const WireCase expected = CimXml::readWireCase("# reply\n" + exchange.expected.reply);
    EXPECT_EQ(std::to_string(reply.status), expected.method) << exchange.name;
    EXPECT_EQ(reply.body, expected.body) << exchange.name;
    for (const auto& [name, value] : expected.headers) {
        if (name.ends_with("WBEMServerResponseTime")) {
            continue; // the one that is not the same each time
        }
        std::string lower = name;
        std::transform(lower.begin(), lower.end(), lower.begin(), [](unsigned char c) { return std::tolower(c); });
        const auto header = reply.headers.find(lower);
        EXPECT_TRUE(header != reply.headers.end() && header->second == value) << exchange.name << ": " << name;
    }
}

/** A request for an operation in root/test, by the user. */
std::string requestOf(const std::string& method, const std::string& parameters) {
    WireCase given;
    given.method = "POST";
    given.headers = CimXml::requestHeaders(method);
    given.caller.user = "operator";
    given.body = CimXml::requestBody(method, parameters);
    return requestOf(given);
}

/** The part of a document between two texts; empty if it does not contain both. */
std::string between(const std::string& document, const std::string& before, const std::string& behind) {
    const std::size_t found = document.find(before);
    if (found == std::string::npos) {
        return {};
    }
    const std::size_t start = found + before.size();
    const std::size_t end = document.find(behind, start);
    return end == std::string::npos ? std::string() : document.substr(start, end - start);
}

std::string objectsOf(const Reply& reply) {
    return between(reply.body, "<IRETURNVALUE>\n", "</IRETURNVALUE>");
}

std::string contextOf(const Reply& reply) {
    return between(reply.body, "NAME=\"EnumerationContext\" PARAMTYPE=\"string\"><VALUE>", "</VALUE>");
}

Reply ask(HttpClient& client, const std::string& request) {
    client.send(request);
    Reply reply = client.receive();
    EXPECT_EQ(reply.status, 200) << reply.body;
    return reply;
}

/** The instances of Test_Disk: opens the enumeration with some of them, and pulls the others one by one. */
std::string pulledDisks(HttpClient& client, int atOnce) {
    const std::string count =
        "<IPARAMVALUE NAME=\"MaxObjectCount\"><VALUE>" + std::to_string(atOnce) + "</VALUE></IPARAMVALUE>";
    Reply reply =
        ask(client, requestOf("OpenEnumerateInstances",
                              "<IPARAMVALUE NAME=\"ClassName\"><CLASSNAME NAME=\"Test_Disk\"/></IPARAMVALUE>" + count));
    std::string objects = objectsOf(reply);
    for (std::string context = contextOf(reply); !context.empty(); context = contextOf(reply)) {
        reply = ask(
            client,
            requestOf("PullInstancesWithPath",
                      "<IPARAMVALUE NAME=\"EnumerationContext\"><VALUE>" + context +
                          "</VALUE></IPARAMVALUE><IPARAMVALUE NAME=\"MaxObjectCount\"><VALUE>1</VALUE></IPARAMVALUE>"));
        objects += objectsOf(reply);
    }
    return objects;
}

class StressTest : public CimXml::ServiceFixture {};

TEST_F(StressTest, EveryClientGetsItsOwnReplies) {
    constexpr unsigned int clients = 64;
    constexpr std::size_t requestsPerConnection = 40;
    const std::vector<Exchange> all = exchanges();
    ASSERT_GT(all.size(), 100U);
    Doorkeeper doorkeeper;
    Server::Settings settings;
    settings.threads = 8;
    settings.hosts = {"server.example"};
    const Server::HttpServer server(
        settings,
        [](const Server::HttpRequest& request, const Server::Caller& caller) {
            return service().answer(request, caller);
        },
        &doorkeeper, [](const std::string&) {});
    HttpClient first(server.port());
    const std::string disks = pulledDisks(first, 1000);
    ASSERT_NE(disks, "");
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
        HttpClient puller(server.port());
        EXPECT_EQ(pulledDisks(puller, 1), disks);
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

/** Many clients ask at once for many instances. Each gets all of them, though there is memory for a few at a time. */
TEST_F(StressTest, LargeAnswersShareABoundedMemory) {
    constexpr unsigned int clients = 16;
    constexpr std::size_t kilobyte = 1024;
    setenv("TEST_MORE_DISKS", "500", 1);
    Doorkeeper doorkeeper;
    Server::Settings settings;
    settings.hosts = {"server.example"};
    settings.limits.allAnswersBytes = 1024 * kilobyte;
    // However long a client waits for a processor here, it is not cut off.
    settings.hurryTime = std::chrono::minutes{1};
    settings.limits.requestTime = std::chrono::minutes{1};
    const Server::HttpServer server(
        settings,
        [](const Server::HttpRequest& request, const Server::Caller& caller) {
            return service().answer(request, caller);
        },
        &doorkeeper, [](const std::string&) {});
    const std::string request = requestOf(
        "EnumerateInstances", "<IPARAMVALUE NAME=\"ClassName\"><CLASSNAME NAME=\"Test_Disk\"/></IPARAMVALUE>");
    std::atomic<std::size_t> most = 0;
    std::atomic<bool> done = false;
    std::thread watching([&] {
        for (; !done; std::this_thread::sleep_for(std::chrono::milliseconds{1})) {
            most = std::max<std::size_t>(most, Arena::usage().chunksInUse * Arena::chunkBytes);
        }
    });
    HttpClient first(server.port());
    const Reply expected = ask(first, request);
    EXPECT_GT(expected.chunks, 5U);
    const std::size_t ofOne = most;
    std::vector<std::thread> running;
    for (unsigned int i = 0; i < clients; ++i) {
        running.emplace_back([&] {
            HttpClient client(server.port());
            EXPECT_EQ(ask(client, request).body, expected.body);
        });
    }
    for (std::thread& thread : running) {
        thread.join();
    }
    done = true;
    watching.join();
    unsetenv("TEST_MORE_DISKS");
    // The half of one network, one answer beyond the limit, and the free part of each answer that is being made.
    EXPECT_LT(most, 512 * kilobyte + ofOne + settings.threads * 512 * kilobyte);
}

} // namespace
} // namespace ServerTest
