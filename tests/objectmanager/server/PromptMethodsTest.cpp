/* Which requests are answered without a worker, and that nobody waits for those that are not. */
#include "Served.h"

#include "server/PromptMethods.h"

#include <unistd.h>

#include <ctime>

namespace ServerTest {
namespace {

using Server::PromptMethods;
using testing::IsNull;
using testing::NotNull;

const PromptMethods::Clock::time_point now = PromptMethods::Clock::now();

Server::HttpRequest requestFor(const std::string& method) {
    return {"POST", {{"Host", "x"}, {"cimmethod", method}}, ""};
}

TEST(PromptMethodsTest, areFoundByTheirHeader) {
    PromptMethods methods({"GetInstance", "GetClass"});
    ASSERT_THAT(methods.find(requestFor("getclass")), NotNull());
    EXPECT_EQ(methods.find(requestFor("getclass"))->name(), "GetClass");
    EXPECT_EQ(methods.find(requestFor("GetClass")), methods.find(requestFor("getclass")));
    EXPECT_THAT(methods.find(requestFor("RequestPowerStateChange")), IsNull());
    EXPECT_THAT(methods.find({"POST", {{"Host", "GetClass"}}, ""}), IsNull());
}

TEST(PromptMethodsTest, arePromptOnceTheyWereQuick) {
    PromptMethods::Method method("GetInstance");
    EXPECT_FALSE(method.isPrompt(now));
    method.took(PromptMethods::limit, now);
    EXPECT_TRUE(method.isPrompt(now));
    method.took(10us, now + 1s);
    EXPECT_TRUE(method.isPrompt(now));
}

TEST(PromptMethodsTest, pauseAfterTheyTookMuch) {
    PromptMethods::Method method("GetInstance");
    method.took(10us, now);
    method.took(PromptMethods::limit + 1us, now);
    method.took(10us, now + 1s);
    EXPECT_FALSE(method.isPrompt(now + PromptMethods::pause - 1ms));
    EXPECT_TRUE(method.isPrompt(now + PromptMethods::pause));
}

class PromptServerTest : public Served {
protected:
    PromptServerTest() { _settings.promptMethods = {"Prompt"}; }

    static std::string requestOf(const std::string& method, const std::string& body) {
        return post(body, "CIMMethod: " + method + "\r\n");
    }

    /** Which thread answers. */
    static Server::HttpReply thread(const Server::HttpRequest& /*request*/, const Server::Caller& /*caller*/) {
        return {200, {}, std::to_string(gettid())};
    }
};

TEST_F(PromptServerTest, answersQuickMethodsWithoutAWorkerUntilTheyTakeMuch) {
    _settings.threads = 1;
    serve([](const Server::HttpRequest& request, const Server::Caller& caller) {
        if (request.body == "much") {
            const std::clock_t begin = std::clock();
            while (std::clock() - begin < CLOCKS_PER_SEC / 100) {
            }
        }
        return thread(request, caller);
    });
    HttpClient asking = client();
    const auto answerer = [&](const std::string& body, const std::string& method = "Prompt") {
        asking.send(requestOf(method, body));
        return asking.receive().body;
    };
    const std::string worker = answerer("little", "Other");
    EXPECT_EQ(answerer("little", "Other"), worker);
    EXPECT_EQ(answerer("little"), worker);
    const std::string reader = answerer("little");
    EXPECT_NE(reader, worker);
    EXPECT_EQ(answerer("little"), reader);
    EXPECT_EQ(answerer("much"), reader);
    EXPECT_EQ(answerer("little"), worker);
}

TEST_F(PromptServerTest, keepsNobodyWaitingForAMethodThatMayWait) {
    Gate gate;
    _settings.threads = 20;
    serve([&](const Server::HttpRequest& request, const Server::Caller& caller) {
        if (request.body == "waits") {
            gate.wait();
        }
        return echo(request, caller);
    });
    std::vector<HttpClient> others;
    for (int i = 0; i < 15; ++i) {
        others.push_back(client());
        others.back().send(requestOf("MayWait", "is quick"));
        EXPECT_EQ(others.back().receive().body, "is quick");
    }
    for (HttpClient& other : others) {
        other.send(requestOf("MayWait", "waits"));
    }
    for (int i = 0; i < 8; ++i) {
        EXPECT_EQ(ask(requestOf("Prompt", "x")).body, "x");
    }
    gate.open();
    for (HttpClient& other : others) {
        EXPECT_EQ(other.receive().body, "waits");
    }
}

} // namespace
} // namespace ServerTest
